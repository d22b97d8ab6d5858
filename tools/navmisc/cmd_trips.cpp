#include <cstdio>

#include "cli.h"
#include "listing.h"
#include "navmisc/platform/files.h"
#include "navmisc/records/trip_tree.h"

namespace navmisc::cli {

int CmdTrips(Args& args) {
  if (args.Flag("help")) {
    std::puts("Usage: navmisc trips [--app trip|sport|tracker]\n\n"
              "Lists the trips: for the trip application the tree of trips (node, trip id, name,\n"
              "tracks, points, first and last UTC time), for the others every trip folder.");
    return 0;
  }
  const std::string app = args.Option("app").value_or("trip");
  if (!args.Positionals().empty()) Usage("trips takes no arguments");
  GPS_APP_PROG_TYPE type;
  if (app == "trip") type = GPS_APP_TRIP;
  else if (app == "sport") type = GPS_APP_SPORT;
  else if (app == "tracker") type = GPS_APP_TRACKER;
  else Usage("--app must be trip, sport or tracker");

  if (type == GPS_APP_TRIP) {
    BLOG_TREE_NODE tree(nullptr);
    if (tree.ReadInfo(0, nullptr) != 1) {
      Fail("no trip tree under " + DataRoot() + " (Resource/RESOURCE_INFO.INI is missing or unreadable)");
    }
    PrintTree(stdout, tree);
    return 0;
  }
  CStringList folders;
  if (GetContent(GetAppDataFolder(type), L"*.*", folders) < 0) Fail("no " + app + " data under " + DataRoot());
  PrintTripHeader(stdout);
  for (const CString& id : folders) {
    BLOG_ITEM_INFO trip(type, id, 0);
    if (!FileExists(trip.GetBlogItemProfilePathName()) || trip.ReadInfo() != 1) continue;
    PrintTripLine(stdout, app.c_str(), trip);
  }
  return 0;
}

}  // namespace navmisc::cli
