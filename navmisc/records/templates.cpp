#include "navmisc/records/templates.h"

#include "navmisc/platform/files.h"
#include "navmisc/platform/settings.h"
#include "navmisc/platform/shared_globals.h"

CPtrList g_plTemplateItemList;

namespace {

// A value that starts with ".\" lies in the templates folder; any other value is kept as it is.
// The catalogue writes the relative part with backslashes: they separate folders here too.
CString ResolveTemplatePath(const CString& folder, const CString& value) {
  if (value.Left(2) != L".\\") return value;
  CString rest = value.Mid(2);
  rest.Replace(L"\\", L"/");
  return PathJoin(folder, rest);
}

}  // namespace

int ReadTemplateInfo(CString language) {
  const CString folder = PathJoin(g_szExecProgPath, L"Templates");
  const unsigned long h = RD_BEGIN(PathJoin(folder, L"TEMP.INI"));
  if (h) {
    const CString own = CString(L"L10N.") + language;
    const wchar_t* fallback = L"L10N.DEFAULT";
    auto localise = [&](const CString& key) {
      CString text = RD_STRING(h, own, key, L"");
      if (text.IsEmpty()) text = RD_STRING(h, fallback, key, L"");
      return text;
    };
    const int count = RD_INT(h, L"templates", L"temp_count", 0);
    for (int i : navmisc::SectionIndices(h, L"temp.%d", count)) {
      const CString s = FormatString(L"temp.%-d", i);
      auto* t = new TEMPLATE_ITEM_INFO;
      t->name = localise(RD_STRING(h, s, L"name", L""));
      t->description = localise(RD_STRING(h, s, L"desc", L""));
      t->thumbnailPath = ResolveTemplatePath(folder, RD_STRING(h, s, L"thumb", L""));
      t->landmarkPath = ResolveTemplatePath(folder, RD_STRING(h, s, L"landmark", L""));
      t->landmarkWidth = RD_INT(h, s, L"landmark_w", 0);
      t->landmarkHeight = RD_INT(h, s, L"landmark_h", 0);
      t->mode = RD_INT(h, s, L"Mode", 0);
      t->style = RD_INT(h, s, L"Style", 0);
      t->wideStyle = t->style >= 100;
      t->graph = RD_INT(h, s, L"graph", 0);
      t->summary = RD_INT(h, s, L"summary", 0);
      t->brandedLabel = RD_INT(h, s, L"@vorla", 0) != 0;
      g_plTemplateItemList.AddTail(t);
    }
    RD_END(h);
  }
  return g_plTemplateItemList.GetCount();
}

void FreeTemplateInfo() { navmisc::DeleteAll<TEMPLATE_ITEM_INFO>(g_plTemplateItemList); }
