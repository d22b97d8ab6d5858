// Streaming readers of track files: GPX 1.0 and 1.1, TCX and NMEA 0183. A reader is fed the
// document in pieces of any size and hands what it finds to a sink as it goes (tracks, their
// segments and points, markers), so memory stays the same however long the file is. The format
// mapping is in docs/track-import.md.
//
//   GpxSink sink;                                 // an ImportSink of the caller
//   auto reader = navmisc::import::MakeGpxReader(sink);
//   while (more) if (!reader->Feed(data, size)) break;
//   reader->Finish();                             // status() tells how it ended
//
// ReadTrackFile (read_track_file.h) does this for a file, and for every format gpsbabel knows.
#pragma once

#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <string>

namespace navmisc::import {

inline constexpr int64_t kNoTime = -1;

// One point as the file gives it; what the file leaves out keeps its "unknown" value.
struct ImportPoint {
  int64_t time = kNoTime;     // seconds since 1970, UTC (0 .. 2^31-1)
  double latitude = 0.0;      // degrees north, -90 .. 90
  double longitude = 0.0;     // degrees east, -180 .. 180
  bool hasPosition = false;   // a TCX point may carry only sensor values
  double altitude = 0.0;      // metres
  bool hasAltitude = false;
  double speed = -1.0;        // metres per second; negative = unknown
  double course = -1.0;       // degrees clockwise from north, 0 .. 360; negative = unknown
  int heartRate = -1;         // beats per minute, 0 .. 254; -1 = none
  int cadence = -1;           // revolutions (or steps) per minute, 0 .. 254; -1 = none
};

// A named place of the file (a GPX waypoint, a TCX course point).
struct ImportMarker {
  std::string name;           // UTF-8, at most kMaxText bytes
  std::string description;
  std::string symbol;         // the file's icon name ("Flag, Blue"), when it has one
  int64_t time = kNoTime;
  double latitude = 0.0;
  double longitude = 0.0;
  double altitude = 0.0;
  bool hasAltitude = false;
};

enum class TrackKind {
  kTrack,   // GPX trk
  kRoute,   // GPX rte
  kLap,     // TCX activity lap
  kCourse,  // TCX course
  kLog,     // the fixes of an NMEA log
};

struct ImportTrack {
  TrackKind kind = TrackKind::kTrack;
  std::string name;           // UTF-8; may be empty
  std::string description;
};

// The piece in which documents are read from a file and handed to a parser.
inline constexpr size_t kReadPiece = 256u << 10;

// Texts longer than this many bytes are cut (at a whole character).
inline constexpr size_t kMaxText = 4096;

// Receives what a reader finds, in document order: for each track BeginTrack, then for each
// segment BeginSegment and its points, then EndTrack; markers and the document's own name in
// between. Any call returning false stops the reading (status DC_ERR_IMPORT_CANCELLED).
class ImportSink {
 public:
  virtual ~ImportSink() = default;
  // The document's own name and description (GPX metadata, TCX activity notes). It may come at
  // any point, also after the tracks, and more than once; an empty value leaves what an earlier
  // call gave.
  virtual bool Document(const std::string& name, const std::string& description) {
    (void)name;
    (void)description;
    return true;
  }
  virtual bool BeginTrack(const ImportTrack& track) = 0;
  virtual bool BeginSegment() = 0;
  virtual bool Point(const ImportPoint& point) = 0;
  virtual bool EndTrack() = 0;
  virtual bool Marker(const ImportMarker& marker) = 0;
};

// How a reading ended: code 0, or one of DC_ERR_IMPORT_* (import_errors.h) with a message for
// people that says what and where ("line 12: latitude 91.5 is out of range").
struct ReadStatus {
  int32_t code = 0;
  std::string message;
  bool ok() const { return code == 0; }
};

// What a reader has handed to its sink so far.
struct ReadCounts {
  uint64_t tracks = 0;
  uint64_t points = 0;
  uint64_t markers = 0;
  uint64_t skipped = 0;  // NMEA sentences left out (bad checksum, bad values, garbage lines)
};

class TrackReader {
 public:
  virtual ~TrackReader() = default;
  // Reads the next `size` bytes of the document. False once the document has failed or the
  // sink has stopped the reading; later calls then do nothing.
  virtual bool Feed(const char* data, size_t size) = 0;
  // The document is complete: checks its end. False when it failed (now or before).
  virtual bool Finish() = 0;
  // Fills `buffer` with at most `size` bytes of the document: the count, 0 at its end, -1 when
  // the bytes cannot be read.
  using Source = std::function<long(char* buffer, size_t size)>;
  // Reads the whole document from `source` and finishes it, as Feed for every piece and then
  // Finish would; a reader may take the bytes at its own pace. Use one way or the other for a
  // document, never both.
  virtual bool ReadFrom(const Source& source);
  const ReadStatus& status() const { return status_; }
  const ReadCounts& counts() const { return counts_; }

 protected:
  // Records the first failure; returns false for convenience.
  bool Fail(int32_t code, std::string message);
  bool failed() const { return !status_.ok(); }
  ReadStatus status_;
  ReadCounts counts_;
};

std::unique_ptr<TrackReader> MakeGpxReader(ImportSink& sink);
std::unique_ptr<TrackReader> MakeTcxReader(ImportSink& sink);

struct NmeaOptions {
  // The UTC day (seconds since 1970 of its midnight) of fixes read before the log gives any
  // date (GGA-only logs). kNoTime: such a log fails with DC_ERR_IMPORT_NO_DATE.
  int64_t defaultDate = kNoTime;
};
// NMEA 0183: GGA, RMC and VTG sentences of any talker. Sentences of one fix time make one
// point; the date comes from RMC and is carried across midnight. Sentences with a bad checksum
// or bad values are skipped (counts().skipped); a log that gives no point fails, with the code
// of the most telling reason.
std::unique_ptr<TrackReader> MakeNmeaReader(ImportSink& sink, const NmeaOptions& options = {});

}  // namespace navmisc::import
