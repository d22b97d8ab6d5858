#include "navmisc/activity/moving_segments.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstdio>
#include <random>
#include <tuple>

#include "navmisc/export/gpx_export.h"
#include "navmisc/geo/gps_helper.h"
#include "navmisc/records/track.h"
#include "testutil.h"

namespace {

using namespace navmisc::activity;
using navmisc::testutil::RunCommand;
using navmisc::testutil::ShellQuote;
using navmisc::testutil::TempDir;

constexpr double kMetresPerDegree = 111195.0;

// Builds tracks second by second: legs at a speed (or standing), gaps in the fixes, and GPS
// error that wanders slowly (as a receiver's does) on top of a little white noise.
class Recorder {
 public:
  explicit Recorder(double noiseMetres = 0.0) : noise_(noiseMetres) {}

  // Moves for `seconds` at `mps` metres per second, one fix every `interval` seconds.
  void Leg(int seconds, double mps, int interval = 1) {
    for (int s = 0; s < seconds; s += interval) {
      heading_ += turn_(rng_);
      Step(mps * interval);
      time_ += interval;
      Fix(mps);
    }
  }
  // No fixes for `seconds` while covering `metres`.
  void Gap(int seconds, double metres) {
    Step(metres);
    time_ += seconds;
    Fix(metres / seconds);
  }
  PointVector points;

 private:
  void Step(double metres) {
    lat_ += metres * std::cos(heading_) / kMetresPerDegree;
    lon_ += metres * std::sin(heading_) / (kMetresPerDegree * std::cos(lat_ * 0.0174533));
  }
  void Fix(double mps) {
    // About noise_ metres of error at any moment, most of it a slow drift.
    auto draw = [&](double sigma) { return noise_ > 0 ? std::normal_distribution<double>(0.0, sigma * noise_)(rng_) : 0.0; };
    driftN_ = 0.95 * driftN_ + draw(0.3);
    driftE_ = 0.95 * driftE_ + draw(0.3);
    ActivityPoint& p = points.emplace_back();
    p.time = time_;
    p.latitude = lat_ + (driftN_ + draw(0.12)) / kMetresPerDegree;
    p.longitude = lon_ + (driftE_ + draw(0.12)) / (kMetresPerDegree * std::cos(lat_ * 0.0174533));
    p.cosLatitude = std::cos(p.latitude * navmisc::geo::kDegToRad);
    p.altitude = 410.0 + draw(0.5);
    p.speed = static_cast<int32_t>(mps * 3600);
    p.present = WAYPOINT_ITEM_INFO::kHasPosition;
  }

