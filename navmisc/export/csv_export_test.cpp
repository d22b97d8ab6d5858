#include "navmisc/export/csv_export.h"

#include <algorithm>

#include <gtest/gtest.h>

#include "navmisc/export/detail/test_support.h"
#include "navmisc/records/trip.h"
#include "testutil.h"

namespace {

using namespace navmisc::exporttest;
using navmisc::testutil::DataRootScope;
using navmisc::testutil::ReadFileBytes;
using navmisc::testutil::TempDir;
using navmisc::testutil::WriteFileBytes;

const std::string kHeader = "Date, Time, Latitude, Longitude, Altitude, Speed, Course, Type, Distance, Essential\r";
const std::string kContinuation =
    "Date, Time, Latitude, Longitude, Altitude, Speed, Course, Type, Distance, Exception\r";
constexpr int32_t kT = 1000000000;  // 2001-09-09 01:46:40 UTC

// Three tracks: a first point shared with a photo, a point without a time, a point due north
// of its predecessor (the distance column measures east-west only), a last point with an
// unknown course, and two one-point tracks, one of them sharing a photo's time.
struct Fixture {
  TempDir dir;
  DataRootScope scope{dir.path()};
  BLOG_ITEM_INFO trip{GPS_APP_TRIP, L"T1", 0};
  CPtrList tracks, photos;
  std::unique_ptr<TRACK_ITEM_INFO> t1, t2, t3;
  std::unique_ptr<PHOTO_ITEM_INFO> ph1, ph2, ph3;
  Fixture() {
    trip.timeZoneShift = 3600;
    trip.optOptimize = trip.optRevise = trip.optRedundance = true;
    trip.optLevel = 5;
    t1 = MakeTrack(L"a", {{25.1, 121.5, 100, kT, 3600, -1, 10},
                          {9, 9, 9, -1},
                          {25.101, 121.5, 101.5, kT + 10, 36000, 45, -1},
                          {25.101, 121.501, -2, kT + 20, 0, -1, 3}});
    t2 = MakeTrack(L"b", {{10, 10, 0, kT + 100, 0, -1, 5}});
    t3 = MakeTrack(L"c", {{-10.5, -20.25, 0, kT + 200, 0, -1, -2}});
    for (auto* t : {t1.get(), t2.get(), t3.get()}) tracks.AddTail(t);
    tracks.AddTail(static_cast<void*>(nullptr));
    ph1 = MakeItem(0, L"p", L"", 0, 0, 0, kT);
    ph2 = MakeItem(0, L"p", L"", 0, 0, 0, kT + 100);
    ph3 = MakeItem(0, L"p", L"", 0, 0, 0, 0);  // no time: marks nothing
    for (auto* p : {ph1.get(), ph2.get(), ph3.get()}) photos.AddTail(p);
  }
};

// One expected line, with both unit systems' figures.
struct Line {
  const char* dateTime;
  const char* position;
  const char* altitude[2];  // metric, imperial
  const char* speed[2];
  const char* courseAndType;
  const char* distance[2];
  const char* essential;
};

std::string Lines(const std::vector<Line>& lines, bool metric) {
  std::string out = kHeader;
  const int u = metric ? 0 : 1;
  for (const Line& l : lines) {
    out += std::string(l.dateTime) + ", " + l.position + ", " + l.altitude[u] + ",  " + l.speed[u] + ", " +
           l.courseAndType + ", " + l.distance[u] + ", " + l.essential + "\r";
  }
  return out;
}

TEST(ExportCsv, WritesEveryColumnInBothUnitSystems) {
  const std::vector<Line> withTrip = {
      {"2001/09/09, 02:46:40", "25.100000, 121.500000", {"100.00", "328.08"}, {"3600.00", "2.24"}, "0, -3",
       {"0.00", "0.00"}, "1"},
      {"2001/09/09, 02:46:50", "25.101000, 121.500000", {"101.50", "333.01"}, {"36000.00", "22.37"}, "45, 0",
       {"0.00", "0.00"}, ""},
      {"2001/09/09, 02:47:00", "25.101000, 121.501000", {"-2.00", "-6.56"}, {"0.00", "0.00"}, "89, -4",
       {"100.69", "62.57"}, ""},
      {"2001/09/09, 02:48:20", "10.000000, 10.000000", {"0.00", "0.00"}, {"0.00", "0.00"}, "0, -3",
       {"0.00", "0.00"}, "1"},
      {"2001/09/09, 02:50:00", "-10.500000, -20.250000", {"0.00", "0.00"}, {"0.00", "0.00"}, "0, -2",
       {"0.00", "0.00"}, ""},
  };
  Fixture f;
  for (bool metric : {true, false}) {
    ASSERT_EQ(ExportCsv(f.dir / L"out.csv", f.tracks, f.photos, &f.trip, metric), 1);
    EXPECT_EQ(ReadFileBytes(f.dir / L"out.csv"), Lines(withTrip, metric)) << "metric " << metric;
  }

  // Without a trip: no time shift, and every point is essential. With the filter off likewise.
  std::vector<Line> noTrip = withTrip;
  const char* utc[] = {"2001/09/09, 01:46:40", "2001/09/09, 01:46:50", "2001/09/09, 01:47:00",
                       "2001/09/09, 01:48:20", "2001/09/09, 01:50:00"};
  for (size_t i = 0; i < noTrip.size(); ++i) {
    noTrip[i].dateTime = utc[i];
    noTrip[i].essential = "1";
  }
  ASSERT_EQ(ExportCsv(f.dir / L"out.csv", f.tracks, f.photos, nullptr, true), 1);
  EXPECT_EQ(ReadFileBytes(f.dir / L"out.csv"), Lines(noTrip, true));
  f.trip.optOptimize = false;
  f.trip.timeZoneShift = 0;
  ASSERT_EQ(ExportCsv(f.dir / L"out.csv", f.tracks, f.photos, &f.trip, true), 1);
  EXPECT_EQ(ReadFileBytes(f.dir / L"out.csv"), Lines(noTrip, true));
}

// A track of `count` points a second apart; the point at `untimed` (if any) has no time.
std::unique_ptr<TRACK_ITEM_INFO> LongTrack(int count, int untimed = -1) {
  std::vector<Pt> pts(static_cast<size_t>(count), Pt{1, 2, 3, kT});
  for (int i = 0; i < count; ++i) pts[static_cast<size_t>(i)].time = i == untimed ? -1 : kT + i;
  return MakeTrack(L"long", pts);
}

size_t LineCount(const std::string& s) { return static_cast<size_t>(std::count(s.begin(), s.end(), '\r')); }

TEST(ExportCsv, SplitsAtTheLineLimit) {
  CPtrList photos;
  const struct {
    int first, second;  // points of two tracks
    int untimed;        // index in the first track of a point without a time, or -1
    std::vector<size_t> lines;  // lines per numbered file; empty: one file at the path
  } cases[] = {
      {65000, 533, -1, {}},
      {65000, 534, -1, {65535, 1}},
      {65000, 534, 7, {65534, 1}},  // an untimed point still takes its place in the count
  };
  for (const auto& c : cases) {
    TempDir dir;
    WriteFileBytes(dir / L"out.csv", "old");
    auto a = LongTrack(c.first, c.untimed), b = LongTrack(c.second);
    CPtrList tracks;
    tracks.AddTail(a.get());
    tracks.AddTail(b.get());
    ASSERT_EQ(ExportCsv(dir / L"out.csv", tracks, photos, nullptr, true), 1);
    const auto numbered = [&](size_t i) { return dir / FormatString(L"out_%d.csv", static_cast<int>(i)); };
    if (c.lines.empty()) {
      EXPECT_EQ(LineCount(ReadFileBytes(dir / L"out.csv")), static_cast<size_t>(c.first + c.second + 1));
    } else {
      EXPECT_FALSE(FileExists(dir / L"out.csv")) << "the target is cleared even when the lines go elsewhere";
    }
    for (size_t i = 0; i < c.lines.size(); ++i) {
      const std::string text = ReadFileBytes(numbered(i + 1));
      EXPECT_EQ(LineCount(text), c.lines[i]) << c.first << "+" << c.second << " file " << i + 1;
      EXPECT_EQ(text.substr(0, kHeader.size()), i == 0 ? kHeader : kContinuation);
    }
    EXPECT_FALSE(FileExists(numbered(c.lines.size() + 1)));

    // A later numbered file that cannot be made (a folder is in its way) fails the export.
    if (c.lines.size() < 2) continue;
    ASSERT_TRUE(DeleteFile(numbered(2)));
    ASSERT_TRUE(MakeDir(numbered(2)));
    EXPECT_EQ(ExportCsv(dir / L"out.csv", tracks, photos, nullptr, true), 0);
    EXPECT_EQ(LineCount(ReadFileBytes(numbered(1))), c.lines[0]);
  }
}

}  // namespace
