#include <cstdio>
#include <cstdlib>
#include <string>
#include <vector>

#include <CLI/CLI.hpp>

#include "cli.h"
#include "demo_pictures.h"
#include "listing.h"
#include "navmisc/geo/gps_mapping.h"
#include "navmisc/platform/datetime.h"
#include "navmisc/platform/files.h"
#include "navmisc/platform/format.h"
#include "navmisc/platform/output_file.h"
#include "navmisc/platform/shared_globals.h"
#include "navmisc/platform/temp_folder.h"
#include "navmisc/records/trip_tree.h"
#include "navmisc/records/user_profile.h"
#include "photo_cli.h"
#include "synthetic.h"

namespace navmisc::cli {
namespace {

// The four profiles with a demo user; with `keep`, a profile that is already there stays as it is.
void MakeProfiles(bool keep) {
  std::puts("Profiles:");
  const struct {
    USER_MAP_INFO* profile;
    const wchar_t* name;
  } profiles[] = {{&g_TripMapInfo, L"Trip journal"},
                  {&g_SportMapInfo, L"Sport"},
                  {&g_TrackerMapInfo, L"Tracker"},
                  {&g_WhereMapInfo, L"Where am I"}};
  for (const auto& p : profiles) {
    const CString file = p.profile->GetProfilePathName();
    if (keep && FileExists(file)) {
      std::printf("  %-13ls %s (kept as it was)\n", p.name, file.ToUtf8().c_str());
      continue;
    }
    // Added to a data root, the profile keeps the suite-wide settings it was read with, so that
    // writing it leaves the suite's file as it was.
    if (!keep) p.profile->Reset();
    p.profile->name = L"Demo User";
    p.profile->year = 1985;
    p.profile->month = 6;
    p.profile->day = 15;
    p.profile->SetWeightHeight(1, 1, 2024, 72.5, 178.0);
    if (!p.profile->WriteInfo()) Fail("cannot write " + file.ToUtf8());
    std::printf("  %-13ls %s\n", p.name, file.ToUtf8().c_str());
  }
}

BLOG_ITEM_INFO* SaveTrip(BLOG_ITEM_INFO* trip, const wchar_t* name) {
  trip->name = name;
  trip->fileName = name;
  trip->createTime = static_cast<int32_t>(GetCurDateTime());
  trip->WriteAllWaypoint(1, nullptr, nullptr);
  trip->WriteInfo(1, nullptr, nullptr);
  return trip;
}

// A located item of `trip` at the place its track was at `time`: a photo (with a picture file in
// the trip's folder) or a marker.
void AddItem(BLOG_ITEM_INFO& trip, int type, long time, const wchar_t* title, const wchar_t* description) {
  auto* item = new PHOTO_ITEM_INFO(&trip, nullptr, nullptr, nullptr);
  item->dataType = type;
  item->title = title;
  item->description = description;
  item->playbackTime = static_cast<int32_t>(time);
  item->originalTime = static_cast<int32_t>(time + trip.timeZoneShift);
  MappingGPSAndTrack(trip.tracks, 50.0, item);
  if (type == PHOTO_ITEM_INFO::kTypePhoto) {
    item->itemName = FormatString(L"IMG_%04d.png", trip.photos.GetCount() + 1);
    item->width = item->originalWidth = 320;
    item->height = item->originalHeight = 240;
    const std::string picture = DemoPicturePng(item->width, item->height, static_cast<uint32_t>(time));
    OutputFile file;
    if (!file.Open(item->GetFilePathName()) || !file.Write(picture) || !file.Close()) {
      Fail("cannot write " + item->GetFilePathName().ToUtf8() + ": " + file.error());
    }
  }
  trip.photos.AddTail(item);
}

// The time `fraction` of the way through `track`'s points.
long TimeInto(BLOG_ITEM_INFO& trip, int track, double fraction) {
  auto* t = static_cast<TRACK_ITEM_INFO*>(trip.tracks.GetAt(trip.tracks.FindIndex(track)));
  const int index = static_cast<int>(fraction * (t->points.GetCount() - 1));
  return static_cast<WAYPOINT_ITEM_INFO*>(t->points.GetAt(t->points.FindIndex(index)))->time;
}

// Fails unless `root` is a folder the demo may fill: a new or empty one, or with `force` any
// data root whose trip tree can be read whole (the demo then adds to it and deletes nothing).
void CheckFolder(const std::string& root, bool force) {
  const CString folder = CString::FromUtf8(root);
  if (FileExists(folder) && !IsDirectory(folder)) Fail(root + " is not a folder");
  CStringList entries;
  if (!IsDirectory(folder) || GetContent(folder, L"*", entries) == 0) return;
  if (!force) {
    Fail(FormatA("%s is not empty (it holds %s%s): the demo writes its profiles and trips into a new or "
                 "empty folder. --force adds them to the data root there, keeping its profiles and trips",
                 root.c_str(), entries.GetHead().ToUtf8().c_str(), entries.GetCount() > 1 ? " and more" : ""));
  }
}

void RunDemo(std::string root, bool force) {
  if (root.empty()) {
    root = CreateTempFolder(L"navmisc-demo").ToUtf8();
    if (root.empty()) Fail("cannot create a temporary folder");
  } else {
    CheckFolder(root, force);
    if (!MakeDir(CString::FromUtf8(root))) Fail("cannot create " + root);
  }
  SetDataRoot(root);
  // The demo's trips join the tree that is there; a tree that cannot be read whole is left alone,
  // since writing it back would drop the trips that did not read.
  BLOG_TREE_NODE tree(nullptr);
  const CString resources = GetAppDataFolder(GPS_APP_TRIP);
  const bool hadTree = FileExists(PathJoin(resources, L"RESOURCE_INFO.INI")) ||
                       FileExists(PathJoin(resources, L"AMBRO_V20.INI"));  // the earlier tree file
  if (hadTree && (tree.ReadInfo(0, nullptr) != 1 || !tree.completeRead.IsComplete())) {
    Fail("the trip tree under " + root + " cannot be read whole; the demo leaves this data root alone");
  }
  if (!hadTree) tree.name = L"My trips";
  g_sVersionInfo = {0, 1, 0, 0};
  std::printf("Data root: %s\n\n", root.c_str());
  MakeProfiles(force);

  // Trips from the seeded generator: the same every time.
  const int32_t day = static_cast<int32_t>(DateTimeToLong(5, 1, 2024, 6, 0, 0));
  std::vector<std::string> demoTrips;
  auto* journey = new BLOG_ITEM_INFO(GPS_APP_TRIP, nullptr, 1);
  synthetic::AddJourney(*journey, 11, day + 86400);
  AddItem(*journey, PHOTO_ITEM_INFO::kTypeMarker, TimeInto(*journey, 0, 0.0), L"Parking", L"Where the car waited");
  AddItem(*journey, PHOTO_ITEM_INFO::kTypePhoto, TimeInto(*journey, 1, 0.2), L"Notre-Dame & the Seine",
          L"From the bridge");
  AddItem(*journey, PHOTO_ITEM_INFO::kTypeMarker, TimeInto(*journey, 1, 0.5), L"Lunch at \"Le <Petit> Caf\u00e9\"",
          L"Two courses\r\nand coffee");
  AddItem(*journey, PHOTO_ITEM_INFO::kTypePhoto, TimeInto(*journey, 1, 0.7), L"Street market", L"");
  tree.trips.AddTail(SaveTrip(journey, L"Day out in Paris"));
  auto* walk = new BLOG_ITEM_INFO(GPS_APP_TRIP, nullptr, 2);
  synthetic::AddStopSpikeGap(*walk, 12, day + 2 * 86400);
  AddItem(*walk, PHOTO_ITEM_INFO::kTypePhoto, TimeInto(*walk, 0, 0.1), L"Lake view", L"Before the long stop");
  tree.trips.AddTail(SaveTrip(walk, L"Zurich walk"));
  auto* runs = new BLOG_TREE_NODE(nullptr);
  runs->name = L"Runs";
  auto* run = new BLOG_ITEM_INFO(GPS_APP_TRIP, nullptr, 3);
  synthetic::AddRun(*run, 13, day);
  runs->trips.AddTail(SaveTrip(run, L"Morning run"));
  tree.children.AddTail(runs);
  tree.WriteInfo(false, 0, nullptr);
  for (BLOG_ITEM_INFO* t : {journey, walk, run}) demoTrips.push_back(t->tripId.ToUtf8());

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
  DemoGeometry(demoTrips);
  DemoPhotos(journey->tripId.ToUtf8());
  DemoExports(root, demoTrips);
  DemoImport(root, demoTrips.front());
  DemoDevice(root);
  DemoActivities(run->tripId, tracker.tripId);
  std::printf("\nTry: navmisc --data-root %s trips\n", root.c_str());
}

}  // namespace

void AddDemoCommand(CLI::App& app) {
  auto folder = std::make_shared<std::string>();
  auto force = std::make_shared<bool>(false);
  CLI::App* cmd = AddCommand(
      app, "demo", "build a sample data root and show what the library does with it",
      "Builds a sample data root in DIR (a fresh temporary folder without it): the four user\n"
      "profiles and a tree of synthetic trips with photos and markers, then reads them back,\n"
      "lists, optimises, draws, places and exports them (DIR/exports), imports two of the\n"
      "exports back and reads a sample logger folder through the data-control process.\n"
      "\n"
      "DIR must be new or empty. With --force the demo adds its trips to the data root in DIR:\n"
      "profiles already there are kept, the demo's trips join the trip tree, and no trip is\n"
      "changed or deleted (a tree that cannot be read whole is left alone and the demo stops).",
      [folder, force] { RunDemo(*folder, *force); }, false);
  cmd->add_option("DIR", *folder, "the folder to fill (created when missing)");
  cmd->add_flag("--force", *force, "add to a data root that is already there");
}

}  // namespace navmisc::cli
