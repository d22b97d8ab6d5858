#include "navmisc/activity/sport_store.h"

#include <gtest/gtest.h>

#include <unistd.h>

#include <algorithm>
#include <map>
#include <tuple>

#include "navmisc/activity/detail/test_support.h"
#include "navmisc/activity/tracker_store.h"
#include "navmisc/platform/datetime.h"
#include "navmisc/platform/files.h"
#include "navmisc/records/user_profile.h"

namespace {

using navmisc::activitytest::NewTrip;
using navmisc::activitytest::Pt;
using navmisc::activitytest::Saved;
using navmisc::testutil::ReadFileBytes;
using navmisc::testutil::TempDir;
using navmisc::testutil::WriteFileBytes;

class SportStore : public navmisc::testutil::RecordTest {
 protected:
  // A ten-minute sport trip starting at `start` (UTC), in memory.
  static BLOG_ITEM_INFO* TripAt(long start, int32_t shift = 0) {
    return NewTrip(GPS_APP_SPORT, {{int32_t(start), 47.0, 8.0}, {int32_t(start + 600), 47.01, 8.0}}, shift);
  }
  static long At(int y, int m, int d, int h = 8) { return DateTimeToLong(m, d, y, h, 0, 0); }
};

// The calendar as text: "2024-05: 1[c] 3[f a b]" with the trips' names.
std::string Calendar(SPORT_DATA_NODE& store) {
  std::string out;
  for (auto* m : navmisc::Items<_CalendarObj>(store.months)) {
    out += (out.empty() ? "" : " | ") + std::to_string(m->year) + "-" + std::to_string(m->month) + ":";
    for (auto* d : navmisc::Items<_DayObj>(m->days)) {
      out += " " + std::to_string(d->day) + "[";
      for (auto* item : navmisc::Items<_SportItem>(d->items)) out += item->trip->name.ToUtf8();
      out += "]";
      EXPECT_EQ(d->count, d->items.GetCount());
      EXPECT_EQ(d->month, m);
    }
    EXPECT_EQ(m->store, &store);
  }
  return out;
}

TEST_F(SportStore, FilesActivitiesInOrderFindsAndDeletesThem) {
  SPORT_DATA_NODE store;
  const struct {
    const char* name;
    long start;
    int32_t shift;
  } trips[] = {
      {"a", At(2024, 5, 3), 0},          {"b", At(2024, 5, 3), 0},  // the same start: kept in order
      {"c", At(2024, 5, 1), 0},          {"d", At(2024, 3, 10), 0},
      {"e", At(2023, 12, 31), 0},        {"f", At(2024, 5, 3, 7), 0},
      {"g", At(2024, 5, 31, 23), 3600},  // 00:00 local on 1 June
  };
  std::map<std::string, _SportItem*> items;
  for (const auto& t : trips) {
    BLOG_ITEM_INFO* trip = TripAt(t.start, t.shift);
    trip->name = CString::FromUtf8(t.name);
    items[t.name] = store.AddSportItem(SPORT_ITEM_RUNNING, trip);
    ASSERT_NE(items[t.name], nullptr) << t.name;
    EXPECT_EQ(store.GetSportItem(trip), items[t.name]);
  }
  EXPECT_EQ(Calendar(store), "2023-12: 31[e] | 2024-3: 10[d] | 2024-5: 1[c] 3[fab] | 2024-6: 1[g]");

  // A trip without tracks has no date: not filed, and still the caller's.
  std::unique_ptr<BLOG_ITEM_INFO> empty(new BLOG_ITEM_INFO(GPS_APP_SPORT, nullptr, 0));
  EXPECT_EQ(store.AddSportItem(SPORT_ITEM_CYCLING, empty.get()), nullptr);
  EXPECT_EQ(store.GetSportItem(empty.get()), nullptr);

  // Neighbouring months.
  auto* first = static_cast<_CalendarObj*>(store.months.GetHead());
  auto* last = static_cast<_CalendarObj*>(store.months.GetTail());
  _CalendarObj stranger(*first);
  EXPECT_EQ(store.GetNextCalendarObj(first)->year * 100 + store.GetNextCalendarObj(first)->month, 202403);
  EXPECT_EQ(store.GetNextCalendarObj(last)->month, 5);
  EXPECT_EQ(store.GetNextCalendarObj(&stranger), nullptr);
  EXPECT_EQ(store.GetRecentCalendarObj(), last);

  // Deleting: only the store's own activities; empty days and months go with their last one.
  SPORT_DATA_NODE other;
  EXPECT_EQ(store.DeleteSportItem(nullptr), 0);
  _SportItem foreign(0, TripAt(At(2024, 5, 3)));
  EXPECT_EQ(store.DeleteSportItem(&foreign), 0);
  for (const char* name : {"g", "a", "c", "e"}) EXPECT_EQ(store.DeleteSportItem(items[name]), 1) << name;
  EXPECT_EQ(Calendar(store), "2024-3: 10[d] | 2024-5: 3[fb]");
  EXPECT_EQ(store.GetRecentCalendarObj()->month, 5);
  for (const char* name : {"f", "b"}) EXPECT_EQ(store.DeleteSportItem(items[name]), 1) << name;
  EXPECT_EQ(store.GetRecentCalendarObj()->month, 3);
  EXPECT_EQ(store.GetNextCalendarObj(store.GetRecentCalendarObj()), nullptr);  // the only month
  EXPECT_EQ(store.DeleteSportItem(items["d"]), 1);
  EXPECT_EQ(store.GetRecentCalendarObj(), nullptr);
  EXPECT_TRUE(store.months.IsEmpty());
}

TEST_F(SportStore, HitTests) {
  SPORT_DATA_NODE store;
  _SportItem* early = store.AddSportItem(SPORT_ITEM_RUNNING, TripAt(At(2024, 5, 3, 7)));
  _SportItem* late = store.AddSportItem(SPORT_ITEM_RUNNING, TripAt(At(2024, 5, 3, 9)));
  store.AddSportItem(SPORT_ITEM_RUNNING, TripAt(At(2024, 6, 1)));
  auto* may = static_cast<_CalendarObj*>(store.months.GetHead());
  auto* day = static_cast<_DayObj*>(may->days.GetHead());
  may->rect = {0, 0, 700, 500};
  static_cast<_CalendarObj*>(store.months.GetTail())->rect = {800, 0, 1500, 500};
  day->rect = {100, 100, 200, 200};
  early->rect = {100, 100, 200, 150};
  late->rect = {100, 150, 200, 200};

  const struct {
    CPoint at;
    int result;
    _CalendarObj* month;
    _DayObj* day;
    _SportItem* item;
  } cases[] = {
      {{750, 10}, 0, nullptr, nullptr, nullptr},  // between the months
      {{10, 10}, 1, may, nullptr, nullptr},       // in May, on no day
      {{150, 120}, 1, may, day, early},
      {{150, 150}, 1, may, day, late},            // the top edge belongs to the rectangle
      {{199, 199}, 1, may, day, late},
      {{200, 199}, 1, may, nullptr, nullptr},     // the right edge does not
  };
  for (const auto& c : cases) {
    CPoint at = c.at;
    _CalendarObj* m = reinterpret_cast<_CalendarObj*>(1);
    _DayObj* d = reinterpret_cast<_DayObj*>(1);
    _SportItem* i = reinterpret_cast<_SportItem*>(1);
    EXPECT_EQ(store.GetSportItem(at, m, d, i), c.result) << at.x << "," << at.y;
    EXPECT_EQ(std::tuple(m, d, i), std::tuple(c.month, c.day, c.item)) << at.x << "," << at.y;
  }
  // Only the first `count` activities of a day are tested.
  day->count = 1;
  CPoint at{150, 160};
  _CalendarObj* m;
  _DayObj* d;
  _SportItem* i;
  EXPECT_EQ(store.GetSportItem(at, m, d, i), 1);
  EXPECT_EQ(std::tuple(m, d, i), std::tuple(may, day, nullptr));
  day->count = 2;
}

TEST_F(SportStore, SummaryCaloriesAndTheOwnersBody) {
  g_SportMapInfo.year = 1985;
  g_SportMapInfo.month = 6;
  g_SportMapInfo.day = 15;
  g_SportMapInfo.SetWeightHeight(1, 1, 2024, 72.5, 178.0);
  // Ten minutes of running at 3 m/s (10.8 km/h, MET 12.6), one fix a second northwards, with a
  // heart rate of 110 (below 65 % of 181.1) for the first half.
  const long start = At(2024, 5, 1);
  std::vector<Pt> pts;
  for (int s = 0; s < 600; ++s) pts.push_back({int32_t(start + s), 47.0 + s * 3.0 / 111195.0, 8.0, 400.0, 10800});
  BLOG_ITEM_INFO* trip = NewTrip(GPS_APP_SPORT, pts, 7200);
  auto* track = static_cast<TRACK_ITEM_INFO*>(trip->tracks.GetHead());
  for (int32_t t = int32_t(start); t < start + 300; t += 24)
    track->heartRates.AddTail(navmisc::activitytest::HeartRates(t, std::vector<uint8_t>(24, 110)));

  _SportItem item(SPORT_ITEM_RUNNING, trip);
  item.PrepareSummaryData(nullptr, nullptr);
  const auto& w = item.whole;
  EXPECT_EQ(std::tuple(w.startTime, w.duration, w.movingTime, w.maxHeartRate, w.avgHeartRate),
            std::tuple(int32_t(start + 7200), 599, 599, 110, 110));
  EXPECT_NEAR(w.distance, 1797.0, 0.5);
  EXPECT_NEAR(w.movingDistance, w.distance, 0.5);
  EXPECT_EQ(w.pace, 333);  // 599 s over 1.797 km
  EXPECT_EQ(item.selected.duration, 599);
  EXPECT_EQ(std::tuple(item.GetAge(), item.GetMaxHeartRate()), std::tuple(38, 202.0 - 0.55 * 38));

  // 599 pairs of 253.75 each, plus the resting 599 s of a 38-year-old man of 72.5 kg, 178 cm.
  EXPECT_EQ(item.GetCalorieBMR(start, start + 599), 11767);
  EXPECT_EQ(item.GetTotalCalorie(), 151996 + 11767);
  EXPECT_EQ(item.GetSelectedCalorie(0, 0), 151996 + 11767);  // the whole activity, resting included
  // A lap of the TCX export is the same activity.
  EXPECT_EQ(navmisc::activity::TrackEnergy(*track, SPORT_ITEM_RUNNING), item.GetTotalCalorie());
  EXPECT_EQ(item._GetCalorie(0, 0.0, 0), 0);
  EXPECT_DOUBLE_EQ(item._GetMovingCalorie(72.5, 1, 10.8), 253.75);

  // Selecting the first half recomputes the selection only.
  item.UpdateSelSummaryData(start, start + 299, nullptr);
  EXPECT_EQ(std::tuple(item.selStartTime, item.selEndTime, item.selected.duration, item.whole.duration),
            std::tuple(int32_t(start + 7200), int32_t(start + 7499), 299, 599));
  EXPECT_EQ(item.GetTotalCalorie(), 75871 + 5873);
  EXPECT_EQ(item.selected.movingTime, 299);  // the part of the one long segment inside

  // Weight on the activity's date.
  double kg = 0, cm = 0;
  EXPECT_TRUE(item.GetWeightHeight(kg, cm));
  EXPECT_EQ(std::tuple(kg, cm), std::tuple(72.5, 178.0));
  EXPECT_FALSE(item.SetWeightHeight(72.5, 178.0));
  EXPECT_TRUE(item.SetWeightHeight(71.0, 178.0));
  EXPECT_TRUE(g_SportMapInfo.GetWeightHeight(5, 1, 2024, kg, cm));
  EXPECT_EQ(kg, 71.0);
}

TEST_F(SportStore, RoundTripOfTheStoreFile) {
  SPORT_DATA_NODE store;
  store.userName = L"Ann";
  _SportItem* ride = store.AddSportItem(SPORT_ITEM_CYCLING, Saved(TripAt(At(2024, 5, 3))));
  _SportItem* swim = store.AddSportItem(SPORT_ITEM_TYPE(4), Saved(TripAt(At(2024, 4, 2))));
  ride->PrepareSummaryData(nullptr, nullptr);
  ride->curSelTab = 2;
  ride->createTime = 1700000000;
  swim->selStartTime = 5;
  ASSERT_TRUE(store.WriteInfo(false, 0, nullptr));

  const std::string text = ReadFileBytes(SPORT_DATA_NODE::GetStorePathName());
  EXPECT_NE(text.find("[SECTION]\nuser_name=Ann\nsport_item_count=2\n"), std::string::npos) << text;
  EXPECT_NE(text.find("[sport_item_(1)]\ntype=0\nres_info=" + ride->trip->tripId.ToUtf8() + "\nsel_starttime="),
            std::string::npos)
      << text;

  SPORT_DATA_NODE back;
  ASSERT_EQ(back.ReadInfo(0, nullptr), 1);
  EXPECT_TRUE(back.readGuard.IsComplete());
  EXPECT_EQ(back.userName, L"Ann");
  auto* rideBack = static_cast<_SportItem*>(
      static_cast<_DayObj*>(static_cast<_CalendarObj*>(back.months.GetTail())->days.GetHead())->items.GetHead());
  EXPECT_EQ(rideBack->trip->tripId, ride->trip->tripId);
  EXPECT_EQ(std::tuple(rideBack->type, rideBack->curSelTab, rideBack->createTime, rideBack->selStartTime,
                       rideBack->selEndTime, rideBack->whole.duration, rideBack->whole.movingTime, rideBack->whole.pace),
            std::tuple(ride->type, 2, 1700000000, ride->selStartTime, ride->selEndTime, 600, ride->whole.movingTime,
                       ride->whole.pace));
  EXPECT_DOUBLE_EQ(rideBack->whole.avgSpeed, ride->whole.avgSpeed);
  auto* swimBack = back.GetSportItem(static_cast<_SportItem*>(
      static_cast<_DayObj*>(static_cast<_CalendarObj*>(back.months.GetHead())->days.GetHead())->items.GetHead())->trip);
  ASSERT_NE(swimBack, nullptr);
  EXPECT_EQ(std::tuple(swimBack->type, swimBack->selStartTime), std::tuple(4, 5));

  // A sport and a tracker store of the same user never see each other's activities.
  TRACKER_DATA_NODE tracker;
  tracker.userName = L"Ann";
  tracker.AddTrackerItem(TRACKER_ITEM_DEFAULT,
                         Saved(NewTrip(GPS_APP_TRACKER, {{int32_t(At(2024, 5, 3)), 51.5, 0.0}, {int32_t(At(2024, 5, 3) + 60), 51.5, 0.01}})));
  ASSERT_TRUE(tracker.WriteInfo(true, 0, nullptr));
  TRACKER_DATA_NODE trackerBack;
  SPORT_DATA_NODE sportAgain;
  ASSERT_EQ(trackerBack.ReadInfo(0, nullptr), 1);
  ASSERT_EQ(sportAgain.ReadInfo(0, nullptr), 1);
  EXPECT_EQ(std::tuple(trackerBack.months.GetCount(), sportAgain.months.GetCount()), std::tuple(1, 2));
  EXPECT_NE(ReadFileBytes(TRACKER_DATA_NODE::GetStorePathName()).find("tracker_item_count=1"), std::string::npos);
  auto* walkDay = static_cast<_TrackerDayObj*>(static_cast<_TrackerCalendarObj*>(trackerBack.months.GetHead())->days.GetHead());
  auto* walk = static_cast<_TrackerItem*>(walkDay->items.GetHead());
  walk->PrepareSummaryData(nullptr, nullptr);
  EXPECT_NEAR(walk->whole.distance, 692.2, 0.1);  // 0.01 degrees of longitude at 51.5 degrees north
  EXPECT_EQ(std::tuple(walk->GetTotalCalorie(), walk->GetSelectedCalorie()), std::tuple(0L, 0L));
}

TEST_F(SportStore, MergedPointsCarryReadingsAndTheTripsMarks) {
  std::unique_ptr<BLOG_ITEM_INFO> trip(NewTrip(GPS_APP_SPORT, {{30, 47.0, 8.0, 0, 0, -1}, {10, 45.0, 45.0, 0, 0, -2},
                                                               {-1, 47.0, 8.0}, {20, 0.0, 0.0}}));
  auto* track = static_cast<TRACK_ITEM_INFO*>(trip->tracks.GetHead());
  track->heartRates.AddTail(navmisc::activitytest::HeartRates(10, {0, 0, 140}));  // 0: no reading
  auto* wheel = new WHEEL_SPEED_ITEM_INFO;
  wheel->time = 20;
  wheel->values[0] = 4.5;
  track->wheelSpeeds.AddTail(wheel);
  navmisc::activitytest::AddTrack(*trip, {{20, 47.1, 8.1, 0, 0, -2}})->hasGpsData = false;

  auto merged = [&](const CPtrList* hr) {
    navmisc::activity::PointVector points;
    navmisc::activity::MergePoints(trip->tracks, hr, nullptr, points);
    std::vector<std::tuple<int32_t, int32_t, int, int, double>> out;  // time, state, flags, bpm, m/s
    for (const auto& p : points) out.emplace_back(p.time, p.type, p.present, p.heartRate, p.speedReading);
    return out;
  };
  using Merged = std::vector<std::tuple<int32_t, int32_t, int, int, double>>;
  // In time order (the second track's point after the first's of the same second); the untimed
  // point gone; no position at 45/45, 0/0 or on a track without GPS data.
  EXPECT_EQ(merged(nullptr), (Merged{{10, -2, 0, 0, 0.0}, {20, 0, 8, 0, 4.5}, {20, -2, 8, 0, 4.5}, {30, -1, 1, 0, 0.0}}));
  CPtrList other;  // heart rate from a list of the caller's instead of the tracks'
  std::unique_ptr<HEARTRATE_ITEM_INFO> hr(navmisc::activitytest::HeartRates(30, {150}));
  other.AddTail(hr.get());
  EXPECT_EQ(std::get<3>(merged(&other)[3]), 150);
  EXPECT_EQ(std::get<2>(merged(&other)[3]), 3);
  // Marks count only where the trip's settings hide them.
  trip->optRedundance = false;
  EXPECT_EQ(std::get<1>(merged(nullptr)[3]), 0);
  trip->optOptimize = false;
  EXPECT_EQ(std::get<1>(merged(nullptr)[0]), 0);
}

// The store file of the clean-up tests: `sections` follow the head.
void WriteStoreFile(const std::string& head, const std::string& sections) {
  MakeDir(GetAppDataFolder(GPS_APP_SPORT));
  WriteFileBytes(SPORT_DATA_NODE::GetStorePathName(), "[SECTION]\n" + head + "\n" + sections);
}

TEST_F(SportStore, HostileFilesDropWhatTheyCannotUseAndStopTheCleanUp) {
  BLOG_ITEM_INFO* kept = Saved(TripAt(At(2024, 5, 3)));
  BLOG_ITEM_INFO* other = Saved(TripAt(At(2024, 5, 4)));
  const std::string keptId = kept->tripId.ToUtf8(), otherId = other->tripId.ToUtf8();
  delete kept;
  delete other;
  auto section = [](int n, const std::string& res) {
    return "[sport_item_(" + std::to_string(n) + ")]\ntype=1\nres_info=" + res + "\n";
  };
  const CString sport = GetAppDataFolder(GPS_APP_SPORT);
  // Beside the two trips: an orphan folder, a trip folder that cannot be read, and a file.
  MakeDir(PathJoin(sport, L"orphan"));
  MakeDir(PathJoin(sport, L"broken"));
  WriteFileBytes(PathJoin(sport, L"notes.txt"), "keep");
  TempDir outside;
  WriteFileBytes(outside / L"precious", "x");

  const struct {
    const char* what;
    std::string head, sections;
    int result;
    int activities;
    bool complete;
  } cases[] = {
      {"honest, names in any case", "user_name=Ann\nSport_Item_Count=2",
       section(0, keptId) + "[SPORT_ITEM_(1)]\nTYPE=1\nres_info=" + otherId + "\n", 1, 2, true},
      {"a count of 2147483647", "user_name=Ann\nsport_item_count=2147483647", section(0, keptId) + section(1, otherId), 1, 2, false},
      {"a missing section", "user_name=Ann\nsport_item_count=3", section(0, keptId) + section(2, otherId), 1, 2, false},
      {"beyond the count, or not as the writer numbers", "user_name=Ann\nsport_item_count=1",
       section(0, keptId) + section(1, otherId) + "[sport_item_(01)]\nres_info=x\n[sport_item_(-1)]\nres_info=x\n", 1, 1,
       true},
      {"a way out", "user_name=Ann\nsport_item_count=2", section(0, keptId) + section(1, ".."), 1, 1, false},
      {"an unreadable trip", "user_name=Ann\nsport_item_count=2", section(0, keptId) + section(1, "broken"), 1, 1, false},
      {"no user", "user_name=\nsport_item_count=1", section(0, keptId), 0, 0, false},
      {"no head", "", section(0, keptId), 0, 0, false},
  };
  for (const auto& c : cases) {
    WriteStoreFile(c.head, c.sections);
    SPORT_DATA_NODE store;
    EXPECT_EQ(store.ReadInfo(0, nullptr), c.result) << c.what;
    int n = 0;
    for (auto* m : navmisc::Items<_CalendarObj>(store.months))
      for (auto* d : navmisc::Items<_DayObj>(m->days)) n += d->items.GetCount();
    EXPECT_EQ(n, c.activities) << c.what;
    EXPECT_EQ(store.readGuard.IsComplete(), c.complete) << c.what;
    if (!c.complete) {
      EXPECT_EQ(store.RemoveAllUnusedResource(), -1) << c.what;
      EXPECT_TRUE(IsDirectory(PathJoin(sport, L"orphan"))) << c.what;
    }
  }
  // No file at all.
  DeleteFile(SPORT_DATA_NODE::GetStorePathName());
  SPORT_DATA_NODE none;
  EXPECT_EQ(none.ReadInfo(0, nullptr), 0);
  EXPECT_EQ(none.RemoveAllUnusedResource(), -1);

  // After a complete read the clean-up removes the unused folders, only they, and never goes
  // through a link.
  ASSERT_EQ(::symlink(outside.path().ToUtf8().c_str(), navmisc::NativePath(PathJoin(sport, L"link")).c_str()), 0);
  WriteStoreFile("user_name=Ann\nsport_item_count=1", section(0, keptId));
  SPORT_DATA_NODE store;
  ASSERT_EQ(store.ReadInfo(0, nullptr), 1);
  EXPECT_EQ(store.RemoveAllUnusedResource(), 3);  // orphan, broken and the other trip
  CStringList left;
  GetContent(sport, L"*.*", left);
  std::vector<std::string> names;
  for (const CString& s : left) names.push_back(s.ToUtf8());
  std::sort(names.begin(), names.end());
  std::vector<std::string> want = {"SPORTRES_INFO.INI", keptId, "link", "notes.txt"};
  std::sort(want.begin(), want.end());
  EXPECT_EQ(names, want);
  EXPECT_EQ(ReadFileBytes(outside / L"precious"), "x");

  // A data folder that is itself a link is never cleaned.
  TempDir elsewhere;
  MakeDir(elsewhere / L"victim");
  RemoveDir(sport);
  ASSERT_EQ(::symlink(elsewhere.path().ToUtf8().c_str(), navmisc::NativePath(sport).c_str()), 0);
  EXPECT_EQ(store.RemoveAllUnusedResource(), 0);
  EXPECT_TRUE(IsDirectory(elsewhere / L"victim"));
}

}  // namespace
