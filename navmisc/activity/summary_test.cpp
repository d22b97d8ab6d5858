#include "navmisc/activity/summary.h"

#include <gtest/gtest.h>

#include <cmath>
#include <random>
#include <tuple>

#include "navmisc/geo/gps_helper.h"

namespace {

using namespace navmisc::activity;

constexpr uint8_t kFix = WAYPOINT_ITEM_INFO::kHasPosition;
constexpr uint8_t kSpeed = WAYPOINT_ITEM_INFO::kHasSpeed;
constexpr uint8_t kHr = WAYPOINT_ITEM_INFO::kHasHeartRate;

// Points every 10 s heading north by 0.0001 degrees (11.1 m), with fixes, at `altitudes`. North
// only, so the cosine of the latitude does not enter the distances.
PointVector Northwards(const std::vector<double>& altitudes) {
  PointVector points(altitudes.size());
  for (size_t i = 0; i < points.size(); ++i) {
    points[i].time = 1000 + 10 * static_cast<int32_t>(i);
    points[i].latitude = 47.0 + 0.0001 * static_cast<double>(i);
    points[i].longitude = 8.0;
    points[i].altitude = altitudes[i];
    points[i].present = kFix;
  }
  return points;
}

TrackerFigures Summed(PointVector& points, SummaryRules rules, long start, long end, MovingTotals moving = {}) {
  TrackerFigures f;
  Summarize(points, LegLengthsKm(points), start, end, 3600, rules, moving, f);
  return f;
}

TEST(Summary, SportAscentHasAHysteresisTheTrackerHasNone) {
  // Wobbles of 0.5 m, a rise of 1.9 m that stays below the threshold, then 1.1 m more, a fall
  // of 1.5 m and one of 0.6 m.
  PointVector points = Northwards({100, 100.5, 100, 100.5, 100, 101.9, 103, 101.5, 100.9});
  const TrackerFigures sport = Summed(points, SummaryRules::kSport, 1000, 1080);
  EXPECT_NEAR(sport.ascent, 3.0, 1e-9);   // 100 -> 103 once the reference is 3 m below
  EXPECT_NEAR(sport.descent, 2.1, 1e-9);  // 103 -> 100.9
  const TrackerFigures tracker = Summed(points, SummaryRules::kTracker, 1000, 1080);
  EXPECT_NEAR(tracker.ascent, 4.0, 1e-9);
  EXPECT_NEAR(tracker.descent, 3.1, 1e-9);
  EXPECT_EQ(std::tuple(sport.minAltitude, sport.maxAltitude), std::tuple(100.0, 103.0));
  // Local times, 80 s, 8 legs of 11.12 m.
  EXPECT_EQ(std::tuple(sport.startTime, sport.endTime, sport.duration), std::tuple(4600, 4680, 80));
  EXPECT_NEAR(sport.distance, 88.956, 0.01);
  EXPECT_NEAR(sport.avgSpeed, sport.distance / 80 * 3600, 1e-9);
  EXPECT_NEAR(points.back().distance, sport.distance, 1e-9);

  // The maximum starts at 0 and takes the later points only: going downhill from 100 m the
  // first altitude is not the maximum. One below 0 starts it.
  PointVector down = Northwards({100, 90, 80});
  EXPECT_EQ(Summed(down, SummaryRules::kSport, 0, 5000).maxAltitude, 90.0);
  PointVector low = Northwards({-5, -7, -6});
  const TrackerFigures below = Summed(low, SummaryRules::kSport, 0, 5000);
  EXPECT_EQ(std::tuple(below.maxAltitude, below.minAltitude), std::tuple(-5.0, -7.0));
}

TEST(Summary, SensorLegsUseThePreviousPairsTimeStep) {
  // No fixes; wheel speed 2 m/s at 0, 10, 30 and 40 s, then a point without a reading.
  PointVector points(5);
  const int32_t times[] = {0, 10, 30, 40, 50};
  for (int i = 0; i < 5; ++i) {
    points[i].time = times[i];
    points[i].speedReading = 2.0;
    points[i].speed = 1000;
    points[i].present = i < 4 ? kSpeed : 0;
  }
  points[4].speed = 8000;
  const TrackerFigures f = Summed(points, SummaryRules::kSport, 0, 50);
  // Legs: 0 (no previous step), 10 s * 2 m/s, 20 s * 2 m/s (not 10 s), and 0 after a reading.
  std::vector<long> cumulative;
  for (const auto& p : points) cumulative.push_back(std::lround(p.distance));
  EXPECT_EQ(cumulative, (std::vector<long>{0, 0, 20, 60, 60}));
  EXPECT_DOUBLE_EQ(f.distance, 60.0);
  // The reading (7200 m/h) stands in for a speed without a fix; the last point has only its own.
  EXPECT_EQ(f.maxSpeed, 8000.0);
  // The tracker measures every leg between the stored positions, here all at 0/0.
  EXPECT_EQ(Summed(points, SummaryRules::kTracker, 0, 50).distance, 0.0);
}

TEST(Summary, EmptyRangesAndZeroDivisorsGiveZeros) {
  PointVector points = Northwards({10, 10, 10});
  points[1].type = -1;  // left out: a wild fix a kilometre off
  points[1].latitude += 0.01;
  SportFigures f;
  // No points in range; a single point; a range of no time; no moving distance; no heart rate.
  for (auto [start, end] : {std::pair{0L, 999L}, std::pair{1010L, 1015L}, std::pair{1020L, 1020L}}) {
    Summarize(points, LegLengthsKm(points), start, end, 0, SummaryRules::kSport, {}, f);
    SummarizeSensors(points, start, end, f);
    EXPECT_EQ(std::tuple(f.distance, f.avgSpeed, f.maxSpeed, f.pace, f.movingAvgSpeed, f.avgHeartRate, f.avgCadence),
              std::tuple(0.0, 0.0, 0.0, 0, 0.0, 0, 0))
        << start << ".." << end;
    EXPECT_EQ(f.duration, end - start);
  }
  // The selected moving time never exceeds the selection; pace follows it.
  Summarize(points, LegLengthsKm(points), 1000, 1020, 0, SummaryRules::kSport, {500, 100.0}, f);
  EXPECT_EQ(std::tuple(f.movingTime, f.pace), std::tuple(20, 200));
  EXPECT_NEAR(f.distance, 22.24, 0.01);  // straight past the left-out point

  // Heart rate and cadence count every point of the range, left out or not.
  points[1].present |= kHr;
  points[1].heartRate = 141;
  points[2].present |= kHr;
  points[2].heartRate = 150;
  SummarizeSensors(points, 1000, 1020, f);
  EXPECT_EQ(std::tuple(f.avgHeartRate, f.maxHeartRate, f.movingAvgSpeed), std::tuple(145, 150, 18000.0));
}

}  // namespace

