#include <cstdio>

#include <CLI/CLI.hpp>

#include "cli.h"
#include "listing.h"
#include "navmisc/platform/files.h"
#include "navmisc/records/trip_tree.h"

namespace navmisc::cli {
namespace {

// The sub-folders of the trip store: trip resources, named or not.
CStringList ResourceFolders() {
  CStringList entries, folders;
  const CString store = GetAppDataFolder(GPS_APP_TRIP);
  GetContent(store, L"*.*", entries);
  for (const CString& e : entries) {
    if (IsDirectory(PathJoin(store, e))) folders.AddTail(e);
  }
  return folders;
}

// Removes the trip folders the tree does not name. A tree that did not read whole is left alone:
// a trip missing from it would look unused.
void CleanUp(BLOG_TREE_NODE& tree) {
  if (!tree.completeRead.IsComplete()) {
    Fail("clean-up skipped, nothing removed: the trip tree did not read completely (" +
         tree.completeRead.Why().ToUtf8() + ")");
  }
  const CStringList before = ResourceFolders();
  tree.RemoveAllUnusedResource();
  const CStringList after = ResourceFolders();
  int removed = 0;
  for (const CString& id : before) {
    if (after.Find(id) == nullptr) {
      std::printf("removed unused folder %s\n", id.ToUtf8().c_str());
      ++removed;
    }
  }
  std::printf("clean-up: %d unused folder%s removed\n", removed, removed == 1 ? "" : "s");
}

void ListTrips(const std::string& app, bool clean) {
  GPS_APP_PROG_TYPE type = GPS_APP_TRIP;
  if (app == "sport") type = GPS_APP_SPORT;
  else if (app == "tracker") type = GPS_APP_TRACKER;

  if (clean && type != GPS_APP_TRIP) Fail("--clean applies to the trip application only");
  if (type == GPS_APP_TRIP) {
    BLOG_TREE_NODE tree(nullptr);
    if (tree.ReadInfo(0, nullptr) != 1) {
      Fail("no trip tree under " + DataRoot() + " (Resource/RESOURCE_INFO.INI is missing or unreadable)");
    }
    PrintTree(stdout, tree);
    if (!tree.completeRead.IsComplete() && !clean) {
      std::fprintf(stderr, "navmisc: the trip tree did not read completely: %s\n",
                   tree.completeRead.Why().ToUtf8().c_str());
    }
    if (clean) CleanUp(tree);
    return;
  }
  CStringList folders;
  if (GetContent(GetAppDataFolder(type), L"*.*", folders) < 0) Fail("no " + app + " data under " + DataRoot());
  PrintTripHeader(stdout);
  for (const CString& id : folders) {
    BLOG_ITEM_INFO trip(type, id, 0);
    if (!FileExists(trip.GetBlogItemProfilePathName()) || trip.ReadInfo() != 1) continue;
    PrintTripLine(stdout, app.c_str(), trip);
  }
}

}  // namespace

void AddTripsCommand(CLI::App& app) {
  auto application = std::make_shared<std::string>("trip");
  auto clean = std::make_shared<bool>(false);
  CLI::App* cmd = AddCommand(app, "trips", "list the trips",
                             "Lists the trips: for the trip application the tree of trips (node, trip id, name,\n"
                             "tracks, points, first and last UTC time), for the others every trip folder.\n"
                             "--clean then removes the trip folders the tree no longer names; it removes\n"
                             "nothing, and fails saying why, when any trip or node of the tree did not read.",
                             [application, clean] { ListTrips(*application, *clean); });
  cmd->add_option("--app", *application, "the application whose trips to list (default trip)")
      ->check(CLI::IsMember({"trip", "sport", "tracker"}));
  cmd->add_flag("--clean", *clean, "remove the trip folders the tree does not name (trip application)");
}

}  // namespace navmisc::cli
