// The activity stores, each measured against its baseline in the same run:
//  - the summary and calories of a 1,000,000-point activity with heart rate and cadence
//    (PrepareSummaryData, then GetTotalCalorie) against reading the same points from their
//    files: the summary must cost less than the read (speed-up above 1);
//  - reading and writing the store file of a calendar of 10,000 activities against 10,000 bare
//    trip-settings reads: at most ten times their cost (speed-up above 0.1).
#include <benchmark/benchmark.h>

#include <cstdio>
#include <cstdlib>
#include <memory>
#include <random>
#include <string>
#include <vector>

#include "navmisc/activity/sport_store.h"
#include "navmisc/platform/files.h"
#include "navmisc/platform/shared_globals.h"
#include "navmisc/platform/temp_folder.h"
#include "navmisc/records/trip.h"
#include "speedup_reporter.h"

namespace {

constexpr int kPoints = 1000000;
constexpr int kActivities = 10000;
constexpr int32_t kStart = 1714543200;  // 2024-05-01 06:00 UTC

struct Root {
  CString path;
  Root() {
    path = CreateTempFolder(L"navmisc-bench-activity");
    navmisc::SetSharedText(g_szAppDataPath, path);
  }
  ~Root() { RemoveDir(path, L"*.*"); }
};

Root& R() {
  static Root r;
  return r;
}

// A sport trip of `points` one-second fixes of a run at about 3 m/s, with heart rate and
// cadence for every second, saved to its files.
CString SaveRun(int points, int32_t start, int index) {
  BLOG_ITEM_INFO trip(GPS_APP_SPORT, nullptr, index);
  auto* track = new TRACK_ITEM_INFO(&trip);
  trip.tracks.AddTail(track);
  std::mt19937_64 rng(static_cast<uint64_t>(index) + 1);
  std::normal_distribution<double> jitter(0.0, 0.000003);
  double lat = 25.0, lon = 121.5, alt = 20;
  for (int i = 0; i < points; ++i) {
    auto* p = new WAYPOINT_ITEM_INFO(nullptr);
    lat += 0.000027 + jitter(rng);
    lon += jitter(rng);
    alt += jitter(rng) * 10000;
    p->time = start + i;
    p->latitude = lat;
    p->longitude = lon;
    p->altitude = alt;
    p->speed = 10800 + static_cast<int32_t>(rng() % 1000);
    track->points.AddTail(p);
  }
  for (int32_t t = start; t < start + points; t += HEARTRATE_ITEM_INFO::kValues) {
    auto* hr = new HEARTRATE_ITEM_INFO(nullptr);
    auto* cad = new CYCLING_CADENCE_RPM_ITEM_INFO(nullptr);
    hr->time = cad->time = t;
    for (int k = 0; k < HEARTRATE_ITEM_INFO::kValues && t + k < start + points; ++k) {
      hr->values[k] = static_cast<uint8_t>(120 + rng() % 60);
      cad->values[k] = static_cast<uint8_t>(80 + rng() % 10);
    }
    track->heartRates.AddTail(hr);
    track->cadences.AddTail(cad);
  }
  trip.WriteAllWaypoint(1, nullptr, nullptr);
  trip.WriteInfo(1, nullptr, nullptr);
  return trip.tripId;
}

// ---- summary and calories against the read ---------------------------------------------------

struct Run {
  CString id;
  std::unique_ptr<_SportItem> item;
  Run() {
    R();
    id = SaveRun(kPoints, kStart, 0);
    auto* trip = new BLOG_ITEM_INFO(GPS_APP_SPORT, id, 0);
    trip->ReadInfo();
    item = std::make_unique<_SportItem>(SPORT_ITEM_RUNNING, trip);  // loads the points
  }
};

Run& TheRun() {
  static Run r;
  return r;
}

void BM_ReadActivityPoints(benchmark::State& state) {
  const CString id = TheRun().id;
  for (auto _ : state) {
    BLOG_ITEM_INFO trip(GPS_APP_SPORT, id, 0);
    trip.ReadInfo();
    trip.ReadAllWaypoint(0);
    const auto* track = static_cast<const TRACK_ITEM_INFO*>(trip.tracks.GetHead());
    if (track->points.GetCount() != kPoints) state.SkipWithError("the points did not read back");
    benchmark::DoNotOptimize(track->heartRates.GetCount());
  }
}
BENCHMARK(BM_ReadActivityPoints)->Unit(benchmark::kMillisecond)->UseRealTime();

void BM_SummaryAndCalories(benchmark::State& state) {
  _SportItem& item = *TheRun().item;
  long calories = 0;
  for (auto _ : state) {
    item.PrepareSummaryData(nullptr, nullptr);
    calories = item.GetTotalCalorie();
    benchmark::DoNotOptimize(calories);
  }
  if (item.whole.avgHeartRate == 0 || item.whole.avgCadence == 0 || calories <= 0) {
    state.SkipWithError("no heart rate, cadence or calories: the summary did not see the samples");
  }
  state.counters["moving_s"] = item.whole.movingTime;
  state.counters["kcal"] = static_cast<double>(calories) / 1000.0;
}
BENCHMARK(BM_SummaryAndCalories)->Unit(benchmark::kMillisecond)->UseRealTime();

// ---- a calendar of 10,000 activities against bare trip-settings reads -----------------------

struct Calendar {
  std::vector<CString> ids;
  Calendar() {
    R();
    SPORT_DATA_NODE store;
    store.userName = L"bench";
    for (int i = 0; i < kActivities; ++i) {
      // One activity every nine hours, so that months and days fill as a real calendar does.
      ids.push_back(SaveRun(2, kStart + i * 9 * 3600, i));
      auto* trip = new BLOG_ITEM_INFO(GPS_APP_SPORT, ids.back(), 0);
      trip->ReadInfo();
      store.AddSportItem(SPORT_ITEM_TYPE(i % 7), trip);
    }
    store.WriteInfo(false, 0, nullptr);
  }
};

Calendar& TheCalendar() {
  static Calendar c;
  return c;
}

void BM_CalendarStoreReadWrite(benchmark::State& state) {
  TheCalendar();
  for (auto _ : state) {
    SPORT_DATA_NODE store;
    if (store.ReadInfo(0, nullptr) != 1 || !store.readGuard.IsComplete()) state.SkipWithError("the store did not read");
    if (!store.WriteInfo(false, 0, nullptr)) state.SkipWithError("the store did not write");
  }
}
BENCHMARK(BM_CalendarStoreReadWrite)->Unit(benchmark::kMillisecond)->UseRealTime();

void BM_BareTripSettingsReads(benchmark::State& state) {
  const std::vector<CString>& ids = TheCalendar().ids;
  for (auto _ : state) {
    for (const CString& id : ids) {
      BLOG_ITEM_INFO trip(GPS_APP_SPORT, id, 0);
      if (trip.ReadInfo() != 1) state.SkipWithError("a trip did not read");
    }
  }
}
BENCHMARK(BM_BareTripSettingsReads)->Unit(benchmark::kMillisecond)->UseRealTime();

}  // namespace

int main(int argc, char** argv) {
  // The 10,000 trips of the calendar are set up in memory unless TMPDIR says otherwise: on a
  // disk every one of their saves waits for a sync, which makes the set-up take minutes. Both
  // sides of each pair read from the page cache either way.
  if (IsDirectory(L"/dev/shm")) setenv("TMPDIR", "/dev/shm", 0);
  return navmisc::bench::RunWithSpeedups(
      argc, argv,
      {{"BM_SummaryAndCalories/real_time", "BM_ReadActivityPoints/real_time", 1.0},
       {"BM_CalendarStoreReadWrite/real_time", "BM_BareTripSettingsReads/real_time", 0.1}});
}
