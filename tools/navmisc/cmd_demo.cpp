#include <cstdio>
#include <cstdlib>
#include <string>

#include <CLI/CLI.hpp>

#include "cli.h"
#include "listing.h"
#include "navmisc/platform/datetime.h"
#include "navmisc/platform/files.h"
#include "navmisc/platform/shared_globals.h"
#include "navmisc/platform/temp_folder.h"
#include "navmisc/records/trip_tree.h"
#include "navmisc/records/user_profile.h"
#include "synthetic.h"

namespace navmisc::cli {
namespace {

void MakeProfiles() {
  std::puts("Profiles:");
  const struct {
    USER_MAP_INFO* profile;
    const wchar_t* name;
  } profiles[] = {{&g_TripMapInfo, L"Trip journal"},
                  {&g_SportMapInfo, L"Sport"},
                  {&g_TrackerMapInfo, L"Tracker"},
                  {&g_WhereMapInfo, L"Where am I"}};
  for (const auto& p : profiles) {
    p.profile->Reset();
    p.profile->name = L"Demo User";
    p.profile->year = 1985;
    p.profile->month = 6;
    p.profile->day = 15;
    p.profile->SetWeightHeight(1, 1, 2024, 72.5, 178.0);
    if (!p.profile->WriteInfo()) Fail("cannot write " + p.profile->GetProfilePathName().ToUtf8());
    std::printf("  %-13ls %s\n", p.name, p.profile->GetProfilePathName().ToUtf8().c_str());
  }
  std::printf("  %-13s %s\n", "Suite", USER_MAP_INFO::GetSuiteSettingsPathName().ToUtf8().c_str());
}

BLOG_ITEM_INFO* SaveTrip(BLOG_ITEM_INFO* trip, const wchar_t* name) {
  trip->name = name;
  trip->fileName = name;
  trip->createTime = static_cast<int32_t>(GetCurDateTime());
  trip->WriteAllWaypoint(1, nullptr, nullptr);
  trip->WriteInfo(1, nullptr, nullptr);
  return trip;
}

void RunDemo(std::string root) {
  if (root.empty()) {
    root = CreateTempFolder(L"navmisc-demo").ToUtf8();
    if (root.empty()) Fail("cannot create a temporary folder");
  } else {
    if (!MakeDir(CString::FromUtf8(root))) Fail("cannot create " + root);
  }
  SetDataRoot(root);
  g_sVersionInfo = {0, 1, 0, 0};
  std::printf("Data root: %s\n\n", root.c_str());
  MakeProfiles();

  // Trips from the seeded generator: the same every time.
  const int32_t day = static_cast<int32_t>(DateTimeToLong(5, 1, 2024, 6, 0, 0));
  BLOG_TREE_NODE tree(nullptr);
  tree.name = L"My trips";
  auto* journey = new BLOG_ITEM_INFO(GPS_APP_TRIP, nullptr, 1);
  synthetic::AddJourney(*journey, 11, day + 86400);
  tree.trips.AddTail(SaveTrip(journey, L"Day out in Paris"));
  auto* walk = new BLOG_ITEM_INFO(GPS_APP_TRIP, nullptr, 2);
  synthetic::AddStopSpikeGap(*walk, 12, day + 2 * 86400);
  tree.trips.AddTail(SaveTrip(walk, L"Zurich walk"));
  auto* runs = new BLOG_TREE_NODE(nullptr);
  runs->name = L"Runs";
  auto* run = new BLOG_ITEM_INFO(GPS_APP_TRIP, nullptr, 3);
  synthetic::AddRun(*run, 13, day);
  runs->trips.AddTail(SaveTrip(run, L"Morning run"));
  tree.children.AddTail(runs);
  tree.WriteInfo(false, 0, nullptr);

  BLOG_ITEM_INFO tracker(GPS_APP_TRACKER, nullptr, 4);
  synthetic::AddTrackerDay(tracker, 14, day + 3 * 86400);
  SaveTrip(&tracker, L"Tracker day in London");

  std::puts("\nTrips, read back from disk:");
  BLOG_TREE_NODE back(nullptr);
  if (back.ReadInfo(0, nullptr) != 1) Fail("the trip tree just written cannot be read back");
  PrintTree(stdout, back);
  BLOG_ITEM_INFO trackerBack(GPS_APP_TRACKER, tracker.tripId, 0);
  if (trackerBack.ReadInfo() != 1) Fail("the tracker trip just written cannot be read back");
  PrintTripLine(stdout, "tracker", trackerBack);
  long cells = 0, help = 0;
  for (auto* t : Items<TRACK_ITEM_INFO>(trackerBack.tracks)) {
    cells += t->cellFixes.GetCount();
    help += t->helpPoints.GetCount();
  }
  std::printf("  (tracker day: %ld cell fixes, %ld help points)\n", cells, help);
  DemoGeometry();
  DemoExports(root);
  DemoImport(root);
  std::printf("\nTry: navmisc --data-root %s trips\n", root.c_str());
}

}  // namespace

void AddDemoCommand(CLI::App& app) {
  auto folder = std::make_shared<std::string>();
  CLI::App* cmd = AddCommand(app, "demo", "build a sample data root and show what the library does with it",
                             "Builds a sample data root in DIR (a fresh temporary folder without it): the four\n"
                             "user profiles, the suite settings and a tree of synthetic trips, then reads them\n"
                             "back, lists, optimises, draws and exports them, and imports two of the exports\n"
                             "back through the data-control process.",
                             [folder] { RunDemo(*folder); }, false);
  cmd->add_option("DIR", *folder, "the folder to fill (created when missing)");
}

}  // namespace navmisc::cli
