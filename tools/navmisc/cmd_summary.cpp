#include <cstdio>
#include <memory>
#include <optional>
#include <string>

#include <CLI/CLI.hpp>

#include "activity_cli.h"
#include "cli.h"
#include "navmisc/activity/sport_store.h"
#include "navmisc/activity/tracker_item.h"
#include "navmisc/records/trip.h"
#include "navmisc/records/user_profile.h"

namespace navmisc::cli {
namespace {

constexpr const char* kSummaryHelp =
    "Sums a trip up as an activity: duration, moving time, distance, speeds, pace, altitude\n"
    "range, ascent and descent, heart rate and cadence, and the calories (the resting part\n"
    "shown apart), for the whole trip and for the selection --from/--to (UTC; the whole trip\n"
    "without them). The owner is the user profile of the trip's application (weight and height\n"
    "on the activity's date, age, sex), whose units the table uses.\n"
    "\n"
    "A sport trip filed with `navmisc sport add` keeps its sport type; other trips count as\n"
    "running unless --sport says otherwise. A tracker trip is summed up as a tracker activity\n"
    "(no heart rate, cadence or calories) unless --sport is given.\n"
    "\n"
    "--json prints one JSON object in fixed units (metres, seconds, km/h, kilocalories).\n"
    "docs/activity-stores.md and docs/moving-segments.md describe the figures.";

struct SummaryOptions {
  std::string trip;
  std::string sport;
  std::string from, to;
  bool json = false;
};

// The sport type of a sport trip in the store, if it is filed there.
std::optional<int> FiledSportType(const CString& tripId) {
  SPORT_DATA_NODE store;
  if (store.ReadInfo(0, nullptr) != 1) return std::nullopt;
  for (auto* m : Items<_CalendarObj>(store.months))
    for (auto* d : Items<_DayObj>(m->days))
      for (auto* item : Items<_SportItem>(d->items))
        if (item->trip->tripId == tripId) return item->type;
  return std::nullopt;
}

template <class Item>
void Summarize(std::unique_ptr<BLOG_ITEM_INFO> trip, int type, const SummaryOptions& o) {
  USER_MAP_INFO* profile = GetUserMapInfo(trip->appType);
  Item item(type, trip.release());
  item.profile = profile;
  int counter = 0;
  bool keepGoing = true;
  if (!RunWithProgress("summing up", 0, counter, keepGoing, [&] { item.PrepareSummaryData(nullptr, nullptr); })) {
    Fail("stopped");
  }
  if (item.points.empty()) Fail("the trip has no timed points to sum up");
  if (!o.from.empty() || !o.to.empty()) {
    const long from = o.from.empty() ? item.UtcStartTime() : ParseTime(o.from);
    const long to = o.to.empty() ? item.whole.endTime - item.TimeShift() : ParseTime(o.to);
    if (to < from) Usage("--to lies before --from");
    item.UpdateSelSummaryData(from, to, nullptr);
  }
  PrintSummary(stdout, item, *profile, o.json);
}

}  // namespace

void SummarizeTrip(const std::string& tripName, const std::string& sport, const std::string& from,
                   const std::string& to, bool json) {
  const SummaryOptions o{tripName, sport, from, to, json};
  auto trip = OpenTrip(o.trip);
  if (!o.sport.empty()) {
    Summarize<_SportItem>(std::move(trip), ParseSportType(o.sport), o);
  } else if (trip->appType == GPS_APP_TRACKER) {
    Summarize<_TrackerItem>(std::move(trip), TRACKER_ITEM_DEFAULT, o);
  } else {
    const int type = FiledSportType(trip->tripId).value_or(SPORT_ITEM_RUNNING);
    Summarize<_SportItem>(std::move(trip), type, o);
  }
}

void AddSummaryCommand(CLI::App& app) {
  auto o = std::make_shared<SummaryOptions>();
  CLI::App* cmd = AddCommand(app, "summary", "sum a trip up as an activity, with calories", kSummaryHelp,
                             [o] { SummarizeTrip(o->trip, o->sport, o->from, o->to, o->json); });
  cmd->add_option("TRIP", o->trip, "the trip")->required();
  cmd->add_option("--sport", o->sport, "running, cycling or 2 to 6")->option_text("TYPE");
  cmd->add_option("--from", o->from, "start of the selection (UTC)")->option_text("TIME");
  cmd->add_option("--to", o->to, "end of the selection (UTC)")->option_text("TIME");
  cmd->add_flag("--json", o->json, "one JSON object for scripts");
}

}  // namespace navmisc::cli
