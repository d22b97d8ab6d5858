// navmisc export: a trip as an interchange document.
#include <algorithm>
#include <cctype>
#include <cstdint>
#include <cstdio>
#include <memory>
#include <optional>
#include <vector>

#include <CLI/CLI.hpp>

#include "cli.h"
#include "navmisc/export/csv_export.h"
#include "navmisc/export/gpx_export.h"
#include "navmisc/export/kml_export.h"
#include "navmisc/export/tcx_export.h"
#include "navmisc/export/tcx_from_trip.h"
#include "navmisc/platform/console.h"
#include "navmisc/platform/files.h"
#include "navmisc/platform/format.h"
#include "navmisc/platform/staging_folder.h"
#include "navmisc/platform/temp_folder.h"
#include "navmisc/records/track_point_reader.h"
#include "navmisc/records/trip.h"
#include "navmisc/util/xml_text.h"

namespace navmisc::cli {
namespace {

constexpr const char* kExportHelp =
    "Writes the trip's tracks (and its photos and markers, where the format has room for them)\n"
    "to FILE:\n"
    "  gpx   GPX 1.0: photos and markers as waypoints, then one track per track\n"
    "  kml   KML 2.1 for Google Earth: tracks as lines, photos and markers as placemarks\n"
    "  kmz   the KML document zipped with numbered copies of the photos\n"
    "  tcx   Training Center: one activity with one lap per track, summed up from the\n"
    "        track's points (--sport 0 biking, 1 running, 2-7 other; default 1)\n"
    "  csv   one line per point; imperial units unless --metric; with 65534 points or\n"
    "        more the lines go to FILE_1.csv, FILE_2.csv, ... (65534 lines each)\n"
    "Without --format the format is FILE's extension (any case). FILE \"-\" writes the\n"
    "document to standard output (--format needed).\n"
    "\n"
    "--track exports one track; --level N only the points the simplification keeps at display\n"
    "level N (see navmisc optimize); points the trip hides (bad fixes, stops) stay hidden.\n"
    "Titles and names are escaped, so every document is well-formed.\n"
    "\n"
    "The document is written beside FILE and moved into place only when it is complete: after\n"
    "any failure (a full disk, Ctrl-C) the previous FILE is still there. A symbolic link at FILE\n"
    "is replaced by the document; the file it pointed to stays as it was.\n"
    "Points without a time are left out. docs/exported-documents.md describes the documents.";

constexpr const char* kFormats[] = {"gpx", "kml", "kmz", "tcx", "csv"};
// Lines of one CSV file; more points go to numbered files.
constexpr long long kCsvLinesPerFile = 65534;
// The exporters' text limits in bytes, terminator excluded.
constexpr size_t kGpxTextBytes = 2047;
constexpr size_t kKmlTrackNameBytes = 1023;
constexpr size_t kUnlimited = static_cast<size_t>(-1);

std::string Lower(std::string s) {
  std::transform(s.begin(), s.end(), s.begin(), [](unsigned char c) { return std::tolower(c); });
  return s;
}

bool IsFormat(const std::string& f) {
  return std::find(std::begin(kFormats), std::end(kFormats), f) != std::end(kFormats);
}

// The format asked for, else the output's extension.
std::string ChooseFormat(const ExportRequest& r) {
  if (!r.format.empty()) {
    const std::string f = Lower(r.format);
    if (!IsFormat(f)) Usage("--format must be gpx, kml, kmz, tcx or csv, not '" + r.format + "'");
    return f;
  }
  if (r.out == "-") Usage("writing to standard output (-o -) needs --format");
  const std::string f = Lower(PathExtension(CString::FromUtf8(r.out)).ToUtf8());
  if (!IsFormat(f)) {
    Usage("cannot tell the format from '" + r.out + "'; name it .gpx, .kml, .kmz, .tcx or .csv, or give --format");
  }
  return f;
}

void CheckOptionsFit(const ExportRequest& r, const std::string& format) {
  if (r.metric && format != "csv") Usage("--metric applies to csv only, not " + format);
  if (r.sport && format != "tcx") Usage("--sport applies to tcx only, not " + format);
}

// The number of steps an export counts for the progress bar.
long long ProgressTotal(const CPtrList& tracks, const CPtrList& items, const std::string& format, bool fromFiles) {
  long long total = 0;
  for (const auto* track : Items<TRACK_ITEM_INFO>(tracks)) {
    total += fromFiles ? TrackPointReader::Count(*track) : track->points.GetCount();
  }
  if (format == "gpx" || format == "kml" || format == "kmz") total += items.GetCount();
  return total;
}

// The trip's tracks as exported: all, or the one --track names. With points read from the files
// the tracks without points are dropped first, as loading them would.
void SelectTracks(BLOG_ITEM_INFO& trip, const std::string& track, bool fromFiles, CPtrList& out) {
  if (fromFiles) {
    CPtrList all;
    while (!trip.tracks.IsEmpty()) all.AddTail(trip.tracks.RemoveHead());
    for (auto* t : Items<TRACK_ITEM_INFO>(all)) {
      TrackPointReader reader;
      WAYPOINT_ITEM_INFO first;
      if (t && reader.Open(*t) && reader.Next(first)) trip.tracks.AddTail(t);
      else delete t;
    }
  }
  if (!track.empty()) {
    out.AddTail(&FindTrack(trip, track));
    return;
  }
  for (auto* t : Items<TRACK_ITEM_INFO>(trip.tracks)) out.AddTail(t);
}

// Gives the tracks and copies of the photos the texts that `format` writes raw, made safe for
// XML. The trip is the command's own copy and is never saved.
void MakeTextsSafe(CPtrList& tracks, CPtrList& photos, const std::string& format,
                   std::vector<std::unique_ptr<PHOTO_ITEM_INFO>>& copies, CPtrList& items) {
  const bool gpx = format == "gpx";
  const bool kml = format == "kml" || format == "kmz";
  for (auto* t : Items<TRACK_ITEM_INFO>(tracks)) {
    if (gpx) t->description = XmlText(t->description, kGpxTextBytes);
    if (kml) t->description = XmlText(t->description, kKmlTrackNameBytes);
  }
  for (auto* p : Items<PHOTO_ITEM_INFO>(photos)) {
    if (!p) continue;
    copies.push_back(std::make_unique<PHOTO_ITEM_INFO>(*p));
    PHOTO_ITEM_INFO& copy = *copies.back();
    if (gpx) {
      copy.title = XmlText(p->title, kGpxTextBytes);
      copy.description = XmlText(p->description, kGpxTextBytes);
    } else if (kml) {
      // The KML exporter escapes item texts itself.
      copy.title = XmlCharacters(p->title);
      copy.description = XmlCharacters(p->description);
    }
    items.AddTail(&copy);
  }
}

[[noreturn]] void FailKmz(const KmzExportFailure& failure, const std::string& out) {
  const std::string why = failure.message.ToUtf8();
  if (failure.stage == KmzExportFailure::kAddFile && failure.photo) {
    Fail("cannot add photo \"" + failure.photo->title.ToUtf8() + "\" (" + failure.photo->GetFilePathName().ToUtf8() +
         ") to " + out + ": " + why);
  }
  Fail("cannot write " + out + ": " + why);
}

// Thinned tracks of --level, put back whatever happens.
class Thinning {
 public:
  Thinning(BLOG_ITEM_INFO& trip, int level) : trip_(trip) {
    trip.optLevel = level;
    CreateOptimizeTrack(&trip, old_);
    // The thinned copies know only their ids; the documents want the names too.
    POSITION thin = trip.tracks.GetHeadPosition();
    for (auto* real : Items<TRACK_ITEM_INFO>(old_)) {
      if (!thin) break;
      static_cast<TRACK_ITEM_INFO*>(trip.tracks.GetNext(thin))->description = real->description;
    }
  }
  ~Thinning() {
    RestoreOldTrack(&trip_, old_);
    old_.RemoveAll();
  }
  Thinning(const Thinning&) = delete;
  Thinning& operator=(const Thinning&) = delete;

