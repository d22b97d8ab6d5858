// The exported documents as real readers see them: xmllint against the published schemas, and
// gpsbabel, GDAL's ogrinfo and unzip reading them back. Skipped when a tool or the schema folder
// is missing (scripts/setup.sh installs the tools).
#include <cstdio>
#include <sstream>

#include <gtest/gtest.h>

#include "navmisc/export/csv_export.h"
#include "navmisc/export/detail/test_support.h"
#include "navmisc/export/gpx_export.h"
#include "navmisc/export/kml_export.h"
#include "navmisc/export/tcx_export.h"
#include "navmisc/records/trip.h"
#include "testutil.h"

namespace {

using namespace navmisc::exporttest;
using navmisc::testutil::DataRootScope;
using navmisc::testutil::TempDir;
using navmisc::testutil::WriteFileBytes;
using Points = std::vector<std::string>;

std::string LatLon(double lat, double lon) {
  char buf[64];
  std::snprintf(buf, sizeof buf, "%.6f,%.6f", lat, lon);
  return buf;
}

// "lat,lon" of every row of a gpsbabel unicsv listing (whose first columns are No, Latitude,
// Longitude) or of every vertex of the POINT and LINESTRING geometries in an ogrinfo listing.
Points ReadPoints(const std::string& listing) {
  Points out;
  std::istringstream lines(listing);
  for (std::string line; std::getline(lines, line);) {
    double x, y;
    int n;
    if (std::sscanf(line.c_str(), "%d,%lf,%lf", &n, &y, &x) == 3) out.push_back(LatLon(y, x));
    const size_t open = line.find('(');
    if (open == std::string::npos || (line.find("POINT") > open && line.find("LINESTRING") > open)) continue;
    std::istringstream vertices(line.substr(open + 1, line.find(')') - open - 1));
    for (std::string v; std::getline(vertices, v, ',');) {
      if (std::sscanf(v.c_str(), "%lf %lf", &x, &y) == 2) out.push_back(LatLon(y, x));
    }
  }
  return out;
}

// A trip folder with two photos and one track, all inside what the schemas allow.
struct Fixture {
  TempDir root;
  DataRootScope scope{root.path()};
  BLOG_ITEM_INFO trip{GPS_APP_TRIP, L"T1", 0};
  std::unique_ptr<TRACK_ITEM_INFO> track = MakeTrack(L"Z\u00fcrich \u2013 \u00dcetliberg",
                                                     {{47.376887, 8.541694, 408.5, 1714543200, 5400},
                                                      {47.3770015, 8.5421234, 409.25, 1714543210, 7200},
                                                      {1, 1, 1, -1},
                                                      {-33.856784, -70.250001, -2.5, 1714550400, 3600}});
  std::unique_ptr<PHOTO_ITEM_INFO> photos[2] = {
      MakeItem(0, L"Aussicht \u2615", L"Blick\r\nnach S\u00fcden", 47.3497, 8.4912, 870, 1714546900),
      MakeItem(0, L"Bahnhof", L"", 47.378, 8.54, 408, 0)};
  CPtrList tracks, items;
  const Points points = {"47.376887,8.541694", "47.377001,8.542123", "-33.856784,-70.250001"};
  const Points photoPoints = {"47.349700,8.491200", "47.378000,8.540000"};

