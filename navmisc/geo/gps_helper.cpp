#include "navmisc/geo/gps_helper.h"

#include <algorithm>
#include <cmath>
#include <vector>

#include "navmisc/geo/trace.h"
#include "navmisc/platform/shared_globals.h"

using navmisc::geo::kDegToRad;
using navmisc::geo::kRadToDeg;
using navmisc::geo::HaversineAngle;

namespace navmisc::geo {

UnitVector ToUnitVector(double lat, double lon) {
  const double la = lat * kDegToRad;
  const double lo = lon * kDegToRad;
  const double c = std::cos(la);
  return {c * std::cos(lo), c * std::sin(lo), std::sin(la)};
}

namespace {

UnitVector Cross(const UnitVector& a, const UnitVector& b) {
  return {a.y * b.z - a.z * b.y, a.z * b.x - a.x * b.z, a.x * b.y - a.y * b.x};
}

double Dot(const UnitVector& a, const UnitVector& b) { return a.x * b.x + a.y * b.y + a.z * b.z; }

}  // namespace

// atan2 of the sine and cosine stays accurate for tiny and for nearly opposite directions,
// where acos or a chord's asin lose their digits.
double AngleBetween(const UnitVector& a, const UnitVector& b) {
  const UnitVector c = Cross(a, b);
  return std::atan2(std::sqrt(Dot(c, c)), Dot(a, b));
}

// The nearest point of the great circle through a and b is p's projection onto the circle's
// plane; when that lies outside the arc, the nearer end is the nearest point.
double SegmentDistanceKm(const UnitVector& a, const UnitVector& b, const UnitVector& p,
                         double* where) {
  const UnitVector n = Cross(a, b);
  const double nn = Dot(n, n);
  // Outside the arc (or without a circle: equal ends, or p at the circle's pole, where every
  // point of the circle is equally far) the nearer end answers.
  auto nearerEnd = [&] {
    const double toA = AngleBetween(p, a), toB = AngleBetween(p, b);
    if (where) *where = toB < toA ? 1.0 : 0.0;
    return (toB < toA ? toB : toA) * kEarthRadiusKm;
  };
  if (nn == 0.0) return nearerEnd();
  const double k = Dot(p, n) / nn;
  UnitVector q{p.x - k * n.x, p.y - k * n.y, p.z - k * n.z};
  const double qq = Dot(q, q);
  if (qq == 0.0 || !(Dot(Cross(a, q), n) >= 0.0 && Dot(Cross(q, b), n) >= 0.0)) return nearerEnd();
  const double len = std::sqrt(qq);
  q = {q.x / len, q.y / len, q.z / len};
  if (where) {
    const double arc = AngleBetween(a, b);
    *where = arc > 0.0 ? std::min(1.0, AngleBetween(a, q) / arc) : 0.0;
  }
  return AngleBetween(p, q) * kEarthRadiusKm;
}

// The central angle (radians) between two positions by the haversine formula, with the cosines
// of both latitudes supplied by the caller. 0 for identical positions, and for positions less
// than a centimetre apart: that difference is rounding noise of the inputs, not a distance.
double HaversineAngle(double lat1, double lon1, double cosLat1, double lat2, double lon2,
                      double cosLat2) {
  if (lat1 == lat2 && lon1 == lon2) return 0.0;
  const double dLat = (lat2 - lat1) * kDegToRad;
  const double dLon = (lon2 - lon1) * kDegToRad;
  const double a = std::pow(std::sin(dLat / 2.0), 2.0) +
                   cosLat1 * cosLat2 * std::pow(std::sin(dLon / 2.0), 2.0);
  const double c = 2.0 * std::atan2(std::sqrt(a), std::sqrt(1.0 - a));
  return c * 6371000.0 < 0.01 ? 0.0 : c;
}

}  // namespace navmisc::geo

