#include <cstdio>

#include "activity_cli.h"
#include "cli.h"
#include "navmisc/records/trip.h"

namespace navmisc::cli {

void DemoActivities(const CString& runId, const CString& trackerId) {
  std::puts("\nActivities:");
  const std::string sportId = FileActivity(GPS_APP_SPORT, runId.ToUtf8(), "running");
  FileActivity(GPS_APP_TRACKER, trackerId.ToUtf8(), "0");

  // Where am I: at the end of the run.
  auto run = OpenTrip(sportId);
  run->ReadAllWaypoint(0);
  const auto* track = static_cast<const TRACK_ITEM_INFO*>(run->tracks.GetTail());
  const auto* last = static_cast<const WAYPOINT_ITEM_INFO*>(track->points.GetTail());
  std::printf("where am I: %s\n",
              SetWherePosition({last->latitude, last->longitude, last->altitude, last->speed / 1000.0, last->time, 0}).c_str());

  std::puts("\nThe run as an activity:");
  SummarizeTrip(sportId, "", "", "", false);
}

}  // namespace navmisc::cli
