// What the activity commands share: trips filed into an application's folder, sport type names,
// and the summary as the tool prints it.
#pragma once

#include <cstdio>
#include <memory>
#include <string>

#include "navmisc/platform/types.h"

class BLOG_ITEM_INFO;
class _SportItem;
class _TrackerItem;
class USER_MAP_INFO;

namespace navmisc::cli {

// The trip `from` (points loaded) as a trip of `app`: `from` itself when it is one already,
// else a copy of its settings and tracks saved in a new folder of that application.
std::unique_ptr<BLOG_ITEM_INFO> TripOfApplication(std::unique_ptr<BLOG_ITEM_INFO> from, GPS_APP_PROG_TYPE app);

// "running", "cycling" or "2".."6" as a sport type; fails with a usage message otherwise.
int ParseSportType(const std::string& text);
// The name of a sport type ("running", "cycling", "sport 4", "unknown").
std::string SportTypeName(int type);

// Files `trip` (id) as an activity of the sport (`app` 22) or tracker (55) store, of the kind
// `type` ("running", "cycling", "2".."6"; a number for the tracker), printing what was filed.
// Returns the id of the filed trip (a copy, unless the trip was of that application already).
std::string FileActivity(GPS_APP_PROG_TYPE app, const std::string& trip, const std::string& type);

// `navmisc summary`: sums `trip` up (`sport` a type or empty; `from`/`to` times or empty).
void SummarizeTrip(const std::string& trip, const std::string& sport, const std::string& from,
                   const std::string& to, bool json);

// A where-am-I position as `navmisc where set` takes it.
struct WherePosition {
  double lat = 0;       // degrees
  double lon = 0;       // degrees
  double alt = 0;       // metres
  double speedKmh = 0;  // km/h
  long time = -1;       // seconds since 1970; -1 = now
  int type = 0;
};
// Writes the position for the where-am-I trip (made when there is none) and records the trip
// in the store. Returns the path of the position script.
std::string SetWherePosition(const WherePosition& p);

// Prints the whole and the selected figures, with calories (the resting part apart), in the
// owner's units (`profile`), as a table or as one JSON object.
void PrintSummary(std::FILE* out, _SportItem& item, const USER_MAP_INFO& profile, bool json);
void PrintSummary(std::FILE* out, _TrackerItem& item, const USER_MAP_INFO& profile, bool json);

}  // namespace navmisc::cli