namespace {

double RadiusOf(CGPSHelper::DIS_UNIT unit) {
  switch (static_cast<int>(unit)) {
    case CGPSHelper::DIS_MILE: return 3956.0;
    case CGPSHelper::DIS_NAUTICAL_MILE: return 3437.7;
    case CGPSHelper::DIS_KILOMETER: return 6371.0;
    case CGPSHelper::DIS_METER: return 6371000.0;
    default: return 0.0;
  }
}

// Truncation toward zero of a pixel distance. A distance that is not a number (a NaN
// coordinate) lands on the left or top edge rather than in undefined behaviour.
long TruncatePixels(double metres) {
  return std::isfinite(metres) ? static_cast<long>(metres) : 0L;
}

}  // namespace

CGPSHelper::~CGPSHelper() = default;

double CGPSHelper::GetDistance(double lat1, double lon1, double lat2, double lon2, DIS_UNIT unit) {
  return HaversineAngle(lat1, lon1, std::cos(lat1 * kDegToRad), lat2, lon2,
                        std::cos(lat2 * kDegToRad)) *
         RadiusOf(unit);
}

// GetDistance in kilometres between records of one array, as the cleaning passes measure them:
// the cosine of every latitude is taken once per array instead of twice per distance, and the
// lengths of the legs between neighbours can be kept for a later look. The arithmetic is
// GetDistance's own, so every result is the same to the last bit.
class CGPSHelper::RecordDistances {
 public:
  RecordDistances(const sWayPoint* points, int count)
      : points_(points), cos_(static_cast<size_t>(std::max(count, 0))) {
    for (int i = 0; i < count; ++i) cos_[i] = std::cos(points[i].latitude * kDegToRad);
  }

  double Km(int from, int to) const {
    const sWayPoint& a = points_[from];
    const sWayPoint& b = points_[to];
    return HaversineAngle(a.latitude, a.longitude, cos_[from], b.latitude, b.longitude,
                          cos_[to]) *
           RadiusOf(DIS_KILOMETER);
  }
  double Metres(int from, int to) const { return Km(from, to) * 1000.0; }

  // The sum of Km(i - 1, i) over the array, added up in order; the legs are kept for Leg.
  double SumOfLegsKm() {
    legs_.assign(cos_.size(), 0.0);
    double sum = 0.0;
    for (size_t i = 1; i < legs_.size(); ++i) {
      legs_[i] = Km(static_cast<int>(i) - 1, static_cast<int>(i));
      sum += legs_[i];
    }
    return sum;
  }
  // Km(i - 1, i).
  double LegKm(int i) const { return legs_.empty() ? Km(i - 1, i) : legs_[i]; }

 private:
  const sWayPoint* points_;
  std::vector<double> cos_;
  std::vector<double> legs_;
};

double CGPSHelper::GetInitialBearing(double lat1, double lon1, double lat2, double lon2) {
  if (lat1 == lat2 && lon1 == lon2) return 0.0;
  const double la1 = lat1 * kDegToRad, la2 = lat2 * kDegToRad;
  const double dLon = (lon2 - lon1) * kDegToRad;
  const double theta =
      std::atan2(std::sin(dLon) * std::cos(la2),
                 std::cos(la1) * std::sin(la2) - std::sin(la1) * std::cos(la2) * std::cos(dLon)) *
      kRadToDeg;
  if (std::isnan(theta)) return 0.0;  // a NaN coordinate has no direction to truncate
  // Whole degrees on purpose: the fraction is truncated after the shift into 0..720.
  return static_cast<double>(static_cast<int>(theta + 360.0) % 360);
}

void CGPSHelper::GetMidiPoint(double lat1, double lon1, double lat2, double lon2, double& lat,
                              double& lon) {
  const double la1 = lat1 * kDegToRad, la2 = lat2 * kDegToRad;
  const double dLon = (lon2 - lon1) * kDegToRad;
  const double bx = std::cos(la2) * std::cos(dLon);
  const double by = std::cos(la2) * std::sin(dLon);
  const double cx = std::cos(la1) + bx;
  lat = std::atan2(std::sin(la1) + std::sin(la2), std::sqrt(cx * cx + by * by)) * kRadToDeg;
  lon = (lon1 * kDegToRad + std::atan2(by, cx)) * kRadToDeg;
}

