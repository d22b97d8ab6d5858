// navmisc photos add|list and navmisc geotag: photos into a trip, placed on its tracks and tagged.
#include <CLI/CLI.hpp>
#include <cstdio>
#include <optional>
#include <string>
#include <vector>

#include "cli.h"
#include "navmisc/records/trip.h"
#include "photo_cli.h"

namespace navmisc::cli {
namespace {

constexpr const char* kAddHelp =
    "Copies the photos into the trip, reads their capture times, positions and comments through\n"
    "the tagging tool FixTag.exe, and places each on the trip's tracks: by its time when that\n"
    "falls within a track, else by the position its camera recorded (within --tolerance). The\n"
    "camera's clock is taken to show the trip's local time (the trip's time-zone shift); --offset\n"
    "adds seconds to every photo's time for a camera clock that was wrong, and --offset-from\n"
    "PHOTO=TIME works that out from one photo taken at a known TIME (UTC). Lists where each\n"
    "photo landed and which did not fit. Exit code 1 when a file was not a photo.";

constexpr const char* kListHelp =
    "Lists the trip's photos: camera time, track time, position, track.";

constexpr const char* kGeotagHelp =
    "Writes the positions of the trip's placed photos into their copies in the trip (one run of\n"
    "the tagging tool). With --originals also into the files they were imported from, asking\n"
    "before each: y yes, n no, a yes to all, q no to all (the end of the input answers no to\n"
    "all); --yes-to-all and --no-to-all answer in advance. Photos without a position are left\n"
    "alone. Exit code 1 when a copy could not be tagged.";

struct AddOptions {
  std::string trip;
  std::vector<std::string> files;
  long offset = 0;
  std::string offsetFrom;
  double tolerance = 50.0;
};

void RunAdd(const AddOptions& o) {
  auto trip = OpenTrip(o.trip);
  trip->ReadAllWaypoint(0);
  const std::vector<AddedPhoto> added =
      AddPhotos(*trip, o.files, {o.offset, o.offsetFrom}, o.tolerance);
  PrintAddedPhotos(stdout, added);
  for (const AddedPhoto& a : added) {
    if (!a.photo) Fail("some files were not added");
  }
}

struct GeotagOptions {
  std::string trip;
  bool originals = false, yesToAll = false, noToAll = false;
};

void RunGeotag(const GeotagOptions& o) {
  auto trip = OpenTrip(o.trip);
  std::optional<int> answer;
  if (o.yesToAll) answer = IDYESTOALL;
  if (o.noToAll) answer = IDCANCEL;
  TerminalOverwriteView view;
  const GeotagOutcome r = GeotagTrip(*trip, o.originals, answer, &view);
  std::printf("tagged %d of %d placed photos in the trip", r.tagged, r.placed);
  if (o.originals) std::printf(", %d original%s", r.originals, r.originals == 1 ? "" : "s");
  if (r.unplaced) std::printf("; %d without a position left alone", r.unplaced);
  std::printf("\n");
  for (const std::string& name : r.failed)
    std::fprintf(stderr, "navmisc geotag: %s was not tagged\n", name.c_str());
  if (!r.failed.empty()) Fail("some photos were not tagged");
}

}  // namespace

void AddPhotosCommand(CLI::App& app) {
  CLI::App* photos =
      app.add_subcommand("photos", "add photos to a trip, placed on its tracks; list them");
  photos->require_subcommand(1);
  photos->fallthrough();

  auto add = std::make_shared<AddOptions>();
  CLI::App* cmd = AddCommand(*photos, "add", "copy photos into a trip and place them on its tracks",
                             kAddHelp, [add] { RunAdd(*add); });
  cmd->add_option("TRIP", add->trip, "the trip")->required();
  cmd->add_option("FILES", add->files, "the photos")->required();
  CLI::Option* offset =
      cmd->add_option("--offset", add->offset, "seconds added to every photo's time")
          ->option_text("SECONDS");
  CLI::Option* from =
      cmd->add_option("--offset-from", add->offsetFrom, "the offset that puts PHOTO at TIME (UTC)")
          ->option_text("PHOTO=TIME");
  offset->excludes(from);
  cmd->add_option("--tolerance", add->tolerance,
                  "how near a track a photo's own position must be, metres (default 50)")
      ->check(CLI::PositiveNumber);

  auto list = std::make_shared<std::string>();
  cmd = AddCommand(*photos, "list", "list a trip's photos", kListHelp, [list] {
    auto trip = OpenTrip(*list);
    PrintPhotoList(stdout, *trip);
  });
  cmd->add_option("TRIP", *list, "the trip")->required();
}

void AddGeotagCommand(CLI::App& app) {
  auto o = std::make_shared<GeotagOptions>();
  CLI::App* cmd =
      AddCommand(app, "geotag", "write the positions of a trip's photos into the photo files",
                 kGeotagHelp, [o] { RunGeotag(*o); });
  cmd->add_option("TRIP", o->trip, "the trip")->required();
  cmd->add_flag("--originals", o->originals, "also tag the files the photos were imported from");
  CLI::Option* yes =
      cmd->add_flag("--yes-to-all", o->yesToAll, "tag every original without asking");
  CLI::Option* no = cmd->add_flag("--no-to-all", o->noToAll, "tag no original");
  yes->excludes(no);
}

}  // namespace navmisc::cli
