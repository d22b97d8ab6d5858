// Optimisation levels of a track's points (the per-track work of
// BLOG_ITEM_INFO::OptimizeWaypoint, declared with the trip record).
//
// A point's level (WAYPOINT_ITEM_INFO::type): 10000 never dropped by any pass; 100 .. 0 the
// point survives Smooth down to a tolerance of level x 0.0001 degrees (the higher, the more
// essential); -1 dropped by Reduction (a stop); -2 dropped by Revise (a bad fix).
#pragma once

#include <vector>

#include "navmisc/platform/lists.h"
#include "navmisc/platform/types.h"

namespace navmisc {

constexpr int kLevelNeverDropped = 10000;
constexpr int kLevelStop = -1;
constexpr int kLevelBadFix = -2;
constexpr int kSmoothSteps = 100;  // levels 100 .. 0

// The Smooth tolerance (degrees) of level k.
inline double SmoothLevelTolerance(int k) { return k * 0.0001; }

// For every point of `points` (WAYPOINT_ITEM_INFO*, nulls skipped), the largest k in 0 .. 100 at
// which Smooth(points, SmoothLevelTolerance(k)) keeps it, in one Douglas-Peucker pass.
std::vector<int> SmoothKeepLevels(const CPtrList& points);

// Levels the points of one track (a single point first gets a copy one second later, when the
// list owns its points and `ownsPoints` says so). `progress` (may be null) advances by 100 after
// the revise step, after the reduction step and after each of the 101 smoothing steps. Returns
// false, at once, when `*keepGoing` (may be null) is found cleared after a smoothing step; the
// levels set so far stay, and the kept-marks are those that Smooth would have left at that step.
//
// The result is exactly that of running Smooth once per level from 100 down to 0, but the
// Douglas-Peucker split tree is built once: where a range splits does not depend on the
// tolerance, only whether it splits (see douglas_peucker.cpp).
bool OptimizeTrackPoints(CPtrList& points, bool ownsPoints, int optimise, int* progress,
                         bool* keepGoing);

// The display level of a track: the smallest L in 0 .. 100 at which fewer than the limit of
// points (1000 for the trip application, 11000 otherwise) have a level of at least L; 101 when
// none does.
int TrackDisplayLevel(const CPtrList& points, GPS_APP_PROG_TYPE product);

}  // namespace navmisc
