#include "navmisc/activity/calories.h"

#include <gtest/gtest.h>

#include "navmisc/activity/detail/test_support.h"
#include "navmisc/platform/datetime.h"
#include "navmisc/records/user_profile.h"

namespace {

using namespace navmisc::activity;

TEST(Calories, MetTablesAtTheirBandEdges) {
  const struct {
    int sport;
    double kmh;
    double moving;   // MovingMet
  } moving[] = {
      {0, 50.9, 28.0},   {0, 50.85, 28.34}, {0, 45, 26.0},  {0, 40, 24.0},   {0, 35, 22.0},
      {0, 30, 20.0},     {0, 25, 15.0},     {0, 24.99, 14.987073170731707},  {0, 20.9, 9.7},
      {0, 20.89, 11.955555555555556},       {0, 8.8, 3.0},  {0, 8.79, 3.0},  {0, 0, 3.0},
      {1, 20, 25.0},     {1, 19.99, 24.9875}, {1, 16, 20.0}, {1, 12, 15.0},  {1, 11.99, 14.98},
      {1, 9, 9.0},       {1, 8, 6.5},       {1, 7, 5.2},    {1, 6, 3.9},     {1, 5, 3.5},
      {1, 4, 2.6},       {1, 3, 2.1},       {1, 2.99, 2.1},
      {2, 40, 12.0},     {3, 1, 7.2},       {4, 1, 3.7},    {5, 1, 12.4},    {6, 1, 5.5},
      {7, 1, 6.6},       {-1, 30, 6.6},
  };
  for (const auto& c : moving) EXPECT_NEAR(MovingMet(c.sport, c.kmh), c.moving, 1e-9) << c.sport << " " << c.kmh;

  const struct {
    int sport;
    double kmh;
    double workout;  // WorkoutMet
  } workout[] = {
      {0, 20.9, 9.7}, {0, 20.89, 9.694462809917356}, {0, 8.8, 3.0}, {0, 5, 3.0},
      {1, 16, 13.2},  {1, 15.99, 13.1912}, {1, 6, 4.4}, {1, 5.99, 4.3935}, {1, 4, 3.1}, {1, 3, 3.1},
      {2, 9, 7.0},    {3, 9, 7.2},  {4, 9, 3.7},
      {5, 8.8, 12.4}, {5, 8.79, 12.383333333333333}, {5, 4, 4.4}, {5, 3.99, 3.4},
      {6, 9, 5.1},    {9, 9, 5.0},
  };
  for (const auto& c : workout) EXPECT_NEAR(WorkoutMet(c.sport, c.kmh), c.workout, 1e-9) << c.sport << " " << c.kmh;
}

class Owner : public navmisc::testutil::RecordTest {};

TEST_F(Owner, AgeWeightAndHeightOnTheActivitysDate) {
  USER_MAP_INFO& profile = g_SportMapInfo;
  profile.year = 1985;
  profile.month = 6;
  profile.day = 15;
  auto on = [&](int y, int m, int d) { return PersonOn(profile, DateTimeToLong(m, d, y, 12, 0, 0)); };

  // Before any history: the profile's defaults, not from the history.
  Person p = on(2024, 6, 14);
  EXPECT_EQ(std::tuple(p.age, p.weight, p.height, p.weightFromHistory), std::tuple(38, 60.0, 170.0, false));
  EXPECT_NEAR(p.fractionalAge, (39 * 365 - 15 + 14) / 365.0, 1e-12);
  EXPECT_EQ(on(2024, 6, 15).age, 39);  // the birthday itself counts
  EXPECT_EQ(on(2024, 7, 1).age, 39);
  EXPECT_EQ(on(2024, 5, 30).age, 38);

  profile.SetWeightHeight(1, 1, 2024, 72.5, 178.0);  // month, day, year
  p = on(2024, 6, 14);
  EXPECT_EQ(std::tuple(p.weight, p.height, p.weightFromHistory), std::tuple(72.5, 178.0, true));
  // No date (a trip without tracks starts at 2147483647): the defaults, and today for the age.
  p = PersonOn(profile, 2147483647L);
  EXPECT_EQ(std::tuple(p.weight, p.weightFromHistory), std::tuple(60.0, false));
  EXPECT_GE(p.age, 38);

  profile.year = 0;  // unknown birth year
  p = on(2024, 6, 14);
  EXPECT_EQ(std::tuple(p.age, p.fractionalAge), std::tuple(0, 0.0));
  EXPECT_EQ(MaxHeartRate(p), 202.0);
  p.male = false;
  EXPECT_EQ(MaxHeartRate(p), 216.0);
}

TEST(Calories, RestingAndHeartRateEnergyForBothSexesAndAtTheExtremes) {
  Person man{true, 30, 30.0, 70, 175};
  Person woman{false, 40, 40.0, 60, 165};
  EXPECT_NEAR(BasalRate(man), 1701.875, 1e-9);
  EXPECT_NEAR(BasalRate(woman), 1347.09, 1e-9);
  EXPECT_EQ(RestingEnergy(man, 0, 3600), 70911);
  EXPECT_EQ(RestingEnergy(man, 1000, 2800), 35456);  // 35455.73 rounds up
  EXPECT_EQ(RestingEnergy(man, 5, 5), 0);
  EXPECT_EQ(RestingEnergy(man, 10, 5), 0);            // a backwards range costs nothing
  EXPECT_EQ(MaxHeartRate(man), 185.5);
  EXPECT_NEAR(MaxHeartRate(Person{false, 30}), 183.3, 1e-9);

  EXPECT_NEAR(HeartRateEnergy(man, 150), 237.0343371574251, 1e-9);
  // A low heart rate of a heavy young woman, and an impossible body: never negative.
  EXPECT_EQ(HeartRateEnergy(Person{false, 20, 20, 100, 170}, 60), 0.0);
  const Person ancient{true, 120, 120, 1, 1};
  EXPECT_EQ(BasalRate(ancient), 0.0);
  EXPECT_EQ(RestingEnergy(ancient, 0, 86400), 0);
  EXPECT_EQ(WorkoutEnergy(2, ancient, 3600, 0, 3600), 7);  // W * MET only: 1 * 7.0, + 0.5

  // The workout model mixes kilocalories per hour (W * MET) with small calories (B).
  EXPECT_EQ(WorkoutEnergy(1, man, 3600, 10.0, 1800), 106554);
}

TEST(Calories, ExerciseEnergyTakesTheHeartRateFormulaPerSampleAboveTheThreshold) {
  // Running, a man of 30 with 70 kg: maximum heart rate 185.5, threshold round(120.575) = 121.
  const Person man{true, 30, 30.0, 70, 175};
  PointVector points(4);
  for (int i = 0; i < 4; ++i) points[i].time = 10 * i;
  points[1].speed = 10000;  // no heart rate: 10 s at 10 km/h, MET 11
  points[2].speed = 10000;
  points[2].heartRate = 150;  // above: one sample's worth, not ten seconds'
  points[3].speed = 12000;
  points[3].heartRate = 120;  // below the threshold: by speed, MET 15
  for (int i : {2, 3}) points[i].present = WAYPOINT_ITEM_INFO::kHasHeartRate;
  EXPECT_EQ(ExerciseEnergy(points, FindRange(points, 0, 30, true), 1, man), 5293);  // 5292.59
  EXPECT_EQ(ExerciseEnergy(points, FindRange(points, 100, 200, true), 1, man), 0);
  EXPECT_EQ(ExerciseEnergy(points, FindRange(points, 10, 10, true), 1, man), 0);  // one point, no pair
}

}  // namespace
