// Texts shown to the user, by numeric identifier, from the resource file that ships beside the
// programs ("navmisc-strings.ini", see docs/resources.md). A missing text is an empty string.
#pragma once

#include "navmisc/platform/cstring.h"

CString LoadResString(unsigned id);

namespace navmisc {
// Text `id` with `argument` in place of its first "%s" or "%d" ("%%" stands for "%"). The text
// comes from a file, so it is never used as a printf format: a text with other or more
// placeholders keeps them as written.
CString FormatResString(unsigned id, const wchar_t* argument);
}  // namespace navmisc

namespace navmisc {
// Reads the texts from this file instead (tests, or an application with its own file);
// an empty path returns to the default lookup.
void SetResourceFile(const wchar_t* path);
}  // namespace navmisc
