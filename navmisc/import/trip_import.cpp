#include "navmisc/import/trip_import.h"

#include <cmath>
#include <cstring>

#include "navmisc/import/import_errors.h"
#include "navmisc/platform/atomic_file.h"
#include "navmisc/platform/datetime.h"
#include "navmisc/platform/files.h"
#include "navmisc/platform/shared_globals.h"
#include "navmisc/records/photo.h"
#include "navmisc/records/point_codec.h"
#include "navmisc/records/track.h"
#include "navmisc/records/trip.h"
#include "navmisc/records/trip_tree.h"

namespace navmisc::import {
namespace {

namespace pf = navmisc::point_file;

constexpr size_t kFlushAt = 1 << 16;
// The colour and transparency a track gets when its settings name none.
constexpr uint32_t kTrackColor = 16711935;
constexpr int32_t kTrackTransparency = 10;
// The root of a trip tree made for the first imported trip.
constexpr const wchar_t* kNewTreeName = L"My trips";

// One kind of per-second sample (heart rate or cadence) on its way into a side file: runs of
// consecutive seconds make one record of up to 24 values.
class SampleFile {
 public:
  explicit SampleFile(CString path) : path_(std::move(path)) {}
  bool Add(int64_t time, int value) {
    if (n_ > 0 && time >= start_ && time < start_ + n_) return true;  // a second already held
    if (n_ == kValues || (n_ > 0 && time != start_ + n_)) {
      if (!FlushRecord()) return false;
    }
    if (n_ == 0) start_ = time;
    values_[n_++] = static_cast<uint8_t>(value);
    return true;
  }
  // Writes what is held; false when the file cannot be written.
  bool Commit() {
    if (!FlushRecord()) return false;
    if (!file_.IsOpen()) return true;  // no sample: no file
    return file_.Write(buf_) && file_.Commit();
  }

 private:
  static constexpr int kValues = HEARTRATE_ITEM_INFO::kValues;
  bool FlushRecord() {
    if (n_ == 0) return true;
    if (!file_.IsOpen() && !file_.Open(path_)) return false;
    uint8_t values[kValues];
    std::memset(values, HEARTRATE_ITEM_INFO::kEnd, sizeof values);
    std::memcpy(values, values_, static_cast<size_t>(n_));
    pf::AppendHeartRateLine(buf_, static_cast<int32_t>(start_), values, kValues);
    n_ = 0;
    if (buf_.size() < kFlushAt) return true;
    const bool ok = file_.Write(buf_);
    buf_.clear();
    return ok;
  }

  CString path_;
  navmisc::AtomicFile file_;
  std::string buf_;
  int64_t start_ = 0;
  uint8_t values_[kValues] = {};
  int n_ = 0;
};

}  // namespace

// The track being filled: its points go line by line into its ".BIN" file, its samples into
// ".HR" and ".CS".
class TripImporter::OpenTrack {
 public:
  OpenTrack(BLOG_ITEM_INFO* trip, const CString& name)
      : track_(std::make_unique<TRACK_ITEM_INFO>(trip)),
        heartRate_(track_->GetHeartRateFilePathName()),
        cadence_(track_->GetCyclingCadenceFilePathName()) {
    track_->description = name;
    track_->color = kTrackColor;
    track_->transparency = kTrackTransparency;
    buf_.reserve(kFlushAt + 512);
  }

  bool Add(const ImportPoint& p, int64_t time) {
    if (time != kNoTime) {
      if (p.heartRate >= 0 && !heartRate_.Add(time, p.heartRate)) return false;
      if (p.cadence >= 0 && !cadence_.Add(time, p.cadence)) return false;
    }
    if (!p.hasPosition) return true;
    if (!bin_.IsOpen() && !bin_.Open(track_->GetFilePathName())) return false;
    point_.time = static_cast<int32_t>(time);
    point_.latitude = p.latitude;
    point_.longitude = p.longitude;
    point_.altitude = p.hasAltitude ? p.altitude : 0.0;
    point_.speed = p.speed >= 0 ? static_cast<int32_t>(std::llround(p.speed * 3600.0)) : 0;
    point_.course = p.course >= 0 ? static_cast<int32_t>(std::lround(p.course)) % 360 : -1;
    pf::AppendPointLine(buf_, point_);
    ++points_;
    if (buf_.size() < kFlushAt) return true;
    const bool ok = bin_.Write(buf_);
    buf_.clear();
    return ok;
  }

  uint64_t points() const { return points_; }

  // Puts the files in place; the track then belongs to the trip. False when a file cannot be
  // written.
  bool Commit() {
    return bin_.Write(buf_) && bin_.Commit() && heartRate_.Commit() && cadence_.Commit();
  }
  TRACK_ITEM_INFO* Release() { return track_.release(); }

