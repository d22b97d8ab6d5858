// GPX 1.0 export of tracks and located items (photos, markers).
#pragma once

#include "navmisc/platform/cstring.h"
#include "navmisc/platform/lists.h"

// Writes `items` (PHOTO_ITEM_INFO*, as waypoints) and then `tracks` (TRACK_ITEM_INFO*) into one
// GPX 1.0 document at `path`, replacing any file there. Null entries are skipped. Track points
// without a time (-1) are left out.
//
// The layout is fixed: CR LF before every element, no indentation, no final line break, the
// track description always "Color:004000ff", numbers in the "C" locale. Titles and descriptions
// are written without XML escaping, so "&" or "<" in them makes the document ill-formed.
//
// Returns 1 when the document was written, 0 when the target could not be opened for writing.
// Write errors after opening are not detected.
int ExportGpx(CString path, CPtrList& tracks, CPtrList& items);
