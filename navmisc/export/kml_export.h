// KML 2.1 export of tracks and located items, and its zipped form KMZ with copies of the photos.
#pragma once

#include "navmisc/platform/cstring.h"
#include "navmisc/platform/lists.h"

class PHOTO_ITEM_INFO;

// Writes one KML 2.1 document at `path` (replacing any file there): a Folder named after the
// current local date and time, one LineString placemark per track of `tracks`
// (TRACK_ITEM_INFO*) and one Point placemark per photo or marker of `items` (PHOTO_ITEM_INFO*).
// Null entries, items of other kinds and photos without a file are skipped.
//
// `photoSourceMode` chooses the picture address in photo placemarks: 1 the file the photo was
// imported from, 2 the address of its published picture (each falling back to the photo's file
// when it has none), any other value the photo's file in the trip, as "file:///" addresses.
//
// Track names are written without escaping (an "&" in one makes the document ill-formed); item
// titles and descriptions are escaped. Every track placemark carries the same LineStyle id, so a
// document with two or more tracks is readable but not schema-valid.
//
// Returns 1 on success, 0 when `path` is empty or cannot be opened for writing.
int ExportKml(CString path, CPtrList& tracks, CPtrList& items, int photoSourceMode);

// Writes the same document (pictures referred to by bare names) and packs it with numbered
// copies of the photos ("1.jpg", "2.jpg", ... in item order) into a zip archive at `path`; the
// document comes last, named after `path` with the extension ".kml". Scratch copies live in a
// folder of their own under $TMPDIR (else /tmp), removed afterwards.
//
// Returns 1 on success, 0 when the document cannot be written or a file cannot be added to the
// archive; nothing is left at `path` then.
int ExportKmz(CString path, CPtrList& tracks, CPtrList& items);

// Why an ExportKmz call returned 0, for callers that tell the user.
struct KmzExportFailure {
  enum Stage {
    kNone = 0,       // no failure
    kScratchFolder,  // the scratch folder could not be made
    kDocument,       // the document could not be written at the target
    kArchive,        // the archive could not be created at the target
    kAddFile,        // `file` could not be added (a photo that cannot be read, for instance)
    kCloseArchive,   // the archive could not be completed (disk full, a file vanished)
  };
  Stage stage = kNone;
  CString file;                            // the file that could not be packed, when known
  const PHOTO_ITEM_INFO* photo = nullptr;  // the photo it was copied from, when it is a photo
  CString message;                         // a short explanation in English
};

// ExportKmz that also says why it failed: `failure` (may be null) is reset, then filled when
// the result is 0.
int ExportKmz(CString path, CPtrList& tracks, CPtrList& items, KmzExportFailure* failure);
