// Trip builders shared by the activity tests.
#pragma once

#include <cstdint>
#include <vector>

#include "navmisc/records/track.h"
#include "navmisc/records/trip.h"
#include "record_fixture.h"

namespace navmisc::activitytest {

struct Pt {
  int32_t time;
  double lat;
  double lon;
  double alt = 0.0;
  int32_t speed = 0;  // metres per hour
  int32_t type = 0;   // negative: left out of the statistics
};

// Appends a track of `pts` to `trip` and returns it.
inline TRACK_ITEM_INFO* AddTrack(BLOG_ITEM_INFO& trip, const std::vector<Pt>& pts) {
  auto* track = new TRACK_ITEM_INFO(&trip);
  for (const Pt& p : pts) {
    auto* w = navmisc::testutil::NewPoint(p.time, p.lat, p.lon, p.type);
    w->altitude = p.alt;
    w->speed = p.speed;
    track->points.AddTail(w);
  }
  trip.tracks.AddTail(track);
  return track;
}

// A new trip of `app` (its folder created) with one track of `pts`.
inline BLOG_ITEM_INFO* NewTrip(GPS_APP_PROG_TYPE app, const std::vector<Pt>& pts, int32_t timeShift = 0) {
  auto* trip = new BLOG_ITEM_INFO(app, nullptr, 0);
  trip->timeZoneShift = timeShift;
  AddTrack(*trip, pts);
  return trip;
}

// Writes the trip's settings and point files.
inline BLOG_ITEM_INFO* Saved(BLOG_ITEM_INFO* trip) {
  trip->WriteAllWaypoint(1, nullptr, nullptr);
  trip->WriteInfo(1, nullptr, nullptr);
  return trip;
}

// Heart-rate samples, one a second from `time`.
inline HEARTRATE_ITEM_INFO* HeartRates(int32_t time, const std::vector<uint8_t>& values) {
  auto* hr = new HEARTRATE_ITEM_INFO;
  hr->time = time;
  for (size_t i = 0; i < values.size() && i < HEARTRATE_ITEM_INFO::kValues; ++i) hr->values[i] = values[i];
  return hr;
}

}  // namespace navmisc::activitytest
