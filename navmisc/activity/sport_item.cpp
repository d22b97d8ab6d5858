#include "navmisc/activity/sport_item.h"

#include "navmisc/records/user_profile.h"

using namespace navmisc::activity;

_SportItem::_SportItem(int32_t type, BLOG_ITEM_INFO* trip) : ActivityItem(type, trip, &g_SportMapInfo) {}

long _SportItem::GetTotalCalorie() {
  const long start = selStartTime - TimeShift();
  const long end = selEndTime - TimeShift();
  return GetSelectedCalorie(start, end) + GetCalorieBMR(start, end);
}

long _SportItem::GetCalorieBMR(long start, long end) { return RestingEnergy(Owner(), start, end); }

long _SportItem::GetSelectedCalorie(long start, long end) {
  const Person owner = Owner();
  long resting = 0;
  if (start == 0 && end == 0) {
    start = whole.startTime - TimeShift();
    end = whole.endTime - TimeShift();
    resting = RestingEnergy(owner, start, end);
  }
  return ExerciseEnergy(points, FindRange(points, start, end, true), type, owner) + resting;
}

int _SportItem::GetAge() { return Owner().age; }

double _SportItem::GetMaxHeartRate() { return MaxHeartRate(Owner()); }

long _SportItem::_GetCalorie(long movingSeconds, double speedKmh, long restSeconds) {
  return WorkoutEnergy(type, Owner(), movingSeconds, speedKmh, restSeconds);
}

double _SportItem::_GetMovingCalorie(double weightKg, long seconds, double speedKmh) {
  return MovingEnergy(type, weightKg, seconds, speedKmh);
}
