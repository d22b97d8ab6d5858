#include "navmisc/platform/lists.h"

#include <cwchar>

int CxStringList::Tokenize(const wchar_t* text, const wchar_t* seps) {
  RemoveAll();
  if (!text) return 0;
  if (!seps) seps = L",";
  const wchar_t* start = text;
  for (const wchar_t* p = text;; ++p) {
    if (*p == L'\0' || std::wcschr(seps, *p)) {
      AddTail(CString(start, static_cast<int>(p - start)));
      if (*p == L'\0') break;
      start = p + 1;
    }
  }
  return GetCount();
}
