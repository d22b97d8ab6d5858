#include "navmisc/activity/moving_segments.h"

#include <algorithm>
#include <cmath>
#include <thread>

#include "navmisc/geo/gps_helper.h"

namespace navmisc::activity {
namespace {

constexpr uint8_t kPosition = WAYPOINT_ITEM_INFO::kHasPosition;
constexpr uint8_t kSpeed = WAYPOINT_ITEM_INFO::kHasSpeed;
// Yield the processor after this many pairs.
constexpr size_t kYieldEvery = 1 << 16;

bool Fixed(const ActivityPoint& p) { return p.Has(kPosition); }

// The speed a point reports by itself, metres per hour: the wheel sensor when there is one,
// else the logger's own.
double ReportedSpeed(const ActivityPoint& p) {
  if (p.Has(kSpeed)) return p.speedReading * 3600.0;
  return p.speed;
}

// Straight-line distance in metres on a local flat approximation: for the short spans of the
// speed window, where it agrees with the great circle to far better than the fixes do.
double FlatMetres(const ActivityPoint& a, const ActivityPoint& b) {
  using navmisc::geo::kDegToRad;
  const double x = (b.longitude - a.longitude) * (a.cosLatitude + b.cosLatitude) * 0.5;
  const double y = b.latitude - a.latitude;
  return std::sqrt(x * x + y * y) * kDegToRad * navmisc::geo::kEarthRadiusKm * 1000.0;
}

}  // namespace

int32_t SamplingInterval(const PointVector& points) {
  // The median by counting: steps beyond the longest gap all count as one long step, which
  // gives the same gap limit as their true length would.
  std::vector<uint32_t> counts(kMaxGap + 2, 0);
  size_t steps = 0;
  for (size_t i = 1; i < points.size(); ++i) {
    const int64_t dt = static_cast<int64_t>(points[i].time) - points[i - 1].time;
    if (dt <= 0) continue;
    ++counts[static_cast<size_t>(std::min<int64_t>(dt, kMaxGap + 1))];
    ++steps;
  }
  if (steps == 0) return 1;
  size_t seen = 0;
  for (size_t dt = 1; dt < counts.size(); ++dt) {
    seen += counts[dt];
    if (seen > steps / 2) return static_cast<int32_t>(dt);
  }
  return kMaxGap + 1;
}

std::vector<MovingSegment> BuildMovingSegments(const PointVector& points, const std::vector<double>& legKm) {
  std::vector<MovingSegment> segments;
  // The points that take part, and where the runs between gaps end.
  std::vector<size_t> kept;
  kept.reserve(points.size());
  for (size_t i = 0; i < points.size(); ++i)
    if (points[i].type >= 0) kept.push_back(i);
  if (kept.size() < 2) return segments;
  const int64_t gapLimit = std::min<int64_t>(kMaxGap, static_cast<int64_t>(kGapIntervals) * SamplingInterval(points));
  auto step = [&](size_t j) { return static_cast<int64_t>(points[kept[j]].time) - points[kept[j - 1]].time; };
  auto splits = [&](size_t j) { return step(j) <= 0 || step(j) > gapLimit; };  // pair j ends a run
  std::vector<uint32_t> runEnd(kept.size());
  runEnd.back() = static_cast<uint32_t>(kept.size() - 1);
  for (size_t j = kept.size() - 1; j-- > 0;) runEnd[j] = splits(j + 1) ? static_cast<uint32_t>(j) : runEnd[j + 1];

  bool inSegment = false;
  size_t runStart = 0, lo = 0, hi = 0;  // the speed window, indexes into `kept`
  for (size_t j = 1; j < kept.size(); ++j) {
    if (j % kYieldEvery == 0) std::this_thread::yield();
    const size_t ia = kept[j - 1], ib = kept[j];
    const ActivityPoint& a = points[ia];
    const ActivityPoint& b = points[ib];
    const int64_t dt = step(j);

    // How far the pair went: along the great circle between two fixes, else by the speed the
    // point reports.
    double metres;
    if (Fixed(a) && Fixed(b)) {
      metres = 1000.0 * (ia + 1 == ib ? legKm[ib] : LegKm(a, b));
    } else {
      metres = ReportedSpeed(b) * static_cast<double>(dt) / 3600.0;
    }

    bool moving = false;
    if (dt <= 0 || dt > kMaxGap) {
      runStart = j;  // a repeated time or a break
    } else if (dt > gapLimit) {
      // The fixes stopped for a while: moving only when the owner clearly travelled meanwhile
      // (a tunnel), not when the logger slept through a stop.
      moving = metres / static_cast<double>(dt) * 3600.0 >= kGapMovingSpeed;
      runStart = j;
    } else {
      // Standing still, the fixes wander by metres from second to second; over a window of
      // some seconds around the pair that wander is a small speed, while real motion adds up.
      // The window is centred, so that it starts and ends moving as late as it starts early.
      const int64_t twice = static_cast<int64_t>(a.time) + b.time;  // twice the pair's middle
      lo = std::max(lo, runStart);
      while (lo + 1 < j && 2 * static_cast<int64_t>(points[kept[lo]].time) < twice - kSpeedWindow) ++lo;
      hi = std::max(hi, j);
      while (hi < runEnd[j] && 2 * static_cast<int64_t>(points[kept[hi + 1]].time) <= twice + kSpeedWindow) ++hi;
      const ActivityPoint& w = points[kept[lo]];
      const ActivityPoint& e = points[kept[hi]];
      const double speed = (Fixed(w) && Fixed(e))
                               ? FlatMetres(w, e) / static_cast<double>(e.time - w.time) * 3600.0
                               : ReportedSpeed(b);
      moving = speed >= kMovingSpeed;
    }

    if (moving) {
      if (!inSegment) {
        segments.push_back({static_cast<int32_t>(ia), a.time, 0, 0.0});
        inSegment = true;
      }
      MovingSegment& s = segments.back();
      s.duration += static_cast<int32_t>(dt);
      s.distance += metres;
    } else {
      inSegment = false;
    }
  }
  return segments;
}

MovingTotals SumMovingSegments(const std::vector<MovingSegment>& segments) {
  MovingTotals t;
  for (const MovingSegment& s : segments) {
    t.time += s.duration;
    t.distance += s.distance;
  }
  return t;
}

MovingTotals SumMovingSegments(const std::vector<MovingSegment>& segments, long start, long end) {
  MovingTotals t;
  double distance = 0.0;
  for (const MovingSegment& s : segments) {
    // A segment's pairs follow each other without a pause, so it spans its duration from its
    // start; the range takes the part of that span it covers.
    const long from = std::max<long>(start, s.startTime);
    const long to = std::min<long>(end, static_cast<long>(s.startTime) + s.duration);
    if (to <= from || s.duration <= 0) continue;
    t.time += static_cast<int32_t>(to - from);
    distance += s.distance * static_cast<double>(to - from) / s.duration;
  }
  t.distance = distance;
  return t;
}

}  // namespace navmisc::activity
