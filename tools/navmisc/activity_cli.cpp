#include "activity_cli.h"

#include <cmath>
#include <cstdlib>
#include <string>
#include <type_traits>

#include "cli.h"
#include "navmisc/activity/sport_item.h"
#include "navmisc/activity/tracker_item.h"
#include "navmisc/platform/datetime.h"
#include "navmisc/platform/files.h"
#include "navmisc/platform/format.h"
#include "navmisc/records/trip.h"
#include "navmisc/records/user_profile.h"

namespace navmisc::cli {
namespace {

using navmisc::activity::SportFigures;
using navmisc::activity::TrackerFigures;
using navmisc::FormatA;

template <class T>
void CopyRecords(const CPtrList& from, CPtrList& to) {
  for (const T* r : Items<T>(from))
    if (r) to.AddTail(new T(*r));
}

// ---- units ------------------------------------------------------------------------------------

struct Units {
  bool metric;
  double Distance(double metres) const { return metric ? metres / 1000.0 : metres / 1609.344; }
  double Speed(double metresPerHour) const { return Distance(metresPerHour); }
  double Height(double metres) const { return metric ? metres : metres / 0.3048; }
  const char* distance() const { return metric ? "km" : "mi"; }
  const char* speed() const { return metric ? "km/h" : "mph"; }
  const char* height() const { return metric ? "m" : "ft"; }
};

std::string Clock(long seconds) {
  if (seconds < 0) return "-";
  return FormatA("%ld:%02ld:%02ld", seconds / 3600, seconds / 60 % 60, seconds % 60);
}

// Seconds per kilometre as minutes and seconds per the owner's unit of distance.
std::string Pace(const TrackerFigures& f, const Units& u) {
  if (f.movingDistance <= 0 || f.movingTime <= 0) return "-";
  const long perUnit = std::lround(f.movingTime / u.Distance(f.movingDistance));
  return FormatA("%ld:%02ld /%s", perUnit / 60, perUnit % 60, u.distance());
}

std::string LocalTime(int32_t t) { return TimeTToStdStringTime(t).ToUtf8(); }

std::string JsonText(const std::string& s) {
  std::string out = "\"";
  for (unsigned char c : s) {
    if (c == '"' || c == '\\') out += '\\', out += static_cast<char>(c);
    else if (c < 0x20) out += FormatA("\\u%04x", c);
    else out += static_cast<char>(c);
  }
  return out + "\"";
}

struct Calories {
  long total = 0;    // small calories
  long resting = 0;
};

// One set of figures as JSON, in fixed units: metres, seconds, km/h, kilocalories.
template <class Figures>
std::string JsonFigures(const Figures& f, const Calories& c) {
  std::string s = FormatA(
      "{\"start_local\": %s, \"end_local\": %s, \"duration_s\": %d, \"distance_m\": %.1f, "
      "\"moving_time_s\": %d, \"moving_distance_m\": %.1f, \"avg_speed_kmh\": %.2f, \"max_speed_kmh\": %.2f, "
      "\"pace_s_per_km\": %d, \"min_altitude_m\": %.1f, \"max_altitude_m\": %.1f, \"ascent_m\": %.1f, "
      "\"descent_m\": %.1f",
      JsonText(LocalTime(f.startTime)).c_str(), JsonText(LocalTime(f.endTime)).c_str(), f.duration, f.distance,
      f.movingTime, f.movingDistance, f.avgSpeed / 1000.0, f.maxSpeed / 1000.0, f.pace, f.minAltitude,
      f.maxAltitude, f.ascent, f.descent);
  if constexpr (std::is_same_v<Figures, SportFigures>) {
    s += FormatA(", \"moving_speed_kmh\": %.2f, \"heart_rate_avg\": %d, \"heart_rate_max\": %d, "
                 "\"cadence_avg\": %d, \"cadence_max\": %d",
                 f.movingAvgSpeed / 1000.0, f.avgHeartRate, f.maxHeartRate, f.avgCadence, f.maxCadence);
  }
  s += FormatA(", \"calories_kcal\": %.3f, \"resting_kcal\": %.3f}", c.total / 1000.0, c.resting / 1000.0);
  return s;
}

template <class Figures>
void PrintTable(std::FILE* out, const Figures& whole, const Figures& sel, const Calories cal[2], const Units& u) {
  const Figures* sets[2] = {&whole, &sel};
  auto row = [&](const char* label, auto text) {
    std::fprintf(out, "  %-16s %-24s %s\n", label, text(*sets[0], 0).c_str(), text(*sets[1], 1).c_str());
  };
  row("", [](const Figures&, int i) { return std::string(i ? "selected" : "whole"); });
  row("start (local)", [](const Figures& f, int) { return LocalTime(f.startTime); });
  row("end (local)", [](const Figures& f, int) { return LocalTime(f.endTime); });
  row("duration", [](const Figures& f, int) { return Clock(f.duration); });
  row("moving time", [](const Figures& f, int) { return Clock(f.movingTime); });
  row("distance", [&](const Figures& f, int) { return FormatA("%.2f %s", u.Distance(f.distance), u.distance()); });
  row("moving distance",
      [&](const Figures& f, int) { return FormatA("%.2f %s", u.Distance(f.movingDistance), u.distance()); });
  row("average speed", [&](const Figures& f, int) { return FormatA("%.1f %s", u.Speed(f.avgSpeed), u.speed()); });
  if constexpr (std::is_same_v<Figures, SportFigures>) {
    row("moving speed", [&](const Figures& f, int) { return FormatA("%.1f %s", u.Speed(f.movingAvgSpeed), u.speed()); });
  }
  row("maximum speed", [&](const Figures& f, int) { return FormatA("%.1f %s", u.Speed(f.maxSpeed), u.speed()); });
  row("pace", [&](const Figures& f, int) { return Pace(f, u); });
  row("altitude", [&](const Figures& f, int) {
    return FormatA("%.0f to %.0f %s", u.Height(f.minAltitude), u.Height(f.maxAltitude), u.height());
  });
  row("ascent/descent", [&](const Figures& f, int) {
    return FormatA("%.0f / %.0f %s", u.Height(f.ascent), u.Height(f.descent), u.height());
  });
  if constexpr (std::is_same_v<Figures, SportFigures>) {
    row("heart rate", [](const Figures& f, int) {
      return f.maxHeartRate ? FormatA("avg %d, max %d bpm", f.avgHeartRate, f.maxHeartRate) : std::string("-");
    });
    row("cadence", [](const Figures& f, int) {
      return f.maxCadence ? FormatA("avg %d, max %d rpm", f.avgCadence, f.maxCadence) : std::string("-");
    });
  }
  row("calories", [&](const Figures&, int i) {
    return FormatA("%.0f kcal (resting %.0f)", cal[i].total / 1000.0, cal[i].resting / 1000.0);
  });
}

template <class Item>
void PrintItem(std::FILE* out, Item& item, const USER_MAP_INFO& profile, bool json, const Calories cal[2],
               const std::string& kind) {
  const Units units{profile.metric};
  const BLOG_ITEM_INFO& trip = *item.trip;
  if (json) {
    std::fprintf(out, "{\"trip\": %s, \"name\": %s, \"kind\": %s, \"whole\": %s, \"selected\": %s}\n",
                 JsonText(trip.tripId.ToUtf8()).c_str(), JsonText(trip.name.ToUtf8()).c_str(), JsonText(kind).c_str(),
                 JsonFigures(item.whole, cal[0]).c_str(), JsonFigures(item.selected, cal[1]).c_str());
    return;
  }
  std::fprintf(out, "%s (%s), %s\n", trip.name.ToUtf8().c_str(), trip.tripId.ToUtf8().c_str(), kind.c_str());
  PrintTable(out, item.whole, item.selected, cal, units);
}

}  // namespace

std::unique_ptr<BLOG_ITEM_INFO> TripOfApplication(std::unique_ptr<BLOG_ITEM_INFO> from, GPS_APP_PROG_TYPE app) {
  if (from->appType == app) return from;
  auto copy = std::make_unique<BLOG_ITEM_INFO>(app, nullptr, 0);
  copy->name = from->name;
  copy->fileName = from->fileName;
  copy->description = from->description;
  copy->languageId = from->languageId;
  copy->createTime = from->createTime;
  copy->timeZone = from->timeZone;
  copy->dayLight = from->dayLight;
  copy->timeZoneShift = from->timeZoneShift;
  copy->tags = from->tags;
  for (const TRACK_ITEM_INFO* t : Items<TRACK_ITEM_INFO>(from->tracks)) {
    auto* track = new TRACK_ITEM_INFO(copy.get());
    track->modelId = t->modelId;
    track->description = t->description;
    track->color = t->color;
    track->transparency = t->transparency;
    track->hasGpsData = t->hasGpsData;
    CopyRecords<WAYPOINT_ITEM_INFO>(t->points, track->points);
    CopyRecords<BASE_ITEM_INFO>(t->cellFixes, track->cellFixes);
    CopyRecords<WAYPOINT_ITEM_INFO>(t->helpPoints, track->helpPoints);
    CopyRecords<HEARTRATE_ITEM_INFO>(t->heartRates, track->heartRates);
    CopyRecords<CYCLING_CADENCE_RPM_ITEM_INFO>(t->cadences, track->cadences);
    CopyRecords<WHEEL_SPEED_ITEM_INFO>(t->wheelSpeeds, track->wheelSpeeds);
    copy->tracks.AddTail(track);
  }
  copy->WriteAllWaypoint(1, nullptr, nullptr);
  copy->WriteInfo(1, nullptr, nullptr);
  if (!FileExists(copy->GetBlogItemProfilePathName())) Fail("cannot save the copy of the trip in " + copy->GetResourcePath().ToUtf8());
  return copy;
}

int ParseSportType(const std::string& text) {
  if (text == "cycling") return SPORT_ITEM_CYCLING;
  if (text == "running") return SPORT_ITEM_RUNNING;
  if (text.size() == 1 && text[0] >= '0' && text[0] <= '6') return text[0] - '0';
  Usage("--type must be running, cycling or 2 to 6, not '" + text + "'");
}

std::string SportTypeName(int type) {
  switch (type) {
    case SPORT_ITEM_CYCLING: return "cycling";
    case SPORT_ITEM_RUNNING: return "running";
  }
  return type >= 2 && type <= 6 ? "sport " + std::to_string(type) : "unknown sport";
}

void PrintSummary(std::FILE* out, _SportItem& item, const USER_MAP_INFO& profile, bool json) {
  const long shift = item.TimeShift();
  Calories cal[2];
  cal[0].resting = item.GetCalorieBMR(item.whole.startTime - shift, item.whole.endTime - shift);
  cal[0].total = item.GetSelectedCalorie(0, 0);
  cal[1].resting = item.GetCalorieBMR(item.selStartTime - shift, item.selEndTime - shift);
  cal[1].total = item.GetTotalCalorie();
  PrintItem(out, item, profile, json, cal, SportTypeName(item.type));
}

void PrintSummary(std::FILE* out, _TrackerItem& item, const USER_MAP_INFO& profile, bool json) {
  // Tracker activities have no calorie model: both figures are 0.
  Calories cal[2] = {{item.GetTotalCalorie(), 0}, {item.GetSelectedCalorie(), 0}};
  PrintItem(out, item, profile, json, cal, "tracker activity");
}

}  // namespace navmisc::cli
