// The exported documents as real readers see them: xmllint against the published schemas, and
// gpsbabel and GDAL's ogrinfo reading back the points. Each test is skipped when its tools or
// the schema folder are missing (scripts/setup.sh installs them).
#include <cstdio>
#include <vector>

#include <gtest/gtest.h>

#include "navmisc/export/csv_export.h"
#include "navmisc/export/gpx_export.h"
#include "navmisc/export/kml_export.h"
#include "navmisc/export/tcx_export.h"
#include "navmisc/export/detail/test_support.h"
#include "navmisc/records/trip.h"
#include "testutil.h"

namespace {

using namespace navmisc::exporttest;
using navmisc::testutil::DataRootScope;
using navmisc::testutil::TempDir;
using navmisc::testutil::WriteFileBytes;

std::string LatLon(double lat, double lon) {
  char buf[64];
  std::snprintf(buf, sizeof buf, "%.6f,%.6f", lat, lon);
  return buf;
}

// "lat,lon" of every row of a gpsbabel unicsv listing.
std::vector<std::string> UnicsvPoints(const std::string& csv) {
  std::vector<std::string> rows, out;
  size_t start = 0;
  for (size_t nl; (nl = csv.find('\n', start)) != std::string::npos; start = nl + 1) {
    rows.push_back(csv.substr(start, nl - start));
  }
  if (rows.empty()) return out;
  auto split = [](const std::string& row) {
    std::vector<std::string> cells;
    size_t from = 0;
    for (size_t comma; (comma = row.find(',', from)) != std::string::npos; from = comma + 1) {
      cells.push_back(row.substr(from, comma - from));
    }
    cells.push_back(row.substr(from));
    return cells;
  };
  const auto header = split(rows[0]);
  size_t lat = header.size(), lon = header.size();
  for (size_t i = 0; i < header.size(); ++i) {
    if (header[i] == "Latitude") lat = i;
    if (header[i] == "Longitude") lon = i;
  }
  for (size_t r = 1; r < rows.size(); ++r) {
    const auto cells = split(rows[r]);
    if (lat < cells.size() && lon < cells.size()) {
      out.push_back(LatLon(std::stod(cells[lat]), std::stod(cells[lon])));
    }
  }
  return out;
}

// "lat,lon" of every vertex of the POINT and LINESTRING geometries in an ogrinfo listing.
std::vector<std::string> OgrPoints(const std::string& listing) {
  std::vector<std::string> out;
  size_t pos = 0;
  while ((pos = listing.find('(', pos)) != std::string::npos) {
    const size_t lineStart = listing.rfind('\n', pos) + 1;
    const std::string head = listing.substr(lineStart, pos - lineStart);
    const size_t end = listing.find(')', pos);
    if (end == std::string::npos) break;
    if (head.find("POINT") != std::string::npos || head.find("LINESTRING") != std::string::npos) {
      std::string body = listing.substr(pos + 1, end - pos - 1);
      size_t from = 0;
      while (from < body.size()) {
        size_t comma = body.find(',', from);
        if (comma == std::string::npos) comma = body.size();
        double x = 0, y = 0;
        if (std::sscanf(body.c_str() + from, "%lf %lf", &x, &y) == 2) out.push_back(LatLon(y, x));
        from = comma + 1;
      }
    }
    pos = end;
  }
  return out;
}

// A trip folder with two photos and one track whose titles stay inside what the schemas allow.
struct Fixture {
  TempDir root;
  DataRootScope scope{root.path()};
  BLOG_ITEM_INFO trip{GPS_APP_TRIP, L"T1", 0};
  std::unique_ptr<TRACK_ITEM_INFO> track;
  std::unique_ptr<PHOTO_ITEM_INFO> photo1, photo2;
  CPtrList tracks, items, none;
  std::vector<std::string> expected;  // the track's timed points

