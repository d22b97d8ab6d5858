// What the sport and the tracker stores share: the calendar, its settings file (see
// docs/activity-stores.md), filing, finding, hit tests and the clean-up of the data folder.
//
// `Item` provides kAppType (the application whose data folder holds the trips), kKeyPrefix
// ("sport_item"), a constructor (int type, BLOG_ITEM_INFO* trip) that takes the trip, the
// fields `trip` and `day`, UtcStartTime(), and ReadStoreKeys/WriteStoreKeys. `Store` provides
// kFileName ("SPORTRES_INFO.INI").
#pragma once

#include "navmisc/activity/calendar.h"
#include "navmisc/platform/cstring.h"
#include "navmisc/platform/lists.h"
#include "navmisc/platform/types.h"
#include "navmisc/records/resource_cleanup.h"

class BLOG_ITEM_INFO;

namespace navmisc::activity {

template <class Item, class Store>
class CalendarStore {
 public:
  using Month = CalendarMonth<Item, Store>;
  using Day = CalendarDay<Item, Store>;

  CalendarStore() = default;
  // Copies the user name only.
  CalendarStore(const CalendarStore& other) : userName(other.userName) {}
  CalendarStore& operator=(const CalendarStore&) = delete;
  virtual ~CalendarStore();

  // Reads the store. A null handle opens the store's own file and reads the section "SECTION";
  // otherwise the given open file and section. 0 when the file cannot be opened or names no
  // user; activities whose trip cannot be read are left out (and the read is then not
  // complete, so no clean-up runs). Costs time in proportion to the file, whatever count it
  // claims.
  int ReadInfo(unsigned long handle, const wchar_t* section);
  // Writes the store (the mirror of ReadInfo). With `writeTrips` every activity's trip writes
  // its own settings file too. False when the file could not be written.
  bool WriteInfo(bool writeTrips, unsigned long handle, const wchar_t* section);

  // The month after `month`; the one before when it is the last; null when it is the only one
  // or not in the store.
  Month* GetNextCalendarObj(Month* month);
  // The most recent month, or null.
  Month* GetRecentCalendarObj();

  // Deletes every folder of the store's data folder that no activity's trip names. Does nothing
  // unless the last read was complete (see readGuard). The number of folders removed, -1 when
  // the guard refused.
  int RemoveAllUnusedResource();

  // Removes every activity.
  void Clear();
  // The store's settings file: data root, the application's folder, kFileName.
  static CString GetStorePathName();

  CString userName;  // the owner; an empty name marks an empty store
  CPtrList months;   // Month*, owned; by year, then month
  CompleteReadGuard readGuard;

 protected:
  // Files a new activity of `type` for `trip` (taking the trip); null when the trip's start
  // date cannot be formed (the trip then stays the caller's).
  Item* AddItem(int type, BLOG_ITEM_INFO* trip);
  // 1 when `item` was the store's activity of its trip and is now destroyed; 0 otherwise.
  int DeleteItem(Item* item);
  // The activity of that very trip, or null.
  Item* FindItem(BLOG_ITEM_INFO* trip);
  // Hit test: 0 with all three null when no month contains the point; otherwise 1, with the
  // month and, when they contain the point too, the day and the activity.
  int HitTest(const CPoint& point, Month*& month, Day*& day, Item*& item);
  // Empties `ids` and adds the id of every activity's trip.
  void _FindAllUsedResource(CStringList& ids);

 private:
  Month* FindMonth(int year, int month) const;
};

}  // namespace navmisc::activity
