// Texts shown to the user, by numeric identifier, from the resource file that ships beside the
// programs ("navmisc-strings.ini", see docs/resources.md). A missing text is an empty string.
#pragma once

#include "navmisc/platform/cstring.h"

CString LoadResString(unsigned id);

namespace navmisc {
// Reads the texts from this file instead (tests, or an application with its own file);
// an empty path returns to the default lookup.
void SetResourceFile(const wchar_t* path);
}  // namespace navmisc
