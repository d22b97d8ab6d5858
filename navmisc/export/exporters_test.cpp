// What every exporter does alike: progress and stopping, unwritable targets, and numbers that
// ignore the process locale.
#include <functional>

#include <gtest/gtest.h>

#include "navmisc/export/csv_export.h"
#include "navmisc/export/detail/test_support.h"
#include "navmisc/export/gpx_export.h"
#include "navmisc/export/kml_export.h"
#include "navmisc/export/tcx_export.h"
#include "navmisc/export/tcx_from_trip.h"
#include "navmisc/platform/output_file.h"
#include "testutil.h"

namespace {

using namespace navmisc::exporttest;
using navmisc::testutil::ReadFileBytes;
using navmisc::testutil::TempDir;
using navmisc::testutil::WriteFileBytes;

struct Exporter {
  const wchar_t* extension;
  int steps;  // what a full export counts: track points, and item entries where items are written
  std::function<int(const CString& path, int* counter, bool* keepGoing)> run;
};

// Three track points (one without a time) and two items, in every format.
struct Fixture {
  std::unique_ptr<TRACK_ITEM_INFO> track = MakeTrack(
      L"t", {{47.376887, 8.541694, 408.5, 1714543200, 5400}, {1, 1, 1, -1}, {-33.5, -70.25, -2.5, 1714543260}});
  std::unique_ptr<PHOTO_ITEM_INFO> marker = MakeItem(1, L"m", L"d", 47.5, 8.5, 400, 1714543230);
  std::unique_ptr<PHOTO_ITEM_INFO> photo = MakeItem(0, L"p", L"", -1.5, -2.25, 0, 0);
  CPtrList tracks, items;
  CTcxActivities activity;
  std::vector<Exporter> exporters;

  Fixture() {
    tracks.AddTail(track.get());
    items.AddTail(marker.get());
    items.AddTail(photo.get());
    FillTcxActivity(tracks, CTcxActivities::kRunning, activity);
    exporters = {
        {L"gpx", 5, [this](const CString& p, int* c, bool* k) { return ExportGpx(p, tracks, items, c, k); }},
        {L"kml", 5, [this](const CString& p, int* c, bool* k) { return ExportKml(p, tracks, items, 0, c, k); }},
        {L"kmz", 5, [this](const CString& p, int* c, bool* k) { return ExportKmz(p, tracks, items, nullptr, c, k); }},
        {L"tcx", 3, [this](const CString& p, int* c, bool* k) { return ExportTcx(p, activity, c, k); }},
        {L"csv", 3, [this](const CString& p, int* c, bool* k) { return ExportCsv(p, tracks, items, nullptr, true, c, k); }},
    };
  }
};

TEST(Exporters, CountProgressAndAStoppedExportLeavesNothing) {
  TempDir dir;
  Fixture f;
  for (const Exporter& e : f.exporters) {
    const CString path = dir / (CString(L"out.") + e.extension);
    int counter = 0;
    bool keepGoing = true;
    EXPECT_EQ(e.run(path, &counter, &keepGoing), 1) << e.extension;
    EXPECT_EQ(counter, e.steps) << e.extension;
    // The flag is read after every step: cleared from the start, the export stops after one.
    keepGoing = false;
    counter = 0;
    EXPECT_EQ(e.run(path, &counter, &keepGoing), 0) << e.extension;
    EXPECT_EQ(counter, 1) << e.extension;
    EXPECT_FALSE(FileExists(path)) << e.extension;
  }
}

TEST(Exporters, UnwritableTargetsGiveZeroAndAReason) {
  TempDir dir;
  Fixture f;
  WriteFileBytes(dir / L"file", "x");
  const struct {
    CString target;
    const char* why;
  } targets[] = {{dir / L"missing/out", "No such file or directory"},
                 {dir / L"file/out", "Not a directory"},
                 {dir.path(), "Is a directory"}};
  for (const Exporter& e : f.exporters) {
    for (const auto& t : targets) {
      EXPECT_EQ(e.run(t.target, nullptr, nullptr), 0) << e.extension << " " << t.target.ToUtf8();
      EXPECT_EQ(navmisc::LastOpenError(), t.why) << e.extension << " " << t.target.ToUtf8();
    }
  }
  EXPECT_EQ(ReadFileBytes(dir / L"file"), "x");
  EXPECT_FALSE(FileExists(dir / L"missing"));
}

TEST(Exporters, NumbersIgnoreACommaDecimalLocale) {
  TempDir dir;
  Fixture f;
  std::vector<std::string> inC;
  for (const Exporter& e : f.exporters) {
    ASSERT_EQ(e.run(dir / (CString(L"c.") + e.extension), nullptr, nullptr), 1);
    inC.push_back(MaskKmlDate(ReadFileBytes(dir / (CString(L"c.") + e.extension))));
  }
  EXPECT_NE(inC[0].find("<trkpt lat=\"-33.500000\" lon=\"-70.250000\">"), std::string::npos);
  CommaLocale locale;
  if (!locale.ok()) GTEST_SKIP() << "no comma-decimal locale installed (scripts/setup.sh makes de_DE.UTF-8)";
  for (size_t i = 0; i < f.exporters.size(); ++i) {
    if (f.exporters[i].extension == std::wstring(L"kmz")) continue;  // holds the KML, and zip times
    const CString path = dir / (CString(L"de.") + f.exporters[i].extension);
    ASSERT_EQ(f.exporters[i].run(path, nullptr, nullptr), 1);
    EXPECT_EQ(MaskKmlDate(ReadFileBytes(path)), inC[i]) << f.exporters[i].extension;
  }
}

}  // namespace
