// `navmisc import` of a 1,000,000-point GPX 1.1 track (heart rate and cadence in the Garmin
// extension, as a sports watch writes it) through the real data-control process into a saved
// trip, against gpsbabel reading the same file into unicsv on /dev/null; then the same track as
// NMEA (written by gpsbabel) both ways. Each run is a separate program run, timed from start to
// exit; the peak memory is the largest resident set of a run's processes (wait4), and for ours
// also the sum of both processes' peaks (sampled from /proc while they run, the command-line
// program and GpsDataControl.exe).
//
//   cmake --preset release && cmake --build --preset release --target import_bench
//   build/release/bench/import_bench
//
// Targets: at least 5x as fast as gpsbabel, and no more memory than it.
#include <fcntl.h>
#include <signal.h>
#include <spawn.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <cerrno>
#include <chrono>
#include <cmath>
#include <cstdio>
#include <cstring>
#include <filesystem>
#include <ctime>
#include <fstream>
#include <map>
#include <sstream>
#include <string>
#include <thread>
#include <vector>

#include "navmisc/platform/files.h"
#include "navmisc/platform/process.h"
#include "navmisc/platform/temp_folder.h"
#include "speedup_reporter.h"

extern char** environ;

namespace {

constexpr int kPoints = 1000000;

struct Files {
  navmisc::ScopedTempFolder dir{L"navmisc-bench-import"};
  std::string gpx, nmea, babel;
  bool ok = false;

  Files() {
    const std::string root = navmisc::NativePath(dir.path());
    gpx = root + "/million.gpx";
    nmea = root + "/million.nmea";
    babel = navmisc::FindProgram("gpsbabel");
    WriteGpx();
    // gpsbabel writes the NMEA form of the same track: what a logger would have logged.
    ok = !babel.empty() && std::system(("'" + babel + "' -i gpx -f '" + gpx + "' -o nmea -F '" + nmea + "'").c_str()) == 0;
  }

