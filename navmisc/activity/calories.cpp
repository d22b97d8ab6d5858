#include "navmisc/activity/calories.h"

#include <cmath>

#include "navmisc/platform/datetime.h"
#include "navmisc/records/track.h"
#include "navmisc/records/trip.h"
#include "navmisc/records/user_profile.h"

namespace navmisc::activity {
namespace {

// Kilojoules per minute to small calories per minute.
constexpr double kKilojouleToSmallCalories = 239.0057361376673;

long Truncate(double v) { return static_cast<long>(v); }

}  // namespace

double MovingMet(int sportType, double v) {
  switch (sportType) {
    case 0:  // cycling
      if (v >= 50.9) return 28.0;
      if (v >= 45) return 26 + 0.4 * (v - 45);
      if (v >= 40) return 24 + 0.4 * (v - 40);
      if (v >= 35) return 22 + 0.4 * (v - 35);
      if (v >= 30) return 20 + 0.4 * (v - 30);
      if (v >= 25) return 15 + (v - 25);
      if (v >= 20.9) return 9.7 + (v - 20.9) * 5.3 / 4.1;
      if (v >= 8.8) return 3.0 + (v - 8.8) * 12 / 16.2;
      return 3.0;
    case 1:  // running
      if (v >= 20) return 25.0;
      if (v >= 16) return 20 + 1.25 * (v - 16);
      if (v >= 12) return 15 + 1.25 * (v - 12);
      if (v >= 9) return 9 + 2 * (v - 9);
      if (v >= 8) return 6.5 + 2.5 * (v - 8);
      if (v >= 7) return 5.2 + 1.3 * (v - 7);
      if (v >= 6) return 3.9 + 1.3 * (v - 6);
      if (v >= 5) return 3.5 + 0.4 * (v - 5);
      if (v >= 4) return 2.6 + 0.9 * (v - 4);
      if (v >= 3) return 2.1 + 0.5 * (v - 3);
      return 2.1;
    case 2: return 12.0;
    case 3: return 7.2;
    case 4: return 3.7;
    case 5: return 12.4;
    case 6: return 5.5;
    default: return 6.6;
  }
}

double WorkoutMet(int sportType, double v) {
  switch (sportType) {
    case 0:
      if (v >= 20.9) return 9.7;
      if (v >= 8.8) return 3.0 + (v - 8.8) * 6.7 / 12.1;
      return 3.0;
    case 1:
      if (v >= 16) return 13.2;
      if (v >= 6) return 4.4 + (v - 6) * 0.88;
      if (v >= 4) return 3.1 + (v - 4) * 0.65;
      return 3.1;
    case 2: return 7.0;
    case 3: return 7.2;
    case 4: return 3.7;
    case 5:
      if (v >= 8.8) return 12.4;
      if (v >= 4) return 4.4 + (v - 4) * 8 / 4.8;
      return 3.4;
    case 6: return 5.1;
    default: return 5.0;
  }
}

bool LocalDate(long localTime, int& year, int& month, int& day) {
  if (localTime < 0 || localTime >= 2147483647L) return false;
  int hour, minute, second;
  GetDateTimeInfo(localTime, year, month, day, hour, minute, second);
  return true;
}

Person PersonOn(USER_MAP_INFO& profile, long localTime) {
  Person p;
  p.male = profile.male;
  p.weight = profile.weight;
  p.height = profile.height;
  int year, month, day;
  const bool dated = LocalDate(localTime, year, month, day);
  if (dated) {
    p.weightFromHistory = profile.GetWeightHeight(month, day, year, p.weight, p.height);
  } else {
    LocalDate(GetCurDateTime(), year, month, day);
  }
  if (profile.year != 0) {
    p.age = year - profile.year;
    if (!(month > profile.month || (month == profile.month && day >= profile.day))) --p.age;
    const long days = static_cast<long>(year - profile.year) * 365 + (month - profile.month) * 31 - profile.day + day;
    p.fractionalAge = static_cast<double>(days) / 365.0;
  }
  return p;
}

double BasalRate(const Person& p) {
  const double bmr = p.male ? 66.5 + 13.75 * p.weight + 5.003 * p.height - 6.755 * p.age
                            : 655.1 + 9.563 * p.weight + 1.85 * p.height - 4.676 * p.age;
  return bmr < 0 ? 0.0 : bmr;
}

long RestingEnergy(const Person& person, long start, long end) {
  if (end <= start) return 0;
  return Truncate(static_cast<double>(end - start) / 3600.0 * BasalRate(person) * 1000.0 / 24.0 + 0.5);
}

double MaxHeartRate(const Person& p) { return p.male ? 202.0 - 0.55 * p.age : 216.0 - 1.09 * p.age; }

double HeartRateEnergy(const Person& p, int hr) {
  const double perMinute = p.male ? 0.6309 * hr + 0.2017 * p.age + 0.1988 * p.weight - 55.0969
                                  : 0.4472 * hr - 20.4022 - 0.1263 * p.weight + 0.074 * p.age;
  const double amount = perMinute * kKilojouleToSmallCalories / 60.0;
  return amount < 0 ? 0.0 : amount;
}

double MovingEnergy(int sportType, double weightKg, long seconds, double kmh) {
  return static_cast<double>(seconds) / 3600.0 * MovingMet(sportType, kmh) * 1000.0 * weightKg;
}

long ExerciseEnergy(const PointVector& points, IndexRange range, int sportType, const Person& person) {
  if (range.empty) return 0;
  const int threshold = static_cast<int>(0.65 * MaxHeartRate(person) + 0.5);
  double sum = 0.0;
  size_t prevIndex = range.first;
  for (size_t i = range.first + 1; i <= range.last; ++i) {
    const ActivityPoint& cur = points[i];
    if (cur.type < 0) continue;  // left out, as in the summary
    const ActivityPoint& prev = points[prevIndex];
    prevIndex = i;
    const bool hasHr = cur.Has(WAYPOINT_ITEM_INFO::kHasHeartRate);
    if (hasHr && cur.heartRate >= threshold) {
      sum += HeartRateEnergy(person, cur.heartRate);
    } else {
      const long step = static_cast<long>(cur.time) - prev.time;
      sum += MovingEnergy(sportType, person.weight, step, cur.speed * 0.001);
    }
  }
  return Truncate(sum + 0.5);
}

long WorkoutEnergy(int sportType, const Person& p, long movingSeconds, double kmh, long restSeconds) {
  const double a = p.fractionalAge;
  double bmr = p.male ? 66 + 13.7 * p.weight + 5.0 * p.height - 6.8 * a
                      : 655 + 9.6 * p.weight + 1.8 * p.height - 4.7 * a;
  if (bmr < 0) bmr = 0;
  const double b = bmr * 1000 * 0.05;
  return Truncate((p.weight * WorkoutMet(sportType, kmh) + b) * static_cast<double>(movingSeconds) / 3600.0 +
                  static_cast<double>(restSeconds) / 3600.0 * b * 0.5 + 0.5);
}

long TrackEnergy(TRACK_ITEM_INFO& track, int sportType) {
  CPtrList one;
  one.AddTail(&track);
  PointVector points;
  MergePoints(one, nullptr, nullptr, points);
  if (points.empty() || !track.trip) return 0;
  USER_MAP_INFO* profile = GetUserMapInfo(track.trip->appType);
  if (!profile) return 0;
  const long start = points.front().time;
  const long end = points.back().time;
  const Person person = PersonOn(*profile, start + track.trip->timeZoneShift);
  return ExerciseEnergy(points, FindRange(points, start, end, true), sportType, person) +
         RestingEnergy(person, start, end);
}

}  // namespace navmisc::activity
