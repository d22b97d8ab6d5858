// navmisc optimize, plot and place: the track geometry of a trip from the command line.
#include <cmath>
#include <cstdio>

#include "cli.h"
#include "geo_cli.h"
#include "navmisc/geo/gps_mapping.h"
#include "navmisc/geo/optimize.h"
#include "navmisc/geo/track_plot.h"
#include "navmisc/platform/atomic_file.h"
#include "navmisc/platform/files.h"
#include "navmisc/platform/format.h"
#include "navmisc/records/trip.h"

namespace navmisc::cli {
namespace {

constexpr const char* kOptimizeHelp =
    "Usage: navmisc optimize TRIP [--off]\n"
    "\n"
    "Runs the cleaning passes over every track of the trip and stores each point's level:\n"
    "  -2       a bad fix (after a long gap, or a lone jump faster than 120 km/h)\n"
    "  -1       a fix of a stop\n"
    "  0 .. 100 the coarsest simplification (level x 0.0001 degrees) that still keeps it\n"
    "  10000    never dropped (tracks too short to simplify)\n"
    "then chooses the trip's display level and saves the trip (settings and point files).\n"
    "\n"
    "  --off    keep the levels; only choose the display level again\n"
    "\n"
    "Ctrl-C stops after the current step; the levels set so far are saved (exit code 130).\n";

constexpr const char* kPlotHelp =
    "Usage: navmisc plot TRIP -o FILE.svg [--size PIXELS]\n"
    "\n"
    "Draws the trip's tracks as an SVG picture, north up: one pixel per metre when the trip\n"
    "fits into PIXELS (default 800), coarser steps of 0.2 m per pixel until it does. Every point\n"
    "is a dot coloured by its level: red a bad fix, orange a stop, pale to dark blue levels 0\n"
    "to 100, black never dropped. A scale bar and a key sit under the drawing. Run\n"
    "`navmisc optimize TRIP` first to give the points their levels.\n";

constexpr const char* kPlaceHelp =
    "Usage: navmisc place TRIP (--time T | --lat LAT --lon LON) [--tolerance M] [--track ID]\n"
    "\n"
    "Places a photo on the trip's tracks: where the trip was at time T (seconds since 1970 or\n"
    "YYYY-MM-DDThh:mm:ss, UTC), or when it passed nearest to a position (within M metres,\n"
    "default 50), and on which track. A time wins over a position when it falls on a track.\n"
    "--track tries that track first. Exit code 1 when the trip was not there.\n";

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

std::string OneTrip(Args& args, const char* command) {
  const auto pos = args.Positionals();
  if (pos.size() != 1) Usage(std::string(command) + " takes one trip id");
  return pos[0];
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
  const CString wpath = CString::FromUtf8(path);
  const CString folder = PathFolder(wpath);
  if (!folder.IsEmpty() && !IsDirectory(folder)) Fail("the folder " + folder.ToUtf8() + " does not exist");
  TrackPlotOptions options;
  options.size = size;
  const std::string svg = RenderTrackPlotSvg(trip, options);
  AtomicFile file;
  if (!file.Open(wpath) || !file.Write(svg) || !file.Commit()) Fail("cannot write " + path);
}

int CmdOptimize(Args& args) {
  if (args.Flag("help")) {
    std::fputs(kOptimizeHelp, stdout);
    return 0;
  }
  const bool off = args.Flag("off");
  auto trip = OpenTripWithPoints(OneTrip(args, "optimize"));
  const bool finished = OptimizeTrip(*trip, !off);
  PrintLevelSummary(stdout, *trip);
  if (!finished) {
    std::fprintf(stderr, "navmisc optimize: stopped by Ctrl-C; the levels set so far are saved\n");
    return 130;
  }
  return 0;
}

int CmdPlot(Args& args) {
  if (args.Flag("help")) {
    std::fputs(kPlotHelp, stdout);
    return 0;
  }
  const auto out = args.Option("o");
  if (!out || out->empty()) Usage("plot needs -o FILE.svg");
  long size = 800;
  if (const auto s = args.Option("size")) {
    const double v = ParseDouble(*s, "--size");
    if (v < 16 || v > 100000 || v != std::floor(v)) Usage("--size must be a whole number of pixels from 16 to 100000");
    size = static_cast<long>(v);
  }
  auto trip = OpenTripWithPoints(OneTrip(args, "plot"));
  WritePlot(*trip, *out, size);
  std::printf("%s\n", out->c_str());
  return 0;
}

int CmdPlace(Args& args) {
  if (args.Flag("help")) {
    std::fputs(kPlaceHelp, stdout);
    return 0;
  }
  long time = -1;
  double lat = 0.0, lon = 0.0, tolerance = 50.0;
  const auto timeText = args.Option("time");
  const auto latText = args.Option("lat"), lonText = args.Option("lon");
  if (timeText) {
    time = ParseTime(*timeText);
    if (time < 1) Usage("--time must be after 1970-01-01T00:00:00");
  }
  if (latText.has_value() != lonText.has_value()) Usage("--lat and --lon go together");
  if (latText) {
    lat = ParseDouble(*latText, "--lat");
    lon = ParseDouble(*lonText, "--lon");
    if (std::fabs(lat) > 90 || std::fabs(lon) > 180) Usage("--lat must lie in -90..90 and --lon in -180..180");
    if (lat == 0.0 && lon == 0.0) Usage("0/0 stands for no position; give another one");
  }
  if (!timeText && !latText) Usage("place needs --time or --lat and --lon");
  if (const auto t = args.Option("tolerance")) {
    tolerance = ParseDouble(*t, "--tolerance");
    if (tolerance <= 0) Usage("--tolerance must be a positive number of metres");
  }
  CString trackId = CString::FromUtf8(args.Option("track").value_or(""));
  auto trip = OpenTripWithPoints(OneTrip(args, "place"));

  double altitude = 0.0;
  long speed = 0;
  const long asked = time;
  if (!MappingGPSAndTrack(trip->tracks, tolerance, trackId, lat, lon, altitude, speed, time)) {
    Fail(timeText && latText ? "the trip was neither there at that time nor within the tolerance of that position"
         : timeText          ? "the trip has no track at " + TimeText(asked)
                             : FormatA("no track of the trip passed within %g m of that position", tolerance));
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
                              timeText && time == asked ? "time" : "position",
                              trackId.ToUtf8().c_str(),
                              track ? track->GetName().ToUtf8().c_str() : "",
                              TimeText(time).c_str(), time, lat, lon, altitude, speed / 1000.0)
                          .c_str());
  return 0;
}

}  // namespace navmisc::cli
