// KML 2.1 export of tracks and located items, and its zipped form KMZ with copies of the photos.
#pragma once

#include "navmisc/export/export_control.h"
#include "navmisc/platform/cstring.h"
#include "navmisc/platform/lists.h"

class PHOTO_ITEM_INFO;

// Writes one KML 2.1 document at `path` (replacing any file there): a Folder named after the
// current local date and time in the user's conventions, one LineString placemark per track of
// `tracks` (TRACK_ITEM_INFO*, points without a time left out) and one Point placemark per
// marker (types 1 and 2) or photo (type 0, with a file) of `items` (PHOTO_ITEM_INFO*). Null
// entries and other items are skipped.
//
// `photoSourceMode` chooses the picture address in photo placemarks: 1 the file the photo was
// imported from, 2 the address of its published picture (each falling back to the photo's file
// when it has none), any other value the photo's file in the trip, as "file:///" addresses.
//
// Track names are written without escaping (an "&" in one makes the document ill-formed) and
// repeated as the description; item titles and descriptions are escaped ("&", "<", ">", the
// double quote, and a pair of apostrophes; a single apostrophe stays). Every track placemark
// carries the same LineStyle id, so a document with two or more tracks is readable but not
// schema-valid.
//
// Returns 1 on success, 0 when `path` is empty or cannot be opened for writing. Write errors
// after opening do not change the result.
int ExportKml(CString path, CPtrList& tracks, CPtrList& items, int photoSourceMode);

// The same under `control` (progress, stopping, points read from the point files), which also
// receives the reason when the target could not be opened or a write failed.
int ExportKml(CString path, CPtrList& tracks, CPtrList& items, int photoSourceMode, ExportControl& control);

// Writes the same document (pictures referred to by bare names) and packs it with numbered
// copies of the photos ("1.jpg", "2.jpg", ... in item order) into a zip archive at `path`; the
// document comes last, named after `path` with the extension ".kml". The copies are made in a
// folder of this call's own under $TMPDIR (else /tmp), removed afterwards.
//
// Returns 1 on success, 0 when the document cannot be written or a file cannot be added to the
// archive. After a failed addition the archive at `path` holds the files added before it.
int ExportKmz(CString path, CPtrList& tracks, CPtrList& items);

// Why an ExportKmz call returned 0, for callers that tell the user.
struct KmzExportFailure {
  enum Stage {
    kNone = 0,       // no failure
    kScratchFolder,  // the scratch folder could not be made
    kDocument,       // the document could not be written at the target
    kArchive,        // the archive could not be started at the target
    kAddFile,        // `file` could not be added (a photo that cannot be read, for instance)
    kCloseArchive,   // the archive could not be completed (disk full, a file vanished)
    kStopped,        // the caller cleared the keep-going flag
  };
  Stage stage = kNone;
  CString file;                            // the file that could not be packed, when known
  const PHOTO_ITEM_INFO* photo = nullptr;  // the photo that file is a copy of, when it is one
  CString message;                         // the reason in the system's words
};

// ExportKmz under `control` (as for ExportKml) that also says why it failed: `failure` (may be
// null) is reset, then filled when the result is 0, and its message goes to the control's error.
// A document that lost bytes on the way is still packed (result 1); the control's error says so.
// A stopped export leaves nothing at `path`.
int ExportKmz(CString path, CPtrList& tracks, CPtrList& items, KmzExportFailure* failure,
              ExportControl& control);
