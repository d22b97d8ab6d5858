// navmisc profile, templates and timezone, run as a user runs them.
#include <gtest/gtest.h>

#include <string>

#include "navmisc/platform/files.h"
#include "navmisc/records/trip_tree.h"
#include "navmisc/records/user_profile.h"
#include "testutil.h"
#include "tool_test_support.h"

namespace {

using navmisc::testutil::CommandResult;
using navmisc::testutil::DataRootScope;
using navmisc::testutil::RunTool;
using navmisc::testutil::ShellQuote;
using navmisc::testutil::TempDir;
using navmisc::testutil::WriteFileBytes;

bool Shows(const CommandResult& r, const std::string& text) { return r.out.find(text) != std::string::npos; }

TEST(InfoCommands, TimeZoneFollowsTZ) {
  // The zone rules themselves are the library's; here the command must honour TZ and say both.
  const CommandResult r = RunTool("timezone", "TZ=Asia/Taipei");
  EXPECT_EQ(r.status, 0) << r.out;
  EXPECT_TRUE(Shows(r, "Offset from UTC: 28800 s (+8.00 h)\nDaylight saving: no")) << r.out;
}

TEST(InfoCommands, ProfileShowsWhatTheLibraryWrote) {
  TempDir root;
  {
    DataRootScope scope(root.path());
    USER_MAP_INFO sport(GPS_APP_SPORT);
    sport.name = L"Zoë";
    sport.male = false;
    sport.SetWeightHeight(1, 15, 2024, 58.5, 168);
    sport.SetWeightHeight(6, 1, 2024, 61, 168);
    ASSERT_TRUE(sport.WriteInfo());
  }
  const std::string profile = "--data-root " + ShellQuote(root.path().ToUtf8()) + " profile --app sport --on ";
  // The ISO date and the older month-first form; the answer always in ISO form.
  for (const char* date : {"2024-05-31", "05/31/2024"}) {
    const CommandResult r = RunTool(profile + date);
    EXPECT_EQ(r.status, 0) << r.out;
    EXPECT_TRUE(Shows(r, "Zoë (female)")) << r.out;
    EXPECT_TRUE(Shows(r, "On 2024-05-31:   58.5 kg, 168 cm")) << r.out;
  }
  // A bad date fails before anything is shown.
  for (const char* date : {"yesterday", "2024-02-30", "31/05/2024", "2024-5-31"}) {
    const CommandResult r = RunTool(profile + date);
    EXPECT_EQ(r.status, 2) << date << "\n" << r.out;
    EXPECT_TRUE(Shows(r, "is not a date")) << date << "\n" << r.out;
    EXPECT_FALSE(Shows(r, "File:")) << date << "\n" << r.out;
  }
}

TEST(InfoCommands, TemplatesComeFromTheCatalogueBesideTheProgram) {
  // A translated name where the catalogue has one, the default text where it has not.
  const CommandResult r = RunTool("templates --language fr");
  ASSERT_EQ(r.status, 0) << r.out;
  EXPECT_TRUE(Shows(r, "Journal classique")) << r.out;
  EXPECT_TRUE(Shows(r, "Panorama")) << r.out;
  EXPECT_TRUE(Shows(r, "/Templates/classic/thumb.png")) << r.out;
}

TEST(InfoCommands, TripsCleanRemovesUnnamedFoldersOnlyAfterACompleteRead) {
  TempDir root;
  CString kept, damaged;
  {
    DataRootScope scope(root.path());
    BLOG_TREE_NODE tree(nullptr);
    tree.name = L"All";
    for (const wchar_t* name : {L"kept", L"damaged"}) {
      auto* trip = new BLOG_ITEM_INFO(GPS_APP_TRIP, nullptr, 0);
      trip->name = name;
      trip->WriteInfo(1, nullptr, nullptr);
      tree.trips.AddTail(trip);
    }
    kept = static_cast<BLOG_ITEM_INFO*>(tree.trips.GetHead())->GetResourcePath();
    damaged = static_cast<BLOG_ITEM_INFO*>(tree.trips.GetTail())->GetResourcePath();
    tree.WriteInfo(false, 0, nullptr);
  }
  ASSERT_TRUE(MakeDir(root / L"Resource/orphan"));
  const std::string dataRoot = "--data-root " + ShellQuote(root.path().ToUtf8());

  // A trip whose settings lost their id drops out of the tree: nothing may go, and the user is
  // told why, both when listing and when asking for the clean-up.
  WriteFileBytes(PathJoin(damaged, L"BLOG_ITEM_INFO.INI"), "[SECTION]\nname=damaged\n");
  CommandResult r = RunTool(dataRoot + " trips");
  EXPECT_EQ(r.status, 0) << r.out;
  EXPECT_TRUE(Shows(r, "did not read completely")) << r.out;
  r = RunTool(dataRoot + " trips --clean");
  EXPECT_EQ(r.status, 1) << r.out;
  EXPECT_TRUE(Shows(r, "clean-up skipped, nothing removed")) << r.out;
  EXPECT_TRUE(IsDirectory(damaged));
  EXPECT_TRUE(IsDirectory(root / L"Resource/orphan"));

  // Whole again, the tree lets the clean-up take the folder no trip names, and only that one.
  WriteFileBytes(PathJoin(damaged, L"BLOG_ITEM_INFO.INI"), "");
  {
    DataRootScope scope(root.path());
    BLOG_ITEM_INFO trip(GPS_APP_TRIP, PathFileName(damaged), 0);
    trip.name = L"damaged";
    trip.WriteInfo(1, nullptr, nullptr);
  }
  r = RunTool(dataRoot + " trips --clean");
  EXPECT_EQ(r.status, 0) << r.out;
  EXPECT_TRUE(Shows(r, "removed unused folder orphan\nclean-up: 1 unused folder removed")) << r.out;
  EXPECT_FALSE(IsDirectory(root / L"Resource/orphan"));
  EXPECT_TRUE(IsDirectory(kept));
  EXPECT_TRUE(IsDirectory(damaged));

  r = RunTool(dataRoot + " trips --app sport --clean");
  EXPECT_EQ(r.status, 1) << r.out;
}

}  // namespace