  Fixture() {
    MakeDir(trip.GetResourcePath());
    tracks.AddTail(track.get());
    for (int i = 0; i < 2; ++i) {
      photos[i]->trip = &trip;
      photos[i]->itemName = FormatString(L"photo%d.jpg", i + 1);
      WriteFileBytes(photos[i]->GetFilePathName(), std::string(5000, 'a'));
      items.AddTail(photos[i].get());
    }
  }
  std::string Path(const wchar_t* name) const { return ShellQuote((root / name).ToUtf8()); }
  Points WithPhotos() const {
    Points all = points;
    all.insert(all.end(), photoPoints.begin(), photoPoints.end());
    return all;
  }
};

std::string MissingTool(std::initializer_list<const char*> programs, bool schemas) {
  for (const char* p : programs) {
    if (!HaveProgram(p)) return std::string(p) + " is not installed (scripts/setup.sh installs it)";
  }
  if (schemas && SchemaDir().empty()) return "the schema folder (NAVMISC_SCHEMA_DIR) is not there";
  return {};
}
#define REQUIRE(schemas, ...)                                                  \
  if (std::string why = MissingTool({__VA_ARGS__}, schemas); !why.empty()) { \
    GTEST_SKIP() << why;                                                       \
  }

// xmllint's exit status (0 = valid) and messages for `file` against schema `xsd`.
CommandResult Validate(const std::string& file, const char* xsd) {
  return RunCommand("xmllint --noout --nonet --schema " + ShellQuote(SchemaDir() + "/" + xsd) + " " + file + " 2>&1");
}

TEST(Readers, GpxValidatesAndReadsBack) {
  REQUIRE(true, "xmllint", "gpsbabel", "ogrinfo");
  Fixture f;
  CPtrList none;
  ASSERT_EQ(ExportGpx(f.root / L"out.gpx", f.tracks, f.items), 1);
  ASSERT_EQ(ExportGpx(f.root / L"empty.gpx", none, none), 1);
  for (const wchar_t* file : {L"out.gpx", L"empty.gpx"}) {
    const auto valid = Validate(f.Path(file), "gpx10.xsd");
    EXPECT_EQ(valid.status, 0) << valid.out;
  }
  const std::string gpx = f.Path(L"out.gpx");
  EXPECT_EQ(ReadPoints(RunCommand("gpsbabel -t -i gpx -f " + gpx + " -o unicsv -F -").out), f.points);
  EXPECT_EQ(ReadPoints(RunCommand("gpsbabel -w -i gpx -f " + gpx + " -o unicsv -F -").out), f.photoPoints);
  EXPECT_EQ(ReadPoints(RunCommand("ogrinfo -ro -q " + gpx + " track_points").out), f.points);
  EXPECT_NE(RunCommand("ogrinfo -ro -q " + gpx + " tracks").out.find("Z\xC3\xBCrich \xE2\x80\x93 \xC3\x9C" "etliberg"),
            std::string::npos);
}

TEST(Readers, KmlValidatesAndReadsBackAndKmzOpens) {
  REQUIRE(true, "xmllint", "gpsbabel", "ogrinfo", "unzip");
  Fixture f;
  ASSERT_EQ(ExportKml(f.root / L"out.kml", f.tracks, f.items, 0), 1);
  const std::string kml = f.Path(L"out.kml");
  const auto valid = Validate(kml, "kml21.xsd");
  EXPECT_EQ(valid.status, 0) << valid.out;
  EXPECT_EQ(ReadPoints(RunCommand("gpsbabel -t -i kml -f " + kml + " -o unicsv -F -").out), f.points);
  EXPECT_EQ(ReadPoints(RunCommand("ogrinfo -ro -al -q " + kml).out), f.WithPhotos());
  EXPECT_EQ(ReadPoints(RunCommand("ogrinfo --config GDAL_SKIP LIBKML -ro -al -q " + kml).out), f.WithPhotos());

  ASSERT_EQ(ExportKmz(f.root / L"Z\u00fcrich.kmz", f.tracks, f.items), 1);
  const std::string kmz = f.Path(L"Z\u00fcrich.kmz");
  EXPECT_EQ(RunCommand("unzip -tq " + kmz).status, 0);
  EXPECT_EQ(RunCommand("unzip -Z1 " + kmz).out, "1.jpg\n2.jpg\nZ\xC3\xBCrich.kml\n");
  EXPECT_EQ(ReadPoints(RunCommand("ogrinfo -ro -al -q " + kmz).out), f.WithPhotos());
}

TEST(Readers, TcxValidatesAndReadsBack) {
  REQUIRE(true, "xmllint", "gpsbabel");
  Fixture f;
  int n = 0;
  for (auto* p : navmisc::Items<WAYPOINT_ITEM_INFO>(f.track->points)) {
    p->flags[WAYPOINT_ITEM_INFO::kFlagPresence] = 0x0F;
    std::tie(p->workDistance, p->workHeartRate, p->workCadence, p->workSpeed) =
        std::make_tuple(100.0 * n, 110 + n, 80 + n, 1.5 * n);
    ++n;
  }
  CTcxActivities activity;
  activity.Id = L"2024-05-01T06:00:00Z";
  TcxLap* lap = activity.AddLap();
  lap->startTime = 1714543200;
  lap->totalTimeSeconds = 7200;
  lap->calories = 320;  // the schema requires calories
  lap->tracks.AddTail(f.track.get());
  ASSERT_EQ(ExportTcx(f.root / L"out.tcx", activity), 1);
  const auto valid = Validate(f.Path(L"out.tcx"), "tcx2-with-ax2.xsd");
  EXPECT_EQ(valid.status, 0) << valid.out;
  EXPECT_EQ(ReadPoints(RunCommand("gpsbabel -t -i gtrnctr -f " + f.Path(L"out.tcx") + " -o unicsv -F -").out),
            f.points);
}

TEST(Readers, CsvReadsBack) {
  REQUIRE(false, "gpsbabel", "ogrinfo");
  Fixture f;
  ASSERT_EQ(ExportCsv(f.root / L"out.csv", f.tracks, f.items, &f.trip, true), 1);
  const std::string csv = f.Path(L"out.csv");
  // gpsbabel reads no points from CR-only lines; the line ends are converted on the way.
  EXPECT_EQ(ReadPoints(RunCommand("tr '\\r' '\\n' < " + csv + " | gpsbabel -i unicsv -f - -o unicsv -F -").out),
            f.points);
  EXPECT_EQ(ReadPoints(RunCommand("ogrinfo -ro -al -q " + csv +
                                  " -oo X_POSSIBLE_NAMES=Longitude -oo Y_POSSIBLE_NAMES=Latitude").out),
            f.points);
}

}  // namespace
