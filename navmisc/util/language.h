// Language identifiers (Windows-style LCIDs) and the web language codes of the suite's service.
#pragma once

#include "navmisc/platform/cstring.h"

// The web language code of a language identifier ("en", "de", "zh-TW", ...); "en" for an
// identifier it does not know.
CString GetHttpLNGFromLCID(unsigned long lcid);
// The language identifier of a POSIX locale name such as "de_DE.UTF-8"; 0x0409 (English) when
// the language is not known.
unsigned long LcidFromLocaleName(const char* name);
