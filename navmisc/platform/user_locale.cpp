#include "navmisc/platform/user_locale.h"

#include <cstdlib>

#include "navmisc/util/language.h"

unsigned long GetUserDefaultLCID() {
  for (const char* var : {"LC_ALL", "LC_MESSAGES", "LANG"}) {
    const char* v = std::getenv(var);
    if (v && *v) return LcidFromLocaleName(v);
  }
  return LcidFromLocaleName(nullptr);
}
