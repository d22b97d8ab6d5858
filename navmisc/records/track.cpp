#include "navmisc/records/track.h"

#include <string>

#include "navmisc/platform/atomic_file.h"
#include "navmisc/platform/files.h"
#include "navmisc/platform/line_reader.h"
#include "navmisc/platform/settings.h"
#include "navmisc/records/photo.h"
#include "navmisc/records/point_file_format.h"
#include "navmisc/records/point_lists.h"
#include "navmisc/records/trip.h"
#include "navmisc/records/user_profile.h"

namespace pf = navmisc::point_file;
using navmisc::DeleteAll;
using navmisc::Items;

namespace {

using pf::Kind;

// Writes the list of one kind to its point file through an atomic replace. A cleared *keepGoing
// stops before the next line; the lines written so far still replace the old file. A file that
// cannot be written is skipped (inside a FileTransaction it fails the save).
void WriteListFile(const CString& path, Kind kind, const TRACK_ITEM_INFO& track, int* counter, bool* keepGoing) {
  navmisc::AtomicFile file;
  if (!file.Open(path)) return;
  pf::EncodeList(kind, track, [&](std::string_view text) { file.Write(text); }, counter, keepGoing);
  file.Commit();
}

CString PathOf(const TRACK_ITEM_INFO& track, Kind kind) {
  switch (kind) {
    case Kind::kPoints: return track.GetFilePathName();
    case Kind::kCellFixes: return track.GetCellIDFilePathName();
    case Kind::kHelpPoints: return track.GetSOSPointFilePathName();
    case Kind::kHeartRate: return track.GetHeartRateFilePathName();
    case Kind::kCadence: return track.GetCyclingCadenceFilePathName();
    case Kind::kWheelSpeed: return track.GetWheelSpeedFilePathName();
  }
  return {};
}

// Reads a point file into its list when the file opens (emptying the list first).
void ReadListFile(const CString& path, Kind kind, TRACK_ITEM_INFO& track, long shift) {
  navmisc::LineReader reader(pf::kMaxLine);
  if (reader.Open(path)) pf::ReadList(kind, reader, track, shift);
}

}  // namespace

TRACK_ITEM_INFO::TRACK_ITEM_INFO(BLOG_ITEM_INFO* owner) : trip(owner), id(NewItemId(L"TK_")) {}

TRACK_ITEM_INFO::TRACK_ITEM_INFO(BLOG_ITEM_INFO* owner, const CString& sameId, SharedPointsTag)
    : trip(owner), id(sameId), ownsPoints_(false) {}

TRACK_ITEM_INFO::TRACK_ITEM_INFO(BLOG_ITEM_INFO* owner, TRACK_ITEM_INFO* from)
    : trip(owner), id(NewItemId(L"TK_")) {
  if (!from) return;
  modelId = from->modelId;
  description = from->description;
  runner = from->runner;
  color = from->color;
  transparency = from->transparency;
  hasGpsData = from->hasGpsData;
  // The points travel as files; the new track reads them on demand.
  for (Kind kind : pf::kAllKinds) {
    const CString src = PathOf(*from, kind), dst = PathOf(*this, kind);
    if (!src.IsEmpty() && !dst.IsEmpty() && FileExists(src)) CopyFile(src, dst, false);
  }
  // The runner's frame images live in the trip's folder unless they come from the network.
  if (!from->trip || !trip) return;
  for (auto* r : Items<RUNNER_ITEM_INFO>(from->trip->runners)) {
    if (r->id != runner || r->netSource) continue;
    for (int f = 0; f < r->frameCount && f < RUNNER_ITEM_INFO::kMaxFrames; ++f) {
      if (!IsPlainPathComponent(r->frameUrl[f])) continue;
      const CString src = PathJoin(from->trip->GetResourcePath(), r->frameUrl[f]);
      if (FileExists(src)) CopyFile(src, PathJoin(trip->GetResourcePath(), r->frameUrl[f]), false);
    }
    break;
  }
}

TRACK_ITEM_INFO::~TRACK_ITEM_INFO() { ClearAll(); }

void TRACK_ITEM_INFO::ClearAll() {
  if (ownsPoints_) DeleteAll<WAYPOINT_ITEM_INFO>(points);
  else points.RemoveAll();  // the real track owns these
  DeleteAll<BASE_ITEM_INFO>(cellFixes);
  DeleteAll<WAYPOINT_ITEM_INFO>(helpPoints);
  DeleteAll<HEARTRATE_ITEM_INFO>(heartRates);
  DeleteAll<CYCLING_CADENCE_RPM_ITEM_INFO>(cadences);
  DeleteAll<WHEEL_SPEED_ITEM_INFO>(wheelSpeeds);
}