void CGPSHelper::GetDestinationPoint(double lat, double lon, double bearing, double distance,
                                     double& lat2, double& lon2) {
  lat2 = 0.0;
  lon2 = 0.0;
  const double delta = distance * 0.0001569612305760477;  // km over a 6371 km radius
  const double theta = bearing * kDegToRad;
  const double la1 = lat * kDegToRad;
  const double la2 =
      std::asin(std::cos(theta) * std::cos(la1) * std::sin(delta) + std::sin(la1) * std::cos(delta));
  const double lo2 = lon * kDegToRad + std::atan2(std::sin(theta) * std::cos(la1) * std::sin(delta),
                                                  std::cos(delta) - std::sin(la2) * std::sin(la1));
  lat2 = la2 * kRadToDeg;
  lon2 = lo2 * kRadToDeg;
}

void CGPSHelper::GetPointBetween2Point(double lat1, double lon1, double lat2, double lon2,
                                       double distance, double& lat, double& lon) {
  lat = 0.0;
  lon = 0.0;
  const double bearing = GetInitialBearing(lat1, lon1, lat2, lon2);
  GetDestinationPoint(lat1, lon1, bearing, distance * 0.001, lat, lon);
}

double CGPSHelper::_GetMinDistance(double lat1, double lon1, double lat2, double lon2, double lat,
                                   double lon, double* where) {
  using namespace navmisc::geo;
  return SegmentDistanceKm(ToUnitVector(lat1, lon1), ToUnitVector(lat2, lon2),
                           ToUnitVector(lat, lon), where);
}

double CGPSHelper::GetMinDistance(const sWayPoint* points, int count, double lat, double lon,
                                  double* where) {
  if (!points || count < 1) return -1.0;
  if (count == 1) {
    return _GetMinDistance(points[0].latitude, points[0].longitude, points[0].latitude,
                           points[0].longitude, lat, lon, where);
  }
  double best = 0.0, bestWhere = 0.0;
  for (int i = 0; i + 1 < count; ++i) {
    double w = 0.0;
    const double d = _GetMinDistance(points[i].latitude, points[i].longitude,
                                     points[i + 1].latitude, points[i + 1].longitude, lat, lon, &w);
    if (i == 0 || d < best) {
      best = d;
      bestWhere = w;
    }
  }
  if (where) *where = bestWhere;
  return best;
}

void CGPSHelper::MappingToXY(const sWayPoint* points, int& count, CPoint* screen, long& size,
                             long margin, double* deviation, double* scaleOut) {
  if (!points || count < 1) return;
  const int n = count;
  const double firstLat = points[0].latitude, firstLon = points[0].longitude;
  const double lastLat = points[n - 1].latitude, lastLon = points[n - 1].longitude;
  double maxLat = points[0].latitude, minLon = points[0].longitude, maxDev = 0.0;
  for (int i = 0; i < n; ++i) {
    const double lat = points[i].latitude, lon = points[i].longitude;
    maxLat = std::max(maxLat, lat);
    minLon = std::min(minLon, lon);
    if (i > 0) {
      maxDev = std::max(maxDev,
                        _GetMinDistance(firstLat, firstLon, lastLat, lastLon, lat, lon, nullptr));
    }
  }
  long maxX = 0, maxY = 0;
  for (int i = 0; i < n; ++i) {
    const double lat = points[i].latitude, lon = points[i].longitude;
    screen[i].x = TruncatePixels(GetDistance(lat, minLon, lat, lon, DIS_METER));
    screen[i].y = TruncatePixels(GetDistance(maxLat, lon, lat, lon, DIS_METER));
    maxX = std::max(maxX, screen[i].x);
    maxY = std::max(maxY, screen[i].y);
  }
  const long extent = std::max(maxX, maxY);
  double scale = 1.0;
  // With a size of 0 or less the coarsening below could never make the track fit (0 / scale
  // stays 0), so such a request is served at one metre per pixel like a small track.
  if (size > 0 && extent >= size) {
    while (static_cast<long>(extent / scale) >= size) scale += 0.2;
  } else {
    size = extent + 2 * margin;
  }
  for (int i = 0; i < n; ++i) {
    screen[i].x = static_cast<long>(screen[i].x / scale) + margin;
    screen[i].y = static_cast<long>(screen[i].y / scale) + margin;
  }
  if (deviation) *deviation = maxDev * 1000.0 / scale + 0.5;
  if (scaleOut) *scaleOut = scale;
}

