// Writing and reading a 1,000,000-point main point file through the track record, against a
// plain stdio writer and reader of the same line format. Both must make the same bytes and the
// same points; the benchmark stops with an error when they do not.
#include <benchmark/benchmark.h>
#include <sys/resource.h>

#include <cstdio>
#include <cstdlib>
#include <memory>
#include <random>
#include <string>

#include "navmisc/platform/files.h"
#include "navmisc/platform/shared_globals.h"
#include "navmisc/platform/temp_folder.h"
#include "navmisc/records/trip.h"
#include "speedup_reporter.h"

namespace {

constexpr int kPoints = 1000000;

struct Fixture {
  CString root;
  std::unique_ptr<BLOG_ITEM_INFO> trip;
  TRACK_ITEM_INFO* track = nullptr;
  std::string baselinePath;

  Fixture() {
    root = CreateTempFolder(L"navmisc-bench-points");
    navmisc::SetSharedText(g_szAppDataPath, root);
    trip = std::make_unique<BLOG_ITEM_INFO>(GPS_APP_TRIP, L"BENCH", 0);
    MakeDir(trip->GetResourcePath());
    track = new TRACK_ITEM_INFO(trip.get());
    trip->tracks.AddTail(track);
    std::mt19937_64 rng(7);
    std::normal_distribution<double> step(0.0, 0.00002);
    double lat = 25.0, lon = 121.5, alt = 100;
    for (int i = 0; i < kPoints; ++i) {
      auto* p = new WAYPOINT_ITEM_INFO(nullptr);
      lat += step(rng);
      lon += step(rng);
      alt += step(rng) * 1000;
      p->time = 1700000000 + i;
      p->latitude = lat;
      p->longitude = lon;
      p->altitude = alt;
      p->speed = static_cast<int32_t>(rng() % 50000);
      p->type = static_cast<int32_t>(rng() % 102) - 2;
      p->course = static_cast<int32_t>(rng() % 361) - 1;
      track->points.AddTail(p);
    }
    baselinePath = navmisc::NativePath(root) + "/baseline.BIN";
  }
  ~Fixture() { RemoveDir(root, L"*.*"); }
};

Fixture& F() {
  static Fixture f;
  return f;
}

void StdioWrite(const CPtrList& points, const std::string& path) {
  FILE* f = std::fopen(path.c_str(), "wb");
  for (auto* p : navmisc::Items<WAYPOINT_ITEM_INFO>(points)) {
    std::fprintf(f, "%-d,%-lf,%-lf,%-lf,%-d,%-d,%-d,%d,%d\r\n", p->time, p->latitude, p->longitude,
                 p->altitude, p->speed, p->type, p->course, p->extraA, p->extraB);
  }
  std::fclose(f);
}

void StdioRead(CPtrList& points, const std::string& path) {
  FILE* f = std::fopen(path.c_str(), "rb");
  char line[256];
  while (std::fgets(line, sizeof line, f)) {
    auto* p = new WAYPOINT_ITEM_INFO(nullptr);
    std::sscanf(line, "%d,%lf,%lf,%lf,%d,%d,%d,%d,%d", &p->time, &p->latitude, &p->longitude,
                &p->altitude, &p->speed, &p->type, &p->course, &p->extraA, &p->extraB);
    points.AddTail(p);
  }
  std::fclose(f);
}

std::string Slurp(const std::string& path) {
  std::string out;
  FILE* f = std::fopen(path.c_str(), "rb");
  char buf[1 << 16];
  size_t n;
  while ((n = std::fread(buf, 1, sizeof buf, f)) > 0) out.append(buf, n);
  std::fclose(f);
  return out;
}

void BM_WriteAllWaypoint(benchmark::State& state) {
  Fixture& f = F();
  for (auto _ : state) f.trip->WriteAllWaypoint(1, nullptr, nullptr);
  state.SetItemsProcessed(state.iterations() * kPoints);
}

void BM_StdioWrite(benchmark::State& state) {
  Fixture& f = F();
  for (auto _ : state) StdioWrite(f.track->points, f.baselinePath);
  state.SetItemsProcessed(state.iterations() * kPoints);
  if (Slurp(f.baselinePath) != Slurp(navmisc::NativePath(f.track->GetFilePathName())))
    state.SkipWithError("the two writers made different files");
}

void BM_ReadAllWaypoint(benchmark::State& state) {
  Fixture& f = F();
  f.trip->WriteAllWaypoint(1, nullptr, nullptr);
  TRACK_ITEM_INFO reader(f.trip.get());
  reader.id = f.track->id;
  for (auto _ : state) reader.ReadAllWaypoint(1);
  state.SetItemsProcessed(state.iterations() * kPoints);
  // The same points as the records that were written.
  POSITION a = reader.points.GetHeadPosition(), b = f.track->points.GetHeadPosition();
  while (a && b) {
    auto* x = static_cast<WAYPOINT_ITEM_INFO*>(reader.points.GetNext(a));
    auto* y = static_cast<WAYPOINT_ITEM_INFO*>(f.track->points.GetNext(b));
    if (x->time != y->time || x->speed != y->speed || x->type != y->type) {
      state.SkipWithError("read points differ from the written ones");
      return;
    }
  }
}

void BM_StdioRead(benchmark::State& state) {
  Fixture& f = F();
  StdioWrite(f.track->points, f.baselinePath);
  CPtrList points;
  for (auto _ : state) {
    navmisc::DeleteAll<WAYPOINT_ITEM_INFO>(points);
    StdioRead(points, f.baselinePath);
  }
  state.SetItemsProcessed(state.iterations() * kPoints);
  TRACK_ITEM_INFO reader(f.trip.get());
  reader.id = f.track->id;
  reader.ReadAllWaypoint(1);
  POSITION a = reader.points.GetHeadPosition(), b = points.GetHeadPosition();
  while (a && b) {
    if (!(*static_cast<WAYPOINT_ITEM_INFO*>(reader.points.GetNext(a)) ==
          *static_cast<WAYPOINT_ITEM_INFO*>(points.GetNext(b)))) {
      state.SkipWithError("the two readers read different points");
      break;
    }
  }
  if (a || b) state.SkipWithError("the two readers read different numbers of points");
  navmisc::DeleteAll<WAYPOINT_ITEM_INFO>(points);
}

long PeakRssKb() {
  rusage usage{};
  ::getrusage(RUSAGE_SELF, &usage);
  return usage.ru_maxrss;
}

// Reading streams: the memory a read costs is the points it holds, not a copy of the file. Runs
// first, before anything else has raised the process's peak, on a file written line by line.
void BM_ReadMemory(benchmark::State& state) {
  const CString root = CreateTempFolder(L"navmisc-bench-memory");
  navmisc::SetSharedText(g_szAppDataPath, root);
  BLOG_ITEM_INFO trip(GPS_APP_TRIP, L"MEMORY", 0);
  MakeDir(trip.GetResourcePath());
  TRACK_ITEM_INFO track(&trip);
  const std::string path = navmisc::NativePath(track.GetFilePathName());
  FILE* f = std::fopen(path.c_str(), "wb");
  for (int i = 0; i < kPoints; ++i) {
    std::fprintf(f, "%d,%lf,%lf,%lf,%d,%d,%d,0,0\r\n", 1700000000 + i, 25.0 + i * 1e-6,
                 121.5 - i * 1e-6, 100.0 + (i % 1000) * 0.5, i % 50000, i % 102 - 2, i % 361 - 1);
  }
  const double fileBytes = static_cast<double>(std::ftell(f));
  std::fclose(f);
  const long before = PeakRssKb();
  for (auto _ : state) track.ReadAllWaypoint(1);
  const double perPoint = (PeakRssKb() - before) * 1024.0 / kPoints;
  // What holding one point costs at the least: the record and a list node, as the allocator
  // rounds them.
  const double held = (sizeof(WAYPOINT_ITEM_INFO) + 8 + 15) / 16 * 16 + 32;
  state.counters["file_bytes_per_point"] = fileBytes / kPoints;
  state.counters["rss_bytes_per_point"] = perPoint;
  state.counters["held_bytes_per_point"] = held;
  if (track.points.GetCount() != kPoints) state.SkipWithError("unexpected number of points");
  if (perPoint > held + fileBytes / kPoints / 2) state.SkipWithError("reading keeps the file in memory");
  navmisc::DeleteAll<WAYPOINT_ITEM_INFO>(track.points);
  RemoveDir(root, L"*.*");
}

BENCHMARK(BM_ReadMemory)->Unit(benchmark::kMillisecond)->Iterations(1);
BENCHMARK(BM_WriteAllWaypoint)->Unit(benchmark::kMillisecond)->MinTime(2.0);
BENCHMARK(BM_StdioWrite)->Unit(benchmark::kMillisecond)->MinTime(2.0);
BENCHMARK(BM_ReadAllWaypoint)->Unit(benchmark::kMillisecond)->MinTime(2.0);
BENCHMARK(BM_StdioRead)->Unit(benchmark::kMillisecond)->MinTime(2.0);

}  // namespace

int main(int argc, char** argv) {
  return navmisc::bench::RunWithSpeedups(
      argc, argv,
      {{"BM_WriteAllWaypoint/min_time:2.000", "BM_StdioWrite/min_time:2.000", 5},
       {"BM_ReadAllWaypoint/min_time:2.000", "BM_StdioRead/min_time:2.000", 5}});
}