  double noise_;
  std::mt19937 rng_{20240501};
  std::normal_distribution<double> turn_{0.0, 0.03};
  double lat_ = 47.3769, lon_ = 8.5417, heading_ = 0.7;
  double driftN_ = 0.0, driftE_ = 0.0;
  int32_t time_ = 1714543200;
};

int32_t MovingTime(const PointVector& points) {
  return SumMovingSegments(BuildMovingSegments(points, LegLengthsKm(points))).time;
}

TEST(MovingSegments, GapsStopsAndBreaksWithoutNoise) {
  const struct {
    const char* what;
    void (*record)(Recorder&);
    int32_t moving;  // seconds
  } cases[] = {
      {"a ride through a tunnel: 120 s without fixes at 20 km/h still moves",
       [](Recorder& r) { r.Leg(300, 5.56); r.Gap(120, 667); r.Leg(300, 5.56); }, 720},
      {"a logger asleep through a stop: 20 minutes for 100 m do not",
       [](Recorder& r) { r.Leg(300, 1.4); r.Gap(1200, 100); r.Leg(300, 1.4); }, 600},
      {"two hours apart is a break however far it went",
       [](Recorder& r) { r.Leg(300, 5.56); r.Gap(7200, 100000); r.Leg(300, 5.56); }, 600},
      {"a slow stroll at 2.5 km/h stands, a walk moves",
       [](Recorder& r) { r.Leg(300, 0.7); r.Leg(300, 1.4); }, 300},
      {"a fix every 5 s: a 30 s gap is no gap yet, a 120 s one without motion is a stop",
       [](Recorder& r) { r.Leg(300, 1.4, 5); r.Gap(30, 42); r.Leg(100, 1.4, 5); r.Gap(120, 5); r.Leg(100, 1.4, 5); }, 530},
  };
  for (const auto& c : cases) {
    Recorder r;
    c.record(r);
    // The speed window blurs a change of pace by a few seconds either way.
    EXPECT_NEAR(MovingTime(r.points), c.moving, 8) << c.what;
  }

  // Points left out of the statistics take no part: a wild fix 3 km off between two standing
  // ones moves nobody.
  Recorder r;
  r.Leg(60, 0.0);
  r.points[30].latitude += 0.03;
  r.points[30].type = -2;
  EXPECT_EQ(MovingTime(r.points), 0);
  EXPECT_EQ(SamplingInterval(r.points), 1);
  EXPECT_EQ(SamplingInterval({}), 1);

  // A selection takes the part of each segment inside it, distance in proportion.
  const std::vector<MovingSegment> segments = {{0, 100, 100, 1000.0}, {9, 300, 50, 100.0}};
  const struct {
    long start, end;
    int32_t time;
    double distance;
  } cuts[] = {{0, 1000, 150, 1100.0}, {150, 320, 70, 540.0}, {200, 300, 0, 0.0}, {120, 130, 10, 100.0}};
  for (const auto& c : cuts) {
    const MovingTotals t = SumMovingSegments(segments, c.start, c.end);
    EXPECT_EQ(t.time, c.time) << c.start << ".." << c.end;
    EXPECT_DOUBLE_EQ(t.distance, c.distance) << c.start << ".." << c.end;
  }
}

TEST(MovingSegments, AWalkWithStopsAgainstTheTruthAndGpxpy) {
  // A 50-minute town walk at 1.4 m/s with a wandering GPS error of about 2 m: a red light,
  // a coffee, a look at a shop window.
  Recorder r(2.0);
  r.Leg(600, 1.4);
  r.Leg(120, 0.0);
  r.Leg(900, 1.4);
  r.Leg(600, 0.0);
  r.Leg(300, 1.4);
  r.Leg(60, 0.0);
  r.Leg(420, 1.4);
  const int32_t truth = 600 + 900 + 300 + 420;
  const int32_t ours = MovingTime(r.points);
  EXPECT_NEAR(ours, truth, truth * 0.03);

  const std::string python = navmisc::testutil::PythonWithModule("gpxpy");
  if (python.empty()) GTEST_SKIP() << "python3-gpxpy is not installed (scripts/setup.sh installs it)";
  TempDir dir;
  TRACK_ITEM_INFO track(nullptr);
  for (const ActivityPoint& p : r.points) {
    auto* w = new WAYPOINT_ITEM_INFO;
    std::tie(w->time, w->latitude, w->longitude, w->altitude, w->speed) =
        std::tie(p.time, p.latitude, p.longitude, p.altitude, p.speed);
    track.points.AddTail(w);
  }
  CPtrList tracks, none;
  tracks.AddTail(&track);
  ASSERT_EQ(ExportGpx(dir / L"walk.gpx", tracks, none), 1);
  const auto out = RunCommand(python + " -c 'import gpxpy,sys; m = gpxpy.parse(open(sys.argv[1])).get_moving_data(); "
                                       "print(int(m.moving_time), len(gpxpy.parse(open(sys.argv[1])).tracks[0].segments[0].points))' " +
                              ShellQuote((dir / L"walk.gpx").ToUtf8()));
  ASSERT_EQ(out.status, 0) << out.out;
  int gpxpy = 0;
  size_t points = 0;
  ASSERT_EQ(std::sscanf(out.out.c_str(), "%d %zu", &gpxpy, &points), 2) << out.out;
  EXPECT_EQ(points, r.points.size());
  std::printf("walk with stops: moving time %d s (truth %d s), gpxpy get_moving_data() %d s\n", ours, truth, gpxpy);
  // gpxpy counts every pair faster than 1 km/h, so the GPS error of the stops counts as moving:
  // it can only come out longer than the truth.
  EXPECT_GT(gpxpy, truth);
}

}  // namespace
