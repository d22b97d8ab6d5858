// Moving segments: the stretches of an activity during which its owner was on the move. Moving
// time, moving distance and pace are summed over them. docs/moving-segments.md gives the rule
// and the reasons for it.
#pragma once

#include <cstdint>
#include <vector>

#include "navmisc/activity/activity_points.h"

namespace navmisc::activity {

struct MovingSegment {
  int32_t first = 0;      // index of the segment's first point in the point list
  int32_t startTime = 0;  // that point's time, seconds since 1970 (UTC)
  int32_t duration = 0;   // seconds
  double distance = 0.0;  // metres
};

// The thresholds of the rule.
inline constexpr double kMovingSpeed = 3000.0;      // metres per hour: slower is standing
inline constexpr double kGapMovingSpeed = 10000.0;  // metres per hour across a gap in the fixes
inline constexpr int32_t kMaxGap = 3600;            // seconds: a longer gap is always a break
inline constexpr int32_t kGapIntervals = 20;        // a gap is longer than 20 sampling intervals
inline constexpr int32_t kSpeedWindow = 20;         // seconds around a pair over which its pace is measured

// The moving segments of `points` (in time order). `legKm` are the leg lengths of
// LegLengthsKm. Points with a negative state (type) take no part. Yields the processor now and
// then, so that a long list does not hog it.
std::vector<MovingSegment> BuildMovingSegments(const PointVector& points, const std::vector<double>& legKm);

// The typical time between two fixes: the median of the positive steps (all steps longer than
// kMaxGap counting as kMaxGap + 1), 1 when there are none.
int32_t SamplingInterval(const PointVector& points);

struct MovingTotals {
  int32_t time = 0;       // seconds
  double distance = 0.0;  // metres
};
// Sums every segment.
MovingTotals SumMovingSegments(const std::vector<MovingSegment>& segments);
// Sums the parts of the segments that lie inside [start, end] (UTC seconds): a segment the range
// cuts counts with the time inside it, and with its distance in proportion to that time.
MovingTotals SumMovingSegments(const std::vector<MovingSegment>& segments, long start, long end);

}  // namespace navmisc::activity
