// navmisc optimize, plot and place, run as a user runs them.
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cstdlib>
#include <string>

#include "geo_reference.h"
#include "navmisc/platform/datetime.h"
#include "navmisc/platform/files.h"
#include "navmisc/platform/format.h"
#include "navmisc/records/trip.h"
#include "testutil.h"
#include "tool_test_support.h"

namespace {

using navmisc::testutil::CommandResult;
using navmisc::testutil::HaveProgram;

std::vector<WAYPOINT_ITEM_INFO*> AllPoints(BLOG_ITEM_INFO& trip) {
  std::vector<WAYPOINT_ITEM_INFO*> out;
  for (auto* t : navmisc::Items<TRACK_ITEM_INFO>(trip.tracks)) {
    for (auto* p : navmisc::Items<WAYPOINT_ITEM_INFO>(t->points)) out.push_back(p);
  }
  return out;
}

class GeoCommands : public ::testing::Test {
 protected:
  void SetUp() override {
    BLOG_ITEM_INFO trip(GPS_APP_TRIP, L"GEOTRIP", 0);
    ASSERT_TRUE(MakeDir(trip.GetResourcePath()));
    trip.name = L"Noisy";
    for (uint32_t seed : {41u, 42u}) {
      auto* track = new TRACK_ITEM_INFO(&trip);
      navmisc::testing::AppendNoisyTrack(track->points, seed, 1500);
      trip.tracks.AddTail(track);
    }
    trip.WriteAllWaypoint(1, nullptr, nullptr);
    trip.WriteInfo(1, nullptr, nullptr);
  }

  // The trip as the files hold it now.
  std::unique_ptr<BLOG_ITEM_INFO> Load() {
    auto trip = std::make_unique<BLOG_ITEM_INFO>(GPS_APP_TRIP, L"GEOTRIP", 0);
    EXPECT_EQ(trip->ReadInfo(), 1);
    trip->ReadAllWaypoint(1);
    return trip;
  }

  // The program on the test's data root with `args`, standard error folded into the output.
  CommandResult RunTool(const std::string& args) {
    return navmisc::testutil::RunTool("--data-root " + root.path().ToUtf8() + " " + args);
  }

