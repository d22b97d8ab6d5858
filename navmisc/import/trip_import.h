// Track files into a trip of the data root. Points stream straight into the trip's point files
// while the files are read (memory does not grow with the file); the trip's settings file is
// written last and the trip registered after it (the trip tree for the trip application). On
// any failure, and when an unfinished importer goes away, the trip's folder is removed: a trip
// exists whole or not at all. The mapping is in docs/track-import.md.
//
//   TripImporter importer(options);
//   ReadStatus s = importer.Begin();
//   if (s.ok()) s = importer.AddFile(path, readOptions).status;   // as many files as wanted
//   if (s.ok()) s = importer.Commit();                            // importer.tripId() names it
#pragma once

#include <cstdint>
#include <memory>
#include <string>

#include "navmisc/import/read_track_file.h"
#include "navmisc/import/track_reader.h"
#include "navmisc/platform/cstring.h"
#include "navmisc/platform/types.h"

class BLOG_ITEM_INFO;

namespace navmisc::import {

struct TripImportOptions {
  GPS_APP_PROG_TYPE appType = GPS_APP_TRIP;  // 1, 22 or 55
  // The trip's name; empty: the document's own name, else the first file's title.
  CString name;
  CString description;  // empty: the document's own description
  // The zone (seconds east of UTC) the files' times are written in: subtracted from every time,
  // so that the trip holds UTC.
  int32_t timeZone = 0;
  // Points and markers outside [cutStart, cutEnd] (UTC seconds, after the zone is taken off)
  // are left out; kNoTime leaves that end open. With a cut, points without a time are left out
  // too.
  int64_t cutStart = kNoTime;
  int64_t cutEnd = kNoTime;
};

// A trip takes at most this many tracks and markers.
inline constexpr int kMaxTracks = 10000;
inline constexpr int kMaxMarkers = 10000;

class TripImporter : public ImportSink {
 public:
  explicit TripImporter(TripImportOptions options);
  // A trip that was not committed is removed with its folder.
  ~TripImporter() override;
  TripImporter(const TripImporter&) = delete;
  TripImporter& operator=(const TripImporter&) = delete;

  // Creates the new trip and its folder.
  ReadStatus Begin();
  // Reads one more file into the trip. A file that gives nothing (empty, no point, no date)
  // fails and leaves the trip as it was; any other failure abandons the trip (nothing of it
  // stays). The result says why.
  ReadFileResult AddFile(const wchar_t* path, ReadFileOptions options);
  // Writes the trip's settings file and registers the trip. Fails (and abandons the trip) when
  // nothing was kept (with a cut: no point), or anything cannot be written.
  ReadStatus Commit();
  // Removes the trip and its folder.
  void Abandon();

  const CString& tripId() const { return tripId_; }
  // What the trip holds so far (after the cut).
  uint64_t keptPoints() const { return keptPoints_; }
  uint64_t keptMarkers() const { return keptMarkers_; }
  int tracks() const { return trackCount_; }
  // The first and last point kept (time and position), for replies.
  const ImportPoint& firstPoint() const { return first_; }
  const ImportPoint& lastPoint() const { return last_; }
  // Points and markers left out by the cut.
  uint64_t cutAway() const { return cut_; }
  const CString& tripName() const;

  // ImportSink: what the readers hand over.
  bool Document(const std::string& name, const std::string& description) override;
  bool BeginTrack(const ImportTrack& track) override;
  bool BeginSegment() override;
  bool Point(const ImportPoint& point) override;
  bool EndTrack() override;
  bool Marker(const ImportMarker& marker) override;

 private:
  class OpenTrack;
  bool Fail(int32_t code, std::string message);
  // Takes the zone off and applies the cut; false when the time is cut away.
  bool Keep(int64_t& time);
  bool CloseTrack();
  bool Register();

  TripImportOptions options_;
  std::unique_ptr<BLOG_ITEM_INFO> trip_;
  CString tripId_;
  CString folder_;
  bool committed_ = false;
  ReadStatus failure_;  // the importer's own failure (a write), which stops the reader
  std::string docName_, docDescription_, firstFileTitle_, fileTitle_;
  ImportTrack track_;
  int segment_ = 0;             // segments of the current file track that hold points
  std::unique_ptr<OpenTrack> open_;
  int trackCount_ = 0;
  uint64_t keptPoints_ = 0, keptMarkers_ = 0, cut_ = 0;
  ImportPoint first_, last_;
};

}  // namespace navmisc::import
