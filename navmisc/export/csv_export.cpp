#include "navmisc/export/csv_export.h"

#include <optional>
#include <unordered_set>
#include <vector>

#include "navmisc/export/detail/export_common.h"
#include "navmisc/geo/gps_helper.h"
#include "navmisc/platform/datetime.h"
#include "navmisc/platform/files.h"
#include "navmisc/platform/format.h"
#include "navmisc/records/photo.h"
#include "navmisc/records/track.h"
#include "navmisc/records/trip.h"

namespace {

using navmisc::AppendFixed;
using navmisc::AppendInt;
using navmisc::exportdetail::DocumentWriter;
using navmisc::exportdetail::ForEachPoint;
using navmisc::exportdetail::PointCount;
using navmisc::exportdetail::Progress;

// Spreadsheets of the time held 65536 rows: one header and 65534 points leave room to spare.
constexpr int kPointsPerFile = 65534;
constexpr double kFeetPerMetre = 3.280842;
constexpr double kMilesPerKilometre = 0.621371;

constexpr std::string_view kFirstHeader =
    "Date, Time, Latitude, Longitude, Altitude, Speed, Course, Type, Distance, Essential\r";
// Later files of a split export end their header in "Exception"; readers of older exports rely
// on the difference.
constexpr std::string_view kContinuationHeader =
    "Date, Time, Latitude, Longitude, Altitude, Speed, Course, Type, Distance, Exception\r";

// "%02d"
void AppendTwo(std::string& out, int v) {
  if (v >= 0 && v < 10) out += '0';
  AppendInt(out, v);
}

// The trip's point filter: which points it treats as exceptions rather than essential.
struct PointFilter {
  explicit PointFilter(const BLOG_ITEM_INFO* trip)
      : enabled(trip && trip->optOptimize),
        revised(trip && trip->optRevise),
        redundant(trip && trip->optRedundance),
        level(trip ? trip->optLevel : 0) {}
  // `type` is the point's optimisation mark (a level, -1 redundant, -2 revised).
  bool IsException(int32_t type) const {
    return enabled && ((type == -2 && revised) || (type == -1 && redundant) || type < level);
  }
  bool enabled, revised, redundant;
  int32_t level;
};

class CsvWriter {
 public:
  CsvWriter(CPtrList& photos, const BLOG_ITEM_INFO* trip, bool metric)
      : filter_(trip), shift_(trip ? trip->timeZoneShift : 0), metric_(metric) {
    // A photo time below 1 means the photo has none.
    for (const PHOTO_ITEM_INFO* photo : navmisc::Items<PHOTO_ITEM_INFO>(photos)) {
      if (photo && photo->playbackTime >= 1) photoTimes_.insert(photo->playbackTime);
    }
  }

  bool Open(const CString& path, std::string_view header) {
    Close();
    if (!writer_.Open(path)) {
      if (error_.empty()) error_ = writer_.error();
      return false;
    }
    written_.push_back(path);
    writer_.text() += header;
    return true;
  }
  void Close() {
    writer_.Close();
    if (error_.empty()) error_ = writer_.error();
  }
  // The first failure of any file: opening, writing or closing it.
  const std::string& error() const { return error_; }
  // Deletes every file written so far.
  void RemoveAll() {
    writer_.Remove();
    for (const CString& file : written_) DeleteFileRetry(file);
  }

  // Where the track's previous written point lies.
  struct Previous {
    double latitude, longitude;
  };

