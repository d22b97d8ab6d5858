#pragma once

// The language identifier of the user's locale (LC_ALL, LC_MESSAGES or LANG, in that order).
unsigned long GetUserDefaultLCID();