CString TRACK_ITEM_INFO::FilePath(const wchar_t* extension) const {
  // The id names files in the trip's folder: one that could leave it names nothing.
  if (!trip || !IsPlainPathComponent(id)) return {};
  return PathJoin(trip->GetResourcePath(), id + L"." + extension);
}

CString TRACK_ITEM_INFO::GetFilePathName() const { return FilePath(pf::kPoints); }
CString TRACK_ITEM_INFO::GetCellIDFilePathName() const { return FilePath(pf::kCellFixes); }
CString TRACK_ITEM_INFO::GetSOSPointFilePathName() const { return FilePath(pf::kHelpPoints); }
CString TRACK_ITEM_INFO::GetHeartRateFilePathName() const { return FilePath(pf::kHeartRate); }
CString TRACK_ITEM_INFO::GetCyclingCadenceFilePathName() const { return FilePath(pf::kCadence); }
CString TRACK_ITEM_INFO::GetWheelSpeedFilePathName() const { return FilePath(pf::kWheelSpeed); }

void TRACK_ITEM_INFO::WriteInfo(unsigned long h, const wchar_t* s, int write, int* counter, bool*) {
  if (write) {
    WR_STRING(h, s, L"track_item_id", id);
    WR_STRING(h, s, L"track_model_id", modelId);
    WR_STRING(h, s, L"description", description);
    WR_STRING(h, s, L"runner", runner);
    WR_INT(h, s, L"rgb_color", static_cast<int>(color));
    WR_INT(h, s, L"transparent", transparency);
    WR_INT(h, s, L"has_gps_data", hasGpsData ? 1 : 0);
  }
  if (counter) ++*counter;
}

void TRACK_ITEM_INFO::ReadInfo(unsigned long h, const wchar_t* s) {
  id = RD_STRING(h, s, L"track_item_id", L"");
  modelId = RD_STRING(h, s, L"track_model_id", L"");
  description = RD_STRING(h, s, L"description", L"");
  runner = RD_STRING(h, s, L"runner", L"");
  color = static_cast<uint32_t>(RD_INT(h, s, L"rgb_color", 16711935));
  transparency = RD_INT(h, s, L"transparent", 10);
  hasGpsData = RD_INT(h, s, L"has_gps_data", 1) != 0;
}

void TRACK_ITEM_INFO::WriteAllWaypoint(int write, int* counter, bool* keepGoing) {
  const bool tracker = trip && trip->appType == GPS_APP_TRACKER;
  if (!write) {
    if (counter) *counter += points.GetCount() + (tracker ? cellFixes.GetCount() : 0);
    return;
  }
  // A thinned copy holds only part of the points: writing it would lose the rest.
  if (!ownsPoints_) return;
  // The points file is rewritten even when empty; a side file only when its list holds records,
  // and the cell and help files only for the tracker application.
  WriteListFile(GetFilePathName(), Kind::kPoints, *this, counter, keepGoing);
  for (Kind kind : {Kind::kCellFixes, Kind::kHelpPoints, Kind::kHeartRate, Kind::kCadence, Kind::kWheelSpeed}) {
    const bool trackerOnly = kind == Kind::kCellFixes || kind == Kind::kHelpPoints;
    if ((tracker || !trackerOnly) && !pf::ListIsEmpty(kind, *this))
      WriteListFile(PathOf(*this, kind), kind, *this, counter, keepGoing);
  }
}

void TRACK_ITEM_INFO::ReadAllWaypoint(int force) {
  // A thinned copy shares its points with the real track: reloading would free them under it.
  if (!ownsPoints_) return;
  if (!force && !points.IsEmpty()) return;
  ReadListFile(GetFilePathName(), Kind::kPoints, *this, trip ? GetProfileTimeShift(trip->appType) : 0);
  // Every loaded track has at least two points.
  if (points.GetCount() == 1) {
    auto* second = new WAYPOINT_ITEM_INFO(static_cast<WAYPOINT_ITEM_INFO*>(points.GetHead()));
    second->time = static_cast<int32_t>(static_cast<uint32_t>(second->time) + 1u);  // wraps, never overflows
    points.AddTail(second);
  }
  const bool tracker = trip && trip->appType == GPS_APP_TRACKER;
  for (Kind kind : {Kind::kCellFixes, Kind::kHelpPoints, Kind::kHeartRate, Kind::kCadence, Kind::kWheelSpeed}) {
    const bool trackerOnly = kind == Kind::kCellFixes || kind == Kind::kHelpPoints;
    if (tracker || !trackerOnly) ReadListFile(PathOf(*this, kind), kind, *this, 0);
  }
}