  // Laps of a 3 km loop, one point a second from 2023-11-14 22:13:20 UTC, with a few metres of
  // noise on every fix.
  void WriteGpx() const {
    std::FILE* f = std::fopen(gpx.c_str(), "wb");
    std::fputs("<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n"
               "<gpx version=\"1.1\" creator=\"bench\" xmlns=\"http://www.topografix.com/GPX/1/1\" "
               "xmlns:gpxtpx=\"http://www.garmin.com/xmlschemas/TrackPointExtension/v1\">\n"
               "<metadata><name>A million points</name></metadata>\n<trk><name>Loops</name><trkseg>\n",
               f);
    constexpr double kRadius = 3000.0 / (2 * 3.141592653589793);
    constexpr double kDegreesPerMetre = 1.0 / 111195.0;
    unsigned noise = 11;
    auto jitter = [&noise](double metres) {
      noise = noise * 1103515245u + 12345u;
      return (static_cast<double>(noise >> 16 & 2047) / 1023.5 - 1.0) * metres;
    };
    for (int i = 0; i < kPoints; ++i) {
      const double angle = i * 1.4 / kRadius;
      const std::time_t t = 1700000000 + i;
      std::tm tm;
      gmtime_r(&t, &tm);
      char when[32];
      std::strftime(when, sizeof when, "%Y-%m-%dT%H:%M:%SZ", &tm);
      std::fprintf(f,
                   "<trkpt lat=\"%.7f\" lon=\"%.7f\"><ele>%.1f</ele><time>%s</time><fix>3d</fix><sat>9</sat>"
                   "<extensions><gpxtpx:TrackPointExtension><gpxtpx:hr>%d</gpxtpx:hr><gpxtpx:cad>%d</gpxtpx:cad>"
                   "</gpxtpx:TrackPointExtension></extensions></trkpt>\n",
                   47.37 + (kRadius * std::sin(angle) + jitter(4)) * kDegreesPerMetre,
                   8.54 + (kRadius * std::cos(angle) + jitter(4)) * kDegreesPerMetre / 0.6769,
                   410 + 15 * std::sin(angle * 3) + jitter(2), when, 120 + i % 40, 80 + i % 15);
    }
    std::fputs("</trkseg></trk>\n</gpx>\n", f);
    std::fclose(f);
  }
};

Files& TheFiles() {
  static Files f;
  return f;
}

// The peak resident set of a process so far (KiB), 0 when it is gone.
long PeakKiB(pid_t pid) {
  std::ifstream in("/proc/" + std::to_string(pid) + "/status");
  std::string line;
  while (std::getline(in, line)) {
    if (line.rfind("VmHWM:", 0) == 0) return std::atol(line.c_str() + 6);
  }
  return 0;
}

// The processes started by any thread of `pid` (the command thread starts the data-control
// process).
std::vector<pid_t> Children(pid_t pid) {
  std::vector<pid_t> out;
  const std::string dir = "/proc/" + std::to_string(pid) + "/task";
  std::error_code ec;  // the process may be gone already
  for (std::filesystem::directory_iterator it(dir, ec), end; !ec && it != end; it.increment(ec)) {
    std::ifstream children(it->path() / "children");
    for (pid_t c; children >> c;) out.push_back(c);
  }
  return out;
}

struct RunResult {
  bool ok = false;
  double seconds = 0;
  long maxKiB = 0;  // the largest process of the run (exact)
  long sumKiB = 0;  // the sum of every process's peak (sampled)
};

// Runs a program to its end: the time, the exit, the memory.
RunResult Run(const std::vector<std::string>& argv) {
  RunResult r;
  std::vector<char*> args;
  for (const auto& a : argv) args.push_back(const_cast<char*>(a.c_str()));
  args.push_back(nullptr);
  posix_spawn_file_actions_t actions;
  posix_spawn_file_actions_init(&actions);
  posix_spawn_file_actions_addopen(&actions, STDOUT_FILENO, "/dev/null", O_WRONLY, 0);
  const auto start = std::chrono::steady_clock::now();
  pid_t pid = -1;
  const int rc = posix_spawn(&pid, args[0], &actions, nullptr, args.data(), environ);
  posix_spawn_file_actions_destroy(&actions);
  if (rc != 0) return r;
  std::atomic<bool> done{false};
  std::map<pid_t, long> peaks;
  std::thread sampler([&] {
    while (!done) {
      peaks[pid] = std::max(peaks[pid], PeakKiB(pid));
      for (pid_t c : Children(pid)) peaks[c] = std::max(peaks[c], PeakKiB(c));
      std::this_thread::sleep_for(std::chrono::milliseconds(5));
    }
  });
  int status = 0;
  struct rusage ru {};
  while (wait4(pid, &status, 0, &ru) < 0 && errno == EINTR) {
  }
  r.seconds = std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count();
  done = true;
  sampler.join();
  r.ok = WIFEXITED(status) && WEXITSTATUS(status) == 0;
  // wait4 gives the largest of the process and the children it waited for.
  r.maxKiB = ru.ru_maxrss;
  for (const auto& [p, kib] : peaks) r.sumKiB += kib;
  r.sumKiB = std::max(r.sumKiB, r.maxKiB);
  return r;
}

std::string Tool(const char* name) { return std::string(NAVMISC_TOOLS_DIR) + "/" + name; }

void Measure(benchmark::State& state, const std::vector<std::string>& argv, bool fresh) {
  Files& f = TheFiles();
  if (!f.ok) {
    state.SkipWithError("gpsbabel is needed for the comparison and the NMEA file");
    return;
  }
  long maxKiB = 0, sumKiB = 0;
  for (auto _ : state) {
    std::vector<std::string> args = argv;
    navmisc::ScopedTempFolder root(L"navmisc-bench-root");
    if (fresh) {
      args.insert(args.begin() + 1, {"--data-root", navmisc::NativePath(root.path())});
    }
    const RunResult r = Run(args);
    if (!r.ok) {
      state.SkipWithError((args[0] + " failed").c_str());
      return;
    }
    state.SetIterationTime(r.seconds);
    maxKiB = std::max(maxKiB, r.maxKiB);
    sumKiB = std::max(sumKiB, r.sumKiB);
  }
  state.counters["peak_MiB"] = static_cast<double>(maxKiB) / 1024.0;
  state.counters["sum_MiB"] = static_cast<double>(sumKiB) / 1024.0;
  state.SetItemsProcessed(state.iterations() * kPoints);
}

void BM_NavmiscImportGpx(benchmark::State& state) {
  Measure(state, {Tool("navmisc"), "import", TheFiles().gpx}, true);
}
void BM_GpsbabelGpx(benchmark::State& state) {
  Measure(state, {TheFiles().babel, "-i", "gpx", "-f", TheFiles().gpx, "-o", "unicsv", "-F", "/dev/null"}, false);
}
void BM_NavmiscImportNmea(benchmark::State& state) {
  Measure(state, {Tool("navmisc"), "import", TheFiles().nmea}, true);
}
void BM_GpsbabelNmea(benchmark::State& state) {
  Measure(state, {TheFiles().babel, "-i", "nmea", "-f", TheFiles().nmea, "-o", "unicsv", "-F", "/dev/null"}, false);
}

BENCHMARK(BM_NavmiscImportGpx)->UseManualTime()->Unit(benchmark::kMillisecond)->Iterations(3);
BENCHMARK(BM_GpsbabelGpx)->UseManualTime()->Unit(benchmark::kMillisecond)->Iterations(3);
BENCHMARK(BM_NavmiscImportNmea)->UseManualTime()->Unit(benchmark::kMillisecond)->Iterations(3);
BENCHMARK(BM_GpsbabelNmea)->UseManualTime()->Unit(benchmark::kMillisecond)->Iterations(3);

// The speed-up lines, then the memory of each pair.
class ImportReporter : public navmisc::bench::SpeedupReporter {
 public:
  using SpeedupReporter::SpeedupReporter;
  void ReportRuns(const std::vector<Run>& runs) override {
    SpeedupReporter::ReportRuns(runs);
    for (const Run& r : runs) {
      if (r.error_occurred) continue;
      const auto peak = r.counters.find("peak_MiB"), sum = r.counters.find("sum_MiB");
      if (peak != r.counters.end()) memory_[r.benchmark_name()] = {peak->second.value, sum->second.value};
    }
  }
  void Finalize() override {
    SpeedupReporter::Finalize();
    for (const auto& [ours, theirs] : {std::pair{"BM_NavmiscImportGpx", "BM_GpsbabelGpx"},
                                       std::pair{"BM_NavmiscImportNmea", "BM_GpsbabelNmea"}}) {
      const auto a = memory_.find(std::string(ours) + "/iterations:3/manual_time");
      const auto b = memory_.find(std::string(theirs) + "/iterations:3/manual_time");
      if (a == memory_.end() || b == memory_.end()) continue;
      std::printf("peak memory %s: largest process %.1f MiB, both processes %.1f MiB; %s: %.1f MiB%s\n", ours,
                  a->second.first, a->second.second, theirs, b->second.first,
                  a->second.second <= b->second.first ? "" : "  ABOVE TARGET");
    }
  }

 private:
  std::map<std::string, std::pair<double, double>> memory_;
};

}  // namespace

int main(int argc, char** argv) {
  benchmark::Initialize(&argc, argv);
  if (benchmark::ReportUnrecognizedArguments(argc, argv)) return 1;
  ImportReporter reporter({{"BM_NavmiscImportGpx/iterations:3/manual_time", "BM_GpsbabelGpx/iterations:3/manual_time", 5},
                           {"BM_NavmiscImportNmea/iterations:3/manual_time", "BM_GpsbabelNmea/iterations:3/manual_time", 5}});
  benchmark::RunSpecifiedBenchmarks(&reporter);
  benchmark::Shutdown();
  return 0;
}
