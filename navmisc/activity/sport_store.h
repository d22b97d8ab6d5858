// The store of one user's sport activities: a calendar of months, days and activities, kept in
// "SportRes/SPORTRES_INFO.INI" under the data root (see docs/activity-stores.md), each
// activity's trip in its own folder of "SportRes".
#pragma once

#include "navmisc/activity/calendar_store.h"
#include "navmisc/activity/sport_item.h"
#include "navmisc/platform/cstring.h"

class SPORT_DATA_NODE : public navmisc::activity::CalendarStore<_SportItem, SPORT_DATA_NODE> {
 public:
  static constexpr const wchar_t* kFileName = L"SPORTRES_INFO.INI";

  // The first store made loads the texts of the sport views (g_szSportViewTexts).
  SPORT_DATA_NODE();
  SPORT_DATA_NODE(const SPORT_DATA_NODE& other);

  // Files a new activity for `trip`, which the store takes; null when the trip's start date
  // cannot be formed (the trip then stays the caller's).
  _SportItem* AddSportItem(SPORT_ITEM_TYPE type, BLOG_ITEM_INFO* trip) { return AddItem(type, trip); }
  // Destroys the activity and its trip, with a day or month left empty. 0 when `item` is null
  // or not the store's activity of its trip.
  int DeleteSportItem(_SportItem* item) { return DeleteItem(item); }
  // The activity of that very trip (found by the trip's local start date), or null.
  _SportItem* GetSportItem(BLOG_ITEM_INFO* trip) { return FindItem(trip); }
  // Hit test of the calendar view: 0 when no month contains the point (all three null);
  // otherwise 1 with the month and, where they contain the point, the day and the activity.
  int GetSportItem(CPoint& point, _CalendarObj*& month, _DayObj*& day, _SportItem*& item) {
    return HitTest(point, month, day, item);
  }
};

// The two texts of the sport views (resource texts 9653 and 9654).
extern CString g_szSportViewTexts[2];
