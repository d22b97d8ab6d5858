// What every exporter does alike (progress and stopping, existing and unwritable targets), and
// the documents as real readers see them: xmllint against the published schemas, and gpsbabel,
// GDAL's ogrinfo and unzip reading them back. The reader tests are skipped when a tool or the
// schema folder is missing (scripts/setup.sh installs the tools).
#include <sys/stat.h>

#include <cstdio>
#include <functional>
#include <sstream>

#include <gtest/gtest.h>

#include "navmisc/export/csv_export.h"
#include "navmisc/export/detail/test_support.h"
#include "navmisc/export/gpx_export.h"
#include "navmisc/export/kml_export.h"
#include "navmisc/export/tcx_export.h"
#include "navmisc/platform/atomic_file.h"
#include "navmisc/platform/format.h"
#include "navmisc/records/trip.h"
#include "testutil.h"

namespace {

using namespace navmisc::exporttest;
using navmisc::testutil::DataRootScope;
using navmisc::testutil::ReadFileBytes;
using navmisc::testutil::TempDir;
using navmisc::testutil::WriteFileBytes;
using Points = std::vector<std::string>;

struct Exporter {
  const wchar_t* extension;
  int steps;  // what a full export counts: track points, and item entries where items are written
  std::function<int(const CString& path, ExportControl& control)> run;
};

// A trip folder with two photos and one track (one of its points without a time), all inside
// what the schemas allow, and each format's exporter of them.
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
  CTcxActivities activity;
  const Points points = {"47.376887,8.541694", "47.377001,8.542123", "-33.856784,-70.250001"};
  const Points photoPoints = {"47.349700,8.491200", "47.378000,8.540000"};
  const Points allPoints = {"47.376887,8.541694", "47.377001,8.542123", "-33.856784,-70.250001",
                            "47.349700,8.491200", "47.378000,8.540000"};
  std::vector<Exporter> exporters;

  Fixture() {
    MakeDir(trip.GetResourcePath());
    tracks.AddTail(track.get());
    for (int i = 0; i < 2; ++i) {
      photos[i]->trip = &trip;
      photos[i]->itemName = FormatString(L"photo%d.jpg", i + 1);
      WriteFileBytes(photos[i]->GetFilePathName(), std::string(5000, 'a'));
      items.AddTail(photos[i].get());
    }
    int n = 0;
    for (auto* p : navmisc::Items<WAYPOINT_ITEM_INFO>(track->points)) {
      p->flags[WAYPOINT_ITEM_INFO::kFlagPresence] = 0x0F;
      std::tie(p->workDistance, p->workHeartRate, p->workCadence, p->workSpeed) =
          std::make_tuple(100.0 * n, 110 + n, 80 + n, 1.5 * n);
      ++n;
    }
    activity.Id = L"2024-05-01T06:00:00Z";
    TcxLap* lap = activity.AddLap();
    lap->startTime = 1714543200;
    lap->totalTimeSeconds = 7200;
    lap->calories = 320;  // the schema requires calories
    lap->tracks.AddTail(track.get());
    exporters = {
        {L"gpx", 6, [this](const CString& p, ExportControl& c) { return ExportGpx(p, tracks, items, c); }},
        {L"kml", 6, [this](const CString& p, ExportControl& c) { return ExportKml(p, tracks, items, 0, c); }},
        {L"kmz", 6, [this](const CString& p, ExportControl& c) { return ExportKmz(p, tracks, items, nullptr, c); }},
        {L"tcx", 4, [this](const CString& p, ExportControl& c) { return ExportTcx(p, activity, c); }},
        {L"csv", 4, [this](const CString& p, ExportControl& c) { return ExportCsv(p, tracks, items, &trip, true, c); }},
    };
  }
  std::string Path(const wchar_t* name) const { return ShellQuote((root / name).ToUtf8()); }
};

