// ExportGpx of a 1,000,000-point track (and 100 photos) against a plain stdio writer that makes
// the same bytes with one fprintf per element. The benchmark stops with an error when the two
// documents differ, and prints the speed ratio at the end (target: at least 3x).
//
// `gpx_export_bench --write-trip=DIR` instead saves the same track as a trip under the data
// root DIR and prints its id, for bench/export_vs_gpsbabel.sh.
#include <benchmark/benchmark.h>

#include <cmath>
#include <cstdio>
#include <cstring>
#include <ctime>
#include <fstream>
#include <iterator>
#include <map>
#include <memory>
#include <random>
#include <string>

#include "navmisc/export/gpx_export.h"
#include "navmisc/platform/files.h"
#include "navmisc/platform/shared_globals.h"
#include "navmisc/platform/temp_folder.h"
#include "navmisc/platform/textconv.h"
#include "navmisc/records/trip.h"

namespace {

constexpr int kPoints = 1000000;
constexpr int kPhotos = 100;

// Laps of a 3 km loop, one point a second from 2023-11-14 22:13:20 UTC (so that the times
// cross days), with a few metres of noise on every fix as a logger records it.
void AddTrack(BLOG_ITEM_INFO& trip) {
  auto* track = new TRACK_ITEM_INFO(&trip);
  track->description = L"Bench walk \u00fcber Land";
  trip.tracks.AddTail(track);
  std::minstd_rand noise(11);
  auto jitter = [&noise](double metres) { return (static_cast<double>(noise() % 2001) - 1000.0) / 1000.0 * metres; };
  constexpr double kDegreesPerMetre = 1.0 / 111195.0;
  constexpr double kRadius = 3000.0 / (2 * 3.141592653589793);  // metres
  for (int i = 0; i < kPoints; ++i) {
    const double angle = i * 1.4 / kRadius;  // 1.4 m/s
    auto* p = new WAYPOINT_ITEM_INFO(nullptr);
    p->time = 1700000000 + i;
    p->latitude = 47.37 + (kRadius * std::sin(angle) + jitter(4)) * kDegreesPerMetre;
    p->longitude = 8.54 + (kRadius * std::cos(angle) + jitter(4)) * kDegreesPerMetre / 0.6769;
    p->altitude = 410 + 15 * std::sin(angle * 3) + jitter(2);
    p->speed = static_cast<int32_t>(5040 + jitter(1500));
    track->points.AddTail(p);
  }
}

struct Fixture {
  CString root;
  std::unique_ptr<BLOG_ITEM_INFO> trip;
  std::string ours, baseline;

