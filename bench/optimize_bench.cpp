// BLOG_ITEM_INFO::OptimizeWaypoint on a noisy 200,000-point track, against the literal method
// (a separate Smooth run for every level from 100 down to 0). Before any timing the two must
// give every point the same level and kept-mark and the trip the same display level; the program
// stops with an error when they do not.
#include <benchmark/benchmark.h>

#include <cstdio>
#include <memory>

#include "../tests/geo_reference.h"
#include "navmisc/records/trip.h"
#include "speedup_reporter.h"

namespace {

constexpr int kPoints = 200000;
constexpr uint32_t kSeed = 20240501;

std::unique_ptr<BLOG_ITEM_INFO> MakeTrip() {
  // A folder name: the trip is not created on disk.
  auto trip = std::make_unique<BLOG_ITEM_INFO>(GPS_APP_TRIP, L"bench-optimize", 0);
  auto* track = new TRACK_ITEM_INFO(trip.get());
  navmisc::testing::AppendNoisyTrack(track->points, kSeed, kPoints);
  trip->tracks.AddTail(track);
  return trip;
}

// Describes the first difference, or returns an empty text.
std::string FirstDifference(BLOG_ITEM_INFO& a, BLOG_ITEM_INFO& b) {
  char text[200];
  if (a.optLevel != b.optLevel) {
    std::snprintf(text, sizeof text, "display level %d against %d", a.optLevel, b.optLevel);
    return text;
  }
  auto* ta = static_cast<TRACK_ITEM_INFO*>(a.tracks.GetHead());
  auto* tb = static_cast<TRACK_ITEM_INFO*>(b.tracks.GetHead());
  if (ta->points.GetCount() != tb->points.GetCount()) return "point counts differ";
  POSITION pa = ta->points.GetHeadPosition(), pb = tb->points.GetHeadPosition();
  for (int i = 0; pa; ++i) {
    auto* p = static_cast<WAYPOINT_ITEM_INFO*>(ta->points.GetNext(pa));
    auto* q = static_cast<WAYPOINT_ITEM_INFO*>(tb->points.GetNext(pb));
    if (p->type != q->type || p->flags[WAYPOINT_ITEM_INFO::kFlagKept] != q->flags[WAYPOINT_ITEM_INFO::kFlagKept]) {
      std::snprintf(text, sizeof text, "point %d: level %d mark %d against level %d mark %d", i,
                    p->type, p->flags[0], q->type, q->flags[0]);
      return text;
    }
  }
  return {};
}

void BM_OptimizeWaypoint(benchmark::State& state) {
  auto trip = MakeTrip();
  for (auto _ : state) {
    int progress = 0;
    bool keepGoing = true;
    trip->OptimizeWaypoint(GPS_APP_TRIP, 1, &progress, &keepGoing);
    benchmark::DoNotOptimize(trip->optLevel);
  }
  state.counters["points"] = kPoints;
}

void BM_OptimizeWaypointLiteral(benchmark::State& state) {
  auto trip = MakeTrip();
  for (auto _ : state) {
    int progress = 0;
    bool keepGoing = true;
    navmisc::testing::OptimizeTripLiterally(*trip, GPS_APP_TRIP, 1, &progress, &keepGoing);
    benchmark::DoNotOptimize(trip->optLevel);
  }
  state.counters["points"] = kPoints;
}

BENCHMARK(BM_OptimizeWaypoint)->Unit(benchmark::kMillisecond)->MinTime(2.0);
BENCHMARK(BM_OptimizeWaypointLiteral)->Unit(benchmark::kMillisecond)->Iterations(3);

}  // namespace

int main(int argc, char** argv) {
  auto fast = MakeTrip(), literal = MakeTrip();
  int fastProgress = 0, literalProgress = 0;
  bool keepGoing = true;
  fast->OptimizeWaypoint(GPS_APP_TRIP, 1, &fastProgress, &keepGoing);
  navmisc::testing::OptimizeTripLiterally(*literal, GPS_APP_TRIP, 1, &literalProgress, &keepGoing);
  std::string diff = FirstDifference(*fast, *literal);
  if (diff.empty() && fastProgress != literalProgress) diff = "progress counters differ";
  if (!diff.empty()) {
    std::fprintf(stderr, "optimize_bench: the levels differ from the literal method: %s\n",
                 diff.c_str());
    return 1;
  }
  std::printf("levels identical to the literal method on %d points (display level %d)\n",
              kPoints, fast->optLevel);
  return navmisc::bench::RunWithSpeedups(
      argc, argv, {{"BM_OptimizeWaypoint/min_time:2.000", "BM_OptimizeWaypointLiteral/iterations:3", 20.0}});
}
