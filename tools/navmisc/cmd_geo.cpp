// navmisc optimize, plot and place: the track geometry of a trip from the command line.
#include <cmath>
#include <cstdio>
#include <optional>

#include <CLI/CLI.hpp>

#include "cli.h"
#include "geo_cli.h"
#include "navmisc/geo/gps_mapping.h"
#include "navmisc/geo/optimize.h"
#include "navmisc/geo/track_plot.h"
#include "navmisc/platform/files.h"
#include "navmisc/platform/format.h"
#include "navmisc/platform/output_file.h"
#include "navmisc/platform/staging_folder.h"
#include "navmisc/records/trip.h"

namespace navmisc::cli {
namespace {

constexpr const char* kOptimizeHelp =
    "Runs the cleaning passes over every track of the trip and stores each point's level:\n"
    "  -2       a bad fix (after a long gap, or a lone jump faster than 120 km/h)\n"
    "  -1       a fix of a stop\n"
    "  0 .. 100 the coarsest simplification (level x 0.0001 degrees) that still keeps it\n"
    "  10000    never dropped (tracks too short to simplify)\n"
    "then chooses the trip's display level and saves the trip (settings and point files).\n"
    "\n"
    "Ctrl-C stops after the current step; the levels set so far are saved (exit code 130).";

constexpr const char* kPlotHelp =
    "Draws the trip's tracks as a square SVG picture of --size pixels, north up, filled with the\n"
    "trip: each track's line in its own colour, every point a dot coloured by its level (red a\n"
    "bad fix, orange a stop, pale to dark blue levels 0 to 100, black never dropped), the start\n"
    "(green) and the end (dark square) marked, the trip's name and times as the title, a scale\n"
    "bar and a key underneath. Bad fixes stay out of the frame, so one wild fix cannot shrink\n"
    "the drawing. Run `navmisc optimize TRIP` first to give the points their levels.";

constexpr const char* kPlaceHelp =
    "Places a photo on the trip's tracks: where the trip was at time T (seconds since 1970 or\n"
    "YYYY-MM-DDThh:mm:ss, UTC), or when it passed nearest to a position (within M metres,\n"
    "default 50), and on which track. A time wins over a position when it falls on a track.\n"
    "--track tries that track first. Exit code 1 when the trip was not there.";

struct LevelCounts {
  long points = 0, badFixes = 0, stops = 0, essential = 0;
  long atLeast[4] = {0, 0, 0, 0};  // levels >= 100, 50, 10, 0 (not counting 10000)
};

LevelCounts CountLevels(TRACK_ITEM_INFO& track) {
  static constexpr int kSteps[4] = {100, 50, 10, 0};
  LevelCounts c;
  for (auto* p : Items<WAYPOINT_ITEM_INFO>(track.points)) {
    if (!p) continue;
    ++c.points;
    if (p->type == kLevelBadFix) ++c.badFixes;
    if (p->type == kLevelStop) ++c.stops;
    if (p->type >= kLevelNeverDropped) ++c.essential;
    for (int k = 0; k < 4; ++k) c.atLeast[k] += p->type >= kSteps[k] && p->type <= kSmoothSteps;
  }
  return c;
}

std::unique_ptr<BLOG_ITEM_INFO> OpenTripWithPoints(const std::string& id) {
  auto trip = OpenTrip(id);
  trip->ReadAllWaypoint(0);
  const std::string refused = LastFileRefusal();
  if (trip->tracks.IsEmpty()) Fail("trip '" + id + "' has no track points" + (refused.empty() ? "" : ": " + refused));
  return trip;
}

}  // namespace

bool OptimizeTrip(BLOG_ITEM_INFO& trip, bool optimise) {
  const int total = trip.tracks.GetCount() * (2 + kSmoothSteps + 1) * 100;
  int counter = 0;
  bool keepGoing = true;
  // The save runs under the same Ctrl-C watch, so that a late Ctrl-C cannot end the process
  // half-way through the files; it is saved whole either way; the flag only stops the levelling.
  bool saved = false;
  CString why;
  RunWithProgress("Optimising", total, counter, keepGoing, [&] {
    trip.OptimizeWaypoint(trip.appType, optimise ? 1 : 0, &counter, &keepGoing);
    if (optimise) trip.optOptimize = true;
    saved = trip.SaveAll(nullptr, nullptr, &why);
  });
  if (!saved) Fail("cannot save the trip under " + trip.GetResourcePath().ToUtf8() + ": " + why.ToUtf8());
  return counter == total;  // a stop leaves steps uncounted
}

void PrintLevelSummary(std::FILE* out, BLOG_ITEM_INFO& trip) {
  std::fprintf(out, "Trip %s \"%s\": display level %d\n", trip.tripId.ToUtf8().c_str(),
               trip.name.ToUtf8().c_str(), trip.optLevel);
  for (auto* track : Items<TRACK_ITEM_INFO>(trip.tracks)) {
    const LevelCounts c = CountLevels(*track);
    std::fprintf(out,
                 "  %-22s %6ld points: %ld bad, %ld in stops, %ld never dropped; kept at level "
                 "100: %ld, 50: %ld, 10: %ld, 0: %ld\n",
                 (track->GetName().IsEmpty() ? track->id : track->GetName()).ToUtf8().c_str(),
                 c.points, c.badFixes, c.stops, c.essential, c.atLeast[0] + c.essential,
                 c.atLeast[1] + c.essential, c.atLeast[2] + c.essential, c.atLeast[3] + c.essential);
  }
}

void WritePlot(BLOG_ITEM_INFO& trip, const std::string& path, long size) {
  CheckOutputFolder(path);
  TrackPlotOptions options;
  options.size = size;
  const std::string svg = RenderTrackPlotSvg(trip, options);
  StagingFolder staging(PathFolder(CString::FromUtf8(path)), PathFileName(CString::FromUtf8(path)));
  if (staging.path().IsEmpty()) Fail("cannot write " + path + ": " + staging.error());
  OutputFile file;
  const bool written = file.Open(PathJoin(staging.path(), PathFileName(CString::FromUtf8(path)))) &&
                       file.Write(svg) && file.Close();
  if (!written) Fail("cannot write " + path + ": " + file.error());
  if (!staging.Publish()) Fail("cannot write " + path + ": " + staging.error());
}

namespace {

void RunOptimize(const std::string& id, bool off) {
  auto trip = OpenTripWithPoints(id);
  const bool finished = OptimizeTrip(*trip, !off);
  PrintLevelSummary(stdout, *trip);
  if (!finished) Fail("stopped by Ctrl-C; the levels set so far are saved", 130);
}

struct PlaceOptions {
  std::string trip;
  std::string time;
  std::optional<double> lat, lon;
  double tolerance = 50.0;
  std::string track;
};

void RunPlace(const PlaceOptions& o) {
  long time = -1;
  double lat = 0.0, lon = 0.0;
  const bool byTime = !o.time.empty();
  const bool byPosition = o.lat.has_value();
  if (byTime) {
    time = ParseTime(o.time);
    if (time < 1) Usage("--time must be after 1970-01-01T00:00:00");
  }
  if (byPosition) {
    lat = *o.lat;
    lon = *o.lon;
    if (lat == 0.0 && lon == 0.0) Usage("0/0 stands for no position; give another one");
  }
  if (!byTime && !byPosition) Usage("place needs --time or --lat and --lon");
  auto trip = OpenTripWithPoints(o.trip);
  CString trackId = o.track.empty() ? CString() : FindTrack(*trip, o.track).id;

  double altitude = 0.0;
  long speed = 0;
  const long asked = time;
  if (!MappingGPSAndTrack(trip->tracks, o.tolerance, trackId, lat, lon, altitude, speed, time)) {
    Fail(byTime && byPosition ? "the trip was neither there at that time nor within the tolerance of that position"
         : byTime             ? "the trip has no track at " + TimeText(asked)
                              : FormatA("no track of the trip passed within %g m of that position", o.tolerance));
  }
  const TRACK_ITEM_INFO* track = nullptr;
  for (auto* t : Items<TRACK_ITEM_INFO>(trip->tracks)) {
    if (t && t->id == trackId) track = t;
  }
  std::printf("%s\n", FormatA("placed by %s\n"
                              "track      %s  %s\n"
                              "time       %s (%ld)\n"
                              "latitude   %.6f\n"
                              "longitude  %.6f\n"
                              "altitude   %.1f m\n"
                              "speed      %.1f km/h",
                              byTime && time == asked ? "time" : "position",
                              trackId.ToUtf8().c_str(),
                              track ? track->GetName().ToUtf8().c_str() : "",
                              TimeText(time).c_str(), time, lat, lon, altitude, speed / 1000.0)
                          .c_str());
}

}  // namespace

void AddOptimizeCommand(CLI::App& app) {
  auto id = std::make_shared<std::string>();
  auto off = std::make_shared<bool>(false);
  CLI::App* cmd = AddCommand(app, "optimize", "set the optimisation levels of a trip's points and save it",
                             kOptimizeHelp, [id, off] { RunOptimize(*id, *off); });
  cmd->add_option("TRIP", *id, "the trip")->required();
  cmd->add_flag("--off", *off, "keep the levels; only choose the display level again");
}

void AddPlotCommand(CLI::App& app) {
  struct Options {
    std::string trip, out;
    long size = 800;
  };
  auto o = std::make_shared<Options>();
  CLI::App* cmd = AddCommand(app, "plot", "draw a trip's tracks, points coloured by level", kPlotHelp, [o] {
    const std::string extension = PathExtension(CString::FromUtf8(o->out)).ToUtf8();
    if (extension != "svg" && extension != "SVG") Usage("the plot is an SVG picture: name it FILE.svg");
    auto trip = OpenTripWithPoints(o->trip);
    WritePlot(*trip, o->out, o->size);
    std::printf("%s\n", o->out.c_str());
  });
  cmd->add_option("TRIP", o->trip, "the trip")->required();
  cmd->add_option("-o,--output", o->out, "the picture to write")->required()->option_text("FILE.svg");
  cmd->add_option("--size", o->size, "the picture's width and height in pixels (default 800)")
      ->check(CLI::Range(200L, 100000L));
}

void AddPlaceCommand(CLI::App& app) {
  auto o = std::make_shared<PlaceOptions>();
  CLI::App* cmd = AddCommand(app, "place", "where a trip was at a time, or when it passed a position",
                             kPlaceHelp, [o] { RunPlace(*o); });
  cmd->add_option("TRIP", o->trip, "the trip")->required();
  cmd->add_option("--time", o->time, "the time (seconds since 1970 or YYYY-MM-DDThh:mm:ss, UTC)")
      ->option_text("T");
  CLI::Option* lat = cmd->add_option("--lat", o->lat, "latitude, degrees")->check(CLI::Range(-90.0, 90.0));
  CLI::Option* lon = cmd->add_option("--lon", o->lon, "longitude, degrees")->check(CLI::Range(-180.0, 180.0));
  lat->needs(lon);
  lon->needs(lat);
  cmd->add_option("--tolerance", o->tolerance, "how near the track must pass, metres (default 50)")
      ->check(CLI::PositiveNumber);
  cmd->add_option("--track", o->track, "the track to try first: its id, the start of its id, or its name")
      ->option_text("ID");
}

}  // namespace navmisc::cli
