// The merged, time-ordered point list of an activity: copies of the points of every track of a
// trip, each carrying the sensor readings of its second in its working values (see
// docs/activity-stores.md).
#pragma once

#include <vector>

#include "navmisc/platform/lists.h"
#include "navmisc/records/items.h"

namespace navmisc::activity {

using PointVector = std::vector<WAYPOINT_ITEM_INFO>;

// A point without a fix is stored at 0/0, or at 45/45 by loggers that mark sensor-only records
// that way.
bool HasFix(const WAYPOINT_ITEM_INFO& p);

// Replaces `out` by copies of the points of `tracks` (TRACK_ITEM_INFO*) that have a time,
// ordered by time (stable, so equal times keep track order). Each copy's presence flags
// (WAYPOINT_ITEM_INFO::kFlagPresence) say which readings it holds:
//  - kHasPosition: the track has GPS data and the point is not at 0/0 or 45/45;
//  - kHasHeartRate, workHeartRate: a heart-rate sample above 0 at the point's second;
//  - kHasCadence, workCadence: a cadence sample at that second;
//  - kHasSpeed, workSpeed: a wheel-speed sample at that second (metres per second).
// Heart rate and cadence come from `heartRates` and `cadences` when given, else from the
// tracks' own sample lists; wheel speed always from the tracks. The working distance is 0.
void MergePoints(const CPtrList& tracks, const CPtrList* heartRates, const CPtrList* cadences,
                 PointVector& out);

// Length in kilometres of the leg that ends at each point: element i is the great-circle
// distance from point i-1 to point i (whatever their flags), element 0 is 0.
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
