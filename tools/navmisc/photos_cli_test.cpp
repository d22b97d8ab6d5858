// navmisc photos add, photos list and geotag, run as a user runs them, on real JPEGs that
// exiftool reads back.
#include <gtest/gtest.h>

#include <cmath>
#include <cstdlib>
#include <string>
#include <vector>

#include "navmisc/platform/datetime.h"
#include "navmisc/platform/files.h"
#include "navmisc/records/trip.h"
#include "photo_testutil.h"
#include "testutil.h"

namespace {

using namespace navmisc::testutil;

constexpr long kStart = 1714636800;  // 2024-05-02T08:00:00Z, the track's first point
constexpr int32_t kShift = 7200;     // the camera's clock runs on UTC+2

// A line of `photos add`: the copy's name, its time on the track clock, what became of it.
std::string AddLine(const char* name, const char* time, const char* rest) {
  char line[256];
  std::snprintf(line, sizeof line, "%-24s %-20s  %s", name, time, rest);
  return line;
}

class PhotoCommands : public ::testing::Test {
 protected:
  void SetUp() override {
    if (!HavePhotoReaders()) GTEST_SKIP() << "exiftool and exiv2 are needed (scripts/setup.sh)";
    BLOG_ITEM_INFO trip(GPS_APP_TRIP, L"PHOTOTRIP", 0);
    ASSERT_TRUE(MakeDir(trip.GetResourcePath()));
    trip.name = L"Photo walk";
    trip.timeZoneShift = kShift;
    auto* track = new TRACK_ITEM_INFO(&trip);
    for (int i = 0; i <= 360; ++i) {  // an hour, a point every 10 s, heading north-east
      auto* p = new WAYPOINT_ITEM_INFO(nullptr);
      p->time = static_cast<int32_t>(kStart + 10 * i);
      p->latitude = 48.0 + i * 1e-4;
      p->longitude = 2.0 + i * 1.5e-4;
      p->altitude = 100.0 + i * 0.1;
      p->speed = 5000;
      track->points.AddTail(p);
    }
    trip.tracks.AddTail(track);
    trip.WriteAllWaypoint(1, nullptr, nullptr);
    trip.WriteInfo(1, nullptr, nullptr);
    ASSERT_TRUE(MakeDir(camera_.path()));
  }

  // A JPEG in the camera folder, changed by exiftool with `arguments` when given.
  std::string Shot(const char* name, const std::string& arguments) {
    const CString path = camera_ / CString::FromUtf8(name);
    WriteFileBytes(path, Bytes(navmisc::kTinyJpeg));
    if (!arguments.empty()) {
      EXPECT_TRUE(ExiftoolWrite(path, arguments));
    }
    return path.ToUtf8();
  }

  CommandResult Run(const std::string& args, const std::string& input = "") {
    return RunCommand("printf '" + input + "' | " + std::string(NAVMISC_TOOL_PATH) +
                      " --data-root " + ShellQuote(root_.path().ToUtf8()) + " " + args + " 2>&1");
  }

  std::unique_ptr<BLOG_ITEM_INFO> Load() {
    auto trip = std::make_unique<BLOG_ITEM_INFO>(GPS_APP_TRIP, L"PHOTOTRIP", 0);
    EXPECT_EQ(trip->ReadInfo(), 1);
    trip->ReadAllWaypoint(1);
    return trip;
  }

  // Where the track was at `time`, by the library's own mapping.
  std::pair<double, double> TrackAt(long time) {
    auto trip = Load();
    double lat = 0, lon = 0, alt = 0;
    long speed = 0;
    EXPECT_TRUE(static_cast<TRACK_ITEM_INFO*>(trip->tracks.GetHead())
                    ->MappingTimeToPoint(time, lat, lon, speed, alt));
    return {lat, lon};
  }

  const PHOTO_ITEM_INFO* Photo(BLOG_ITEM_INFO& trip, const wchar_t* name) {
    for (const auto* p : navmisc::Items<PHOTO_ITEM_INFO>(trip.photos)) {
      if (p->itemName == name) return p;
    }
    ADD_FAILURE() << "no photo " << CString(name).ToUtf8();
    return nullptr;
  }

