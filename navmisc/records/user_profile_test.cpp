#include "navmisc/records/user_profile.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <string>
#include <tuple>
#include <utility>
#include <vector>

#include "navmisc/platform/files.h"
#include "navmisc/platform/shared_globals.h"
#include "record_fixture.h"

using navmisc::testutil::ReadFileBytes;
using navmisc::testutil::TempDir;
using navmisc::testutil::WriteFileBytes;

namespace {

class Profile : public navmisc::testutil::RecordTest {
 protected:
  Profile() {
    setenv("NAVMISC_KEY_FILE", (keys_ / L"secret.key").ToUtf8().c_str(), 1);
    MakeDir(root_ / L"TrackerRes");
    MakeDir(root_ / L"SportRes");
  }
  ~Profile() override { unsetenv("NAVMISC_KEY_FILE"); }
  void WriteProfile(const wchar_t* folder, const std::string& text) {
    MakeDir(PathJoin(root_.path(), folder));
    WriteFileBytes(PathJoin(PathJoin(root_.path(), folder), L"USER_MAP_INFO.INI"), text);
  }

  TempDir keys_;
};

// The values every application's profile keeps, then those of the tracker's only.
auto Values(USER_MAP_INFO& p) {
  return std::tie(p.name, p.male, p.year, p.height, p.weight, p.userAccount, p.metric, p.localize,
                  p.dayLight, p.timeZoneShift, p.devVersion, p.devSerial, p.exportGpx);
}
auto TrackerValues(USER_MAP_INFO& p) {
  return std::tie(p.trackerType, p.trackerTimeZone, p.trackerDayLight, p.trackerTimeZoneShift);
}

TEST_F(Profile, MissingFilesReadAsDefaults) {
  USER_MAP_INFO p(GPS_APP_TRIP);
  p.localize = L"DEU";
  p.SetWeightHeight(1, 2, 2020, 70, 180);
  p.ReadInfo();
  EXPECT_EQ(std::tuple(p.localize.str(), p.height, p.weight, p.male, p.metric, p.tutorial,
                       p.verEnableCheck, p.verCheckPeriodTime, p.tempMode, p.tempStyle,
                       p.autoLaunch, p.geotagCallEditor, p.timeZoneShiftOn),
            std::tuple(L"ENG", 170.0, 60.0, true, true, true, true, 604800, 1, 2, true, true,
                       false));
  EXPECT_TRUE(p.weightHeights.IsEmpty());
  EXPECT_EQ(p.GetProfilePathName(),
            PathJoin(PathJoin(root_.path(), L"Resource"), L"USER_MAP_INFO.INI"));
}

TEST_F(Profile, EveryValueAndListRoundTrips) {
  g_sVersionInfo = {2, 1, 30, 4};
  USER_MAP_INFO p(GPS_APP_TRACKER);
  Values(p) = std::tuple(L"Zoë", false, 1980, 181.5, 77.25, L"me@example.org", false, L"CHT", true,
                         -3600, 1.25, 12345, L"/home/me/gpx folder");
  TrackerValues(p) = std::tuple(3, L"+08:00", true, 28800);
  auto* m = new MARKER_ITEM_INFO;
  std::tie(m->id, m->url) = std::tuple(L"M1", L"http://x/m1.png");
  p.markers.AddTail(m);
  auto* r = new RUNNER_ITEM_INFO;
  std::tie(r->id, r->frameCount, r->frameUrl[0], r->frameUrl[1]) =
      std::tuple(L"R1", 2, L"a.png", L"b.png");
  p.runners.AddTail(r);
  p.SetWeightHeight(3, 14, 2021, 76.5, 181);
  ASSERT_TRUE(p.WriteInfo());

  USER_MAP_INFO q(GPS_APP_TRACKER);
  q.ReadInfo();
  EXPECT_EQ(Values(q), Values(p));
  EXPECT_EQ(TrackerValues(q), TrackerValues(p));
  EXPECT_EQ(std::vector<int>(q.version, q.version + 4), std::vector<int>({2, 1, 30, 4}));
  EXPECT_FALSE(q.timeZoneShiftOn) << "written by a current version";
  // Written again, what was read gives the same file: the lists came back too.
  const std::string text = ReadFileBytes(q.GetProfilePathName());
  ASSERT_TRUE(q.WriteInfo());
  EXPECT_EQ(ReadFileBytes(q.GetProfilePathName()), text);
  for (const char* line : {"version=2,1,30,4\n", "date=03/14/2021\n", "[SECTION_MKR(0)]\n",
                           "url_1=b.png\n", "tracker_timezone=+08:00\n"})
    EXPECT_NE(text.find(line), std::string::npos) << line;

  // Other applications neither keep nor read the tracker values.
  USER_MAP_INFO sport(GPS_APP_SPORT);
  sport.trackerType = 9;
  ASSERT_TRUE(sport.WriteInfo());
  EXPECT_EQ(ReadFileBytes(sport.GetProfilePathName()).find("tracker_"), std::string::npos);
  WriteProfile(L"SportRes", "[SECTION]\ntracker_trackertype=5\n");
  sport.ReadInfo();
  EXPECT_EQ(sport.trackerType, 0);
  g_sVersionInfo = {0, 0, 0, 0};
}

TEST_F(Profile, TimeShiftOnlyForTheOldReleaseVersions) {
  const std::pair<const char*, bool> cases[] = {
      {"1,0,807,1599", true}, {"1,0,807,1600", false}, {"1,0,808,100", false}, {"", false},
      {"x,0,807,1", false},   {"3, 2, 807, 12", true},
      {"1,0,807", true},  // the missing fourth number stays 0
  };
  for (const auto& [version, on] : cases) {
    WriteProfile(L"Resource", std::string("[SECTION]\nversion=") + version +
                                  "\nday_light=1\ntime_zone_shift=3600\n");
    g_TripMapInfo.ReadInfo();
    EXPECT_EQ(g_TripMapInfo.timeZoneShiftOn, on) << version;
    EXPECT_EQ(GetProfileTimeShift(GPS_APP_TRIP), on ? 3600 + 7200 : 0) << version;
  }
  g_TripMapInfo.Reset();
  EXPECT_EQ(GetProfileTimeShift(GPS_APP_TRIP), 0);
}

TEST_F(Profile, PasswordIsStoredSealed) {
  USER_MAP_INFO p(GPS_APP_TRIP);
  p.password = L"s3cret-Pässword";
  p.keepPassword = true;
  ASSERT_TRUE(p.WriteInfo());
  const std::string text = ReadFileBytes(p.GetProfilePathName());
  EXPECT_EQ(text.find("s3cret"), std::string::npos);
  EXPECT_NE(text.find("user_password=v1:"), std::string::npos);
  USER_MAP_INFO q(GPS_APP_TRIP);
  q.ReadInfo();
  EXPECT_EQ(q.password, L"s3cret-Pässword");

  // Another key, or a profile that does not keep it: no password.
  setenv("NAVMISC_KEY_FILE", (keys_ / L"other.key").ToUtf8().c_str(), 1);
  q.ReadInfo();
  EXPECT_TRUE(q.password.IsEmpty());
  p.keepPassword = false;
  ASSERT_TRUE(p.WriteInfo());
  EXPECT_NE(ReadFileBytes(p.GetProfilePathName()).find("user_password=\n"), std::string::npos);
}

TEST_F(Profile, SuiteSettingsWinForTheVersionCheck) {
  WriteProfile(L"Resource", "[SECTION]\nver_check_period_time=100\nver_unique_id=profile\n");
  WriteFileBytes(root_ / L"AMBRO_SUITE_INFO.INI", "[SECTION]\nver_unique_id=suite\n");
  USER_MAP_INFO p(GPS_APP_TRIP);
  p.ReadInfo();
  EXPECT_EQ(p.verUniqueId, L"suite");
  EXPECT_EQ(p.verCheckPeriodTime, 100) << "a key the suite file lacks comes from the profile";
}

TEST_F(Profile, WeightHeightHistory) {
  USER_MAP_INFO p(GPS_APP_SPORT);
  double w = -1, h = -1;
  EXPECT_FALSE(p.GetWeightHeight(1, 1, 2020, w, h));
  EXPECT_EQ(w, -1);
  EXPECT_FALSE(p.SetWeightHeight(6, 1, 2020, 80, 180));
  EXPECT_TRUE(p.SetWeightHeight(6, 1, 2020, 78, 180));
  EXPECT_EQ(p.weightHeights.GetCount(), 1);
  EXPECT_FALSE(p.SetWeightHeight(1, 15, 2021, 75, 181));
  EXPECT_FALSE(p.SetWeightHeight(12, 31, 2019, 85, 179));
  const struct {
    int month, day, year;
    double weight;
  } cases[] = {
      {6, 1, 2020, 78},    // exact
      {1, 14, 2021, 78},   // latest earlier entry
      {1, 15, 2021, 75},
      {1, 1, 2019, 85},    // before every entry: the earliest
  };
  for (const auto& c : cases) {
    ASSERT_TRUE(p.GetWeightHeight(c.month, c.day, c.year, w, h));
    EXPECT_EQ(w, c.weight) << c.month << "/" << c.day << "/" << c.year;
  }
}

}  // namespace
