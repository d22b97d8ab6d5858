// The definitions of the calendar templates, included by the .cpp of each store, which
// instantiates them for its own item and store classes.
#pragma once

#include <algorithm>
#include <cwchar>
#include <vector>

#include "navmisc/activity/calendar_store.h"
#include "navmisc/activity/calories.h"
#include "navmisc/activity/store_file.h"
#include "navmisc/platform/files.h"
#include "navmisc/platform/settings.h"
#include "navmisc/platform/shared_globals.h"
#include "navmisc/records/trip.h"

namespace navmisc::activity {

template <class Item, class Store>
CalendarDay<Item, Store>::~CalendarDay() {
  DeleteAll<Item>(items);
}

template <class Item, class Store>
CalendarMonth<Item, Store>::~CalendarMonth() {
  DeleteAll<CalendarDay<Item, Store>>(days);
}

namespace detail {

// The local calendar date on which a trip starts; false when none can be formed (no tracks, or
// a time outside the calendar).
inline bool TripStartDate(BLOG_ITEM_INFO& trip, int& year, int& month, int& day) {
  const long start = trip.GetUTCStartTime();
  if (start == 2147483647L) return false;
  return LocalDate(start + trip.timeZoneShift, year, month, day);
}

}  // namespace detail

template <class Item, class Store>
CalendarStore<Item, Store>::~CalendarStore() {
  Clear();
}

template <class Item, class Store>
void CalendarStore<Item, Store>::Clear() {
  DeleteAll<Month>(months);
}

template <class Item, class Store>
CString CalendarStore<Item, Store>::GetStorePathName() {
  return PathJoin(GetAppDataFolder(Item::kAppType), Store::kFileName);
}

template <class Item, class Store>
typename CalendarStore<Item, Store>::Month* CalendarStore<Item, Store>::FindMonth(int year, int month) const {
  for (Month* m : Items<Month>(months))
    if (m->year == year && m->month == month) return m;
  return nullptr;
}

template <class Item, class Store>
Item* CalendarStore<Item, Store>::AddItem(int type, BLOG_ITEM_INFO* trip) {
  int year, month, dayOfMonth;
  if (!trip || !detail::TripStartDate(*trip, year, month, dayOfMonth)) return nullptr;

  Month* m = FindMonth(year, month);
  if (!m) {
    m = new Month;
    m->year = year;
    m->month = month;
    m->store = static_cast<Store*>(this);
    POSITION pos = months.GetHeadPosition();
    for (; pos; months.GetNext(pos)) {
      const Month* other = static_cast<Month*>(months.GetAt(pos));
      if (other->year > year || (other->year == year && other->month > month)) break;
    }
    pos ? months.InsertBefore(pos, m) : months.AddTail(m);
  }

  Day* d = nullptr;
  POSITION pos = m->days.GetHeadPosition();
  for (; pos; m->days.GetNext(pos)) {
    Day* other = static_cast<Day*>(m->days.GetAt(pos));
    if (other->day == dayOfMonth) d = other;
    if (other->day >= dayOfMonth) break;
  }
  if (!d) {
    d = new Day;
    d->day = dayOfMonth;
    d->month = m;
    pos ? m->days.InsertBefore(pos, d) : m->days.AddTail(d);
  }

  auto* item = new Item(type, trip);
  item->day = d;
  pos = d->items.GetHeadPosition();
  for (; pos; d->items.GetNext(pos)) {
    if (static_cast<Item*>(d->items.GetAt(pos))->UtcStartTime() > item->UtcStartTime()) break;
  }
  pos ? d->items.InsertBefore(pos, item) : d->items.AddTail(item);
  ++d->count;
  return item;
}

template <class Item, class Store>
Item* CalendarStore<Item, Store>::FindItem(BLOG_ITEM_INFO* trip) {
  int year, month, dayOfMonth;
  if (!trip || !detail::TripStartDate(*trip, year, month, dayOfMonth)) return nullptr;
  Month* m = FindMonth(year, month);
  if (!m) return nullptr;
  for (Day* d : Items<Day>(m->days)) {
    if (d->day != dayOfMonth) continue;
    for (Item* item : Items<Item>(d->items))
      if (item->trip == trip) return item;
  }
  return nullptr;
}

template <class Item, class Store>
int CalendarStore<Item, Store>::DeleteItem(Item* item) {
  if (!item || FindItem(item->trip) != item) return 0;
  Day* d = item->day;
  d->items.RemoveAt(d->items.Find(item));
  --d->count;
  delete item;
  if (d->items.IsEmpty()) {
    Month* m = d->month;
    m->days.RemoveAt(m->days.Find(d));
    delete d;
    if (m->days.IsEmpty()) {
      months.RemoveAt(months.Find(m));
      delete m;
    }
  }
  return 1;
}

template <class Item, class Store>
int CalendarStore<Item, Store>::HitTest(const CPoint& point, Month*& month, Day*& day, Item*& item) {
  month = nullptr;
  day = nullptr;
  item = nullptr;
  for (Month* m : Items<Month>(months)) {
    if (m->rect.PtInRect(point)) {
      month = m;
      break;
    }
  }
  if (!month) return 0;
  for (Day* d : Items<Day>(month->days)) {
    if (d->rect.PtInRect(point)) {
      day = d;
      break;
    }
  }
  if (!day) return 1;
  int n = 0;
  for (Item* i : Items<Item>(day->items)) {
    if (n++ >= day->count) break;
    if (i->rect.PtInRect(point)) {
      item = i;
      break;
    }
  }
  return 1;
}

template <class Item, class Store>
typename CalendarStore<Item, Store>::Month* CalendarStore<Item, Store>::GetNextCalendarObj(Month* month) {
  POSITION pos = month ? months.Find(month) : nullptr;
  if (!pos || months.GetCount() < 2) return nullptr;
  POSITION next = pos;
  months.GetNext(next);
  if (next) return static_cast<Month*>(months.GetAt(next));
  POSITION prev = pos;
  months.GetPrev(prev);
  return static_cast<Month*>(months.GetAt(prev));
}

template <class Item, class Store>
typename CalendarStore<Item, Store>::Month* CalendarStore<Item, Store>::GetRecentCalendarObj() {
  return months.IsEmpty() ? nullptr : static_cast<Month*>(months.GetTail());
}

template <class Item, class Store>
int CalendarStore<Item, Store>::ReadInfo(unsigned long handle, const wchar_t* section) {
  readGuard.Begin();
  StoreFileReader file(handle, section, GetStorePathName());
  const CString name = file.ok() ? RD_STRING(file.handle(), file.section(), L"user_name", L"") : CString();
  if (name.IsEmpty()) return 0;
  handle = file.handle();
  section = file.section();
  Clear();
  userName = name;
  const CString prefix = Item::kKeyPrefix;
  const int count = std::max(RD_INT(handle, section, prefix + L"_count", 0), 0);
  // Only the sections the file holds are visited: a count of two thousand million costs no
  // more than the sections there are.
  const std::vector<int> numbers = SectionIndices(handle, prefix + L"_(%d)", count);
  // A count beyond the sections present names activities that are gone.
  if (numbers.size() < static_cast<size_t>(count)) {
    readGuard.Missed(FormatString(L"%s names %d activities, of which %d have a section",
                                  static_cast<const wchar_t*>(PathFileName(GetStorePathName())), count,
                                  static_cast<int>(numbers.size())));
  }

  for (int n : numbers) {
    const CString s = FormatString(L"%s_(%d)", static_cast<const wchar_t*>(prefix), n);
    const int type = RD_INT(handle, s, L"type", 7);
    const CString res = RD_STRING(handle, s, L"res_info", L"");
    // The id is a folder of the data folder: anything but one plain name drops the activity.
    if (!IsPlainPathComponent(res)) {
      readGuard.Missed(L"activity " + s + L" names no folder of its own (\"" + res + L"\")");
      continue;
    }
    auto* trip = new BLOG_ITEM_INFO(Item::kAppType, res, 0);
    Item* item = trip->ReadInfo() == 1 ? AddItem(type, trip) : nullptr;
    if (!item) {
      delete trip;
      readGuard.Missed(L"the trip " + res + L" of activity " + s + L" cannot be read");
      continue;
    }
    item->ReadStoreKeys(handle, s);
  }
  readGuard.Finish();
  return 1;
}

template <class Item, class Store>
bool CalendarStore<Item, Store>::WriteInfo(bool writeTrips, unsigned long handle, const wchar_t* section) {
  StoreFileWriter file(handle, section, GetStorePathName());
  if (!file.ok()) return false;
  handle = file.handle();
  section = file.section();
  WR_STRING(handle, section, L"user_name", userName);
  const CString prefix = Item::kKeyPrefix;
  int counter = 0;
  for (Month* m : Items<Month>(months)) {
    for (Day* d : Items<Day>(m->days)) {
      for (Item* item : Items<Item>(d->items)) {
        // The number advances for every activity, so one without a trip leaves a gap.
        const int n = counter++;
        if (!item->trip) continue;
        item->WriteStoreKeys(handle, FormatString(L"%s_(%d)", static_cast<const wchar_t*>(prefix), n));
        if (writeTrips) item->trip->WriteInfo(1, nullptr, nullptr);
      }
    }
  }
  WR_INT(handle, section, prefix + L"_count", counter);
  return file.Finish();
}

template <class Item, class Store>
void CalendarStore<Item, Store>::_FindAllUsedResource(CStringList& ids) {
  ids.RemoveAll();
  for (Month* m : Items<Month>(months))
    for (Day* d : Items<Day>(m->days))
      for (Item* item : Items<Item>(d->items))
        if (item->trip) ids.AddTail(item->trip->tripId);
}

template <class Item, class Store>
int CalendarStore<Item, Store>::RemoveAllUnusedResource() {
  CStringList used;
  _FindAllUsedResource(used);
  // The folder is named through a file name in it, which is never created.
  return RemoveUnusedResourceFolders(PathFolder(PathJoin(GetAppDataFolder(Item::kAppType), L"dumy.file")), used,
                                     readGuard, ResourceRemoval::kOnePass);
}

}  // namespace navmisc::activity