TEST(Exporters, CountProgressReplaceTargetsAndAStoppedExportLeavesNothing) {
  Fixture f;
  for (const Exporter& e : f.exporters) {
    const CString path = f.root / (CString(L"out.") + e.extension);
    // An existing, longer, read-only file is replaced whole.
    WriteFileBytes(path, std::string(100000, 'x'));
    ASSERT_EQ(::chmod(navmisc::NativePath(path).c_str(), 0444), 0);
    int counter = 0;
    bool keepGoing = true;
    ExportControl control;
    control.counter = &counter;
    control.keepGoing = &keepGoing;
    control.error = "left over";
    EXPECT_EQ(e.run(path, control), 1) << e.extension;
    EXPECT_EQ(counter, e.steps) << e.extension;
    EXPECT_EQ(control.error, "") << e.extension;
    EXPECT_EQ(ReadFileBytes(path).find("xxxx"), std::string::npos) << e.extension;
    // The flag is read after every step: cleared from the start, the export stops after one.
    keepGoing = false;
    counter = 0;
    EXPECT_EQ(e.run(path, control), 0) << e.extension;
    EXPECT_EQ(counter, 1) << e.extension;
    EXPECT_EQ(control.error, "stopped") << e.extension;
    EXPECT_FALSE(FileExists(path)) << e.extension;
  }
}

TEST(Exporters, UnwritableTargetsGiveZeroAndAReason) {
  Fixture f;
  WriteFileBytes(f.root / L"file", "x");
  const struct {
    CString target;
    const char* why;
  } targets[] = {{f.root / L"missing/out", "No such file or directory"},
                 {f.root / L"file/out", "Not a directory"},
                 {f.root.path(), "Is a directory"}};
  for (const Exporter& e : f.exporters) {
    for (const auto& t : targets) {
      ExportControl control;
      EXPECT_EQ(e.run(t.target, control), 0) << e.extension << " " << t.target.ToUtf8();
      EXPECT_EQ(control.error, t.why) << e.extension << " " << t.target.ToUtf8();
    }
  }
  EXPECT_EQ(ReadFileBytes(f.root / L"file"), "x");
  EXPECT_FALSE(FileExists(f.root / L"missing"));
}

TEST(Exporters, AFullDiskIsReportedThoughTheResultStaysOne) {
  Fixture f;
  for (const Exporter& e : f.exporters) {
    for (long long budget : {0LL, 100LL}) {
      const CString path = f.root / (CString(L"full.") + e.extension);
      ExportControl control;
      navmisc::testing::FailAtomicWritesAfter(budget);
      const int result = e.run(path, control);
      navmisc::testing::FailAtomicWritesAfter(-1);
      // A KMZ packs the written document into an archive: a short document is noticed there
      // too, and an archive that cannot be finished fails the call.
      if (std::wstring(e.extension) != L"kmz") {
        EXPECT_EQ(result, 1) << e.extension << " " << budget;
      }
      EXPECT_EQ(control.error, "No space left on device") << e.extension << " " << budget;
    }
  }
}