  Fixture() {
    MakeDir(trip.GetResourcePath());
    track = MakeTrack(L"Z\u00fcrich \u2013 \u00dcetliberg",
                      {{47.376887, 8.541694, 408.5, 1714543200, 5400},
                       {47.3770015, 8.5421234, 409.25, 1714543210, 7200},
                       {1, 1, 1, -1},
                       {47.351234, 8.491789, 869, 1714546800, 0},
                       {-33.856784, -70.250001, -2.5, 1714550400, 3600}});
    tracks.AddTail(track.get());
    for (auto* p : navmisc::Items<WAYPOINT_ITEM_INFO>(track->points)) {
      if (p->time != -1) expected.push_back(LatLon(p->latitude, p->longitude));
    }
    photo1 = MakeItem(PHOTO_ITEM_INFO::kTypePhoto, L"Aussicht \u2615", L"Blick\r\nnach S\u00fcden", 47.3497,
                      8.4912, 870, 1714546900);
    photo2 = MakeItem(PHOTO_ITEM_INFO::kTypePhoto, L"Bahnhof", L"", 47.378, 8.54, 408, 0);
    int n = 0;
    for (auto* p : {photo1.get(), photo2.get()}) {
      p->trip = &trip;
      p->itemName = FormatString(L"photo%d.jpg", ++n);
      WriteFileBytes(p->GetFilePathName(), std::string(5000, static_cast<char>('a' + n)));
      items.AddTail(p);
    }
  }
  std::string Path(const wchar_t* name) const { return (root / name).ToUtf8(); }
};

bool Need(std::initializer_list<const char*> programs, std::string* missing) {
  for (const char* p : programs) {
    if (!HaveProgram(p)) {
      *missing = std::string(p) + " is not installed (scripts/setup.sh installs it)";
      return false;
    }
  }
  return true;
}

// xmllint's verdict on `file` against schema `xsd` of the schema folder.
CommandResult Validate(const std::string& file, const char* xsd) {
  return RunCommand("xmllint --noout --nonet --schema " + ShellQuote(SchemaDir() + "/" + xsd) + " " +
                    ShellQuote(file) + " 2>&1");
}

#define REQUIRE_TOOLS(...)                                              \
  do {                                                                  \
    std::string missing;                                                \
    if (!Need({__VA_ARGS__}, &missing)) GTEST_SKIP() << missing;        \
  } while (0)
#define REQUIRE_SCHEMAS()                                                                      \
  do {                                                                                         \
    if (SchemaDir().empty()) GTEST_SKIP() << "schema folder NAVMISC_SCHEMA_DIR is not there"; \
  } while (0)

TEST(Readers, GpxValidatesAndReadsBack) {
  REQUIRE_TOOLS("xmllint", "gpsbabel", "ogrinfo");
  REQUIRE_SCHEMAS();
  Fixture f;
  ASSERT_EQ(ExportGpx(f.root / L"out.gpx", f.tracks, f.items), 1);
  ASSERT_EQ(ExportGpx(f.root / L"empty.gpx", f.none, f.none), 1);
  const std::string gpx = ShellQuote(f.Path(L"out.gpx"));
  for (const wchar_t* file : {L"out.gpx", L"empty.gpx"}) {
    const auto valid = Validate(f.Path(file), "gpx10.xsd");
    EXPECT_EQ(valid.status, 0) << valid.out;
  }

  EXPECT_EQ(UnicsvPoints(RunCommand("gpsbabel -t -i gpx -f " + gpx + " -o unicsv -F -").out), f.expected);
  EXPECT_EQ(UnicsvPoints(RunCommand("gpsbabel -w -i gpx -f " + gpx + " -o unicsv -F -").out),
            (std::vector<std::string>{"47.349700,8.491200", "47.378000,8.540000"}));
  EXPECT_EQ(OgrPoints(RunCommand("ogrinfo -ro -q " + gpx + " track_points").out), f.expected);
  const std::string tracks = RunCommand("ogrinfo -ro -q " + gpx + " tracks").out;
  EXPECT_NE(tracks.find("name (String) = Z\xC3\xBCrich \xE2\x80\x93 \xC3\x9C" "etliberg"), std::string::npos)
      << tracks;
}

TEST(Readers, KmlValidatesAndReadsBack) {
  REQUIRE_TOOLS("xmllint", "gpsbabel", "ogrinfo");
  REQUIRE_SCHEMAS();
  Fixture f;
  ASSERT_EQ(ExportKml(f.root / L"out.kml", f.tracks, f.items, 0), 1);
  const std::string kml = ShellQuote(f.Path(L"out.kml"));
  const auto valid = Validate(f.Path(L"out.kml"), "kml21.xsd");
  EXPECT_EQ(valid.status, 0) << valid.out;
  EXPECT_EQ(UnicsvPoints(RunCommand("gpsbabel -t -i kml -f " + kml + " -o unicsv -F -").out), f.expected);
  std::vector<std::string> withPhotos = f.expected;
  withPhotos.push_back("47.349700,8.491200");
  withPhotos.push_back("47.378000,8.540000");
  EXPECT_EQ(OgrPoints(RunCommand("ogrinfo -ro -al -q " + kml).out), withPhotos);
  EXPECT_EQ(OgrPoints(RunCommand("ogrinfo --config GDAL_SKIP LIBKML -ro -al -q " + kml).out), withPhotos);
}

TEST(Readers, KmzOpensAndListsThePhotosBeforeTheDocument) {
  REQUIRE_TOOLS("unzip", "ogrinfo");
  Fixture f;
  ASSERT_EQ(ExportKmz(f.root / L"Z\u00fcrich.kmz", f.tracks, f.items), 1);
  const std::string kmz = ShellQuote(f.Path(L"Z\u00fcrich.kmz"));
  EXPECT_EQ(RunCommand("unzip -tq " + kmz + " >/dev/null").status, 0);
  EXPECT_EQ(RunCommand("unzip -Z1 " + kmz).out, "1.jpg\n2.jpg\nZ\xC3\xBCrich.kml\n");
  std::vector<std::string> withPhotos = f.expected;
  withPhotos.push_back("47.349700,8.491200");
  withPhotos.push_back("47.378000,8.540000");
  const auto listing = RunCommand("ogrinfo -ro -al -q " + kmz);
  EXPECT_EQ(listing.status, 0);
  EXPECT_EQ(OgrPoints(listing.out), withPhotos);
}

TEST(Readers, TcxValidatesAndReadsBack) {
  REQUIRE_TOOLS("xmllint", "gpsbabel");
  REQUIRE_SCHEMAS();
  Fixture f;
  int n = 0;
  for (auto* p : navmisc::Items<WAYPOINT_ITEM_INFO>(f.track->points)) {
    p->flags[WAYPOINT_ITEM_INFO::kFlagPresence] = 0x0F;
    p->workDistance = 100.0 * n;
    p->workHeartRate = 110 + n;
    p->workCadence = 80 + n;
    p->workSpeed = 1.5 * n++;
  }
  CTcxActivities activity;
  activity.Id = L"2024-05-01T06:00:00Z";
  activity.sportType = CTcxActivities::kBiking;
  TcxLap* lap = activity.AddLap();
  lap->startTime = 1714543200;
  lap->totalTimeSeconds = 7200;
  lap->distanceMeters = 400;
  lap->maximumSpeed = 6;
  lap->calories = 320;
  lap->averageHeartRate = 112;
  lap->maximumHeartRate = 114;
  lap->tracks.AddTail(f.track.get());
  ASSERT_EQ(ExportTcx(f.root / L"out.tcx", activity), 1);
  const auto valid = Validate(f.Path(L"out.tcx"), "tcx2-with-ax2.xsd");
  EXPECT_EQ(valid.status, 0) << valid.out;
  const std::string tcx = ShellQuote(f.Path(L"out.tcx"));
  EXPECT_EQ(UnicsvPoints(RunCommand("gpsbabel -t -i gtrnctr -f " + tcx + " -o unicsv -F -").out), f.expected);
}

TEST(Readers, CsvReadsBack) {
  REQUIRE_TOOLS("gpsbabel", "ogrinfo");
  Fixture f;
  ASSERT_EQ(ExportCsv(f.root / L"out.csv", f.tracks, f.items, &f.trip, true), 1);
  const std::string csv = ShellQuote(f.Path(L"out.csv"));
  // gpsbabel reads no points from CR-only lines; the line ends are converted on the way.
  EXPECT_EQ(UnicsvPoints(RunCommand("tr '\\r' '\\n' < " + csv + " | gpsbabel -i unicsv -f - -o unicsv -F -").out),
            f.expected);
  EXPECT_EQ(OgrPoints(RunCommand("ogrinfo -ro -al -q " + csv +
                                 " -oo X_POSSIBLE_NAMES=Longitude -oo Y_POSSIBLE_NAMES=Latitude")
                          .out),
            f.expected);
}

}  // namespace