uint32_t CGPSHelper::_GetTimeDurationSec(long a, long b) {
  return static_cast<uint32_t>(static_cast<unsigned long>(b) - static_cast<unsigned long>(a));
}

long CGPSHelper::_GetTimeDurationSec(const COleDateTime& a, const COleDateTime& b) {
  return std::lround((b - a) * 86400.0);
}

// ---- cleaning passes -------------------------------------------------------------------------

int CGPSHelper::Revise(sWayPoint* points, int& count) {
  if (!points || count <= 4) return 0;
  int dropped = _Revise_by_interval(points, count, 5.0);
  dropped += _Revise_max_acceleration(points, count, 33.333333333333336);  // 120 km/h
  return dropped;
}

int CGPSHelper::_Revise_by_interval(sWayPoint* points, int& count, double factor) {
  if (!points || count - 1 < 2) return 0;
  int64_t sum = 0;
  for (int i = 1; i < count; ++i) sum += int64_t{points[i].time} - points[i - 1].time;
  const double limit = static_cast<double>(sum) / (count - 1) * factor;
  int dropped = 0;
  // The first and the last point are never dropped.
  for (int i = 1; i <= count - 2; ++i) {
    if (static_cast<double>(int64_t{points[i].time} - points[i - 1].time) > limit) {
      points[i].valid = 0;
      ++dropped;
    }
  }
  return dropped;
}

int CGPSHelper::_Revise_max_acceleration(sWayPoint* points, int& count, double speedLimit) {
  if (!points || count < 2) return 0;
  const RecordDistances distances(points, count);
  auto speed = [&](int from, int to) {
    return distances.Metres(from, to) /
           static_cast<double>(_GetTimeDurationSec(points[from].time, points[to].time));
  };
  int prev = 0, i = 1, dropped = 0;
  while (i < count) {
    if (!(speed(prev, i) > speedLimit)) {
      prev = i;
      ++i;
      continue;
    }
    if (i >= count - 1) {
      points[i].valid = 0;  // a fast last point has nothing after it to vouch for it
      return dropped + 1;
    }
    bool spike = false;
    for (int k = 1; k <= 3 && !spike; ++k) {
      if (i + k < count - 1 && speed(i + k - 1, i + k) < speedLimit) spike = true;
    }
    if (spike) {
      points[i].valid = 0;
      ++dropped;
      prev = i + 1;
      i += 2;
    } else {
      prev = i;
      ++i;
    }
  }
  return dropped;
}

int CGPSHelper::Reduce(sWayPoint* points, int& count) {
  const bool sport = g_nProductId == GPS_APP_SPORT;
  double leave = sport ? 3.0 : 50.0;
  RecordDistances distances(points, points ? count : 0);
  if (points && count > 50) {
    // A densely logged track would otherwise hide its slow sections inside the leave radius.
    const double meanLeg = distances.SumOfLegsKm() / (count - 1) * 1000.0;
    if (meanLeg < leave) leave = meanLeg;
  }
  const double ret = sport ? 0.5 : 6.0;
  // The stop pass measures the same legs again: it gets them from `distances`.
  return StopWalk(points, count, 0.6, ret, leave, false, distances);
}

