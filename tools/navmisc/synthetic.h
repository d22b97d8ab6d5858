// Realistic synthetic trips from a seeded generator, for the demo and for trying the tool out.
#pragma once

#include <cstdint>

class BLOG_ITEM_INFO;
class TRACK_ITEM_INFO;

namespace navmisc::synthetic {

// Every generator draws from its own seeded sequence: the same seed gives the same trip.
// A 30-minute run at one point per second, with heart rate and cadence samples.
void AddRun(BLOG_ITEM_INFO& trip, uint32_t seed, int32_t start);
// A day of a tracker: a point a minute, cell-tower fixes and two help points (tracker trips).
void AddTrackerDay(BLOG_ITEM_INFO& trip, uint32_t seed, int32_t start);
// A journey of several tracks: a drive, a walk in town and back to the car, the same road home
// (it ends where it began).
void AddJourney(BLOG_ITEM_INFO& trip, uint32_t seed, int32_t start);
// One walk with a long stop, a single wild fix (a spike) and a two-hour gap.
void AddStopSpikeGap(BLOG_ITEM_INFO& trip, uint32_t seed, int32_t start);
// A hike as a logger records it, a point every five seconds with a lunch break, into `track`
// (which needs no trip).
void AddHike(TRACK_ITEM_INFO& track, uint32_t seed, int32_t start);

}  // namespace navmisc::synthetic
