#include "navmisc/activity/activity_points.h"

#include <algorithm>
#include <cmath>

#include "navmisc/activity/detail/per_second.h"
#include "navmisc/geo/gps_helper.h"
#include "navmisc/records/track.h"
#include "navmisc/records/trip.h"

namespace navmisc::activity {

namespace {

// Whether the trip's optimisation settings hide a point of mark `type`.
bool Hidden(const BLOG_ITEM_INFO* trip, int32_t type) {
  if (!trip || !trip->optOptimize) return false;
  return (type == -2 && trip->optRevise) || (type == -1 && trip->optRedundance);
}

}  // namespace

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
      ActivityPoint& a = out.emplace_back();
      a.time = p->time;
      a.type = Hidden(t->trip, p->type) ? p->type : 0;
      a.latitude = p->latitude;
      a.longitude = p->longitude;
      a.cosLatitude = std::cos(p->latitude * navmisc::geo::kDegToRad);
      a.altitude = p->altitude;
      a.speed = p->speed;
      a.present = (t->hasGpsData && HasFix(*p)) ? WAYPOINT_ITEM_INFO::kHasPosition : 0;
    }
  }
  auto byTime = [](const ActivityPoint& a, const ActivityPoint& b) { return a.time < b.time; };
  if (!std::is_sorted(out.begin(), out.end(), byTime)) std::stable_sort(out.begin(), out.end(), byTime);

  PerSecond<HEARTRATE_ITEM_INFO>::Cursor hrAt(hr);
  PerSecond<CYCLING_CADENCE_RPM_ITEM_INFO>::Cursor cadenceAt(cadence);
  PerSecond<WHEEL_SPEED_ITEM_INFO>::Cursor wheelAt(wheel);
  for (ActivityPoint& p : out) {
    // A heart rate of 0 is a belt that lost contact, not a reading.
    if (const uint8_t* v = hrAt.At(p.time); v && *v > 0) {
      p.present |= WAYPOINT_ITEM_INFO::kHasHeartRate;
      p.heartRate = *v;
    }
    if (const uint8_t* v = cadenceAt.At(p.time)) {
      p.present |= WAYPOINT_ITEM_INFO::kHasCadence;
      p.cadence = *v;
    }
    if (const double* v = wheelAt.At(p.time)) {
      p.present |= WAYPOINT_ITEM_INFO::kHasSpeed;
      p.speedReading = *v;
    }
  }
}

namespace {

// sin(x) and asin(x) by their series, for |x| below 1e-3 (half-angles of legs up to about
// 12 km), where the first three terms leave an error below 1e-19: the same values as the
// library functions give, at a fraction of their cost. A million legs per summary make it
// matter.
double SmallSin(double x) {
  const double x2 = x * x;
  return x * (1.0 - x2 / 6.0 * (1.0 - x2 / 20.0));
}
double SmallAsin(double x) {
  const double x2 = x * x;
  return x * (1.0 + x2 / 6.0 + x2 * x2 * 3.0 / 40.0);
}
constexpr double kSeriesLimit = 1e-3;

}  // namespace

double LegKm(const ActivityPoint& a, const ActivityPoint& b) {
  using navmisc::geo::kDegToRad;
  using navmisc::geo::kEarthRadiusKm;
  const double halfLat = (b.latitude - a.latitude) * kDegToRad / 2.0;
  const double halfLon = (b.longitude - a.longitude) * kDegToRad / 2.0;
  if (std::fabs(halfLat) >= kSeriesLimit || std::fabs(halfLon) >= kSeriesLimit) {
    return navmisc::geo::HaversineAngle(a.latitude, a.longitude, a.cosLatitude, b.latitude, b.longitude,
                                        b.cosLatitude) *
           kEarthRadiusKm;
  }
  const double sLat = SmallSin(halfLat), sLon = SmallSin(halfLon);
  const double c = 2.0 * SmallAsin(std::sqrt(sLat * sLat + a.cosLatitude * b.cosLatitude * sLon * sLon));
  // Less than a centimetre is rounding noise of the inputs, not a distance.
  return c * 6371000.0 < 0.01 ? 0.0 : c * kEarthRadiusKm;
}

std::vector<double> LegLengthsKm(const PointVector& points) {
  std::vector<double> legs(points.size(), 0.0);
  for (size_t i = 1; i < points.size(); ++i) legs[i] = LegKm(points[i - 1], points[i]);
  return legs;
}

IndexRange FindRange(const PointVector& points, long start, long end, bool skipExcluded) {
  IndexRange r;
  // Points are in time order, so the two walks of the definition start at a binary search.
  auto last = std::upper_bound(points.begin(), points.end(), end,
                               [](long t, const ActivityPoint& p) { return t < p.time; });
  auto first = std::lower_bound(points.begin(), points.end(), start,
                                [](const ActivityPoint& p, long t) { return p.time < t; });
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
