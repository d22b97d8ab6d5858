// The cleaning passes over a track's point list (WAYPOINT_ITEM_INFO*, in time order). None of
// them deletes a point: each clears the kept-mark (flags[WAYPOINT_ITEM_INFO::kFlagKept]) of every
// point and sets it again on the points that stay; the caller decides what to do with the rest.
#pragma once

#include "navmisc/platform/lists.h"

// Marks the points that are not bad fixes (long gaps, impossible jumps). Returns the number of
// drops. A list of fewer than 4 entries returns 0 with every mark cleared.
int Revise(CPtrList& points);
// Marks the points that are not part of a stop. Returns the number dropped. A list of fewer than
// 4 entries returns 0 with every mark cleared. The thresholds depend on g_nProductId.
int Reduction(CPtrList& points);
// Douglas-Peucker on the plain coordinates (degrees, no projection): marks the points that carry
// the track's shape at `tolerance` degrees. A tolerance of 0 or less keeps every point. Returns
// the number kept.
int Smooth(CPtrList& points, double tolerance);
