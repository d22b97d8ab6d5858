// Photo metadata through the tagging tool "FixTag.exe": reading capture times, positions and
// comments of photos, writing positions and comments into them, copying a geotag from one photo to
// another, and the question in front of writing into a user's original files.
//
// Each exchange writes a command file (docs/photo-tagging.md) into the data root, named after the
// calling thread, runs the tool from the program folder (g_szExecProgPath) and waits for it
// without a time limit, reads the tool's answers back and deletes the file. The tool's exit code
// is not looked at: a tool that runs but fails shows only through missing values.
//
// Times are seconds since 1970; photo times are the camera's clock read as if it were UTC.
// Speeds are metres per hour in the records and km/h in the command file.
#pragma once

#include <cstdint>

#include "navmisc/geotag/overwrite_dlg.h"
#include "navmisc/platform/cstring.h"
#include "navmisc/platform/lists.h"
#include "navmisc/platform/types.h"

class PHOTO_ITEM_INFO;

// One photo to be read by GetPhotoInfor.
struct _ExifImageInfo {
  CString path;            // the photo file
  double latitude = 0.0;   // degrees
  double longitude = 0.0;  // degrees
  double altitude = 0.0;   // metres
  int32_t speed = 0;       // metres per hour
  int32_t time = -1;       // seconds since 1970; -1 = unknown, still to be read
  CString comment;
};

// Set when the user ticked the box that stops the overwrite question; from then on originals are
// written without asking. Lives as long as the library.
extern bool g_bOverwriteNoAsk;

// Fills position, speed, comment and time of every entry of `photos` (_ExifImageInfo*) whose time
// is -1, with one run of the tool. The capture time is the photo's metadata date as it stands
// (no time-zone correction); without one it is the file's creation time plus the system's
// time-zone shift. Returns 1 when the tool could be started, else 0 (the entries then get the
// defaults: no position, no comment, the creation time).
int GetPhotoInfor(CPtrList& photos);
// The same for one photo; with `force` it is read even when its time is known.
int GetPhotoInfor(_ExifImageInfo* photo, bool force);

// Writes the photo's position, speed and description into its file in the trip
// (PHOTO_ITEM_INFO::GetFilePathName) and, with `writeOriginal`, first into the file it was
// imported from. Line breaks of the description become single blanks. Returns 1 when the tool
// could be started, 0 otherwise or when the photo has no file.
int WriteGeoTagInfo(PHOTO_ITEM_INFO* photo, bool writeOriginal);
// Asks the tool to copy the geotag (every GPS tag) of `from` into `to`. 1 when the tool started.
int CopyExifGeoTagInfo(const wchar_t* from, const wchar_t* to);

// Decides, asking the user through COverwriteDlg unless `noToAll`, `yesToAll` or g_bOverwriteNoAsk
// answers already, whether the original file is changed too, then calls WriteGeoTagInfo: the
// trip's copy is always tagged. IDCANCEL sets `noToAll`, IDYESTOALL sets `yesToAll`; the two
// belong to the caller and live across one batch of photos. Returns WriteGeoTagInfo's result (0
// when the photo has no file).
int CheckAndWriteGeoTagInfo(PHOTO_ITEM_INFO* photo, bool& noToAll, bool& yesToAll);
// The same for a list of photos (PHOTO_ITEM_INFO*), asking photo by photo in list order and
// writing the originals the user agreed to, then tagging all the trip's copies with one run of
// the tool. `counter` (may be null) advances per photo; a cleared *keepGoing stops before the
// next photo, and then no copy is tagged. Returns 1 when the tool started.
int CheckAndWriteGeoTagInfo(CPtrList& photos, bool& noToAll, bool& yesToAll, int* counter,
                            bool* keepGoing);

// Writes the photo's position, speed and description into the file it was imported from
// (PHOTO_ITEM_INFO::originalName) through the EXIF library. A file that is write-protected or
// hidden is changed only when the user agrees (COverwriteDlg::Confirm); a write-protected one
// gets its protection back afterwards. Returns 1 when the file was written.
int WriteGeoTagInfoToOriginal(PHOTO_ITEM_INFO* photo);
// The same for every photo of the list; returns the number of files written.
int WriteGeoTagInfoToOriginal(CPtrList& photos);

// When the file was made (its birth time where the file system has one, else the time of its last
// status change), returned as seconds since 1970 after a round trip through the local calendar
// (mktime with the daylight flag -1), and as a file time in `created`. 0 when the file cannot be
// opened.
long GetFileCreationTime(const wchar_t* path, FILETIME& created);
