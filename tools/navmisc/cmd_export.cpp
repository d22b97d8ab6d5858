#include <cstdio>

#include "cli.h"
#include "navmisc/export/csv_export.h"
#include "navmisc/export/gpx_export.h"
#include "navmisc/export/kml_export.h"
#include "navmisc/export/tcx_export.h"
#include "navmisc/export/tcx_from_trip.h"
#include "navmisc/platform/files.h"
#include "navmisc/records/trip.h"

namespace navmisc::cli {
namespace {

constexpr const char* kExportHelp =
    "Usage: navmisc export TRIP --format gpx|kml|kmz|tcx|csv [--metric] [--sport N] -o FILE\n"
    "\n"
    "Writes the trip's tracks (and its photos, where the format has room for them):\n"
    "  gpx   GPX 1.0: photos as waypoints, then one track per track\n"
    "  kml   KML 2.1 for Google Earth: tracks as lines, photos and markers as placemarks\n"
    "  kmz   the KML document zipped with copies of the photos\n"
    "  tcx   Training Center: one activity, one lap per track (--sport 0 biking, 1 running,\n"
    "        2-7 other; default 1)\n"
    "  csv   one line per point; imperial units unless --metric; files of at most 65533\n"
    "        points are split into FILE_1.csv, FILE_2.csv, ...\n";

}  // namespace

int ExportTrip(BLOG_ITEM_INFO& trip, const std::string& format, const std::string& out, bool metric,
               int sport) {
  const CString path = CString::FromUtf8(out);
  const CString folder = PathFolder(path);
  if (!folder.IsEmpty() && !IsDirectory(folder)) Fail("the folder " + folder.ToUtf8() + " does not exist");
  int ok = 0;
  if (format == "gpx") {
    ok = ExportGpx(path, trip.tracks, trip.photos);
  } else if (format == "kml") {
    ok = ExportKml(path, trip.tracks, trip.photos, 0);
  } else if (format == "kmz") {
    KmzExportFailure failure;
    ok = ExportKmz(path, trip.tracks, trip.photos, &failure);
    if (!ok && failure.stage == KmzExportFailure::kAddFile) {
      const std::string what = failure.photo ? "photo " + failure.file.ToUtf8() : failure.file.ToUtf8();
      Fail("cannot add " + what + " to " + out + ": " + failure.message.ToUtf8());
    }
    if (!ok) Fail("cannot write " + out + ": " + failure.message.ToUtf8());
  } else if (format == "tcx") {
    CTcxActivities activity;
    FillTcxActivity(trip, sport, activity);
    ok = ExportTcx(path, activity);
  } else if (format == "csv") {
    ok = ExportCsv(path, trip.tracks, trip.photos, &trip, metric);
  } else {
    Usage("--format must be gpx, kml, kmz, tcx or csv");
  }
  if (!ok) Fail("cannot write " + out + " (is the target writable?)");
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
  if (!out) Usage("export needs -o FILE");
  const int sportType = sport ? static_cast<int>(ParseDouble(*sport, "--sport")) : 1;
  if (sportType < 0 || sportType > 7) Usage("--sport must be 0 to 7");
  auto trip = OpenTrip(pos[0]);
  int counter = 0;
  bool keepGoing = true;
  int rc = 0;
  std::optional<Failure> failure;
  RunWithProgress("export " + *format, 0, counter, keepGoing, [&] {
    try {
      trip->ReadAllWaypoint(0);
      rc = ExportTrip(*trip, *format, *out, metric, sportType);
    } catch (const Failure& f) {
      failure = f;
    }
  });
  if (failure) throw *failure;
  std::printf("%s\n", out->c_str());
  return rc;
}

}  // namespace navmisc::cli
