#include <algorithm>
#include <cstdint>
#include <cstdio>
#include <optional>

#include <CLI/CLI.hpp>

#include "cli.h"
#include "navmisc/export/csv_export.h"
#include "navmisc/export/gpx_export.h"
#include "navmisc/export/kml_export.h"
#include "navmisc/export/tcx_export.h"
#include "navmisc/export/tcx_from_trip.h"
#include "navmisc/platform/files.h"
#include "navmisc/platform/output_file.h"
#include "navmisc/records/trip.h"

namespace navmisc::cli {
namespace {

constexpr const char* kExportHelp =
    "Writes the trip's tracks (and its photos, where the format has room for them) to FILE,\n"
    "replacing it:\n"
    "  gpx   GPX 1.0: photos as waypoints, then one track per track\n"
    "  kml   KML 2.1 for Google Earth: tracks as lines, photos and markers as placemarks\n"
    "  kmz   the KML document zipped with numbered copies of the photos\n"
    "  tcx   Training Center: one activity with one lap per track, summed up from the\n"
    "        track's points (--sport 0 biking, 1 running, 2-7 other; default 1)\n"
    "  csv   one line per point; imperial units unless --metric; with 65534 points or\n"
    "        more the lines go to FILE_1.csv, FILE_2.csv, ... (65534 lines each)\n"
    "\n"
    "Points without a time are left out. Ctrl-C stops the export and removes what it wrote.\n"
    "docs/exported-documents.md describes the documents.";

// The number of steps an export of `format` counts for the progress bar.
int ProgressTotal(BLOG_ITEM_INFO& trip, const std::string& format) {
  long long total = 0;
  for (auto* track : Items<TRACK_ITEM_INFO>(trip.tracks)) {
    if (track) total += track->points.GetCount();
  }
  if (format == "gpx" || format == "kml" || format == "kmz") total += trip.photos.GetCount();
  return static_cast<int>(std::min<long long>(total, INT32_MAX));
}

[[noreturn]] void FailKmz(const KmzExportFailure& failure, const std::string& out) {
  const std::string why = failure.message.ToUtf8();
  if (failure.stage == KmzExportFailure::kAddFile && failure.photo) {
    Fail("cannot add photo \"" + failure.photo->title.ToUtf8() + "\" (" +
         failure.photo->GetFilePathName().ToUtf8() + ") to " + out + ": " + why);
  }
  if (failure.stage == KmzExportFailure::kAddFile) {
    Fail("cannot add " + failure.file.ToUtf8() + " to " + out + ": " + why);
  }
  Fail("cannot write " + out + ": " + why);
}

}  // namespace

int ExportTrip(BLOG_ITEM_INFO& trip, const std::string& format, const std::string& out, bool metric,
               int sport, int* counter, bool* keepGoing) {
  const CString path = CString::FromUtf8(out);
  const CString folder = PathFolder(path);
  if (!folder.IsEmpty() && !IsDirectory(folder)) {
    Fail(FileExists(folder) ? folder.ToUtf8() + " is not a folder" : "the folder " + folder.ToUtf8() + " does not exist");
  }
  if (IsDirectory(path)) Fail(out + " is a folder");
  int ok = 0;
  if (format == "gpx") {
    ok = ExportGpx(path, trip.tracks, trip.photos, counter, keepGoing);
  } else if (format == "kml") {
    ok = ExportKml(path, trip.tracks, trip.photos, 0, counter, keepGoing);
  } else if (format == "kmz") {
    KmzExportFailure failure;
    ok = ExportKmz(path, trip.tracks, trip.photos, &failure, counter, keepGoing);
    if (!ok && failure.stage != KmzExportFailure::kStopped) FailKmz(failure, out);
  } else if (format == "tcx") {
    CTcxActivities activity;
    FillTcxActivity(trip, sport, activity);
    ok = ExportTcx(path, activity, counter, keepGoing);
  } else if (format == "csv") {
    ok = ExportCsv(path, trip.tracks, trip.photos, &trip, metric, counter, keepGoing);
  } else {
    Usage("--format must be gpx, kml, kmz, tcx or csv");
  }
  if (!ok && keepGoing && !*keepGoing) Fail("stopped; nothing was written");
  if (!ok) {
    const std::string why = LastOpenError();
    Fail("cannot write " + out + (why.empty() ? "" : ": " + why));
  }
  return 0;
}

namespace {

struct ExportOptions {
  std::string trip;
  std::string format;
  std::string out;
  bool metric = false;
  int sport = 1;
};

void RunExport(const ExportOptions& o) {
  auto trip = OpenTrip(o.trip);

  int counter = 0;
  bool keepGoing = true;
  if (!RunWithProgress("reading " + o.trip, 0, counter, keepGoing, [&] { trip->ReadAllWaypoint(0); })) {
    Fail("stopped; nothing was written");
  }
  std::optional<Failure> failure;
  RunWithProgress("export " + o.format, ProgressTotal(*trip, o.format), counter, keepGoing, [&] {
    try {
      ExportTrip(*trip, o.format, o.out, o.metric, o.sport, &counter, &keepGoing);
    } catch (const Failure& f) {
      failure = f;
    }
  });
  if (failure) throw *failure;

  const CString path = CString::FromUtf8(o.out);
  if (o.format == "csv" && !FileExists(path)) {
    // The lines went to numbered files.
    for (int n = 1;; ++n) {
      const CString part = CsvSplitFileName(path, n);
      if (!FileExists(part)) break;
      std::printf("%s\n", part.ToUtf8().c_str());
    }
    return;
  }
  std::printf("%s\n", o.out.c_str());
}

}  // namespace

void AddExportCommand(CLI::App& app) {
  auto o = std::make_shared<ExportOptions>();
  CLI::App* cmd = AddCommand(app, "export", "write a trip as an interchange document", kExportHelp,
                             [o] { RunExport(*o); });
  cmd->add_option("TRIP", o->trip, "the trip")->required();
  cmd->add_option("--format", o->format, "the document's format")
      ->required()
      ->check(CLI::IsMember({"gpx", "kml", "kmz", "tcx", "csv"}));
  cmd->add_option("-o,--output", o->out, "the file to write")->required()->option_text("FILE");
  cmd->add_flag("--metric", o->metric, "CSV in metres and metres per hour");
  cmd->add_option("--sport", o->sport, "TCX sport: 0 biking, 1 running, 2-7 other (default 1)")
      ->check(CLI::Range(0, 7));
}

}  // namespace navmisc::cli
