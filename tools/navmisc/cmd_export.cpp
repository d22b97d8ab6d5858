#include <algorithm>
#include <cstdint>
#include <cstdio>

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
    "Usage: navmisc export TRIP --format gpx|kml|kmz|tcx|csv [--metric] [--sport N] -o FILE\n"
    "\n"
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
    "docs/exported-documents.md describes the documents.\n";

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

int CmdExport(Args& args) {
  if (args.Flag("help")) {
    std::fputs(kExportHelp, stdout);
    return 0;
  }
  const auto format = args.Option("format");
  const auto out = args.Option("o");
  const auto sport = args.Option("sport");
  const bool metric = args.Flag("metric");
  const auto pos = args.Positionals();
  if (pos.size() != 1) Usage("export needs one TRIP");
  if (!format) Usage("export needs --format");
  if (*format != "gpx" && *format != "kml" && *format != "kmz" && *format != "tcx" && *format != "csv") {
    Usage("--format must be gpx, kml, kmz, tcx or csv, not '" + *format + "'");
  }
  if (!out) Usage("export needs -o FILE");
  const int sportType = sport ? static_cast<int>(ParseDouble(*sport, "--sport")) : 1;
  if (sportType < 0 || sportType > 7) Usage("--sport must be 0 to 7");
  auto trip = OpenTrip(pos[0]);

  int counter = 0;
  bool keepGoing = true;
  if (!RunWithProgress("reading " + pos[0], 0, counter, keepGoing, [&] { trip->ReadAllWaypoint(0); })) {
    Fail("stopped; nothing was written");
  }
  std::optional<Failure> failure;
  RunWithProgress("export " + *format, ProgressTotal(*trip, *format), counter, keepGoing, [&] {
    try {
      ExportTrip(*trip, *format, *out, metric, sportType, &counter, &keepGoing);
    } catch (const Failure& f) {
      failure = f;
    }
  });
  if (failure) throw *failure;

  const CString path = CString::FromUtf8(*out);
  if (*format == "csv" && !FileExists(path)) {
    // The lines went to numbered files.
    for (int n = 1;; ++n) {
      const CString part = CsvSplitFileName(path, n);
      if (!FileExists(part)) break;
      std::printf("%s\n", part.ToUtf8().c_str());
    }
    return 0;
  }
  std::printf("%s\n", out->c_str());
  return 0;
}

}  // namespace navmisc::cli