  TempDir root_;
  DataRootScope scope_{root_.path()};
  TempDir camera_;
};

TEST_F(PhotoCommands, AddPlacesByTimeAndPositionListsMissesAndGeotagWritesTheCopies) {
  const auto [onLat, onLon] = TrackAt(kStart + 2400);
  const std::string a = Shot("a.jpg", "'-DateTimeOriginal=2024:05:02 10:10:05'");  // 08:10:05 UTC
  const std::string b =
      Shot("b.jpg", "'-DateTimeOriginal=2024:05:02 12:30:00'");  // after the track
  char gps[160];
  std::snprintf(gps, sizeof gps,
                "-GPSLatitude=%.7f -GPSLatitudeRef=N -GPSLongitude=%.7f -GPSLongitudeRef=E", onLat,
                onLon);
  const std::string c = Shot("c.jpg", gps);  // no capture time, but a position on the track
  const std::string d = (camera_ / L"notes.txt").ToUtf8();
  WriteFileBytes(CString::FromUtf8(d), "not a photo");

  const CommandResult add = Run("photos add PHOTOTRIP " + a + " " + b + " " + c + " " + d);
  EXPECT_EQ(add.status, 1) << add.out;
  const auto [aLat, aLon] = TrackAt(kStart + 605);
  EXPECT_NE(add.out.find(AddLine("a.jpg", "2024-05-02T08:10:05Z", "placed by time on")),
            std::string::npos)
      << add.out;
  char at[64];
  std::snprintf(at, sizeof at, "at %.6f, %.6f\n", aLat, aLon);
  EXPECT_NE(add.out.find(at), std::string::npos) << add.out;
  EXPECT_NE(add.out.find(
                AddLine("b.jpg", "2024-05-02T10:30:00Z", "not placed: outside the tracks' times")),
            std::string::npos)
      << add.out;
  EXPECT_NE(add.out.find("c.jpg"), std::string::npos);
  EXPECT_NE(add.out.find("placed by position"), std::string::npos) << add.out;
  EXPECT_NE(add.out.find(d + " not added: not a photo of a known format"), std::string::npos)
      << add.out;

  auto trip = Load();
  ASSERT_EQ(trip->photos.GetCount(), 3);
  const PHOTO_ITEM_INFO* pa = Photo(*trip, L"a.jpg");
  ASSERT_TRUE(pa);
  EXPECT_EQ(pa->originalTime, kStart + 605 + kShift);
  EXPECT_EQ(pa->playbackTime, kStart + 605);
  EXPECT_EQ(pa->originalName.ToUtf8(), a);
  EXPECT_EQ(pa->width, 16);

  const CommandResult list = Run("photos list PHOTOTRIP");
  ASSERT_EQ(list.status, 0) << list.out;
  char row[128];
  std::snprintf(row, sizeof row, "%-24s %-21s %-21s -", "b.jpg", "2024-05-02T12:30:00", "-");
  EXPECT_NE(list.out.find(row), std::string::npos) << list.out;

  const CommandResult tag = Run("geotag PHOTOTRIP");
  ASSERT_EQ(tag.status, 0) << tag.out;
  EXPECT_NE(tag.out.find("tagged 2 of 2 placed photos"), std::string::npos) << tag.out;
  const auto read =
      Exiftool(pa->GetFilePathName(), {"Composite:GPSLatitude", "Composite:GPSLongitude"});
  EXPECT_NEAR(std::atof(read[0].c_str()), aLat, 1e-7);
  EXPECT_NEAR(std::atof(read[1].c_str()), aLon, 1e-7);
  EXPECT_EQ(Exiftool(CString::FromUtf8(a), {"Composite:GPSLatitude"})[0], "-")
      << "originals untouched";
  EXPECT_EQ(Exiftool(Photo(*trip, L"b.jpg")->GetFilePathName(), {"Composite:GPSLatitude"})[0], "-");

  // Originals on request, asked one by one in the trip's order: a (yes), then c (no).
  const std::string cBefore = ReadFileBytes(CString::FromUtf8(c));
  const CommandResult originals = Run("geotag PHOTOTRIP --originals", "y\\nn\\n");
  ASSERT_EQ(originals.status, 0) << originals.out;
  EXPECT_NE(originals.out.find("Write the position into the original " + a + " too?"),
            std::string::npos);
  EXPECT_NE(originals.out.find("1 original"), std::string::npos) << originals.out;
  EXPECT_NEAR(std::atof(Exiftool(CString::FromUtf8(a), {"Composite:GPSLatitude"})[0].c_str()), aLat,
              1e-7);
  EXPECT_EQ(ReadFileBytes(CString::FromUtf8(c)), cBefore);
}

TEST_F(PhotoCommands, ClockCorrectionsAndUsageErrors) {
  const std::string b = Shot("b.jpg", "'-DateTimeOriginal=2024:05:02 12:30:00'");
  const CommandResult fixed =
      Run("photos add PHOTOTRIP " + b + " --offset-from b.jpg=2024-05-02T08:30:00");
  ASSERT_EQ(fixed.status, 0) << fixed.out;
  EXPECT_NE(fixed.out.find(AddLine("b.jpg", "2024-05-02T08:30:00Z", "placed by time")),
            std::string::npos)
      << fixed.out;
  const CommandResult shifted = Run("photos add PHOTOTRIP " + b + " --offset -10800");
  ASSERT_EQ(shifted.status, 0) << shifted.out;
  EXPECT_NE(shifted.out.find(AddLine("b-2.jpg", "2024-05-02T07:30:00Z", "not placed")),
            std::string::npos)
      << shifted.out;

  const struct {
    std::string args;
    int status;
    const char* message;
  } errors[] = {
      {"photos add PHOTOTRIP", 2, "FILES"},
      {"photos add NOSUCHTRIP " + b, 1, "NOSUCHTRIP"},
      {"photos add PHOTOTRIP " + b + " --offset-from other.jpg=2024-05-02T08:30:00", 2,
       "other.jpg"},
      {"photos add PHOTOTRIP " + b + " --offset 5 --offset-from b.jpg=2024-05-02T08:30:00", 2,
       "offset"},
      {"geotag PHOTOTRIP --yes-to-all --no-to-all", 2, "yes-to-all"},
      {"photos", 2, ""},
  };
  for (const auto& e : errors) {
    const CommandResult r = Run(e.args);
    EXPECT_EQ(r.status, e.status) << e.args << "\n" << r.out;
    EXPECT_NE(r.out.find(e.message), std::string::npos) << e.args << "\n" << r.out;
  }
  EXPECT_EQ(Load()->photos.GetCount(), 2) << "failed commands add nothing";
}

}  // namespace
