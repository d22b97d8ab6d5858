// One sport activity: a trip seen as a workout, with its summary figures and calories.
#pragma once

#include <cstdint>

#include "navmisc/activity/activity_item.h"
#include "navmisc/activity/calendar.h"
#include "navmisc/platform/types.h"

class _SportItem;
class SPORT_DATA_NODE;
using _CalendarObj = navmisc::activity::CalendarMonth<_SportItem, SPORT_DATA_NODE>;
using _DayObj = navmisc::activity::CalendarDay<_SportItem, SPORT_DATA_NODE>;

// 0 cycling, 1 running, 2 to 6 sports of fixed intensity; any other value is "unknown".
enum SPORT_ITEM_TYPE : int32_t { SPORT_ITEM_CYCLING = 0, SPORT_ITEM_RUNNING = 1 };

class _SportItem : public navmisc::activity::ActivityItem<navmisc::activity::SportFigures> {
 public:
  static constexpr GPS_APP_PROG_TYPE kAppType = GPS_APP_SPORT;
  static constexpr const wchar_t* kKeyPrefix = L"sport_item";

  // Takes `trip`; the owner is the sport application's profile (g_SportMapInfo).
  _SportItem(int32_t type, BLOG_ITEM_INFO* trip);

  // Calories in small calories (1/1000 kcal). All ranges are UTC seconds.
  //
  // Exercise plus resting energy of the selected range.
  long GetTotalCalorie();
  // Resting energy of [start, end] by the Harris-Benedict rate.
  long GetCalorieBMR(long start, long end);
  // Exercise energy of [start, end]; with both 0, of the whole activity and with its resting
  // energy added.
  long GetSelectedCalorie(long start, long end);
  // The owner's age in whole years on the activity's date; 0 when the birth year is unknown.
  int GetAge();
  double GetMaxHeartRate();
  // The workout model: `movingSeconds` at `speedKmh` plus `restSeconds` at rest.
  long _GetCalorie(long movingSeconds, double speedKmh, long restSeconds);
  // Moving `seconds` at `speedKmh` for a person of `weightKg`, by the sport's MET table.
  double _GetMovingCalorie(double weightKg, long seconds, double speedKmh);

  _DayObj* day = nullptr;  // the calendar day that holds the activity
};
