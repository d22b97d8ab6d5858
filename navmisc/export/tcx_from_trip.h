// Builds the TCX activity of a trip: one lap per track, from the track's own points and sensor
// samples (see docs/exported-documents.md).
#pragma once

#include <cstdint>

#include "navmisc/export/tcx_export.h"
#include "navmisc/platform/lists.h"

class BLOG_ITEM_INFO;
class TRACK_ITEM_INFO;

// Fills the working values and presence flags of `track`'s points for the TCX export:
// cumulative great-circle distance (metres) over the points that have a time and a position,
// speed (metres per second, from the stored metres per hour), and heart rate and cadence from
// the track's per-second samples at the point's time, when there is one. Points without a time
// get no flags. Then sums the lap up: start = first point's time, total time = last - first,
// distance, maximum speed, average and maximum heart rate (0 when there are none), and the
// calories of the track as an activity of `sportType` (TCX sport 0 biking, 1 running, 2-7
// other) by the owner in the profile of the trip's application: exercise plus resting energy,
// in whole kilocalories, at least 1 (a lap's calories are required) and at most 65535 (their
// range). Returns false, leaving `lap` alone, when no point of the track has a time.
bool FillTcxLap(TRACK_ITEM_INFO& track, TcxLap& lap, int32_t sportType);

// Replaces `activity`'s laps by one lap per track of `tracks` (TRACK_ITEM_INFO*) that has timed
// points, sets the sport type, and sets the Id to the first lap's start ("YYYY-MM-DDThh:mm:ssZ")
// when there is a lap. Returns the number of laps.
int FillTcxActivity(CPtrList& tracks, int32_t sportType, CTcxActivities& activity);

// FillTcxActivity over the trip's tracks; without any lap the Id is the trip's id. The points
// must be loaded (ReadAllWaypoint) beforehand.
int FillTcxActivity(BLOG_ITEM_INFO& trip, int32_t sportType, CTcxActivities& activity);
