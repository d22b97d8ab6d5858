// Placing 1,000 photos by time and 1,000 by position on a 100,000-point track with
// MappingGPSAndTrack: the straightforward way (every call builds the track's working array and
// searches it, as the mapping is described) against the same calls inside a TrackMappingScope.
// The scoped answers must equal the straightforward ones to the last bit; the program stops with
// an error when they do not.
#include <benchmark/benchmark.h>

#include <cstdio>
#include <cstring>
#include <memory>
#include <random>
#include <vector>

#include "../tests/geo_reference.h"
#include "navmisc/geo/gps_mapping.h"
#include "speedup_reporter.h"

namespace {

constexpr int kPoints = 100000;
constexpr int kPhotos = 1000;
constexpr double kTolerance = 50.0;  // metres

struct Placement {
  CString trackId;
  double lat = 0, lon = 0, alt = 0;
  long speed = 0, time = 0;
  bool placed = false;

  bool operator==(const Placement& o) const {
    // Bit for bit: the same doubles, not merely close ones.
    return trackId == o.trackId && std::memcmp(&lat, &o.lat, sizeof lat) == 0 &&
           std::memcmp(&lon, &o.lon, sizeof lon) == 0 && std::memcmp(&alt, &o.alt, sizeof alt) == 0 &&
           speed == o.speed && time == o.time && placed == o.placed;
  }
};

struct Fixture {
  BLOG_ITEM_INFO trip{GPS_APP_TRIP, L"bench-placement", 0};
  std::vector<Placement> byTime, byPosition;  // the photos before placement

  Fixture() {
    auto* track = new TRACK_ITEM_INFO(&trip);
    navmisc::testing::AppendNoisyTrack(track->points, 4242, kPoints);
    trip.tracks.AddTail(track);
    std::vector<const WAYPOINT_ITEM_INFO*> fixes;
    for (void* v : track->points) fixes.push_back(static_cast<const WAYPOINT_ITEM_INFO*>(v));
    std::mt19937 rng(17);
    std::uniform_int_distribution<size_t> pick(0, fixes.size() - 1);
    std::normal_distribution<double> offset(0.0, 30.0 / 111195.0);  // about 30 m
    const long first = fixes.front()->time, last = fixes.back()->time;
    std::uniform_int_distribution<long> when(first - 600, last + 600);
    for (int i = 0; i < kPhotos; ++i) {
      Placement t;
      t.time = when(rng);  // a few fall outside the track and stay unplaced
      byTime.push_back(t);
      Placement p;
      const WAYPOINT_ITEM_INFO* f = fixes[pick(rng)];
      p.lat = f->latitude + offset(rng);
      p.lon = f->longitude + offset(rng);
      byPosition.push_back(p);
    }
  }
};

Fixture& F() {
  static Fixture f;
  return f;
}

std::vector<Placement> PlaceAll(const std::vector<Placement>& photos, bool scoped) {
  std::unique_ptr<navmisc::TrackMappingScope> scope;
  if (scoped) scope = std::make_unique<navmisc::TrackMappingScope>();
  std::vector<Placement> out = photos;
  for (Placement& p : out) {
    p.placed = MappingGPSAndTrack(F().trip.tracks, kTolerance, p.trackId, p.lat, p.lon, p.alt,
                                  p.speed, p.time);
  }
  return out;
}

// The straightforward answers, kept by the first benchmark of each pair for the second to check.
std::vector<Placement> g_expected[2];
bool g_mismatch = false;

void Place(benchmark::State& state, bool byPosition, bool scoped) {
  const std::vector<Placement>& photos = byPosition ? F().byPosition : F().byTime;
  std::vector<Placement> result;
  for (auto _ : state) {
    result = PlaceAll(photos, scoped);
    benchmark::DoNotOptimize(result.data());
  }
  std::vector<Placement>& expected = g_expected[byPosition];
  if (!scoped) {
    expected = result;
  } else if (result != expected) {
    g_mismatch = true;
    state.SkipWithError("scoped placements differ from the straightforward ones");
  }
  int placed = 0;
  for (const Placement& p : result) placed += p.placed;
  state.counters["placed"] = placed;
}

BENCHMARK_CAPTURE(Place, ByTimeStraightforward, false, false)->Unit(benchmark::kMillisecond)->Iterations(1);
BENCHMARK_CAPTURE(Place, ByTimeScoped, false, true)->Unit(benchmark::kMillisecond)->MinTime(1.0);
BENCHMARK_CAPTURE(Place, ByPositionStraightforward, true, false)->Unit(benchmark::kMillisecond)->Iterations(1);
BENCHMARK_CAPTURE(Place, ByPositionScoped, true, true)->Unit(benchmark::kMillisecond)->MinTime(1.0);

}  // namespace

int main(int argc, char** argv) {
  const int rc = navmisc::bench::RunWithSpeedups(
      argc, argv,
      {{"Place/ByTimeScoped/min_time:1.000", "Place/ByTimeStraightforward/iterations:1", 5.0},
       {"Place/ByPositionScoped/min_time:1.000", "Place/ByPositionStraightforward/iterations:1", 5.0}});
  if (g_mismatch) {
    std::fprintf(stderr, "placement_bench: scoped placements differ from the straightforward ones\n");
    return 1;
  }
  std::printf("scoped placements identical to the straightforward ones (%d by time, %d by position)\n",
              kPhotos, kPhotos);
  return rc;
}