 private:
  BLOG_ITEM_INFO& trip_;
  CPtrList old_;
};

}  // namespace

std::vector<std::string> RunExport(const ExportRequest& r) {
  const std::string format = ChooseFormat(r);
  CheckOptionsFit(r, format);
  CString target = CString::FromUtf8(r.out);
  const bool toStdout = r.out == "-";
  if (!toStdout) CheckOutputFolder(r.out);
  auto trip = OpenTrip(r.trip);

  // Documents of a million points need not hold them: the exporters read them from the point
  // files as they go. The TCX laps and the thinned tracks of a level need them loaded.
  const bool fromFiles = format != "tcx" && !r.level;
  int counter = 0;
  bool keepGoing = true;
  if (!fromFiles &&
      !RunWithProgress("reading " + r.trip, 0, counter, keepGoing, [&] { trip->ReadAllWaypoint(0); })) {
    Fail("stopped; nothing was written");
  }
  std::optional<Thinning> thinning;
  if (r.level) thinning.emplace(*trip, *r.level);
  CPtrList tracks;
  SelectTracks(*trip, r.track, fromFiles, tracks);
  if (r.level) {
    bool any = false;
    for (auto* t : Items<TRACK_ITEM_INFO>(tracks)) any = any || !t->points.IsEmpty();
    if (!any) Fail(FormatA("no point keeps level %d or more (run navmisc optimize first)", *r.level));
  }
  std::vector<std::unique_ptr<PHOTO_ITEM_INFO>> photoCopies;
  CPtrList items;
  MakeTextsSafe(tracks, trip->photos, format, photoCopies, items);
  const long long total = ProgressTotal(tracks, items, format, fromFiles);
  if (toStdout && format == "csv" && total >= kCsvLinesPerFile) {
    Fail(FormatA("%lld points make a CSV of several numbered files; give -o FILE.csv", total));
  }

  // Written beside the target (or in a scratch folder for standard output) and moved into place
  // only when complete.
  std::optional<StagingFolder> staging;
  std::optional<ScopedTempFolder> scratch;
  CString folder;
  if (toStdout) {
    scratch.emplace(L"navmisc-export");
    folder = scratch->path();
    target = PathJoin(folder, trip->tripId + L"." + CString::FromUtf8(format));
    if (folder.IsEmpty()) Fail("cannot create a scratch folder under $TMPDIR");
  } else {
    staging.emplace(PathFolder(target), PathFileName(target));
    folder = staging->path();
    if (folder.IsEmpty()) Fail("cannot write " + r.out + ": " + staging->error());
  }
  const CString path = PathJoin(folder, PathFileName(target));

  ExportControl control;
  control.counter = &counter;
  control.keepGoing = &keepGoing;
  control.pointsFromFiles = fromFiles;
  counter = 0;
  int result = 0;
  KmzExportFailure kmzFailure;
  RunWithProgress("export " + format, static_cast<int>(std::min<long long>(total, INT32_MAX)), counter, keepGoing,
                  [&] {
                    if (format == "gpx") {
                      result = ExportGpx(path, tracks, items, control);
                    } else if (format == "kml") {
                      result = ExportKml(path, tracks, items, 0, control);
                    } else if (format == "kmz") {
                      result = ExportKmz(path, tracks, items, &kmzFailure, control);
                    } else if (format == "tcx") {
                      CTcxActivities activity;
                      FillTcxActivity(tracks, r.sport.value_or(CTcxActivities::kRunning), activity);
                      if (activity.Id.IsEmpty()) activity.Id = trip->tripId;
                      activity.Id = XmlText(activity.Id, kUnlimited);
                      result = ExportTcx(path, activity, control);
                    } else {
                      result = ExportCsv(path, tracks, items, trip.get(), r.metric, control);
                    }
                  });
  if (!keepGoing) Fail("stopped; nothing was written");
  if (!result && format == "kmz") FailKmz(kmzFailure, r.out);
  if (!result || !control.error.empty()) Fail("cannot write " + r.out + ": " + control.error);

  if (toStdout) {
    std::string why;
    if (!CopyFileToStdout(path, why)) Fail("cannot write to standard output: " + why);
    return {"-"};
  }
  if (!staging->Publish()) Fail("cannot write " + r.out + ": " + staging->error());
  std::vector<std::string> written;
  for (const CString& name : staging->published()) written.push_back(PathJoin(PathFolder(target), name).ToUtf8());
  return written;
}

void AddExportCommand(CLI::App& app) {
  auto r = std::make_shared<ExportRequest>();
  CLI::App* cmd = AddCommand(app, "export", "write a trip as an interchange document", kExportHelp, [r] {
    for (const std::string& file : RunExport(*r)) {
      if (file != "-") std::printf("%s\n", file.c_str());
    }
  });
  cmd->add_option("TRIP", r->trip, "the trip: its id, the start of its id, or its name")->required();
  cmd->add_option("-o,--output", r->out, "the file to write; - for standard output")->required()->option_text("FILE");
  cmd->add_option("--format", r->format, "gpx, kml, kmz, tcx or csv (default: FILE's extension)")->option_text("F");
  cmd->add_flag("--metric", r->metric, "csv: metres and metres per hour");
  cmd->add_option("--sport", r->sport, "tcx: 0 biking, 1 running, 2-7 other (default 1)")
      ->check(CLI::Range(0, 7))
      ->option_text("N");
  cmd->add_option("--track", r->track, "only this track: its id, the start of its id, or its name")
      ->option_text("ID");
  cmd->add_option("--level", r->level, "only the points kept at display level N (0 to 100)")
      ->check(CLI::Range(0, 100))
      ->option_text("N");
}

}  // namespace navmisc::cli
