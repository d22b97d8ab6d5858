#include "navmisc/geotag/overwrite_dlg.h"

#include <atomic>

namespace {
std::atomic<COverwriteView*> g_view{nullptr};
}  // namespace

void SetOverwriteView(COverwriteView* view) {
  g_view.store(view);
}
COverwriteView* GetOverwriteView() {
  return g_view.load();
}

COverwriteDlg::COverwriteDlg(const wchar_t* photoName, COverwriteView* view)
    : m_strPhotoName(photoName), view_(view ? view : GetOverwriteView()) {}

int COverwriteDlg::DoModal() {
  if (!view_) return IDNO;
  bool noAsk = m_bNoAsk;
  const int answer = view_->AskOverwrite(m_strPhotoName, noAsk);
  m_bNoAsk = noAsk;
  switch (answer) {
    case IDYES:
    case IDNO:
    case IDCANCEL:
    case IDYESTOALL:
      return answer;
    default:
      return IDNO;
  }
}

bool COverwriteDlg::Confirm(const wchar_t* message, COverwriteView* view) {
  if (!view) view = GetOverwriteView();
  return view && view->Confirm(message);
}
