// What the document exporters share: the maker's identity, writing a document to its target,
// UTF-8 text of the records' wide strings, the standard date-time text and progress reporting.
// Numbers go through navmisc::AppendFixed / AppendInt (platform/format.h), which never depend on
// the process locale.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

#include "navmisc/export/export_control.h"
#include "navmisc/platform/cstring.h"
#include "navmisc/platform/output_file.h"
#include "navmisc/records/track.h"
#include "navmisc/records/track_point_reader.h"

namespace navmisc::exportdetail {

// The maker's web address, as it appears in the documents' creator texts.
inline constexpr std::string_view kMakerAddress = "https://navmisc.example.org";

// A document on its way to its target. Text is collected in memory and handed to the file in
// large pieces. Write errors do not stop the document (the exporters' results do not depend on
// them); error() keeps the first for callers that ask.
class DocumentWriter {
 public:
  DocumentWriter() { text_.reserve(kFlushAt + 64 * 1024); }
  // Whatever is still buffered is written.
  ~DocumentWriter() { Close(); }
  DocumentWriter(const DocumentWriter&) = delete;
  DocumentWriter& operator=(const DocumentWriter&) = delete;

  // Clears the target (ClearTargetFile: a read-only file is replaced too) and creates it anew.
  // False when it cannot be opened; nothing is written then.
  bool Open(const CString& path);
  // The text under construction; call MaybeFlush() after each element.
  std::string& text() { return text_; }
  void MaybeFlush() {
    if (text_.size() >= kFlushAt) Flush();
  }
  void Close();
  // Closes and deletes the file: an export that was stopped leaves no half document behind.
  void Remove();
  // Why the target could not be opened or a write or the close failed, in the system's words;
  // empty when nothing failed.
  const std::string& error() const { return file_.error(); }

 private:
  static constexpr size_t kFlushAt = 1 << 20;
  void Flush();

  CString path_;
  OutputFile file_;
  std::string text_;
};

// The caller's progress counter and keep-going flag (either may be null).
struct Progress {
  int* counter = nullptr;
  bool* keepGoing = nullptr;
  // Counts one point or item; false once the caller has asked to stop.
  bool Step() {
    if (counter) ++*counter;
    return !keepGoing || *keepGoing;
  }
};

// Ends an export that the caller stopped: deletes what was written and returns 0.
int Stopped(DocumentWriter& w, ExportControl& control);

// Calls `visit(const WAYPOINT_ITEM_INFO*)` for every entry of `track`'s point list (nulls
// included) in stored order or, with `fromFile`, for every point of its point file, read one at a
// time into one record that the next point overwrites. Stops and returns false when `visit`
// does.
template <class Visit>
bool ForEachPoint(const TRACK_ITEM_INFO& track, bool fromFile, Visit&& visit) {
  if (!fromFile) {
    for (const WAYPOINT_ITEM_INFO* p : Items<WAYPOINT_ITEM_INFO>(track.points)) {
      if (!visit(p)) return false;
    }
    return true;
  }
  TrackPointReader reader;
  if (!reader.Open(track)) return true;
  WAYPOINT_ITEM_INFO p;
  while (reader.Next(p)) {
    if (!visit(static_cast<const WAYPOINT_ITEM_INFO*>(&p))) return false;
  }
  return true;
}

// The number of entries ForEachPoint visits.
long long PointCount(const TRACK_ITEM_INFO& track, bool fromFile);

// The UTF-8 form of `text` as it fits a C buffer of `bufferSize` bytes, terminator included.
// A longer text is cut after the last whole character that fits (never inside a character);
// text that is not valid Unicode (a lone surrogate) gives an empty result.
std::string Utf8Field(std::wstring_view text, size_t bufferSize);

// The standard date-time text "YYYY-MM-DDThh:mm:ss" (UTC) of `time` (seconds since 1970).
std::string StdTimeText(int32_t time);
// The same with "Z" appended unless the text already ends in "Z".
std::string StdTimeTextZ(int32_t time);

// Appends StdTimeTextZ(time) quickly for long runs of times: the platform text is asked for once
// per UTC day and the clock part of later times of that day is formatted here.
class TimeTextZWriter {
 public:
  void Append(std::string& out, int32_t time);
  // The same text written at `at` (room for 64 bytes); returns the end of it.
  char* Write(char* at, int32_t time);

 private:
  int64_t day_ = INT64_MIN;  // the UTC day whose date part is cached, or none
  char date_[11] = {};       // "YYYY-MM-DDT"
};

}  // namespace navmisc::exportdetail
