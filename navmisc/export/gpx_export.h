// GPX 1.0 export of tracks and located items (photos, markers).
#pragma once

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
// Returns 1 when the document was written, 0 when the target could not be opened for writing
// (LastOpenError() in platform/output_file.h says why). Write errors after opening are not
// detected.
int ExportGpx(CString path, CPtrList& tracks, CPtrList& items);

// The same with progress: `*counter` (may be null) goes up by one per item and per track point
// (written or not). When `*keepGoing` (may be null) turns false the export stops, deletes what
// it wrote and returns 0.
int ExportGpx(CString path, CPtrList& tracks, CPtrList& items, int* counter, bool* keepGoing);
