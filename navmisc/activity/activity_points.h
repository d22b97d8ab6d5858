// The merged, time-ordered point list of an activity: what the summaries need of every point of
// a trip's tracks, with the sensor readings of its second (see docs/activity-stores.md).
#pragma once

#include <cstdint>
#include <vector>

#include "navmisc/platform/lists.h"
#include "navmisc/records/items.h"

namespace navmisc::activity {

// One point of an activity. A compact copy of the track point rather than the record itself:
// a million of them are walked several times per summary.
struct ActivityPoint {
  int32_t time = -1;        // seconds since 1970 (UTC)
  int32_t type = 0;         // the point's state: negative = left out of the statistics
  double latitude = 0.0;    // degrees
  double longitude = 0.0;   // degrees
  double cosLatitude = 1.0;  // cosine of the latitude, for the distances
  double altitude = 0.0;    // metres
  int32_t speed = 0;        // the logger's speed, metres per hour
  uint8_t present = 0;      // WAYPOINT_ITEM_INFO::kHas... bits: which readings it holds
  uint8_t heartRate = 0;    // beats per minute, with kHasHeartRate
  uint8_t cadence = 0;      // revolutions per minute, with kHasCadence
  double speedReading = 0.0;  // the wheel sensor's metres per second, with kHasSpeed
  double distance = 0.0;      // cumulative metres over a summary's range, written by Summarize

  bool Has(uint8_t bit) const { return present & bit; }
};

using PointVector = std::vector<ActivityPoint>;

// A point without a fix is stored at 0/0, or at 45/45 by loggers that mark sensor-only records
// that way.
bool HasFix(const WAYPOINT_ITEM_INFO& p);

// Replaces `out` by the points of `tracks` (TRACK_ITEM_INFO*) that have a time, ordered by
// time (stable, so equal times keep track order). A point keeps its optimisation mark as its
// state when its trip hides points so marked (the trip's optimise switch and its revise switch
// for -2, its redundance switch for -1); otherwise its state is 0. Each point's `present` bits
// say which readings it holds:
//  - kHasPosition: the track has GPS data and the point is not at 0/0 or 45/45;
//  - kHasHeartRate: a heart-rate sample above 0 at the point's second;
//  - kHasCadence: a cadence sample at that second;
//  - kHasSpeed: a wheel-speed sample at that second.
// Heart rate and cadence come from `heartRates` and `cadences` when given, else from the
// tracks' own sample lists; wheel speed always from the tracks.
void MergePoints(const CPtrList& tracks, const CPtrList* heartRates, const CPtrList* cadences,
                 PointVector& out);

// CGPSHelper::GetDistance in kilometres between two points (to within 1e-15 of it).
double LegKm(const ActivityPoint& a, const ActivityPoint& b);

// Length in kilometres of the leg that ends at each point: element i is the great-circle
// distance from point i-1 to point i (whatever their flags), by LegKm; element 0 is 0.
std::vector<double> LegLengthsKm(const PointVector& points);

// Indexes [first, last] of the points inside a time range; empty when none.
struct IndexRange {
  size_t first = 0;
  size_t last = 0;
  bool empty = true;
};
// The last point is the newest one with time <= `end`, the first the oldest with time >=
// `start`; with `skipExcluded` both must also have a state (type) of 0 or more. Points must be
// in time order.
IndexRange FindRange(const PointVector& points, long start, long end, bool skipExcluded);

}  // namespace navmisc::activity
