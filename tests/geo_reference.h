// Reference material shared by the geometry tests and benchmarks: a seeded generator of
// logger-like tracks, and the literal optimisation of a trip (Revise, Reduction, then one Smooth
// run for every level from 100 down to 0) that the library's one-pass levels must match exactly.
// Header-only, so that the benchmarks use it without the test framework.
#pragma once

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <random>
#include <vector>

#include "navmisc/geo/cleaning.h"
#include "navmisc/platform/shared_globals.h"
#include "navmisc/records/trip.h"

namespace navmisc::testing {

// A bare point list that owns its points, for the tests of the passes.
class OwnedPoints {
 public:
  OwnedPoints() = default;
  OwnedPoints(const OwnedPoints&) = delete;
  OwnedPoints& operator=(const OwnedPoints&) = delete;
  ~OwnedPoints() { DeleteAll<WAYPOINT_ITEM_INFO>(list); }

  // Appends a point (speed in metres per hour).
  WAYPOINT_ITEM_INFO* Add(int32_t time, double lat, double lon, int32_t speed = 36000) {
    auto* p = new WAYPOINT_ITEM_INFO(nullptr);
    p->time = time;
    p->latitude = lat;
    p->longitude = lon;
    p->speed = speed;
    list.AddTail(p);
    return p;
  }
  // The positions in the list of the points whose kept-mark is set (or, with false, clear).
  std::vector<int> Marked(bool set = true) const {
    std::vector<int> out;
    int i = 0;
    for (auto* p : navmisc::Items<WAYPOINT_ITEM_INFO>(list)) {
      if (p && (p->flags[WAYPOINT_ITEM_INFO::kFlagKept] != 0) == set) out.push_back(i);
      ++i;
    }
    return out;
  }

  CPtrList list;
};

// Sets the shared product identity (which selects the stop thresholds) for a scope.
class ProductScope {
 public:
  explicit ProductScope(GPS_APP_PROG_TYPE product) : previous_(g_nProductId) { g_nProductId = product; }
  ~ProductScope() { g_nProductId = previous_; }
  ProductScope(const ProductScope&) = delete;
  ProductScope& operator=(const ProductScope&) = delete;

