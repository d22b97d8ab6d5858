#include "navmisc/records/track.h"

#include <string>

#include "navmisc/platform/atomic_file.h"
#include "navmisc/platform/files.h"
#include "navmisc/platform/line_reader.h"
#include "navmisc/platform/settings.h"
#include "navmisc/records/photo.h"
#include "navmisc/records/point_codec.h"
#include "navmisc/records/point_file_format.h"
#include "navmisc/records/track_point_reader.h"
#include "navmisc/records/trip.h"

namespace pf = navmisc::point_file;
using navmisc::DeleteAll;
using navmisc::Items;

namespace {

constexpr size_t kFlushAt = 1 << 16;

// Writes the records of one list to a point file, one line each, through an atomic replace.
// A cleared *keepGoing stops before the next line; the lines written so far still replace the
// old file. A file that cannot be written is skipped without a report, leaving the old one.
template <class T, class Encode>
void WriteListFile(const CString& path, CPtrList& list, int* counter, bool* keepGoing, Encode encode) {
  navmisc::AtomicFile file;
  if (!file.Open(path)) return;
  std::string buf;
  buf.reserve(kFlushAt + 512);
  for (T* rec : Items<T>(list)) {
    if (keepGoing && !*keepGoing) break;
    if (rec) encode(buf, *rec);
    if (buf.size() >= kFlushAt) {
      file.Write(buf);
      buf.clear();
    }
    if (counter) ++*counter;
  }
  file.Write(buf);
  file.Commit();
}

// Reads a side file into `list` when the file opens (emptying the list first).
template <class T, class Parse>
void ReadListFile(const CString& path, CPtrList& list, Parse parse) {
  navmisc::LineReader reader(pf::kMaxLine);
  if (!reader.Open(path)) return;
  DeleteAll<T>(list);
  std::string_view line;
  while (reader.Next(line)) {
    auto* rec = new T(static_cast<const T*>(nullptr));
    parse(line, *rec);
    list.AddTail(rec);
  }
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
  const CString pairs[][2] = {
      {from->GetFilePathName(), GetFilePathName()},
      {from->GetCellIDFilePathName(), GetCellIDFilePathName()},
      {from->GetSOSPointFilePathName(), GetSOSPointFilePathName()},
      {from->GetHeartRateFilePathName(), GetHeartRateFilePathName()},
      {from->GetCyclingCadenceFilePathName(), GetCyclingCadenceFilePathName()},
      {from->GetWheelSpeedFilePathName(), GetWheelSpeedFilePathName()},
  };
  for (const auto& p : pairs) {
    if (!p[0].IsEmpty() && !p[1].IsEmpty() && FileExists(p[0])) CopyFile(p[0], p[1], false);
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
  WriteListFile<WAYPOINT_ITEM_INFO>(GetFilePathName(), points, counter, keepGoing, pf::AppendPointLine);
  if (tracker) {
    if (!cellFixes.IsEmpty())
      WriteListFile<BASE_ITEM_INFO>(GetCellIDFilePathName(), cellFixes, counter, keepGoing, pf::AppendCellFixLine);
    if (!helpPoints.IsEmpty())
      WriteListFile<WAYPOINT_ITEM_INFO>(GetSOSPointFilePathName(), helpPoints, counter, keepGoing, pf::AppendHelpPointLine);
  }
  if (!heartRates.IsEmpty()) {
    WriteListFile<HEARTRATE_ITEM_INFO>(GetHeartRateFilePathName(), heartRates, counter, keepGoing,
        [](std::string& out, const HEARTRATE_ITEM_INFO& r) {
          pf::AppendHeartRateLine(out, r.time, r.values, HEARTRATE_ITEM_INFO::kValues);
        });
  }
  if (!cadences.IsEmpty()) {
    WriteListFile<CYCLING_CADENCE_RPM_ITEM_INFO>(GetCyclingCadenceFilePathName(), cadences, counter, keepGoing,
        [](std::string& out, const CYCLING_CADENCE_RPM_ITEM_INFO& r) {
          pf::AppendHeartRateLine(out, r.time, r.values, CYCLING_CADENCE_RPM_ITEM_INFO::kValues);
        });
  }
  if (!wheelSpeeds.IsEmpty())
    WriteListFile<WHEEL_SPEED_ITEM_INFO>(GetWheelSpeedFilePathName(), wheelSpeeds, counter, keepGoing, pf::AppendWheelSpeedLine);
}

void TRACK_ITEM_INFO::ReadAllWaypoint(int force) {
  // A thinned copy shares its points with the real track: reloading would free them under it.
  if (!ownsPoints_) return;
  if (!force && !points.IsEmpty()) return;
  navmisc::TrackPointReader reader;
  if (reader.Open(*this)) {
    DeleteAll<WAYPOINT_ITEM_INFO>(points);
    WAYPOINT_ITEM_INFO p;
    while (reader.Next(p)) points.AddTail(new WAYPOINT_ITEM_INFO(p));
  }
  // Every loaded track has at least two points (the reader sees to that for what it reads; a
  // list kept because its file is missing gets the same).
  if (points.GetCount() == 1) {
    auto* second = new WAYPOINT_ITEM_INFO(static_cast<WAYPOINT_ITEM_INFO*>(points.GetHead()));
    second->time = static_cast<int32_t>(static_cast<uint32_t>(second->time) + 1u);  // wraps, never overflows
    points.AddTail(second);
  }
  if (trip && trip->appType == GPS_APP_TRACKER) {
    ReadListFile<BASE_ITEM_INFO>(GetCellIDFilePathName(), cellFixes, pf::ParseCellFixLine);
    ReadListFile<WAYPOINT_ITEM_INFO>(GetSOSPointFilePathName(), helpPoints, pf::ParseHelpPointLine);
  }
  ReadListFile<HEARTRATE_ITEM_INFO>(GetHeartRateFilePathName(), heartRates,
      [](std::string_view line, HEARTRATE_ITEM_INFO& r) {
        pf::ParseByteSampleLine(line, r.time, r.values, HEARTRATE_ITEM_INFO::kValues);
      });
  ReadListFile<CYCLING_CADENCE_RPM_ITEM_INFO>(GetCyclingCadenceFilePathName(), cadences,
      [](std::string_view line, CYCLING_CADENCE_RPM_ITEM_INFO& r) {
        pf::ParseByteSampleLine(line, r.time, r.values, CYCLING_CADENCE_RPM_ITEM_INFO::kValues);
      });
  ReadListFile<WHEEL_SPEED_ITEM_INFO>(GetWheelSpeedFilePathName(), wheelSpeeds, pf::ParseWheelSpeedLine);
}