int CGPSHelper::_Reduce_Stop_To_Move(sWayPoint* points, int& count, double stopSpeed,
                                     double returnRadius, double leaveRadius) {
  return StopWalk(points, count, stopSpeed, returnRadius, leaveRadius, false,
                  RecordDistances(points, points ? count : 0));
}

int CGPSHelper::_Revise_Stop_To_Move(sWayPoint* points, int& count, double stopSpeed,
                                     double returnRadius, double leaveRadius) {
  return StopWalk(points, count, stopSpeed, returnRadius, leaveRadius, true,
                  RecordDistances(points, points ? count : 0));
}

int CGPSHelper::StopWalk(sWayPoint* points, int count, double stopSpeed, double returnRadius,
                         double leaveRadius, bool reviseTexts, const RecordDistances& distances) {
  if (!points || count < 6) return 0;
  bool stopped = false;
  int r = 0, stop = 0, dropped = 0;
  for (int i = 1; i < count - 1; ++i) {  // the last point is never looked at
    if (!stopped) {
      // The reference is always the point just before: r follows one behind, and a point that
      // starts moving becomes the reference of the next one.
      const double d = distances.LegKm(i) * 1000.0;
      const uint32_t t = _GetTimeDurationSec(points[r].time, points[i].time);
      // A zero time step gives an infinite speed for a move and NaN (a stop) for no move.
      const double v = d / static_cast<double>(t);
      navmisc::GeoTrace("\nPt%d -> Pt%d = %.6f, time = %ds, speed = %.6f", r, i, d,
                        static_cast<int>(t), v);
      if (!(v > stopSpeed) || points[i].speed <= 0) {
        stopped = true;
        stop = i;
        navmisc::GeoTrace("\nStop point = %d", i);
      }
      ++r;
      continue;
    }
    const double d = distances.Metres(stop, i);
    if (d < leaveRadius || points[i].speed < 1) {
      if (reviseTexts) {
        navmisc::GeoTrace("\nptStop -> pt%d = %.6f < %.6f, Still Stop point", i, d, leaveRadius);
      } else {
        navmisc::GeoTrace("\nptStop -> pt%d = %.6f < %.6f, Still Stop point , Draw out.", i, d,
                          leaveRadius);
      }
      points[i].valid = 0;
      ++dropped;
      continue;
    }
    navmisc::GeoTrace("\nptStop -> pt%d = %.6f > %.6f, May be start moving point", i, d,
                      leaveRadius);
    int ahead = 3;
    if (i + 3 > count - 1) {
      ahead = i - count + 4;
      if (ahead < 1) break;
    }
    bool staying = false;
    for (int j = i + 1; j <= i + ahead && j <= count - 1; ++j) {  // never past the last point
      const double dj = distances.Metres(stop, j);
      navmisc::GeoTrace(reviseTexts ? "\nptStop -> pt%d = %.6f" : "\n\tptStop -> pt%d = %.6f", j,
                        dj);
      if (!(dj > returnRadius) || !(dj > d)) staying = true;
    }
    // Only the earlier form names its decision after the look-ahead.
    if (staying) {
      if (reviseTexts) navmisc::GeoTrace("\nInvalidate point = %d", i);
      points[i].valid = 0;
      ++dropped;
    } else {
      if (reviseTexts) navmisc::GeoTrace("\nStart Moving point = %d", i);
      stopped = false;
      r = i;
    }
  }
  return dropped;
}

void CGPSHelper::_Arrange(sWayPoint* points, int& count) {
  if (!points || count < 1) return;
  int kept = 0;
  for (int i = 0; i < count; ++i) {
    if (points[i].valid) points[kept++] = points[i];
  }
  for (int i = kept; i < count; ++i) points[i] = sWayPoint{};
  count = kept;
}

double GetGpsDistance(double a, double b, double /*c*/, double d) {
  CGPSHelper helper;
  return helper.GetDistance(a, b, a, d, CGPSHelper::DIS_KILOMETER);
}
