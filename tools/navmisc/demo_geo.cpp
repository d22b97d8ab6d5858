// The demo's geometry step: optimise the demo's trips, draw one, place a photo on it.
#include <cstdio>
#include <string>
#include <vector>

#include "cli.h"
#include "geo_cli.h"
#include "navmisc/geo/gps_mapping.h"
#include "navmisc/records/trip.h"

namespace navmisc::cli {

void DemoGeometry(const std::vector<std::string>& trips) {
  std::puts("\nOptimisation levels (navmisc optimize):");
  std::unique_ptr<BLOG_ITEM_INFO> drawn;
  for (const std::string& id : trips) {
    auto trip = OpenTrip(id);
    trip->ReadAllWaypoint(0);
    OptimizeTrip(*trip, true);
    PrintLevelSummary(stdout, *trip);
    // The walk with a stop, a wild fix and a gap shows every kind of level.
    if (!drawn || trip->name == L"Zurich walk") drawn = std::move(trip);
  }
  if (!drawn) return;

  const std::string plot = DataRoot() + "/plot-" + drawn->tripId.ToUtf8() + ".svg";
  WritePlot(*drawn, plot, 800);
  std::printf("\nPlot of \"%s\" (navmisc plot): %s\n", drawn->name.ToUtf8().c_str(), plot.c_str());

  // A photo taken between two recorded points in the middle of the first track (not in one of
  // the walk's logging gaps, where the trip was nowhere).
  auto* track = static_cast<TRACK_ITEM_INFO*>(drawn->tracks.GetHead());
  const POSITION middle = track->points.FindIndex(track->points.GetCount() / 2);
  POSITION next = middle;
  const auto* a = static_cast<const WAYPOINT_ITEM_INFO*>(track->points.GetNext(next));
  const auto* b = static_cast<const WAYPOINT_ITEM_INFO*>(next ? track->points.GetAt(next) : a);
  CString id;
  double lat = 0, lon = 0, alt = 0;
  long speed = 0, time = a->time + (b->time - a->time) / 2;
  if (MappingGPSAndTrack(drawn->tracks, 50.0, id, lat, lon, alt, speed, time)) {
    std::printf("A photo taken at %s lies at %.6f, %.6f on track %s (navmisc place)\n", TimeText(time).c_str(), lat,
                lon, id.ToUtf8().c_str());
  }
  std::printf("Try: navmisc --data-root %s place %s --time %s\n", DataRoot().c_str(), drawn->tripId.ToUtf8().c_str(),
              TimeText(time).c_str());
}

}  // namespace navmisc::cli
