// The EXIF side of photo files, over exiv2: what the suite reads from a photo's metadata (capture
// time, position, speed, comments) and the geotag it writes into one. Works on every format
// exiv2 reads and writes: JPEG, TIFF, PNG, WebP and the raw formats exiv2 can write. The tags and
// their units are described in docs/photo-tagging.md.
//
// The functions on bytes do the work; CExif2 applies them to files, replacing a file only as a
// whole (see FileContent), so a photo is never left half written.
#pragma once

#include <string>
#include <string_view>
#include <vector>

#include "navmisc/platform/cstring.h"
#include "navmisc/platform/file_content.h"

namespace navmisc {

// Largest photo file the suite reads or rewrites (bytes).
constexpr size_t kMaxPhotoBytes = size_t{1} << 30;

// What a photo's metadata says. Values that are missing, malformed or absurd (a latitude of 300,
// a zero denominator, a date "0000:00:00 00:00:00") are reported as absent.
struct ExifInfo {
  int width = 0;  // pixels, 0 when unknown
  int height = 0;
  bool hasPosition = false;
  double latitude = 0.0;   // degrees, north positive
  double longitude = 0.0;  // degrees, east positive
  bool hasAltitude = false;
  double altitude = 0.0;  // metres, negative below sea level
  bool hasSpeed = false;
  double speed = 0.0;   // km/h, whatever unit the photo stores it in
  CString comment;      // the file's own comment (a JPEG comment segment, a PNG description)
  CString xpComment;    // Exif.Image.XPComment
  CString userComment;  // Exif.Photo.UserComment
  // Capture date-times as "YYYY:MM:DD hh:mm:ss", the camera's clock as it stands; empty unless
  // the photo holds a real date and time.
  CString dateTimeOriginal;  // Exif.Photo.DateTimeOriginal
  CString dateTime;          // Exif.Image.DateTime
};

// The geotag written into a photo.
struct ExifGeoTag {
  // Degrees, north and east positive. 0/0 means no position: the photo's GPS tags are removed.
  double latitude = 0.0;
  double longitude = 0.0;
  double altitude = 0.0;  // metres
  double speed = 0.0;     // km/h
  // Written to the file comment, Exif.Photo.UserComment and Exif.Image.XPComment; an empty
  // comment leaves the photo's comments as they are.
  CString comment;
};

// Reads the metadata of a photo held in memory. False, with `error` telling why, when exiv2 does
// not know the format or cannot read it.
bool ReadExif(std::string_view photo, ExifInfo& info, std::string& error);
// Writes the geotag into a photo held in memory: GPS version, latitude and longitude with their
// N/S and E/W references, altitude with its above/below reference, speed in km/h (reference
// "K"), and, when the photo has a capture time, the GPS date and time stamp in UTC (the capture
// time is read as the computer's local time unless the photo states its offset). False, with
// `photo` untouched, on failure.
bool WriteExifGeoTag(std::string& photo, const ExifGeoTag& tag, std::string& error);
// Replaces the GPS tags of `to` with every GPS tag of `from`. Fails when `from` has none.
bool CopyExifGps(std::string_view from, std::string& to, std::string& error);
// Sets Exif.Photo.DateTimeOriginal (and Exif.Image.DateTime) to `dateTime`, "YYYY:MM:DD hh:mm:ss".
bool WriteExifCaptureTime(std::string& photo, const CString& dateTime, std::string& error);

}  // namespace navmisc

// The suite's EXIF library on files. Each call reports failure as false with GetError() telling
// why; a file that cannot be written is left byte for byte as it was.
class CExif2 {
 public:
  bool GetExif(const wchar_t* path, navmisc::ExifInfo& info);
  // Changes one photo; the new content is on disk when the call returns.
  bool SetExif(const wchar_t* path, const navmisc::ExifGeoTag& tag);
  bool SetCaptureTime(const wchar_t* path, const CString& dateTime);
  // Changes for many photos: each is prepared beside its photo (false, with GetError(), when
  // that fails), and CommitStaged puts them all in place together, waiting for the disk once
  // instead of once per photo (see FileReplaceBatch). It returns one text per staged photo in
  // order, empty when the photo was written. StageCopyGps gives `to` the GPS tags of `from`
  // (CopyExifGps).
  bool StageExif(const wchar_t* path, const navmisc::ExifGeoTag& tag);
  bool StageCopyGps(const wchar_t* from, const wchar_t* to);
  std::vector<std::string> CommitStaged();

  const std::string& GetError() const { return error_; }

 private:
  template <class Change>
  bool Stage(const wchar_t* path, navmisc::FileReplaceBatch& batch, Change change);
  // Stages into a batch of its own and commits it.
  template <class Change>
  bool Rewrite(const wchar_t* path, Change change);

  navmisc::FileReplaceBatch staged_;
  std::string error_;
};