 private:
  GPS_APP_PROG_TYPE previous_;
};

// Positions a given number of metres east and north of 47 N 8 E (degrees).
constexpr double kBaseLat = 47.0, kBaseLon = 8.0;
inline double MetresNorth(double metres) { return kBaseLat + metres / 111194.92664455874; }
inline double MetresEast(double metres) {
  return kBaseLon + metres / (111194.92664455874 * std::cos(kBaseLat * 0.017453292519943295));
}

// Appends `n` new points (owned by whoever owns `points`) of a logger on the move: speeds of 1
// to 30 m/s with slow turns, a fix every 1 to 3 seconds with about 4 m of noise, and now and
// then a stop (fixes scattered around one place, logger speed 0), a wild fix kilometres off, or
// a gap of minutes without fixes. The same seed gives the same points.
inline void AppendNoisyTrack(CPtrList& points, uint32_t seed, int n, int32_t start = 1700000000,
                             double lat = 47.37, double lon = 8.54) {
  constexpr double kMetresPerDegree = 111195.0;
  constexpr double kPi = 3.14159265358979323846;
  std::mt19937 rng(seed);
  std::uniform_real_distribution<double> uni(0.0, 1.0);
  std::normal_distribution<double> gauss(0.0, 1.0);
  double heading = uni(rng) * 360.0, speed = 12.0;
  int32_t time = start;
  int stopLeft = 0;
  for (int i = 0; i < n; ++i) {
    const int dt = 1 + static_cast<int>(uni(rng) * 3.0);
    time += dt;
    if (stopLeft == 0 && uni(rng) < 1.0 / 2000) stopLeft = 30 + static_cast<int>(uni(rng) * 270);
    if (uni(rng) < 1.0 / 3000) time += 120 + static_cast<int>(uni(rng) * 780);
    double noise = 4.0;
    int32_t loggerSpeed = 0;
    if (stopLeft > 0) {
      --stopLeft;
      noise = 3.0;
    } else {
      heading += gauss(rng) * 6.0;
      speed = std::clamp(speed + gauss(rng) * 0.7, 1.0, 30.0);
      const double metres = speed * dt;
      lat += metres * std::cos(heading * kPi / 180) / kMetresPerDegree;
      lon += metres * std::sin(heading * kPi / 180) / (kMetresPerDegree * std::cos(lat * kPi / 180));
      loggerSpeed = static_cast<int32_t>(speed * 3600);
    }
    if (uni(rng) < 1.0 / 1500) noise = 2000.0 + uni(rng) * 3000.0;  // a wild fix
    auto* p = new WAYPOINT_ITEM_INFO(nullptr);
    p->time = time;
    p->latitude = lat + gauss(rng) * noise / kMetresPerDegree;
    p->longitude = lon + gauss(rng) * noise / kMetresPerDegree;
    p->altitude = 400.0 + 20.0 * std::sin(i / 500.0);
    p->speed = loggerSpeed;
    points.AddTail(p);
  }
}

// The optimisation of one track's points, step by step as the trip's optimisation describes
// it, with a separate Smooth run for every level. Returns false when cancelled.
inline bool OptimizeTrackLiterally(TRACK_ITEM_INFO& track, int optimise, int* progress,
                                   bool* keepGoing) {
  constexpr int kKept = WAYPOINT_ITEM_INFO::kFlagKept;
  CPtrList& points = track.points;
  // Gives every point of `list` at `from` (and kept-mark `kept`) the level `to`.
  auto relevel = [](CPtrList& list, bool kept, int from, int to) {
    for (auto* p : navmisc::Items<WAYPOINT_ITEM_INFO>(list)) {
      if (p && (p->flags[kKept] != 0) == kept && p->type == from) p->type = to;
    }
  };
  auto collect = [&points](CPtrList& into) {
    into.RemoveAll();
    for (void* v : points) {
      if (v && static_cast<WAYPOINT_ITEM_INFO*>(v)->type == 10000) into.AddTail(v);
    }
  };
  if (points.GetCount() == 1 && track.OwnsPoints()) {
    auto* twin = new WAYPOINT_ITEM_INFO(static_cast<WAYPOINT_ITEM_INFO*>(points.GetHead()));
    twin->time = static_cast<int32_t>(static_cast<uint32_t>(twin->time) + 1u);
    points.AddTail(twin);
  }
  if (optimise) {
    for (auto* p : navmisc::Items<WAYPOINT_ITEM_INFO>(points)) {
      if (p) p->type = 10000;
    }
    if (points.GetCount() > 50) {
      Revise(points);
      relevel(points, false, 10000, -2);
    }
  }
  if (progress) *progress += 100;
  CPtrList working;
  if (optimise) {
    collect(working);
    if (working.GetCount() > 100) {
      Reduction(working);
      relevel(working, false, 10000, -1);
    }
    collect(working);
  }
  if (progress) *progress += 100;
  for (int k = 100; k >= 0; --k) {
    if (optimise && working.GetCount() > 100) {
      Smooth(working, k * 0.0001);
      relevel(working, true, 10000, k);
    }
    if (progress) *progress += 100;
    if (keepGoing && !*keepGoing) return false;
  }
  return true;
}

// BLOG_ITEM_INFO::OptimizeWaypoint done the literal way.
inline void OptimizeTripLiterally(BLOG_ITEM_INFO& trip, GPS_APP_PROG_TYPE product, int optimise,
                                  int* progress, bool* keepGoing) {
  trip.optLevel = 0;
  for (auto* track : navmisc::Items<TRACK_ITEM_INFO>(trip.tracks)) {
    if (!track) continue;
    if (!OptimizeTrackLiterally(*track, optimise, progress, keepGoing)) return;
    const long limit = product == 1 ? 1000 : 11000;
    int level = 101;
    for (int l = 0; l <= 100 && level == 101; ++l) {
      long atLeast = 0;
      for (auto* p : navmisc::Items<WAYPOINT_ITEM_INFO>(track->points)) atLeast += p && p->type >= l;
      if (atLeast < limit) level = l;
    }
    trip.optLevel = std::max(trip.optLevel, level);
  }
}

}  // namespace navmisc::testing