 private:
  std::unique_ptr<TRACK_ITEM_INFO> track_;
  navmisc::AtomicFile bin_;
  std::string buf_;
  WAYPOINT_ITEM_INFO point_{nullptr};
  SampleFile heartRate_;
  SampleFile cadence_;
  uint64_t points_ = 0;
};

TripImporter::TripImporter(TripImportOptions options) : options_(std::move(options)) {}

TripImporter::~TripImporter() {
  if (!committed_) Abandon();
}

bool TripImporter::Fail(int32_t code, std::string message) {
  if (failure_.ok()) failure_ = {code, std::move(message)};
  return false;
}

ReadStatus TripImporter::Begin() {
  if (trip_) return {};
  const GPS_APP_PROG_TYPE type = options_.appType;
  if (type != GPS_APP_TRIP && type != GPS_APP_SPORT && type != GPS_APP_TRACKER) {
    return {DC_ERR_IMPORT_APP, "application type " + std::to_string(static_cast<int>(type)) +
                                   " does not take imported files (1 trip, 22 sport, 55 tracker do)"};
  }
  if (g_szAppDataPath[0] == 0) return {DC_ERR_IMPORT_WRITE, "no data root is chosen"};
  trip_ = std::make_unique<BLOG_ITEM_INFO>(type);
  tripId_ = trip_->tripId;
  folder_ = trip_->GetResourcePath();
  if (folder_.IsEmpty() || !IsDirectory(folder_)) {
    const std::string where = folder_.ToUtf8();
    Abandon();
    return {DC_ERR_IMPORT_WRITE, "cannot create the trip's folder " + where};
  }
  trip_->createTime = static_cast<int32_t>(GetCurDateTime());
  return {};
}

ReadFileResult TripImporter::AddFile(const wchar_t* path, ReadFileOptions options) {
  ReadFileResult result;
  result.format = options.format;
  if (!trip_ || committed_) {
    result.status = {DC_ERR_IMPORT_WRITE, "the trip is not open"};
    return result;
  }
  fileTitle_ = PathFileTitle(path).ToUtf8();
  if (firstFileTitle_.empty()) firstFileTitle_ = fileTitle_;
  segment_ = 0;
  track_ = {};
  const uint64_t pointsBefore = keptPoints_, markersBefore = keptMarkers_;
  result = ReadTrackFile(path, *this, options);
  // A stop that the importer itself caused (a file it cannot write) says so.
  if (!failure_.ok()) result.status = failure_;
  if (result.status.ok() && open_ && !CloseTrack()) result.status = failure_;
  if (result.status.ok()) return result;
  // A file that gave nothing at all leaves the trip as it was; any other failure may have left
  // part of the file in the trip, so the trip goes.
  const int32_t code = result.status.code;
  const bool nothingRead = (code == DC_ERR_IMPORT_EMPTY || code == DC_ERR_IMPORT_NO_POINTS ||
                            code == DC_ERR_IMPORT_NO_DATE) &&
                           keptPoints_ == pointsBefore && keptMarkers_ == markersBefore && !open_;
  if (!nothingRead) Abandon();
  return result;
}

bool TripImporter::Keep(int64_t& time) {
  if (time != kNoTime) {
    time -= options_.timeZone;
    // A zone shift that carries a time out of the stored range drops it rather than wrap it.
    if (time < 0 || time > 2147483647) time = kNoTime;
  }
  const bool cutting = options_.cutStart != kNoTime || options_.cutEnd != kNoTime;
  if (!cutting) return true;
  if (time == kNoTime || (options_.cutStart != kNoTime && time < options_.cutStart) ||
      (options_.cutEnd != kNoTime && time > options_.cutEnd)) {
    ++cut_;
    return false;
  }
  return true;
}

bool TripImporter::Document(const std::string& name, const std::string& description) {
  if (!name.empty()) docName_ = name;
  if (!description.empty()) docDescription_ = description;
  return true;
}

bool TripImporter::BeginTrack(const ImportTrack& track) {
  if (open_ && !CloseTrack()) return false;
  track_ = track;
  segment_ = 0;
  return true;
}

bool TripImporter::BeginSegment() { return !open_ || CloseTrack(); }

bool TripImporter::EndTrack() { return !open_ || CloseTrack(); }

bool TripImporter::Point(const ImportPoint& point) {
  int64_t time = point.time;
  if (!Keep(time)) return true;
  if (!open_) {
    if (trackCount_ >= kMaxTracks) {
      return Fail(DC_ERR_IMPORT_TOO_MANY, "more than " + std::to_string(kMaxTracks) + " tracks");
    }
    // A track's later segments are tracks of their own, numbered after it.
    std::string name = track_.name.empty() ? fileTitle_ : track_.name;
    if (segment_ > 0) name += " (" + std::to_string(segment_ + 1) + ")";
    open_ = std::make_unique<OpenTrack>(trip_.get(), CString::FromUtf8(name));
  }
  if (!open_->Add(point, time)) {
    return Fail(DC_ERR_IMPORT_WRITE, "cannot write the point files in " + folder_.ToUtf8());
  }
  if (point.hasPosition) {
    ImportPoint kept = point;
    kept.time = time;
    if (keptPoints_ == 0) first_ = kept;
    last_ = kept;
    ++keptPoints_;
  }
  return true;
}

bool TripImporter::CloseTrack() {
  std::unique_ptr<OpenTrack> track = std::move(open_);
  // A segment without a single position (samples only) makes no track.
  if (track->points() == 0) return true;
  if (!track->Commit()) return Fail(DC_ERR_IMPORT_WRITE, "cannot write the point files in " + folder_.ToUtf8());
  trip_->tracks.AddTail(track->Release());
  ++trackCount_;
  ++segment_;
  return true;
}

bool TripImporter::Marker(const ImportMarker& marker) {
  int64_t time = marker.time;
  // Markers without a time are places, not moments: a cut keeps them.
  if (time != kNoTime && !Keep(time)) return true;
  if (keptMarkers_ >= static_cast<uint64_t>(kMaxMarkers)) {
    return Fail(DC_ERR_IMPORT_TOO_MANY, "more than " + std::to_string(kMaxMarkers) + " markers");
  }
  auto* item = new PHOTO_ITEM_INFO(trip_.get(), nullptr, nullptr, nullptr);
  item->dataType = PHOTO_ITEM_INFO::kTypeMarker;
  item->title = CString::FromUtf8(marker.name);
  item->description = CString::FromUtf8(marker.description);
  item->latitude = marker.latitude;
  item->longitude = marker.longitude;
  item->altitude = marker.hasAltitude ? marker.altitude : 0.0;
  item->playbackTime = item->originalTime = time == kNoTime ? 0 : static_cast<int32_t>(time);
  trip_->photos.AddTail(item);
  ++keptMarkers_;
  return true;
}

const CString& TripImporter::tripName() const {
  static const CString kNone;
  return trip_ ? trip_->name : kNone;
}

ReadStatus TripImporter::Commit() {
  if (!trip_ || committed_) return {DC_ERR_IMPORT_WRITE, "the trip is not open"};
  if (open_ && !CloseTrack()) {
    const ReadStatus why = failure_;
    Abandon();
    return why;
  }
  // With a cut, the import is about the time range: markers alone do not make a trip.
  const bool cutting = options_.cutStart != kNoTime || options_.cutEnd != kNoTime;
  if (trackCount_ == 0 && (keptMarkers_ == 0 || cutting)) {
    Abandon();
    return {DC_ERR_IMPORT_NO_POINTS, cut_ > 0 ? "no point lies within the chosen time range"
                                              : "the file holds no point with a position"};
  }
  CString name = options_.name;
  if (name.IsEmpty()) name = CString::FromUtf8(docName_.empty() ? firstFileTitle_ : docName_);
  if (!name.IsEmpty()) trip_->name = trip_->fileName = name;
  trip_->description =
      options_.description.IsEmpty() ? CString::FromUtf8(docDescription_) : options_.description;
  trip_->WriteInfo(1, nullptr, nullptr);
  // The settings writer reports nothing: read the file back to know that it is there whole.
  BLOG_ITEM_INFO check(options_.appType, tripId_);
  if (check.ReadInfo() != 1 || check.tracks.GetCount() != trip_->tracks.GetCount() ||
      check.photos.GetCount() != trip_->photos.GetCount()) {
    Abandon();
    return {DC_ERR_IMPORT_WRITE, "cannot write the trip's settings file in " + folder_.ToUtf8()};
  }
  if (!Register()) {
    const ReadStatus why = failure_;
    Abandon();
    return why;
  }
  committed_ = true;
  return {};
}

// Makes the trip known to its application: the trip application lists its trips in the trip
// tree. The sport and tracker applications list theirs in their activity stores, which are
// not part of this library yet; until then such a trip stands in its folder ("SportRes",
// "TrackerRes") and is found there.
bool TripImporter::Register() {
  if (options_.appType != GPS_APP_TRIP) return true;
  const CString treeFile = PathJoin(GetAppDataFolder(GPS_APP_TRIP), L"RESOURCE_INFO.INI");
  BLOG_TREE_NODE tree(nullptr);
  if (FileExists(treeFile) || FileExists(PathJoin(GetAppDataFolder(GPS_APP_TRIP), L"AMBRO_V20.INI"))) {
    // Never write over a tree that could not be read: that would lose every other trip.
    if (tree.ReadInfo(0, nullptr) != 1) {
      return Fail(DC_ERR_IMPORT_WRITE, "the trip tree " + treeFile.ToUtf8() +
                                           " cannot be read; the trip was not added to it");
    }
  } else {
    tree.name = kNewTreeName;
  }
  tree.trips.AddTail(new BLOG_ITEM_INFO(GPS_APP_TRIP, tripId_));
  tree.WriteInfo(false, 0, nullptr);
  BLOG_TREE_NODE back(nullptr);
  bool listed = false;
  if (back.ReadInfo(0, nullptr) == 1) {
    for (auto* t : navmisc::Items<BLOG_ITEM_INFO>(back.trips)) listed = listed || t->tripId == tripId_;
  }
  return listed || Fail(DC_ERR_IMPORT_WRITE, "cannot write the trip tree " + treeFile.ToUtf8());
}

void TripImporter::Abandon() {
  open_.reset();
  if (trip_) {
    trip_->ClearAll();
    trip_.reset();
  }
  if (!folder_.IsEmpty() && !committed_) RemoveDir(folder_, L"*.*");
  folder_.Empty();
}

}  // namespace navmisc::import
