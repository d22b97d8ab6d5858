// navmisc demo, run as a user runs it: what it shows, and what it must leave alone.
#include <gtest/gtest.h>

#include <cmath>
#include <cstdio>
#include <regex>
#include <string>

#include "navmisc/platform/files.h"
#include "navmisc/records/trip_tree.h"
#include "navmisc/records/user_profile.h"
#include "testutil.h"
#include "tool_test_support.h"

namespace {

using navmisc::testutil::CommandResult;
using navmisc::testutil::DataRootScope;
using navmisc::testutil::ReadFileBytes;
using navmisc::testutil::RunCommand;
using navmisc::testutil::RunTool;
using navmisc::testutil::ShellQuote;
using navmisc::testutil::TempDir;
using navmisc::testutil::WriteFileBytes;

// The first group of `pattern` in `text`, empty when it does not match.
std::string Find(const std::string& text, const std::string& pattern) {
  std::smatch m;
  return std::regex_search(text, m, std::regex(pattern)) ? m[1].str() : std::string();
}

TEST(DemoCommand, ShowsPhotosAndMarkersAndItsExamplesWork) {
  TempDir dir;
  const std::string root = (dir / L"root").ToUtf8();
  const CommandResult r = RunTool("demo " + ShellQuote(root));
  ASSERT_EQ(r.status, 0) << r.out;
  const std::string paris = Find(r.out, "My trips +([0-9A-F_]+) +Day out in Paris");
  ASSERT_FALSE(paris.empty()) << r.out;
  const std::string gpx = ReadFileBytes(CString::FromUtf8(root + "/exports/" + paris + ".gpx"));
  // Photos (two drawn by the demo, three tagged camera photos) and markers as waypoints, the
  // marker's title escaped.
  size_t waypoints = 0;
  for (size_t at = 0; (at = gpx.find("<wpt ", at)) != std::string::npos; ++at) ++waypoints;
  EXPECT_EQ(waypoints, 7u);
  EXPECT_NE(gpx.find("<name>Lunch at &quot;Le &lt;Petit&gt; Caf\xC3\xA9&quot;</name>"), std::string::npos);
  if (navmisc::testutil::HaveProgram("unzip")) {
    const CommandResult kmz = RunCommand("unzip -Z1 " + ShellQuote(root + "/exports/" + paris + ".kmz"));
    EXPECT_EQ(kmz.out, "1.JPG\n2.png\n3.JPG\n4.png\n5.JPG\n" + paris + ".kml\n");
  }
  // The drive back ends where the drive out began.
  std::smatch first, last;
  const std::regex point("<trkpt lat=\"([-0-9.]+)\" lon=\"([-0-9.]+)\"");
  ASSERT_TRUE(std::regex_search(gpx, first, point));
  std::string lastPoint;
  for (auto it = std::sregex_iterator(gpx.begin(), gpx.end(), point); it != std::sregex_iterator(); ++it) {
    lastPoint = it->str();
  }
  ASSERT_TRUE(std::regex_search(lastPoint, last, point));
  const double metres = 111320 * std::hypot(std::stod(first[1]) - std::stod(last[1]),
                                            (std::stod(first[2]) - std::stod(last[2])) * std::cos(0.85));
  EXPECT_LT(metres, 200) << first.str() << " " << lastPoint;
  // The place example it suggests finds the trip there by time.
  const std::string place = Find(r.out, "Try: navmisc (--data-root .* place .*)\n");
  ASSERT_FALSE(place.empty()) << r.out;
  const CommandResult placed = RunTool(place);
  EXPECT_EQ(placed.status, 0) << placed.out;
  EXPECT_NE(placed.out.find("placed by time"), std::string::npos) << placed.out;
}

TEST(DemoCommand, LeavesAnExistingDataRootsProfilesAndTripsAlone) {
  TempDir root;
  std::string profile, tripFile, tripId;
  {
    DataRootScope scope(root.path());
    USER_MAP_INFO trip(GPS_APP_TRIP);
    trip.name = L"Someone";
    trip.verEnableCheck = false;  // kept in the suite-wide file
    trip.verCheckPeriodTime = 3600;
    trip.SetWeightHeight(3, 1, 2023, 80, 180);
    trip.SetWeightHeight(3, 1, 2024, 77, 180);
    ASSERT_TRUE(trip.WriteInfo());
    profile = ReadFileBytes(trip.GetProfilePathName());
    auto* mine = new BLOG_ITEM_INFO(GPS_APP_TRIP, nullptr, 5);
    mine->name = L"My own trip";
    mine->WriteInfo(1, nullptr, nullptr);
    tripId = mine->tripId.ToUtf8();
    tripFile = ReadFileBytes(mine->GetBlogItemProfilePathName());
    BLOG_TREE_NODE tree(nullptr);
    tree.name = L"Mine";
    tree.trips.AddTail(mine);
    tree.WriteInfo(false, 0, nullptr);
  }
  const std::string dir = ShellQuote(root.path().ToUtf8());
  const CString treeFile = root / L"Resource/RESOURCE_INFO.INI";
  const std::string tree = ReadFileBytes(treeFile);
  const CString suiteFile = root / L"AMBRO_SUITE_INFO.INI";
  const std::string suite = ReadFileBytes(suiteFile);

  // Without --force it refuses, saying why, and writes nothing.
  CommandResult r = RunTool("demo " + dir);
  EXPECT_EQ(r.status, 1) << r.out;
  EXPECT_NE(r.out.find(root.path().ToUtf8() + " is not empty (it holds "), std::string::npos) << r.out;
  EXPECT_EQ(ReadFileBytes(treeFile), tree);
  EXPECT_FALSE(FileExists(root / L"SportRes"));

  // With --force a tree that cannot be read whole stops it before anything is written.
  WriteFileBytes(treeFile, "[broken\n");
  r = RunTool("demo --force " + dir);
  EXPECT_EQ(r.status, 1) << r.out;
  EXPECT_NE(r.out.find("cannot be read whole; the demo leaves this data root alone"), std::string::npos) << r.out;
  EXPECT_FALSE(FileExists(root / L"SportRes"));
  WriteFileBytes(treeFile, tree);

  // With --force the demo's trips join the tree; the profile and the trip stay as they were.
  r = RunTool("demo --force " + dir);
  ASSERT_EQ(r.status, 0) << r.out;
  EXPECT_NE(r.out.find("(kept as it was)"), std::string::npos) << r.out;
  EXPECT_EQ(ReadFileBytes(root / L"Resource/USER_MAP_INFO.INI"), profile);
  EXPECT_EQ(ReadFileBytes(suiteFile), suite);
  EXPECT_EQ(ReadFileBytes(root / CString::FromUtf8("Resource/" + tripId + "/BLOG_ITEM_INFO.INI")), tripFile);
  const CommandResult trips = RunTool("--data-root " + dir + " trips");
  EXPECT_NE(trips.out.find(tripId + " My own trip"), std::string::npos) << trips.out;
  EXPECT_NE(trips.out.find("Day out in Paris"), std::string::npos) << trips.out;
}

}  // namespace