  navmisc::testutil::TempDir root;
  navmisc::testutil::DataRootScope scope{root.path()};
};

std::vector<int32_t> Levels(BLOG_ITEM_INFO& trip) {
  std::vector<int32_t> out;
  for (const WAYPOINT_ITEM_INFO* p : AllPoints(trip)) out.push_back(p->type);
  return out;
}

TEST_F(GeoCommands, OptimizeStoresTheLibrarysLevelsAndPlotDrawsThem) {
  // --off keeps the levels the files hold.
  const std::vector<int32_t> before = Levels(*Load());
  const CommandResult off = RunTool("optimize GEOTRIP --off");
  ASSERT_EQ(off.status, 0) << off.out;
  EXPECT_EQ(Levels(*Load()), before);

  auto expected = Load();
  expected->OptimizeWaypoint(GPS_APP_TRIP, 1, nullptr, nullptr);
  const CommandResult r = RunTool("optimize GEOTRIP");
  ASSERT_EQ(r.status, 0) << r.out;
  EXPECT_NE(r.out.find("display level " + std::to_string(expected->optLevel)), std::string::npos) << r.out;
  auto saved = Load();
  EXPECT_EQ(saved->optLevel, expected->optLevel);
  EXPECT_TRUE(saved->optOptimize);
  EXPECT_EQ(Levels(*saved), Levels(*expected));
  EXPECT_NE(Levels(*saved), before);

  const std::string svg = (root / L"trip.svg").ToUtf8();
  const CommandResult plot = RunTool("plot GEOTRIP --size 500 -o " + svg);
  ASSERT_EQ(plot.status, 0) << plot.out;
  const std::string text = navmisc::testutil::ReadFileBytes(CString::FromUtf8(svg));
  ASSERT_EQ(text.rfind("<?xml", 0), 0u);
  EXPECT_NE(text.find("width=\"500\" height=\"500\""), std::string::npos);
  const size_t points = text.find("<g id=\"points\">");
  size_t dots = 0;
  for (size_t at = points; (at = text.find("<circle", at + 1)) < text.find("</g>", points);) ++dots;
  // Every point but the bad fixes outside the frame.
  const std::vector<int32_t> levels = Levels(*saved);
  const size_t badFixes = static_cast<size_t>(std::count(levels.begin(), levels.end(), -2));
  ASSERT_GT(badFixes, 0u);
  EXPECT_LE(dots, 3000u);
  EXPECT_GE(dots, 3000u - badFixes);
  for (const char* key : {">Noisy  ", "bad fix (-2)", "stop (-1)", "level 0", "never dropped", "start", "end",
                          "#d62728", "#ff7f0e"}) {
    EXPECT_NE(text.find(key), std::string::npos) << key;
  }
  if (HaveProgram("xmllint")) {
    EXPECT_EQ(std::system(("xmllint --noout " + svg).c_str()), 0);
  }
}

TEST_F(GeoCommands, PlaceAnswersByTimeOrPositionAndErrorsSayWhy) {
  auto trip = Load();
  const WAYPOINT_ITEM_INFO* fix = AllPoints(*trip)[700];
  const std::string lat = navmisc::FormatA("%.6f", fix->latitude);
  const std::string lon = navmisc::FormatA("%.6f", fix->longitude);
  const std::string place = "place GEOTRIP ";
  // The fix's time in ISO form, in UTC and as two hours ahead of it.
  const std::string iso = CString(TimeTToStdStringTime(fix->time)).ToUtf8();
  const std::string plusTwo = CString(TimeTToStdStringTime(fix->time + 7200)).ToUtf8();
  const struct {
    std::string args;
    int status;
    std::string shows;  // a text the output must hold
  } cases[] = {
      {place + "--time " + std::to_string(fix->time), 0, "latitude   " + lat},
      {place + "--lat " + lat + " --lon " + lon + " --tolerance 5", 0, "placed by position"},
      {place + "--lat 10 --lon 10", 1, "no track of the trip passed within 50 m"},
      {place + "--time 100", 1, "the trip has no track at 1970-01-01T00:01:40Z"},
      {place, 2, "place needs --time or --lat and --lon"},
      {place + "--lat 10", 2, "--lat requires --lon"},
      {place + "--lat 0 --lon 0", 2, "0/0 stands for no position"},
      {place + "--time yesterday", 2, "is not a time"},
      {place + "--time 2024-02-30T10:00:00", 2, "is not a time between 1970 and 2037"},
      {place + "--time " + navmisc::FormatA("%sZ", iso.c_str()), 0, "latitude   " + lat},
      {place + "--time " + navmisc::FormatA("%s+02:00", plusTwo.c_str()), 0, "latitude   " + lat},
      {place + "--time '" + plusTwo.substr(0, 10) + " " + plusTwo.substr(11) + "+0200'", 0, "latitude   " + lat},
      {"plot GEOTRIP -o x.png", 2, "the plot is an SVG picture: name it FILE.svg"},
      {"optimize NOPE", 1, "no trip 'NOPE'"},
      {"optimize", 2, "TRIP is required"},
      {"plot GEOTRIP", 2, "--output is required"},
      {"plot GEOTRIP -o /no/such/folder/x.svg", 1, "the folder /no/such/folder does not exist"},
      {"plot GEOTRIP -o x.svg --size 30", 2, "--size: Value 30 not in range 200 to 100000"},
      {"optimize --help", 0, "Usage: navmisc optimize [OPTIONS] TRIP"},
      {"place --help", 0, "Usage: navmisc place [OPTIONS] TRIP"},
  };
  for (const auto& c : cases) {
    const CommandResult r = RunTool(c.args);
    EXPECT_EQ(r.status, c.status) << c.args << "\n" << r.out;
    EXPECT_NE(r.out.find(c.shows), std::string::npos) << c.args << "\n" << r.out;
  }
}

TEST_F(GeoCommands, OptimizeSaysWhichFileItCannotRead) {
  auto trip = Load();
  for (auto* track : navmisc::Items<TRACK_ITEM_INFO>(trip->tracks)) {
    const std::string bin = navmisc::NativePath(track->GetFilePathName());
    ASSERT_EQ(unlink(bin.c_str()), 0);
    ASSERT_EQ(mkfifo(bin.c_str(), 0600), 0);
  }
  const CommandResult r = RunTool("optimize GEOTRIP");
  EXPECT_EQ(r.status, 1) << r.out;
  EXPECT_NE(r.out.find(".BIN is a named pipe, not a regular file"), std::string::npos) << r.out;
}

// The point files no longer fit (a file-size limit stands in for a full disk): optimize fails,
// says why, and the trip reads back wholly as before, settings and points alike.
TEST_F(GeoCommands, OptimizeThatCannotSaveFailsAndKeepsTheTrip) {
  auto before = Load();
  const std::string settings = navmisc::testutil::ReadFileBytes(before->GetBlogItemProfilePathName());
  // 16 KiB: room for the settings file, not for a point file of 1500 points. A process over the
  // limit gets SIGXFSZ, ignored here so that the write fails with EFBIG instead.
  const CommandResult r = navmisc::testutil::RunCommand(
      "trap '' XFSZ; ulimit -f 32; " + std::string(NAVMISC_TOOL_PATH) + " --data-root " +
      root.path().ToUtf8() + " optimize GEOTRIP 2>&1");
  EXPECT_EQ(r.status, 1) << r.out;
  EXPECT_NE(r.out.find("File too large"), std::string::npos) << r.out;
  auto after = Load();
  EXPECT_EQ(navmisc::testutil::ReadFileBytes(after->GetBlogItemProfilePathName()), settings);
  EXPECT_EQ(Levels(*after), Levels(*before));
}

}  // namespace
