#include "navmisc/platform/user_locale.h"

#include <clocale>
#include <cstdlib>
#include <ctime>
#include <cwchar>

#include <locale.h>

#include "navmisc/util/language.h"

unsigned long GetUserDefaultLCID() {
  for (const char* var : {"LC_ALL", "LC_MESSAGES", "LANG"}) {
    const char* v = std::getenv(var);
    if (v && *v) return LcidFromLocaleName(v);
  }
  return LcidFromLocaleName(nullptr);
}

CString UserDateTimeText(long time) {
  std::time_t t = static_cast<std::time_t>(time);
  std::tm local{};
  if (!localtime_r(&t, &local)) return {};
  locale_t loc = newlocale(LC_TIME_MASK, "", static_cast<locale_t>(nullptr));
  if (!loc) loc = newlocale(LC_TIME_MASK, "C", static_cast<locale_t>(nullptr));
  if (!loc) return {};
  const locale_t previous = uselocale(loc);
  wchar_t buf[256];
  const size_t n = std::wcsftime(buf, sizeof buf / sizeof buf[0], L"%x %X", &local);
  uselocale(previous);
  freelocale(loc);
  return CString(buf, static_cast<int>(n));
}
