#include "navmisc/export/tcx_from_trip.h"

#include <algorithm>
#include <utility>
#include <vector>

#include "navmisc/activity/activity_points.h"
#include "navmisc/activity/calories.h"
#include "navmisc/activity/detail/per_second.h"
#include "navmisc/export/detail/export_common.h"
#include "navmisc/geo/gps_helper.h"
#include "navmisc/platform/textconv.h"
#include "navmisc/records/items.h"
#include "navmisc/records/track.h"
#include "navmisc/records/trip.h"

namespace {

using navmisc::activity::PerSecond;
constexpr uint8_t kHasPosition = WAYPOINT_ITEM_INFO::kHasPosition;
constexpr uint8_t kHasHeartRate = WAYPOINT_ITEM_INFO::kHasHeartRate;
constexpr uint8_t kHasCadence = WAYPOINT_ITEM_INFO::kHasCadence;
constexpr uint8_t kHasSpeed = WAYPOINT_ITEM_INFO::kHasSpeed;

}  // namespace

bool FillTcxLap(TRACK_ITEM_INFO& track, TcxLap& lap, int32_t sportType) {
  PerSecond<HEARTRATE_ITEM_INFO> heartRates(track.heartRates);
  PerSecond<CYCLING_CADENCE_RPM_ITEM_INFO> cadences(track.cadences);
  CGPSHelper helper;

  const WAYPOINT_ITEM_INFO* previous = nullptr;  // last point with a time and a position
  const WAYPOINT_ITEM_INFO* first = nullptr;
  const WAYPOINT_ITEM_INFO* last = nullptr;
  double distance = 0.0;
  double maxSpeed = 0.0;
  long long heartSum = 0;
  int heartCount = 0;
  int heartMax = 0;
  for (WAYPOINT_ITEM_INFO* p : navmisc::Items<WAYPOINT_ITEM_INFO>(track.points)) {
    if (!p) continue;
    p->workDistance = 0.0;
    p->workSpeed = 0.0;
    p->workHeartRate = 0;
    p->workCadence = 0;
    uint8_t& flags = p->flags[WAYPOINT_ITEM_INFO::kFlagPresence];
    flags = 0;
    if (p->time == -1) continue;

    flags = kHasSpeed;
    if (navmisc::activity::HasFix(*p)) {
      flags |= kHasPosition;
      if (previous) {
        distance += helper.GetDistance(previous->latitude, previous->longitude, p->latitude,
                                       p->longitude, CGPSHelper::DIS_METER);
      }
      previous = p;
    }
    p->workDistance = distance;
    p->workSpeed = p->speed / 3600.0;
    maxSpeed = std::max(maxSpeed, p->workSpeed);
    // 0 is no heart rate a reader accepts: the belt lost contact.
    if (const uint8_t* hr = heartRates.At(p->time); hr && *hr > 0) {
      flags |= kHasHeartRate;
      p->workHeartRate = *hr;
      heartSum += *hr;
      ++heartCount;
      heartMax = std::max<int>(heartMax, *hr);
    }
    if (const uint8_t* cadence = cadences.At(p->time)) {
      flags |= kHasCadence;
      p->workCadence = *cadence;
    }
    if (!first) first = p;
    last = p;
  }
  if (!first) return false;

  lap.startTime = first->time;
  lap.totalTimeSeconds = static_cast<double>(static_cast<int64_t>(last->time) - first->time);
  lap.distanceMeters = distance;
  lap.maximumSpeed = maxSpeed;
  // The TCX sport types 0 and 1 are the sport store's cycling and running; 2 to 7 map onto its
  // fixed-intensity types, 7 being "unknown" there.
  const long smallCalories = navmisc::activity::TrackEnergy(track, sportType);
  lap.calories = static_cast<int32_t>(std::clamp<long>((smallCalories + 500) / 1000, 1, 65535));
  lap.averageHeartRate = heartCount ? static_cast<int32_t>((heartSum + heartCount / 2) / heartCount) : 0;
  lap.maximumHeartRate = heartMax;
  lap.tracks.RemoveAll();
  lap.tracks.AddTail(&track);
  return true;
}

int FillTcxActivity(CPtrList& tracks, int32_t sportType, CTcxActivities& activity) {
  navmisc::DeleteAll<TcxLap>(activity.laps);
  activity.sportType = sportType;
  for (TRACK_ITEM_INFO* track : navmisc::Items<TRACK_ITEM_INFO>(tracks)) {
    if (!track) continue;
    auto* lap = new TcxLap;
    if (FillTcxLap(*track, *lap, sportType)) activity.laps.AddTail(lap);
    else delete lap;
  }
  if (!activity.laps.IsEmpty()) {
    const auto* firstLap = static_cast<const TcxLap*>(activity.laps.GetHead());
    activity.Id = navmisc::FromUtf8Lossy(navmisc::exportdetail::StdTimeTextZ(firstLap->startTime));
  }
  return activity.laps.GetCount();
}

int FillTcxActivity(BLOG_ITEM_INFO& trip, int32_t sportType, CTcxActivities& activity) {
  int laps = FillTcxActivity(trip.tracks, sportType, activity);
  if (laps == 0) activity.Id = trip.tripId;
  return laps;
}
