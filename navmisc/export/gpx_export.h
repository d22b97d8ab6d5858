// GPX 1.0 export of tracks and located items (photos, markers).
#pragma once

#include "navmisc/export/export_control.h"
#include "navmisc/platform/cstring.h"
#include "navmisc/platform/lists.h"

// Writes `items` (PHOTO_ITEM_INFO*, as waypoints) and then `tracks` (TRACK_ITEM_INFO*) into one
// GPX 1.0 document at `path`, replacing any file there (a read-only one too). Null entries are
// skipped. Track points without a time (-1) are left out; a point at time 0 is written.
//
// The layout is fixed: CR LF before every element, no indentation, no final line break, the
// track description always "Color:004000ff", numbers in the "C" locale, times in UTC with "Z".
// Titles and descriptions are written without XML escaping, so "&" or "<" in them makes the
// document ill-formed; a description's CR LF pairs become "&#13;". Texts are UTF-8, cut at a
// whole character to at most 2047 bytes.
//
// Returns 1 when the document was written, 0 when the target could not be opened for writing.
// Write errors after opening do not change the result.
int ExportGpx(CString path, CPtrList& tracks, CPtrList& items);

// The same under `control` (progress, stopping, points read from the point files), which also
// receives the reason when the target could not be opened or a write failed.
int ExportGpx(CString path, CPtrList& tracks, CPtrList& items, ExportControl& control);
