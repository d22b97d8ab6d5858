// One tracker activity: a trip recorded for everyday tracking, with a simpler summary than a
// sport activity (no heart rate, cadence or moving speed) and no calorie model yet.
#pragma once

#include <cstdint>

#include "navmisc/activity/activity_item.h"
#include "navmisc/activity/calendar.h"
#include "navmisc/platform/types.h"

class _TrackerItem;
class TRACKER_DATA_NODE;
using _TrackerCalendarObj = navmisc::activity::CalendarMonth<_TrackerItem, TRACKER_DATA_NODE>;
using _TrackerDayObj = navmisc::activity::CalendarDay<_TrackerItem, TRACKER_DATA_NODE>;

// The kind of a tracker activity; the tracker application gives the values their meaning.
enum TRACKER_ITEM_TYPE : int32_t { TRACKER_ITEM_DEFAULT = 0 };

class _TrackerItem : public navmisc::activity::ActivityItem<navmisc::activity::TrackerFigures> {
 public:
  static constexpr GPS_APP_PROG_TYPE kAppType = GPS_APP_TRACKER;
  static constexpr const wchar_t* kKeyPrefix = L"tracker_item";

  // Takes `trip`; the owner is the tracker application's profile (g_TrackerMapInfo).
  _TrackerItem(int32_t type, BLOG_ITEM_INFO* trip);

  // Calories of the whole activity and of the selection, through _GetCalorie: always 0.
  long GetTotalCalorie();
  long GetSelectedCalorie();
  // The place for a tracker calorie model; there is none, so every activity reports 0.
  long _GetCalorie(long movingSeconds, double speedKmh, long restSeconds);

  _TrackerDayObj* day = nullptr;  // the calendar day that holds the activity
};
