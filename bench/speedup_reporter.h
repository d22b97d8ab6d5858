// Benchmarks that time a fast method against its reference in one run: the console report, and
// after it one line per pair with the speed-up of the fast side over the reference.
#pragma once

#include <benchmark/benchmark.h>

#include <cstdio>
#include <map>
#include <string>
#include <utility>
#include <vector>

namespace navmisc::bench {

struct SpeedupPair {
  std::string fast;       // benchmark names as reported
  std::string reference;
  double target;          // the speed-up the fast side must reach
};

class SpeedupReporter : public benchmark::ConsoleReporter {
 public:
  explicit SpeedupReporter(std::vector<SpeedupPair> pairs) : pairs_(std::move(pairs)) {}

  void ReportRuns(const std::vector<Run>& runs) override {
    ConsoleReporter::ReportRuns(runs);
    for (const Run& r : runs) {
      if (r.run_type != Run::RT_Iteration || r.error_occurred || r.iterations == 0) continue;
      seconds_[r.benchmark_name()] = r.real_accumulated_time / static_cast<double>(r.iterations);
    }
  }

  void Finalize() override {
    ConsoleReporter::Finalize();
    for (const SpeedupPair& p : pairs_) {
      const auto f = seconds_.find(p.fast), r = seconds_.find(p.reference);
      if (f == seconds_.end() || r == seconds_.end() || f->second <= 0.0) continue;
      const double speedup = r->second / f->second;
      std::printf("speed-up %s over %s: %.1fx (target %gx)%s\n", p.fast.c_str(),
                  p.reference.c_str(), speedup, p.target,
                  speedup >= p.target ? "" : "  BELOW TARGET");
    }
  }

 private:
  std::vector<SpeedupPair> pairs_;
  std::map<std::string, double> seconds_;
};

// Runs the registered benchmarks with the speed-up lines. Returns main's exit code.
inline int RunWithSpeedups(int argc, char** argv, std::vector<SpeedupPair> pairs) {
  benchmark::Initialize(&argc, argv);
  if (benchmark::ReportUnrecognizedArguments(argc, argv)) return 1;
  SpeedupReporter reporter(std::move(pairs));
  benchmark::RunSpecifiedBenchmarks(&reporter);
  benchmark::Shutdown();
  return 0;
}

}  // namespace navmisc::bench
