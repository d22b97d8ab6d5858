// `navmisc sport add|list|remove` and `navmisc tracker add|list|remove`: the two calendar
// stores, which differ only in their folder, file and kinds of activity.
#include <cstdio>
#include <memory>
#include <string>

#include <CLI/CLI.hpp>

#include "activity_cli.h"
#include "cli.h"
#include "navmisc/activity/sport_store.h"
#include "navmisc/activity/tracker_store.h"
#include "navmisc/platform/datetime.h"
#include "navmisc/platform/files.h"
#include "navmisc/platform/format.h"
#include "navmisc/records/trip.h"
#include "navmisc/records/user_profile.h"

namespace navmisc::cli {
namespace {

using navmisc::FormatA;

struct SportCalendar {
  using Store = SPORT_DATA_NODE;
  using Item = _SportItem;
  using Month = _CalendarObj;
  using Day = _DayObj;
  static constexpr const char* kName = "sport";
  static constexpr GPS_APP_PROG_TYPE kApp = GPS_APP_SPORT;
  static constexpr const char* kTypeHelp = "running, cycling or 2 to 6 (default running)";
  static constexpr const char* kDefaultType = "running";
  static Item* Add(Store& s, int type, BLOG_ITEM_INFO* trip) { return s.AddSportItem(SPORT_ITEM_TYPE(type), trip); }
  static int Delete(Store& s, Item* item) { return s.DeleteSportItem(item); }
  static int ParseType(const std::string& text) { return ParseSportType(text); }
  static std::string TypeName(int type) { return SportTypeName(type); }
};

struct TrackerCalendar {
  using Store = TRACKER_DATA_NODE;
  using Item = _TrackerItem;
  using Month = _TrackerCalendarObj;
  using Day = _TrackerDayObj;
  static constexpr const char* kName = "tracker";
  static constexpr GPS_APP_PROG_TYPE kApp = GPS_APP_TRACKER;
  static constexpr const char* kTypeHelp = "the kind of tracker activity, 0 to 99 (default 0)";
  static constexpr const char* kDefaultType = "0";
  static Item* Add(Store& s, int type, BLOG_ITEM_INFO* trip) { return s.AddTrackerItem(TRACKER_ITEM_TYPE(type), trip); }
  static int Delete(Store& s, Item* item) { return s.DeleteTrackerItem(item); }
  static int ParseType(const std::string& text) {
    char* end = nullptr;
    const long v = std::strtol(text.c_str(), &end, 10);
    if (text.empty() || *end || v < 0 || v > 99) Usage("--type must be a number from 0 to 99, not '" + text + "'");
    return static_cast<int>(v);
  }
  static std::string TypeName(int type) { return "kind " + std::to_string(type); }
};

// Reads the store. A missing file is an empty store owned by the profile's user. When the
// store is to be changed, a file that cannot be read, or one some of whose activities cannot,
// is refused: writing it back would forget them, and a later clean-up would delete their trips.
template <class C>
void ReadStore(typename C::Store& store, bool toChange) {
  const CString path = C::Store::GetStorePathName();
  if (store.ReadInfo(0, nullptr) != 1) {
    if (FileExists(path)) Fail("cannot read " + path.ToUtf8() + " (no user name, or not a store file); it stays as it is");
    store.Clear();
    const USER_MAP_INFO* profile = GetUserMapInfo(C::kApp);
    store.userName = profile && !profile->name.IsEmpty() ? profile->name : CString(L"navmisc");
    return;
  }
  if (!store.readGuard.IsComplete()) {
    const std::string why = "not every activity named by " + path.ToUtf8() + " reads: " + store.readGuard.Why().ToUtf8();
    if (toChange) Fail(why + "; the store is left as it is until they can be (see navmisc " + C::kName + " list)");
    std::fprintf(stderr, "navmisc %s: note: %s\n", C::kName, why.c_str());
  }
}

template <class C>
void Save(typename C::Store& store) {
  if (!store.WriteInfo(false, 0, nullptr)) Fail("cannot write " + C::Store::GetStorePathName().ToUtf8());
}

template <class C>
typename C::Item* Find(typename C::Store& store, const CString& tripId) {
  for (auto* m : Items<typename C::Month>(store.months))
    for (auto* d : Items<typename C::Day>(m->days))
      for (auto* item : Items<typename C::Item>(d->items))
        if (item->trip->tripId == tripId) return item;
  return nullptr;
}

template <class C>
std::string Figures(const typename C::Item& item, const USER_MAP_INFO& profile) {
  const auto& w = item.whole;
  const double km = profile.metric ? 1.0 : 1.609344;
  std::string pace = "-";
  if (w.pace > 0) {
    const long perUnit = std::lround(w.pace * km);
    pace = FormatA("%ld:%02ld /%s", perUnit / 60, perUnit % 60, profile.metric ? "km" : "mi");
  }
  return FormatA("%ld:%02ld:%02ld  %.1f %s  moving %ld:%02ld:%02ld  pace %s", long(w.duration / 3600),
                 long(w.duration / 60 % 60), long(w.duration % 60), w.avgSpeed / 1000.0 / km,
                 profile.metric ? "km/h" : "mph", long(w.movingTime / 3600), long(w.movingTime / 60 % 60),
                 long(w.movingTime % 60), pace.c_str());
}

template <class C>
std::string Add(const std::string& tripName, const std::string& typeText) {
  const int type = C::ParseType(typeText);
  typename C::Store store;
  ReadStore<C>(store, true);
  auto trip = OpenTrip(tripName);
  if (trip->appType == C::kApp && Find<C>(store, trip->tripId)) Fail("'" + tripName + "' is filed already");
  int counter = 0;
  bool keepGoing = true;
  if (!RunWithProgress("reading " + tripName, 0, counter, keepGoing, [&] { trip->ReadAllWaypoint(0); })) {
    Fail("stopped; nothing was filed");
  }
  trip = TripOfApplication(std::move(trip), C::kApp);
  BLOG_ITEM_INFO* raw = trip.get();
  typename C::Item* item = C::Add(store, type, raw);
  if (!item) Fail("'" + tripName + "' has no timed points, so no date to file it under");
  trip.release();  // the store has it
  RunWithProgress("summing up", 0, counter, keepGoing, [&] { item->PrepareSummaryData(nullptr, nullptr); });
  Save<C>(store);
  const long start = item->UtcStartTime() + item->TimeShift();
  std::printf("filed %s (%s) as %s on %s: %s\n", raw->tripId.ToUtf8().c_str(), raw->name.ToUtf8().c_str(),
              C::TypeName(item->type).c_str(), TimeTToStdStringTime(start).ToUtf8().substr(0, 10).c_str(),
              Figures<C>(*item, *GetUserMapInfo(C::kApp)).c_str());
  return raw->tripId.ToUtf8();
}

template <class C>
void List() {
  typename C::Store store;
  ReadStore<C>(store, false);
  const USER_MAP_INFO& profile = *GetUserMapInfo(C::kApp);
  std::printf("%s activities of %s (%s)\n", C::kName, store.userName.ToUtf8().c_str(),
              C::Store::GetStorePathName().ToUtf8().c_str());
  for (auto* m : Items<typename C::Month>(store.months)) {
    std::printf("%04d-%02d\n", m->year, m->month);
    for (auto* d : Items<typename C::Day>(m->days)) {
      for (auto* item : Items<typename C::Item>(d->items)) {
        const long start = item->UtcStartTime() + item->TimeShift();
        std::printf("  %02d %s  %-10s %-24s %s  %s\n", d->day, TimeTToStdStringTime(start).ToUtf8().substr(11, 5).c_str(),
                    C::TypeName(item->type).c_str(), item->trip->name.ToUtf8().c_str(),
                    item->trip->tripId.ToUtf8().c_str(), Figures<C>(*item, profile).c_str());
      }
    }
  }
}

template <class C>
void Remove(const std::string& tripId) {
  typename C::Store store;
  ReadStore<C>(store, true);
  typename C::Item* item = Find<C>(store, CString::FromUtf8(tripId));
  if (!item) Fail("no " + std::string(C::kName) + " activity of trip '" + tripId + "' (see navmisc " + C::kName + " list)");
  const std::string name = item->trip->name.ToUtf8();
  if (C::Delete(store, item) != 1) Fail("cannot remove '" + tripId + "'");
  Save<C>(store);
  const int removed = store.RemoveAllUnusedResource();
  std::printf("removed %s (%s)", tripId.c_str(), name.c_str());
  if (removed > 0) std::printf("; %d unused trip folder%s deleted", removed, removed == 1 ? "" : "s");
  std::printf("\n");
}

template <class C>
void AddCalendarCommand(CLI::App& app, const std::string& description, const std::string& details) {
  CLI::App* group = AddCommand(app, C::kName, description, details, [] {}, false);
  group->require_subcommand(1);
  auto trip = std::make_shared<std::string>();
  auto type = std::make_shared<std::string>(C::kDefaultType);
  CLI::App* add = AddCommand(*group, "add", std::string("file a trip as a ") + C::kName + " activity", "",
                             [trip, type] { Add<C>(*trip, *type); });
  add->add_option("TRIP", *trip, "the trip (copied into the application's folder unless it is there)")->required();
  add->add_option("--type", *type, C::kTypeHelp);
  AddCommand(*group, "list", "the calendar: months, days, activities with their stored figures", "", [] { List<C>(); });
  auto removed = std::make_shared<std::string>();
  CLI::App* remove = AddCommand(*group, "remove", "remove an activity and its copy of the trip", "",
                                [removed] { Remove<C>(*removed); });
  remove->add_option("TRIP", *removed, "the trip id of the activity")->required();
}

}  // namespace

std::string FileActivity(GPS_APP_PROG_TYPE app, const std::string& trip, const std::string& type) {
  return app == GPS_APP_TRACKER ? Add<TrackerCalendar>(trip, type) : Add<SportCalendar>(trip, type);
}

void AddSportCommand(CLI::App& app) {
  AddCalendarCommand<SportCalendar>(
      app, "the sport activities: add, list, remove",
      "The sport store (SportRes/SPORTRES_INFO.INI): a calendar of activities, each a trip of the\n"
      "sport application with its type, selection and summary figures. `add` copies a trip of\n"
      "another application into SportRes and sums it up; `remove` takes the activity out and\n"
      "deletes the trip folders of SportRes that no activity names any more (never after a\n"
      "store read in which an activity could not be read). docs/activity-stores.md describes the file.");
}

void AddTrackerCommand(CLI::App& app) {
  AddCalendarCommand<TrackerCalendar>(
      app, "the tracker activities: add, list, remove",
      "The tracker store (TrackerRes/TRACKERRES_INFO.INI), kept like the sport store: `add` files a\n"
      "trip (copied into TrackerRes unless it is a tracker trip), `list` shows the calendar,\n"
      "`remove` takes an activity out and deletes the unused trip folders of TrackerRes.\n"
      "docs/activity-stores.md describes the file.");
}

}  // namespace navmisc::cli
