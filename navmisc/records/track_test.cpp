#include "navmisc/records/track.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstdio>
#include <cstring>
#include <memory>
#include <random>
#include <span>
#include <string>
#include <tuple>
#include <utility>

#include "navmisc/platform/atomic_file.h"
#include "navmisc/platform/files.h"
#include "navmisc/platform/format.h"
#include "navmisc/records/point_codec.h"
#include "navmisc/records/track_point_reader.h"
#include "navmisc/records/trip.h"
#include "record_fixture.h"

using navmisc::testutil::LocaleScope;
using navmisc::testutil::NewPoint;
using navmisc::testutil::ReadFileBytes;
using navmisc::testutil::WriteFileBytes;

namespace {

class TrackFiles : public navmisc::testutil::RecordTest {
 protected:
  std::unique_ptr<BLOG_ITEM_INFO> MakeTrip(GPS_APP_PROG_TYPE type) {
    auto trip = std::make_unique<BLOG_ITEM_INFO>(type, L"TRIP1", 0);
    MakeDir(trip->GetResourcePath());
    return trip;
  }
};

TEST_F(TrackFiles, WritesEachFileInItsExactLineFormat) {
  auto trip = MakeTrip(GPS_APP_TRACKER);
  TRACK_ITEM_INFO track(trip.get());
  auto* p = NewPoint(1000000000, 25.0339, 121.5645, -2);
  std::tie(p->altitude, p->speed, p->course, p->extraA, p->extraB) =
      std::tuple(-3.25, 4500, 359, -8, 7);
  track.points.AddTail(p);
  auto* cell = new BASE_ITEM_INFO(nullptr);
  std::tie(cell->time, cell->name, cell->latitude, cell->longitude) =
      std::tuple(5, L"466-92-1234", -33.5, 151.25);
  track.cellFixes.AddTail(cell);
  auto* help = NewPoint(6, 1.0, 2.0);
  help->name = L"SOS";
  help->extraB = 99;  // not part of the help-point line
  track.helpPoints.AddTail(help);
  auto* full = new HEARTRATE_ITEM_INFO(nullptr);
  full->time = 10;
  for (int i = 0; i < 24; ++i) full->values[i] = static_cast<uint8_t>(100 + i);
  auto* shortHr = new HEARTRATE_ITEM_INFO(nullptr);
  shortHr->time = 11;
  shortHr->values[0] = 90;
  shortHr->values[1] = 91;
  track.heartRates.AddTail(full);
  track.heartRates.AddTail(shortHr);
  auto* cs = new CYCLING_CADENCE_RPM_ITEM_INFO(nullptr);
  cs->time = 12;
  track.cadences.AddTail(cs);
  auto* ws = new WHEEL_SPEED_ITEM_INFO(nullptr);
  ws->time = 13;
  track.wheelSpeeds.AddTail(ws);

  int counter = 0;
  track.WriteAllWaypoint(1, &counter, nullptr);
  EXPECT_EQ(counter, 7) << "one per line written";

  std::string hr = "10";
  for (int i = 0; i < 24; ++i) hr += "," + std::to_string(100 + i);
  const std::pair<CString, std::string> files[] = {
      {track.GetFilePathName(), "1000000000,25.033900,121.564500,-3.250000,4500,-2,359,-8,7\r\n"},
      {track.GetCellIDFilePathName(), "5,466-92-1234,-33.500000,151.250000\r\n"},
      {track.GetSOSPointFilePathName(), "6,SOS,1.000000,2.000000,0.000000,0,0,-1,0\r\n"},
      {track.GetHeartRateFilePathName(), hr + "\r\n11,90,91,255\r\n"},
      {track.GetCyclingCadenceFilePathName(), "12,255\r\n"},
      {track.GetWheelSpeedFilePathName(), "13,-1.000000\r\n"},
  };
  for (const auto& [path, bytes] : files) EXPECT_EQ(ReadFileBytes(path), bytes) << path.ToUtf8();

  // Reading gives back what was written: written again, every file comes out the same, except
  // that the single point is doubled one second later.
  TRACK_ITEM_INFO again(trip.get());
  again.id = track.id;
  again.ReadAllWaypoint(1);
  for (const auto& [path, bytes] : files) ASSERT_TRUE(DeleteFile(path));
  again.WriteAllWaypoint(1, nullptr, nullptr);
  EXPECT_EQ(ReadFileBytes(files[0].first),
            files[0].second + "1000000001,25.033900,121.564500,-3.250000,4500,-2,359,-8,7\r\n");
  for (const auto& [path, bytes] : std::span(files).subspan(1))
    EXPECT_EQ(ReadFileBytes(path), bytes) << "rewritten " << path.ToUtf8();
}

TEST_F(TrackFiles, CorruptLinesGiveDefaultFieldsAndLineEndsMayBeLf) {
  auto trip = MakeTrip(GPS_APP_TRIP);
  TRACK_ITEM_INFO track(trip.get());
  const std::string longLine(300, '7');
  WriteFileBytes(track.GetFilePathName(),
                 "100,1.5,2.5,3.5,4,5,6,7,8\n"    // LF only
                 "200,1.5,oops,9,9,9,9,9,9\r\n"  // breaks off after the latitude
                 "\r\n"                          // empty: all defaults
                 "garbage\n" +
                     longLine + "\n"  // read in pieces of 255 characters
                 "300,+1e2,-0x1p1,inf");
  track.ReadAllWaypoint(1);
  // time, latitude, longitude, altitude, speed, type, course, extra values A and B
  using Fields = std::tuple<int32_t, double, double, double, int32_t, int32_t, int32_t, int32_t,
                            int32_t>;
  const Fields expected[] = {
      {100, 1.5, 2.5, 3.5, 4, 5, 6, 7, 8},
      {200, 1.5, 0, 0, 0, 0, -1, 0, 0},
      {-1, 0, 0, 0, 0, 0, -1, 0, 0},
      {-1, 0, 0, 0, 0, 0, -1, 0, 0},
      {-1, 0, 0, 0, 0, 0, -1, 0, 0},  // 255 digits overflow like the C reader
      {-1, 0, 0, 0, 0, 0, -1, 0, 0},  // and so do the 45 left over
      {300, 100, -2, INFINITY, 0, 0, -1, 0, 0},
  };
  ASSERT_EQ(track.points.GetCount(), static_cast<int>(std::size(expected)));
  POSITION pos = track.points.GetHeadPosition();
  for (const Fields& want : expected) {
    const auto* p = static_cast<WAYPOINT_ITEM_INFO*>(track.points.GetNext(pos));
    EXPECT_EQ(Fields(p->time, p->latitude, p->longitude, p->altitude, p->speed, p->type, p->course,
                     p->extraA, p->extraB),
              want);
  }

  // Side files of a short line leave the missing values at their defaults.
  WriteFileBytes(track.GetHeartRateFilePathName(), "7,80\n,\n");
  track.ReadAllWaypoint(1);
  ASSERT_EQ(track.heartRates.GetCount(), 2);
  auto* hr = static_cast<HEARTRATE_ITEM_INFO*>(track.heartRates.GetHead());
  EXPECT_EQ(std::tuple(hr->time, int{hr->values[0]}, int{hr->values[1]}), std::tuple(7, 80, 255));
}

TEST_F(TrackFiles, LoadingRulesOfTheApplicationType) {
  std::tie(g_TrackerMapInfo.timeZoneShiftOn, g_TrackerMapInfo.timeZoneShift,
           g_TrackerMapInfo.dayLight) = std::tuple(true, 3600, true);

  auto tracker = MakeTrip(GPS_APP_TRACKER);
  TRACK_ITEM_INFO t(tracker.get());
  WriteFileBytes(t.GetFilePathName(), "1000000000,1.0,2.0,0.0,0,0,-1,0,0\r\n1000000005,1.0,2.0,0.0,0,0,-1,0,0\r\n");
  WriteFileBytes(t.GetCellIDFilePathName(), "1000000000,cell,1.0,2.0\r\n");
  WriteFileBytes(t.GetHeartRateFilePathName(), "1000000000,80\r\n");
  t.ReadAllWaypoint(0);
  EXPECT_EQ(static_cast<WAYPOINT_ITEM_INFO*>(t.points.GetHead())->time, 1000010800);
  EXPECT_EQ(static_cast<BASE_ITEM_INFO*>(t.cellFixes.GetHead())->time, 1000000000) << "side files keep their times";
  EXPECT_EQ(static_cast<HEARTRATE_ITEM_INFO*>(t.heartRates.GetHead())->time, 1000000000);

  // Points already loaded are not read again without force.
  WriteFileBytes(t.GetFilePathName(), "");
  t.ReadAllWaypoint(0);
  EXPECT_EQ(t.points.GetCount(), 2);

  // Another application type neither reads nor rewrites the tracker-only files.
  auto trip = MakeTrip(GPS_APP_TRIP);
  TRACK_ITEM_INFO other(trip.get());
  WriteFileBytes(other.GetFilePathName(), "5,1.0,2.0,0.0,0,0,-1,0,0\r\n");
  WriteFileBytes(other.GetCellIDFilePathName(), "keep me\r\n");
  other.ReadAllWaypoint(0);
  EXPECT_TRUE(other.cellFixes.IsEmpty());
  EXPECT_EQ(static_cast<WAYPOINT_ITEM_INFO*>(other.points.GetHead())->time, 5) << "no shift outside its profile";
  other.cellFixes.AddTail(new BASE_ITEM_INFO(nullptr));
  other.WriteAllWaypoint(1, nullptr, nullptr);
  EXPECT_EQ(ReadFileBytes(other.GetCellIDFilePathName()), "keep me\r\n");
}

TEST_F(TrackFiles, ThePointReaderYieldsWhatLoadingHolds) {
  std::tie(g_TrackerMapInfo.timeZoneShiftOn, g_TrackerMapInfo.timeZoneShift) = std::tuple(true, 3600);
  auto trip = MakeTrip(GPS_APP_TRACKER);
  TRACK_ITEM_INFO track(trip.get());
  const std::string files[] = {
      "",
      "1000000000,1.5,2.5,3.5,4,5,6,7,8\r\n",  // a lone point: loaded with its copy
      "100,1.5,2.5,3.5,4,5,6,7,8\n200,1.5,oops\r\n\r\n" + std::string(300, '7') + "\n300,1,2",
  };
  for (const std::string& content : files) {
    WriteFileBytes(track.GetFilePathName(), content);
    track.ReadAllWaypoint(1);
    navmisc::TrackPointReader reader;
    ASSERT_TRUE(reader.Open(track));
    WAYPOINT_ITEM_INFO p;
    int n = 0;
    for (const auto* loaded : navmisc::Items<WAYPOINT_ITEM_INFO>(track.points)) {
      ASSERT_TRUE(reader.Next(p)) << content << " point " << n;
      EXPECT_TRUE(p == *loaded) << content << " point " << n;
      ++n;
    }
    EXPECT_FALSE(reader.Next(p)) << content;
    EXPECT_EQ(navmisc::TrackPointReader::Count(track), n) << content;
  }
  EXPECT_EQ(track.points.GetCount(), 6);
  DeleteFile(track.GetFilePathName());
  navmisc::TrackPointReader reader;
  EXPECT_FALSE(reader.Open(track));
  EXPECT_EQ(navmisc::TrackPointReader::Count(track), 0);
}

TEST_F(TrackFiles, StoppedWritesShortenAndFailedWritesKeepTheOldFile) {
  auto trip = MakeTrip(GPS_APP_TRIP);
  TRACK_ITEM_INFO track(trip.get());
  for (int i = 0; i < 5; ++i) track.points.AddTail(NewPoint(i, 1.0, 2.0));
  track.WriteAllWaypoint(1, nullptr, nullptr);
  const std::string full = ReadFileBytes(track.GetFilePathName());

  // A disk that fills up mid-write leaves the previous file as it was.
  track.points.AddTail(NewPoint(99, 3.0, 4.0));
  navmisc::testing::FailAtomicWritesAfter(10);
  track.WriteAllWaypoint(1, nullptr, nullptr);
  navmisc::testing::FailAtomicWritesAfter(-1);
  EXPECT_EQ(ReadFileBytes(track.GetFilePathName()), full);

  // A stop on request keeps the lines written before it: here, none.
  bool keepGoing = false;
  int counter = 0;
  track.WriteAllWaypoint(1, &counter, &keepGoing);
  EXPECT_EQ(ReadFileBytes(track.GetFilePathName()), "");
  EXPECT_EQ(counter, 0);

  // An empty point list still rewrites the main file, empty.
  TRACK_ITEM_INFO empty(trip.get());
  empty.id = track.id;
  empty.WriteAllWaypoint(1, nullptr, nullptr);
  EXPECT_TRUE(FileExists(empty.GetFilePathName()));
  EXPECT_EQ(ReadFileBytes(empty.GetFilePathName()), "");
}

TEST(PointNumbers, FixedDecimalsMatchTheCLibraryWhateverTheLocale) {
  // Comma-decimal locales must not leak into files.
  const LocaleScope comma("de_DE.UTF-8");
  std::mt19937_64 rng(42);
  std::uniform_real_distribution<double> wide(-1e9, 1e9);
  std::uniform_real_distribution<double> small(-200.0, 200.0);
  std::vector<double> values = {0.0, -0.0, 0.0078125, 0.5e-6, 2.5e-7, -1e-9, 121.5, 1e14, -0.0000005,
                                999999.9999995, 4.9e-324, 0.1, 0.7, 1.0000005};
  for (int i = 0; i < 20000; ++i) values.push_back(i % 2 ? wide(rng) : small(rng));
  // Exact ties of the sixth decimal (odd multiples of 1/128) and their closest neighbours.
  for (int i = 1; i < 4000; i += 2) {
    const double tie = (i % 7 - 3) * 1234.5 + i / 128.0;
    values.insert(values.end(), {tie, std::nextafter(tie, 0.0), std::nextafter(tie, 1e9)});
  }
  for (double v : values) {
    std::string ours;
    navmisc::AppendFixed(ours, v, 6);
    char ref[512];
    {
      navmisc::CLocaleScope c;
      std::snprintf(ref, sizeof ref, "%.6f", v);
    }
    ASSERT_EQ(ours, ref) << "value " << v;
  }
  if (!comma.ok()) GTEST_SKIP() << "de_DE.UTF-8 is not installed; checked in the C locale only";
}

TEST(PointNumbers, ReadingGivesTheCLibrarysDoubles) {
  std::mt19937_64 rng(9);
  std::uniform_real_distribution<double> any(-1e6, 1e6);
  std::vector<std::string> texts = {"0", "-0", "-0.000000", "1.5e3", "123456789012345678.5", "0.1",
                                    "999999999999999", "9999999999999999", "1.", ".5", "-.25",
                                    "0.000000000000000000000001", "2.2250738585072014e-308", "1e400"};
  for (int i = 0; i < 5000; ++i) {
    char buf[64];
    std::snprintf(buf, sizeof buf, i % 2 ? "%.6f" : "%.9g", any(rng));
    texts.push_back(buf);
  }
  for (const std::string& t : texts) {
    WAYPOINT_ITEM_INFO p(nullptr);
    navmisc::point_file::ScanPointLine("1," + t + ",0,0,0,0,0,0,0", p);
    const double expected = std::strtod(t.c_str(), nullptr);
    EXPECT_EQ(std::memcmp(&p.latitude, &expected, sizeof expected), 0) << t;
  }
  // Integers: overflow clamps like strtol, then keeps the low 32 bits.
  const std::pair<const char*, int32_t> ints[] = {{"2147483647", 2147483647}, {"2147483648", -2147483647 - 1},
                                                  {"-5", -5}, {"99999999999999999999", -1},
                                                  {"-99999999999999999999", 0}, {" +7", 7}};
  for (const auto& [text, value] : ints) {
    WAYPOINT_ITEM_INFO p(nullptr);
    navmisc::point_file::ScanPointLine(text, p);
    EXPECT_EQ(p.time, value) << text;
  }
}

}  // namespace