namespace {

TEST(Summary, LegLengthsAreTheGreatCircleDistances) {
  std::mt19937 rng(5);
  std::uniform_real_distribution<double> lat(-80, 80), lon(-180, 180), step(-0.2, 0.2);
  PointVector points;
  for (int i = 0; i < 2000; ++i) {
    // Legs from nothing to some 30 km, and a jump across the globe now and then.
    const bool jump = i % 100 == 0 || points.empty();
    const double la = jump ? lat(rng) : points.back().latitude + step(rng) * (i % 3 == 0 ? 1 : 1e-4);
    const double lo = jump ? lon(rng) : points.back().longitude + step(rng) * (i % 5 == 0 ? 1 : 1e-5);
    ActivityPoint& p = points.emplace_back();
    p.latitude = la;
    p.longitude = lo;
    p.cosLatitude = std::cos(la * navmisc::geo::kDegToRad);
  }
  points[7] = points[6];                      // the same place
  points[9].latitude = points[8].latitude + 5e-8;  // half a centimetre
  points[9].longitude = points[8].longitude;
  points[9].cosLatitude = std::cos(points[9].latitude * navmisc::geo::kDegToRad);
  const std::vector<double> legs = LegLengthsKm(points);
  CGPSHelper helper;
  for (size_t i = 1; i < points.size(); ++i) {
    const double want = helper.GetDistance(points[i - 1].latitude, points[i - 1].longitude, points[i].latitude,
                                           points[i].longitude, CGPSHelper::DIS_KILOMETER);
    ASSERT_NEAR(legs[i], want, want * 1e-12) << i;
  }
  EXPECT_EQ(std::tuple(legs[0], legs[7], legs[9]), std::tuple(0.0, 0.0, 0.0));
}

}  // namespace
