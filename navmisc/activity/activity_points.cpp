#include "navmisc/activity/activity_points.h"

#include <algorithm>

#include "navmisc/activity/detail/per_second.h"
#include "navmisc/geo/gps_helper.h"
#include "navmisc/records/track.h"

namespace navmisc::activity {

bool HasFix(const WAYPOINT_ITEM_INFO& p) {
  return !((p.latitude == 0.0 && p.longitude == 0.0) || (p.latitude == 45.0 && p.longitude == 45.0));
}

void MergePoints(const CPtrList& tracks, const CPtrList* heartRates, const CPtrList* cadences,
                 PointVector& out) {
  out.clear();
  size_t total = 0;
  for (const TRACK_ITEM_INFO* t : Items<TRACK_ITEM_INFO>(tracks)) total += t ? t->points.GetCount() : 0;
  out.reserve(total);

  PerSecond<HEARTRATE_ITEM_INFO> hr;
  PerSecond<CYCLING_CADENCE_RPM_ITEM_INFO> cadence;
  PerSecond<WHEEL_SPEED_ITEM_INFO> wheel;
  if (heartRates) hr.Add(*heartRates);
  if (cadences) cadence.Add(*cadences);
  for (const TRACK_ITEM_INFO* t : Items<TRACK_ITEM_INFO>(tracks)) {
    if (!t) continue;
    if (!heartRates) hr.Add(t->heartRates);
    if (!cadences) cadence.Add(t->cadences);
    wheel.Add(t->wheelSpeeds);
    for (const WAYPOINT_ITEM_INFO* p : Items<WAYPOINT_ITEM_INFO>(t->points)) {
      if (!p || p->time == -1) continue;
      // The copy starts with zero working values.
      WAYPOINT_ITEM_INFO& copy = out.emplace_back(*p);
      copy.flags[WAYPOINT_ITEM_INFO::kFlagPresence] =
          (t->hasGpsData && HasFix(*p)) ? WAYPOINT_ITEM_INFO::kHasPosition : 0;
    }
  }
  auto byTime = [](const WAYPOINT_ITEM_INFO& a, const WAYPOINT_ITEM_INFO& b) { return a.time < b.time; };
  if (!std::is_sorted(out.begin(), out.end(), byTime)) std::stable_sort(out.begin(), out.end(), byTime);

  PerSecond<HEARTRATE_ITEM_INFO>::Cursor hrAt(hr);
  PerSecond<CYCLING_CADENCE_RPM_ITEM_INFO>::Cursor cadenceAt(cadence);
  PerSecond<WHEEL_SPEED_ITEM_INFO>::Cursor wheelAt(wheel);
  for (WAYPOINT_ITEM_INFO& p : out) {
    uint8_t& flags = p.flags[WAYPOINT_ITEM_INFO::kFlagPresence];
    // A heart rate of 0 is a belt that lost contact, not a reading.
    if (const uint8_t* v = hrAt.At(p.time); v && *v > 0) {
      flags |= WAYPOINT_ITEM_INFO::kHasHeartRate;
      p.workHeartRate = *v;
    }
    if (const uint8_t* v = cadenceAt.At(p.time)) {
      flags |= WAYPOINT_ITEM_INFO::kHasCadence;
      p.workCadence = *v;
    }
    if (const double* v = wheelAt.At(p.time)) {
      flags |= WAYPOINT_ITEM_INFO::kHasSpeed;
      p.workSpeed = *v;
    }
  }
}

std::vector<double> LegLengthsKm(const PointVector& points) {
  std::vector<double> legs(points.size(), 0.0);
  CGPSHelper helper;
  for (size_t i = 1; i < points.size(); ++i) {
    const WAYPOINT_ITEM_INFO& a = points[i - 1];
    const WAYPOINT_ITEM_INFO& b = points[i];
    legs[i] = helper.GetDistance(a.latitude, a.longitude, b.latitude, b.longitude, CGPSHelper::DIS_KILOMETER);
  }
  return legs;
}

IndexRange FindRange(const PointVector& points, long start, long end, bool skipExcluded) {
  IndexRange r;
  // Points are in time order, so the two walks of the definition start at a binary search.
  auto last = std::upper_bound(points.begin(), points.end(), end,
                               [](long t, const WAYPOINT_ITEM_INFO& p) { return t < p.time; });
  auto first = std::lower_bound(points.begin(), points.end(), start,
                                [](const WAYPOINT_ITEM_INFO& p, long t) { return p.time < t; });
  if (skipExcluded) {
    while (last != points.begin() && std::prev(last)->type < 0) --last;
    while (first != points.end() && first->type < 0) ++first;
  }
  if (last == points.begin() || first == points.end() || first >= last) return r;
  r.first = static_cast<size_t>(first - points.begin());
  r.last = static_cast<size_t>(last - points.begin()) - 1;
  r.empty = false;
  return r;
}

}  // namespace navmisc::activity