  // `first` and `last` tell the point's place in its track's list; `prev` is the track's
  // previous written point, if any.
  void WriteLine(const WAYPOINT_ITEM_INFO& p, const std::optional<Previous>& prev, bool first, bool last) {
    std::string& out = writer_.text();
    int year, month, day, hour, minute, second;
    GetDateTimeInfo(static_cast<long>(p.time) + shift_, year, month, day, hour, minute, second);
    AppendTwo(out, year);
    out += '/';
    AppendTwo(out, month);
    out += '/';
    AppendTwo(out, day);
    out += ", ";
    AppendTwo(out, hour);
    out += ':';
    AppendTwo(out, minute);
    out += ':';
    AppendTwo(out, second);
    out += ", ";
    AppendFixed(out, p.latitude, 6);
    out += ", ";
    AppendFixed(out, p.longitude, 6);
    out += ", ";
    AppendFixed(out, metric_ ? p.altitude : p.altitude * kFeetPerMetre, 2);
    // Two blanks before the speed: spreadsheet templates made from older exports expect them.
    out += ",  ";
    const double speed = p.speed;  // metres per hour
    AppendFixed(out, metric_ ? speed : speed * 0.001 * kMilesPerKilometre, 2);
    out += ", ";
    int course = p.course;
    if (course == -1) {
      course = prev ? static_cast<int>(helper_.GetInitialBearing(prev->latitude, prev->longitude,
                                                                 p.latitude, p.longitude))
                    : 0;
    }
    AppendInt(out, course);
    out += ", ";
    int type = first ? -2 : last ? -4 : 0;
    if (photoTimes_.count(p.time)) --type;
    AppendInt(out, type);
    out += ", ";
    // GetGpsDistance reads the first latitude for both ends: the east-west distance, kept so.
    const double metres =
        prev ? GetGpsDistance(prev->latitude, prev->longitude, p.latitude, p.longitude) * 1000.0 : 0.0;
    AppendFixed(out, metric_ ? metres : metres * kMilesPerKilometre, 2);
    out += ", ";
    if (!filter_.IsException(p.type)) out += '1';
    out += '\r';
    writer_.MaybeFlush();
  }

 private:
  PointFilter filter_;
  long shift_;
  bool metric_;
  std::unordered_set<int32_t> photoTimes_;
  CGPSHelper helper_;
  DocumentWriter writer_;
  std::vector<CString> written_;
  std::string error_;
};

}  // namespace

CString CsvSplitFileName(const wchar_t* path, int number) {
  return PathJoin(PathFolder(path), FormatString(L"%s_%d.csv", PathFileTitle(path).c_str(), number));
}

int ExportCsv(CString path, CPtrList& tracks, CPtrList& photos, BLOG_ITEM_INFO* trip, bool metric) {
  ExportControl control;
  return ExportCsv(path, tracks, photos, trip, metric, control);
}

int ExportCsv(CString path, CPtrList& tracks, CPtrList& photos, BLOG_ITEM_INFO* trip, bool metric,
              ExportControl& control) {
  control.error.clear();
  const bool fromFile = control.pointsFromFiles;
  ClearTargetFile(path);
  long long total = 0;
  for (const TRACK_ITEM_INFO* track : navmisc::Items<TRACK_ITEM_INFO>(tracks)) {
    if (track) total += PointCount(*track, fromFile);
  }
  const bool split = total >= kPointsPerFile;
  int number = 1;

  Progress progress{control.counter, control.keepGoing};
  CsvWriter csv(photos, trip, metric);
  if (!csv.Open(split ? CsvSplitFileName(path, number) : path, kFirstHeader)) {
    control.error = csv.error();
    return 0;
  }
  int lines = 0;
  bool stopped = false;
  for (const TRACK_ITEM_INFO* track : navmisc::Items<TRACK_ITEM_INFO>(tracks)) {
    if (!track) continue;
    const long long count = PointCount(*track, fromFile);
    long long index = 0;
    std::optional<CsvWriter::Previous> prev;
    const bool finished = ForEachPoint(*track, fromFile, [&](const WAYPOINT_ITEM_INFO* p) {
      if (p && p->time != -1) {
        // A point that is both first and last is typed as first.
        csv.WriteLine(*p, prev, index == 0, index == count - 1);
        prev = CsvWriter::Previous{p->latitude, p->longitude};
      }
      ++index;
      // Points without a time take their place in the file's count all the same.
      if (++lines == kPointsPerFile) {
        csv.Close();
        ++number;
        if (!csv.Open(CsvSplitFileName(path, number), kContinuationHeader)) return false;
        lines = 0;
      }
      if (progress.Step()) return true;
      csv.RemoveAll();
      stopped = true;
      return false;
    });
    if (!finished) {
      control.error = stopped ? "stopped" : csv.error();
      return 0;
    }
  }
  csv.Close();
  control.error = csv.error();
  return 1;
}
