#pragma once

#include "navmisc/platform/cstring.h"

// The language identifier of the user's locale (LC_ALL, LC_MESSAGES or LANG, in that order).
unsigned long GetUserDefaultLCID();

// The local date and time of `time` (seconds since 1970) as the user writes them: the date and
// time conventions of the environment (LC_ALL, LC_TIME, LANG), whatever locale the process has
// switched to, e.g. "05/01/24 08:00:00" in the "C" locale or "01.05.2024 08:00:00" in German.
CString UserDateTimeText(long time);
