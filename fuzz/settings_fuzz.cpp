// Settings files of any content, parsed in memory: every value the reader finds must come back
// identical after it is written with WR_* and read again, and the rewritten document holds
// nothing else.
//
// Run: settings_fuzz -max_len=256 fuzz/corpus/settings

#include <algorithm>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <string>
#include <string_view>
#include <tuple>
#include <utility>
#include <vector>

#include "navmisc/platform/settings.h"

namespace {

[[noreturn]] void Fail(const char* what, const CString& section, const CString& key) {
  std::fprintf(stderr, "settings round trip: %s [%s] %s\n", what, section.ToUtf8().c_str(), key.ToUtf8().c_str());
  std::abort();
}

using Entries = std::vector<navmisc::SettingsEntry>;

// Every entry of a reader, sorted by name; the reader is ended. With `lookUp`, each entry is
// also looked up by the names it was listed under, which must find it, and the numbers of a
// list must come ascending and below the count.
Entries Collect(unsigned long r, bool lookUp) {
  Entries out = navmisc::SettingsEntries(r);
  if (lookUp) {
    for (const auto& e : out) {
      if (!RD_EXISTS(r, e.section, e.key) || RD_STRING(r, e.section, e.key) != e.value)
        Fail("an entry listed is not found", e.section, e.key);
    }
    const std::vector<int> list = navmisc::SectionIndices(r, L"%s_TK(%d)", L"SECTION", 1000);
    for (size_t i = 0; i < list.size(); ++i) {
      if (list[i] < 0 || list[i] >= 1000 || (i && list[i] <= list[i - 1])) Fail("list numbers out of order", L"", L"");
    }
  }
  RD_END(r);
  std::sort(out.begin(), out.end(), [](const auto& x, const auto& y) {
    return std::tie(x.section.str(), x.key.str()) < std::tie(y.section.str(), y.key.str());
  });
  return out;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  const Entries found =
      Collect(navmisc::ReadSettingsFromMemory(std::string_view(reinterpret_cast<const char*>(data), size)), true);
  const unsigned long w = WR_BEGIN(L"memory");
  for (const auto& e : found) WR_STRING(w, e.section, e.key, e.value);
  std::string doc;
  if (!navmisc::EndSettingsToMemory(w, doc)) std::abort();
  const Entries back = Collect(navmisc::ReadSettingsFromMemory(doc), false);
  if (back.size() != found.size()) Fail("the rewritten document holds other entries", L"", L"");
  for (size_t i = 0; i < found.size(); ++i) {
    if (!(back[i] == found[i])) Fail("value changed", found[i].section, found[i].key);
  }
  return 0;
}
