#pragma once

#include "navmisc/platform/cstring.h"

// Creates a new, empty folder of its own under $TMPDIR (else /tmp), named after `prefix`, and
// returns its path; empty when that fails.
CString CreateTempFolder(const wchar_t* prefix);
