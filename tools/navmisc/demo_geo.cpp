// The demo's geometry step: optimise the sample trips, draw one, place a photo on it.
#include <cstdio>
#include <string>

#include "cli.h"
#include "geo_cli.h"
#include "navmisc/geo/gps_mapping.h"
#include "navmisc/records/trip_tree.h"

namespace navmisc::cli {
namespace {

void CollectTrips(BLOG_TREE_NODE& node, std::vector<BLOG_ITEM_INFO*>& out) {
  for (auto* trip : Items<BLOG_ITEM_INFO>(node.trips)) out.push_back(trip);
  for (auto* child : Items<BLOG_TREE_NODE>(node.children)) CollectTrips(*child, out);
}

}  // namespace

void DemoGeometry() {
  BLOG_TREE_NODE tree(nullptr);
  if (tree.ReadInfo(0, nullptr) != 1) Fail("the trip tree cannot be read back for optimising");
  std::vector<BLOG_ITEM_INFO*> trips;
  CollectTrips(tree, trips);
  std::puts("\nOptimisation levels (navmisc optimize):");
  BLOG_ITEM_INFO* drawn = nullptr;
  for (BLOG_ITEM_INFO* trip : trips) {
    trip->ReadAllWaypoint(0);
    OptimizeTrip(*trip, true);
    PrintLevelSummary(stdout, *trip);
    // The walk with a stop, a wild fix and a gap shows every kind of level.
    if (!drawn || trip->name == L"Zurich walk") drawn = trip;
  }
  if (!drawn) return;

  const std::string plot = DataRoot() + "/plot-" + drawn->tripId.ToUtf8() + ".svg";
  WritePlot(*drawn, plot, 800);
  std::printf("\nPlot of \"%s\" (navmisc plot): %s\n", drawn->name.ToUtf8().c_str(), plot.c_str());

  // A photo taken half-way through the trip's first track.
  auto* track = static_cast<TRACK_ITEM_INFO*>(drawn->tracks.GetHead());
  const auto* first = static_cast<const WAYPOINT_ITEM_INFO*>(track->points.GetHead());
  const auto* last = static_cast<const WAYPOINT_ITEM_INFO*>(track->points.GetTail());
  CString id;
  double lat = 0, lon = 0, alt = 0;
  long speed = 0, time = first->time + (last->time - first->time) / 2;
  if (MappingGPSAndTrack(drawn->tracks, 50.0, id, lat, lon, alt, speed, time)) {
    std::printf("A photo taken at %s lies at %.6f, %.6f on track %s (navmisc place)\n",
                TimeText(time).c_str(), lat, lon, id.ToUtf8().c_str());
  }
  std::printf("Try: navmisc --data-root %s place %s --time %ld\n", DataRoot().c_str(),
              drawn->tripId.ToUtf8().c_str(), time);
}

}  // namespace navmisc::cli
