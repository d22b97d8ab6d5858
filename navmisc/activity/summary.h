// The summary figures of an activity over a time range, for the sport and the tracker stores.
#pragma once

#include <cstdint>
#include <vector>

#include "navmisc/activity/activity_points.h"
#include "navmisc/activity/moving_segments.h"

namespace navmisc::activity {

// The figures both stores keep.
struct TrackerFigures {
  int32_t startTime = 0;  // local seconds (UTC + the trip's time shift)
  int32_t endTime = 0;
  int32_t duration = 0;         // seconds, end - start
  double distance = 0.0;        // metres
  double avgSpeed = 0.0;        // metres per hour over the duration
  double maxSpeed = 0.0;        // metres per hour
  double minAltitude = 0.0;     // metres
  double maxAltitude = 0.0;     // metres
  double ascent = 0.0;          // metres
  double descent = 0.0;         // metres
  int32_t pace = 0;             // seconds per kilometre over the moving time
  int32_t movingTime = 0;       // seconds
  double movingDistance = 0.0;  // metres
};

// The sport store adds the moving speed and the sensors.
struct SportFigures : TrackerFigures {
  double movingAvgSpeed = 0.0;  // metres per hour
  int32_t maxHeartRate = 0;     // beats per minute
  int32_t avgHeartRate = 0;
  int32_t maxCadence = 0;       // revolutions per minute
  int32_t avgCadence = 0;
};

// How the two stores measure.
enum class SummaryRules {
  // Legs by position, else by the speed reading; speeds from the readings; ascent and descent
  // count only changes of 2.0 m or more.
  kSport,
  // Legs always by position, speed the logger's, every rise and fall counted.
  kTracker,
};

// Computes `out` over the UTC range [start, end] of `points` (in time order; `legKm` from
// LegLengthsKm) with `moving` summed from the moving segments. The pairs join consecutive
// points whose state is 0 or more; points with a negative state are stepped over. Writes each point's cumulative
// distance (distance) over the range. `timeShift` (seconds) turns the range into the local
// start and end of the figures. `moving.time` is capped at the duration.
void Summarize(PointVector& points, const std::vector<double>& legKm, long start, long end, long timeShift,
               SummaryRules rules, MovingTotals moving, TrackerFigures& out);

// Adds what only the sport store shows: moving average speed, heart rate and cadence (over the
// points in range whatever their state). Call after Summarize.
void SummarizeSensors(const PointVector& points, long start, long end, SportFigures& out);

}  // namespace navmisc::activity
