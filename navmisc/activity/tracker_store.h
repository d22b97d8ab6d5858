// The store of one user's tracker activities, built like the sport store, in
// "TrackerRes/TRACKERRES_INFO.INI" under the data root (see docs/activity-stores.md).
#pragma once

#include "navmisc/activity/calendar_store.h"
#include "navmisc/activity/tracker_item.h"

class TRACKER_DATA_NODE : public navmisc::activity::CalendarStore<_TrackerItem, TRACKER_DATA_NODE> {
 public:
  static constexpr const wchar_t* kFileName = L"TRACKERRES_INFO.INI";

  TRACKER_DATA_NODE() = default;
  TRACKER_DATA_NODE(const TRACKER_DATA_NODE& other) = default;

  // As their sport counterparts (sport_store.h).
  _TrackerItem* AddTrackerItem(TRACKER_ITEM_TYPE type, BLOG_ITEM_INFO* trip) { return AddItem(type, trip); }
  int DeleteTrackerItem(_TrackerItem* item) { return DeleteItem(item); }
  _TrackerItem* GetTrackerItem(BLOG_ITEM_INFO* trip) { return FindItem(trip); }
  int GetTrackerItem(CPoint& point, _TrackerCalendarObj*& month, _TrackerDayObj*& day, _TrackerItem*& item) {
    return HitTest(point, month, day, item);
  }
};