TEST(Exporters, PointsReadFromTheFilesGiveTheDocumentOfTheLoadedPoints) {
  Fixture f;
  // The fixture's track, a one-point track (loaded as two) and an empty one, saved with the trip;
  // the streamed export gets copies that know only the tracks' ids.
  CPtrList saved, unloaded;
  std::vector<std::unique_ptr<TRACK_ITEM_INFO>> owned;
  const std::vector<std::vector<Pt>> shapes = {
      {{47.376887, 8.541694, 408.5, 1714543200, 5400, 90, 3},
       {1, 1, 1, -1},
       {47.3770015, 8.5421234, 409.25, 1714543210, 7200, -1, -2}},
      {{-33.856784, -70.250001, -2.5, 1714550400, 3600}},
      {}};
  for (const auto& shape : shapes) {
    auto loaded = MakeTrack(L"T & <b>", shape);
    loaded->trip = &f.trip;
    loaded->WriteAllWaypoint(1, nullptr, nullptr);
    loaded->ReadAllWaypoint(1);  // as a loaded trip holds it: a lone point has its copy
    auto bare = std::make_unique<TRACK_ITEM_INFO>(&f.trip);
    bare->id = loaded->id;
    bare->description = loaded->description;
    saved.AddTail(loaded.get());
    unloaded.AddTail(bare.get());
    owned.push_back(std::move(loaded));
    owned.push_back(std::move(bare));
  }
  const struct {
    const wchar_t* extension;
    std::function<int(CPtrList& tracks, const CString& path, ExportControl& control)> run;
  } exporters[] = {
      {L"gpx", [&](CPtrList& t, const CString& p, ExportControl& c) { return ExportGpx(p, t, f.items, c); }},
      {L"kml", [&](CPtrList& t, const CString& p, ExportControl& c) { return ExportKml(p, t, f.items, 0, c); }},
      {L"csv", [&](CPtrList& t, const CString& p, ExportControl& c) { return ExportCsv(p, t, f.items, &f.trip, false, c); }},
  };
  for (const auto& e : exporters) {
    const CString expected = f.root / (CString(L"loaded.") + e.extension);
    const CString streamed = f.root / (CString(L"streamed.") + e.extension);
    int loadedSteps = 0, streamedSteps = 0;
    ExportControl plain, fromFiles;
    plain.counter = &loadedSteps;
    fromFiles.counter = &streamedSteps;
    fromFiles.pointsFromFiles = true;
    ASSERT_EQ(e.run(saved, expected, plain), 1) << e.extension;
    ASSERT_EQ(e.run(unloaded, streamed, fromFiles), 1) << e.extension << " " << fromFiles.error;
    EXPECT_EQ(MaskKmlDate(ReadFileBytes(streamed)), MaskKmlDate(ReadFileBytes(expected))) << e.extension;
    EXPECT_EQ(streamedSteps, loadedSteps) << e.extension;
  }
  for (auto* t : navmisc::Items<TRACK_ITEM_INFO>(unloaded)) EXPECT_TRUE(t->points.IsEmpty());
  // The TCX laps need the loaded points' working values.
  ExportControl fromFiles;
  fromFiles.pointsFromFiles = true;
  EXPECT_EQ(ExportTcx(f.root / L"streamed.tcx", f.activity, fromFiles), 0);
  EXPECT_EQ(fromFiles.error, "a TCX export needs the points loaded");
  EXPECT_FALSE(FileExists(f.root / L"streamed.tcx"));
}

// "lat,lon" of every row of a gpsbabel unicsv listing (whose first columns are No, Latitude,
// Longitude) or of every vertex of the POINT and LINESTRING geometries in an ogrinfo listing.
Points ReadPoints(const std::string& listing) {
  Points out;
  const auto add = [&out](double lat, double lon) {
    out.push_back(navmisc::FormatA("%.6f,%.6f", lat, lon));
  };
  std::istringstream lines(listing);
  for (std::string line; std::getline(lines, line);) {
    double x, y;
    int n;
    if (std::sscanf(line.c_str(), "%d,%lf,%lf", &n, &y, &x) == 3) add(y, x);
    const size_t open = line.find('(');
    if (open == std::string::npos || (line.find("POINT") > open && line.find("LINESTRING") > open)) continue;
    std::istringstream vertices(line.substr(open + 1, line.find(')') - open - 1));
    for (std::string v; std::getline(vertices, v, ',');) {
      if (std::sscanf(v.c_str(), "%lf %lf", &x, &y) == 2) add(y, x);
    }
  }
  return out;
}

std::string MissingTool(std::initializer_list<const char*> programs) {
  for (const char* p : programs) {
    if (!HaveProgram(p)) return std::string(p) + " is not installed (scripts/setup.sh installs it)";
  }
  return {};
}
#define REQUIRE(...)                                                   \
  if (std::string why = MissingTool({__VA_ARGS__}); !why.empty()) { \
    GTEST_SKIP() << why;                                               \
  }