  Fixture() {
    root = CreateTempFolder(L"navmisc-bench-gpx");
    navmisc::SetSharedText(g_szAppDataPath, root);
    trip = std::make_unique<BLOG_ITEM_INFO>(GPS_APP_TRIP, L"BENCH", 0);
    AddTrack(*trip);
    for (int i = 0; i < kPhotos; ++i) {
      auto* photo = new PHOTO_ITEM_INFO(trip.get(), nullptr, nullptr, nullptr);
      photo->title = L"Photo \u2615 " + CString(std::to_wstring(i));
      photo->description = L"line one\r\nline two";
      photo->latitude = 25.0 + i * 0.001;
      photo->longitude = 121.5 - i * 0.001;
      photo->altitude = i * 1.5;
      photo->playbackTime = i % 3 == 0 ? 0 : 1700000000 + i * 60;
      trip->photos.AddTail(photo);
    }
    ours = navmisc::NativePath(root) + "/ours.gpx";
    baseline = navmisc::NativePath(root) + "/baseline.gpx";
  }
  ~Fixture() { RemoveDir(root, L"*.*"); }
};

Fixture& F() {
  static Fixture f;
  return f;
}

// The straightforward writer: one formatted write per element, the time from gmtime_r.
void StdioGpx(BLOG_ITEM_INFO& trip, const std::string& path) {
  FILE* f = std::fopen(path.c_str(), "wb");
  std::fprintf(f,
               "<?xml version=\"1.0\" encoding=\"UTF-8\" standalone=\"yes\" ?>\r\n<gpx creator=\"Corvane "
               "https://navmisc.example.org/1.1\" version=\"1.0\" xmlns=\"http://www.topografix.com/GPX/1/0\" "
               "xmlns:xsi=\"http://www.w3.org/2001/XMLSchema-instance\" "
               "xsi:schemaLocation=\"http://www.topografix.com/GPX/1/0 "
               "http://www.topografix.com/GPX/1/0/gpx.xsd\">");
  auto timeText = [](int32_t t, char* buf) {
    std::time_t tt = t;
    std::tm tm;
    gmtime_r(&tt, &tm);
    std::strftime(buf, 32, "%Y-%m-%dT%H:%M:%SZ", &tm);
  };
  char title[2048], desc[2048], when[32];
  for (auto* p : navmisc::Items<PHOTO_ITEM_INFO>(trip.photos)) {
    CString d = p->description;
    d.Replace(L"\r\n", L"&#13;");
    WCSToMBS(p->title, title, sizeof title);
    WCSToMBS(d, desc, sizeof desc);
    if (p->playbackTime == 0 || p->playbackTime == -1) {
      std::fprintf(f,
                   "\r\n<wpt lat=\"%.6f\" lon=\"%.6f\">\r\n<ele>%.6f</ele>\r\n<name>%s</name>\r\n<desc>%s</desc>"
                   "\r\n<sym>Waypoint</sym>\r\n</wpt>",
                   p->latitude, p->longitude, p->altitude, title, desc);
    } else {
      timeText(p->playbackTime, when);
      std::fprintf(f,
                   "\r\n<wpt lat=\"%.6f\" lon=\"%.6f\">\r\n<ele>%.6f</ele>\r\n<time>%s</time>\r\n<name>%s</name>"
                   "\r\n<desc>%s</desc>\r\n<sym>Waypoint</sym>\r\n</wpt>",
                   p->latitude, p->longitude, p->altitude, when, title, desc);
    }
  }
  for (auto* track : navmisc::Items<TRACK_ITEM_INFO>(trip.tracks)) {
    WCSToMBS(track->GetName(), title, sizeof title);
    std::fprintf(f, "\r\n<trk>\r\n<name>%s</name>\r\n<desc>Color:004000ff</desc>\r\n<trkseg>", title);
    for (auto* p : navmisc::Items<WAYPOINT_ITEM_INFO>(track->points)) {
      if (p->time == -1) continue;
      timeText(p->time, when);
      std::fprintf(f,
                   "\r\n<trkpt lat=\"%.6f\" lon=\"%.6f\">\r\n<ele>%.6f</ele>\r\n<time>%s</time>\r\n"
                   "<speed>%.2f</speed>\r\n</trkpt>",
                   p->latitude, p->longitude, p->altitude, when, p->speed * 0.0002777777777777778);
    }
    std::fprintf(f, "\r\n</trkseg>\r\n</trk>");
  }
  std::fprintf(f, "\r\n</gpx>");
  std::fclose(f);
}

std::string Slurp(const std::string& path) {
  std::ifstream in(path, std::ios::binary);
  return std::string(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
}

void BM_ExportGpx(benchmark::State& state) {
  Fixture& f = F();
  const CString path = CString::FromUtf8(f.ours);
  for (auto _ : state) {
    if (ExportGpx(path, f.trip->tracks, f.trip->photos) != 1) state.SkipWithError("ExportGpx failed");
  }
  state.SetItemsProcessed(state.iterations() * kPoints);
}

void BM_StdioGpx(benchmark::State& state) {
  Fixture& f = F();
  for (auto _ : state) StdioGpx(*f.trip, f.baseline);
  state.SetItemsProcessed(state.iterations() * kPoints);
  ExportGpx(CString::FromUtf8(f.ours), f.trip->tracks, f.trip->photos);
  const std::string a = Slurp(f.ours), b = Slurp(f.baseline);
  if (a.empty() || a != b) state.SkipWithError("the two writers made different documents");
}

BENCHMARK(BM_ExportGpx)->Unit(benchmark::kMillisecond)->MinTime(2.0);
BENCHMARK(BM_StdioGpx)->Unit(benchmark::kMillisecond)->MinTime(2.0);

// Console output as usual, plus the ratio of the two writers' times.
class RatioReporter : public benchmark::ConsoleReporter {
 public:
  void ReportRuns(const std::vector<Run>& runs) override {
    ConsoleReporter::ReportRuns(runs);
    for (const Run& r : runs) {
      if (!r.error_occurred && r.run_type == Run::RT_Iteration) {
        seconds_[r.run_name.function_name] = r.GetAdjustedRealTime();
      }
    }
  }
  void Finalize() override {
    ConsoleReporter::Finalize();
    auto ours = seconds_.find("BM_ExportGpx");
    auto plain = seconds_.find("BM_StdioGpx");
    if (ours == seconds_.end() || plain == seconds_.end() || ours->second <= 0) return;
    const double ratio = plain->second / ours->second;
    std::printf("ExportGpx is %.1fx as fast as one fprintf per element (target: at least 3x): %s\n", ratio,
                ratio >= 3.0 ? "met" : "NOT MET");
  }

 private:
  std::map<std::string, double> seconds_;
};

// Saves the bench track as a trip under `root` and prints the trip's id.
int WriteTrip(const std::string& root) {
  const CString wroot = CString::FromUtf8(root);
  if (!MakeDir(wroot)) {
    std::fprintf(stderr, "cannot create %s\n", root.c_str());
    return 1;
  }
  navmisc::SetSharedText(g_szAppDataPath, wroot);
  BLOG_ITEM_INFO trip(GPS_APP_TRIP, nullptr, 1);
  trip.name = L"A million points";
  AddTrack(trip);
  trip.WriteAllWaypoint(1, nullptr, nullptr);
  trip.WriteInfo(1, nullptr, nullptr);
  std::printf("%s\n", trip.tripId.ToUtf8().c_str());
  return 0;
}

}  // namespace

int main(int argc, char** argv) {
  for (int i = 1; i < argc; ++i) {
    if (std::strncmp(argv[i], "--write-trip=", 13) == 0) return WriteTrip(argv[i] + 13);
  }
  benchmark::Initialize(&argc, argv);
  if (benchmark::ReportUnrecognizedArguments(argc, argv)) return 1;
  RatioReporter reporter;
  benchmark::RunSpecifiedBenchmarks(&reporter);
  benchmark::Shutdown();
  return 0;
}
