#include <cstdio>

#include <CLI/CLI.hpp>

#include "cli.h"
#include "listing.h"
#include "navmisc/platform/files.h"
#include "navmisc/records/trip_tree.h"

namespace navmisc::cli {
namespace {

void ListTrips(const std::string& app) {
  GPS_APP_PROG_TYPE type = GPS_APP_TRIP;
  if (app == "sport") type = GPS_APP_SPORT;
  else if (app == "tracker") type = GPS_APP_TRACKER;

  if (type == GPS_APP_TRIP) {
    BLOG_TREE_NODE tree(nullptr);
    if (tree.ReadInfo(0, nullptr) != 1) {
      Fail("no trip tree under " + DataRoot() + " (Resource/RESOURCE_INFO.INI is missing or unreadable)");
    }
    PrintTree(stdout, tree);
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
  CLI::App* cmd = AddCommand(app, "trips", "list the trips",
                             "Lists the trips: for the trip application the tree of trips (node, trip id, name,\n"
                             "tracks, points, first and last UTC time), for the others every trip folder.",
                             [application] { ListTrips(*application); });
  cmd->add_option("--app", *application, "the application whose trips to list (default trip)")
      ->check(CLI::IsMember({"trip", "sport", "tracker"}));
}

}  // namespace navmisc::cli