// `file` must validate against schema `xsd` (xmllint). Without the schema folder only this check
// is left out, with a note; the read-back checks still run.
void ExpectValid(const std::string& file, const char* xsd) {
  if (SchemaDir().empty()) {
    std::printf("note: no schema check of %s: the schema folder (NAVMISC_SCHEMA_DIR) is not there\n",
                file.c_str());
    return;
  }
  const CommandResult r =
      RunCommand("xmllint --noout --nonet --schema " + ShellQuote(SchemaDir() + "/" + xsd) + " " + file + " 2>&1");
  EXPECT_EQ(r.status, 0) << r.out;
}

TEST(Readers, GpxValidatesAndReadsBack) {
  REQUIRE("xmllint", "gpsbabel", "ogrinfo");
  Fixture f;
  CPtrList none;
  ASSERT_EQ(ExportGpx(f.root / L"out.gpx", f.tracks, f.items), 1);
  ASSERT_EQ(ExportGpx(f.root / L"empty.gpx", none, none), 1);
  for (const wchar_t* file : {L"out.gpx", L"empty.gpx"}) ExpectValid(f.Path(file), "gpx10.xsd");
  const std::string gpx = f.Path(L"out.gpx");
  EXPECT_EQ(ReadPoints(RunCommand("gpsbabel -t -i gpx -f " + gpx + " -o unicsv -F -").out), f.points);
  EXPECT_EQ(ReadPoints(RunCommand("gpsbabel -w -i gpx -f " + gpx + " -o unicsv -F -").out), f.photoPoints);
  EXPECT_EQ(ReadPoints(RunCommand("ogrinfo -ro -q " + gpx + " track_points").out), f.points);
  EXPECT_NE(RunCommand("ogrinfo -ro -q " + gpx + " tracks").out.find("Z\xC3\xBCrich \xE2\x80\x93 \xC3\x9C" "etliberg"),
            std::string::npos);
}

TEST(Readers, KmlValidatesAndReadsBackAndKmzOpens) {
  REQUIRE("xmllint", "gpsbabel", "ogrinfo", "unzip");
  Fixture f;
  ASSERT_EQ(ExportKml(f.root / L"out.kml", f.tracks, f.items, 0), 1);
  const std::string kml = f.Path(L"out.kml");
  ExpectValid(kml, "kml21.xsd");
  EXPECT_EQ(ReadPoints(RunCommand("gpsbabel -t -i kml -f " + kml + " -o unicsv -F -").out), f.points);
  EXPECT_EQ(ReadPoints(RunCommand("ogrinfo -ro -al -q " + kml).out), f.allPoints);
  EXPECT_EQ(ReadPoints(RunCommand("ogrinfo --config GDAL_SKIP LIBKML -ro -al -q " + kml).out), f.allPoints);

  ASSERT_EQ(ExportKmz(f.root / L"Z\u00fcrich.kmz", f.tracks, f.items), 1);
  const std::string kmz = f.Path(L"Z\u00fcrich.kmz");
  EXPECT_EQ(RunCommand("unzip -tq " + kmz).status, 0);
  EXPECT_EQ(RunCommand("unzip -Z1 " + kmz).out, "1.jpg\n2.jpg\nZ\xC3\xBCrich.kml\n");
  EXPECT_EQ(ReadPoints(RunCommand("ogrinfo -ro -al -q " + kmz).out), f.allPoints);
}

TEST(Readers, TcxValidatesAndReadsBack) {
  REQUIRE("xmllint", "gpsbabel");
  Fixture f;
  ASSERT_EQ(ExportTcx(f.root / L"out.tcx", f.activity), 1);
  ExpectValid(f.Path(L"out.tcx"), "tcx2-with-ax2.xsd");
  EXPECT_EQ(ReadPoints(RunCommand("gpsbabel -t -i gtrnctr -f " + f.Path(L"out.tcx") + " -o unicsv -F -").out),
            f.points);
}

TEST(Readers, CsvReadsBack) {
  REQUIRE("gpsbabel", "ogrinfo");
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
