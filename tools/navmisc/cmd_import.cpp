// `navmisc import FILE...`: each file becomes a trip, imported by the data-control process as an
// application asks for it (DC_FILE_ImportFile), with a progress bar fed by the process's
// progress blocks. Ctrl-C asks the process to cancel the running import.
#include <cstdio>
#include <limits>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include <CLI/CLI.hpp>

#include "channel_session.h"
#include "cli.h"
#include "navmisc/datactrl/file_commands.h"
#include "navmisc/datactrl/reply_dialog.h"
#include "navmisc/datactrl/request_queue.h"
#include "navmisc/import/import_errors.h"
#include "navmisc/import/read_track_file.h"
#include "navmisc/platform/console.h"
#include "navmisc/platform/datetime.h"
#include "navmisc/platform/files.h"
#include "navmisc/records/user_profile.h"
#include "terminal_view.h"

namespace navmisc::cli {
namespace {

using namespace navmisc::datactrl;

struct ImportArgs {
  std::vector<std::string> files;
  std::string app = "trip";
  std::string format;
  std::string name;
  std::string from, to;
  std::string timeZone;
  bool verbose = false;
};

// "+02:00", "-0530", "+2" or seconds east of UTC ("3600").
int32_t ParseZone(const std::string& text) {
  if (text.empty()) return 0;
  const char sign = text[0];
  if (sign != '+' && sign != '-') {
    char* end = nullptr;
    const long v = std::strtol(text.c_str(), &end, 10);
    if (*end || v < -86400 || v > 86400) Usage("'" + text + "' is not a time zone (+hh:mm or seconds)");
    return static_cast<int32_t>(v);
  }
  int h = 0, m = 0;
  char extra = 0;
  const std::string rest = text.substr(1);
  const bool ok = std::sscanf(rest.c_str(), "%2d:%2d%c", &h, &m, &extra) == 2 ||
                  (rest.size() == 4 && std::sscanf(rest.c_str(), "%2d%2d%c", &h, &m, &extra) == 2) ||
                  (rest.size() <= 2 && std::sscanf(rest.c_str(), "%2d%c", &h, &extra) == 1);
  if (!ok || h > 14 || m > 59) Usage("'" + text + "' is not a time zone (+hh:mm or seconds)");
  return (sign == '-' ? -1 : 1) * (h * 3600 + m * 60);
}

// The window that gets the channel's replies during the import.
class ImportWindow : public CDataCtrlReplyDlg {
 public:
  ImportWindow(TerminalDialogView& view, CString language, bool verbose)
      : CDataCtrlReplyDlg(view, std::move(language)), verbose_(verbose) {}

  long ProcessFile(CDataControlCmdBlk* block) override {
    reply_ = *static_cast<CDataControlCmdBlkFile*>(block);
    return 1;
  }
  long ProcessProgress(CDataControlCmdBlk* block) override {
    const auto& p = *static_cast<CDataControlProgressCmdBlk*>(block);
    if (p.nSource != DC_SOURCE_DEVICE) return 1;
    progress_ = p;
    if (verbose_) {
      std::printf("progress: %d of %d KiB read, %d points\n", p.nProcessed, p.nTotalOfProcess,
                  p.nDatabaseProcessed);
      std::fflush(stdout);
    }
    return 1;
  }

  void Reset() {
    reply_.reset();
    progress_ = {};
  }
  const std::optional<CDataControlCmdBlkFile>& reply() const { return reply_; }
  const CDataControlProgressCmdBlk& progress() const { return progress_; }

 private:
  bool verbose_;
  std::optional<CDataControlCmdBlkFile> reply_;
  CDataControlProgressCmdBlk progress_{};
};

// Asks the process to stop a running read; a file import stops between two points.
void CancelRunningRead() {
  CDataControlCmdBlkKVDevice cancel;
  InitDeviceBlockDefaults(cancel);
  cancel.nDeviceCmd = DC_DEVICE_CANCEL_READ;
  InsertRequestMessage(cancel);
}

// What the reply says, for people: the process's own account, else the code's text.
std::string Explain(const CDataControlCmdBlkFile& reply) {
  const std::string detail = reply.trackInfo.szMetaInfo.ToUtf8();
  if (!detail.empty()) return detail;
  const std::string text = navmisc::import::ImportErrorText(reply.nLastError);
  return text.empty() ? "error " + std::to_string(reply.nLastError) : text;
}

// A summary value ("points=120") of the reply's track record.
std::string Summary(const CDataControlCmdBlkFile& reply, const std::string& key) {
  const std::string meta = " " + reply.trackInfo.szMetaInfo.ToUtf8();
  const size_t at = meta.find(" " + key + "=");
  if (at == std::string::npos) return "0";
  const size_t start = at + key.size() + 2;
  return meta.substr(start, meta.find(' ', start) - start);
}

void RunImport(const ImportArgs& args) {
  ImportRequest request;
  if (args.app == "trip") request.app = GPS_APP_TRIP;
  else if (args.app == "sport") request.app = GPS_APP_SPORT;
  else if (args.app == "tracker") request.app = GPS_APP_TRACKER;
  else Usage("--app must be trip, sport or tracker");
  navmisc::import::FileFormat format;
  if (!navmisc::import::ParseFormatName(args.format, format)) Usage("'" + args.format + "' is not a format name");
  request.format = args.format;
  request.name = args.name;
  if (!args.from.empty()) request.from = CovertTimeTToOleDateTime(ParseTime(args.from));
  if (!args.to.empty()) request.to = CovertTimeTToOleDateTime(ParseTime(args.to));
  request.timeZone = ParseZone(args.timeZone);
  request.verbose = args.verbose;
  bool cancelled = false;
  const int failed = ImportFiles(args.files, request, &cancelled);
  if (cancelled) Fail("interrupted", 130);
  if (failed) Fail(std::to_string(failed) + " of " + std::to_string(args.files.size()) + " files not imported");
}

}  // namespace

int ImportFiles(const std::vector<std::string>& files, const ImportRequest& request, bool* cancelledOut) {
  TerminalDialogView view;
  ImportWindow window(view, GetUserMapInfo(GPS_APP_TRIP)->localize, request.verbose);
  ChannelSession channel(window);
  InterruptWatch interrupt;
  int failed = 0;
  bool cancelled = false;
  for (const std::string& file : files) {
    if (cancelled) break;
    window.Reset();
    // The process may work in another folder than this program: it gets the full path.
    DC_FILE_ImportFile(AbsolutePath(CString::FromUtf8(file)), request.app, CString::FromUtf8(request.format),
                       request.from, request.to, request.timeZone,
                       request.name.empty() ? nullptr : CString::FromUtf8(request.name).c_str());
    ProgressBar bar("importing " + PathFileName(CString::FromUtf8(file)).ToUtf8());
    bool asked = false, lost = false;
    PumpUntil(
        [&] {
          if (window.reply()) return true;
          if (DataControlProcessId() != channel.processId()) return lost = true;
          if (interrupt.Interrupted() && !asked) {
            asked = true;
            CancelRunningRead();
          }
          const auto& p = window.progress();
          bar.Show(p.nProcessed, p.nTotalOfProcess, std::to_string(p.nDatabaseProcessed) + " points");
          return false;
        },
        std::chrono::hours(24 * 365));
    if (lost) {
      bar.Finish("failed");
      Fail(file + ": the data-control process ended during the import");
    }
    const CDataControlCmdBlkFile& reply = *window.reply();
    if (reply.nLastError == DC_ERR_IMPORT_CANCELLED) {
      bar.Finish("cancelled");
      std::fprintf(stderr, "navmisc import: %s: cancelled; no trip was made\n", file.c_str());
      cancelled = true;
      ++failed;
      continue;
    }
    if (reply.nLastError != 0) {
      bar.Finish("failed");
      std::fprintf(stderr, "navmisc import: %s: %s\n", file.c_str(), Explain(reply).c_str());
      ++failed;
      continue;
    }
    bar.Finish("done");
    std::printf("%s: trip %s \"%s\" (%s tracks, %s points, %s markers; %s)\n", file.c_str(),
                reply.trackInfo.szTrackId.ToUtf8().c_str(), reply.trackInfo.szSubject.ToUtf8().c_str(),
                Summary(reply, "tracks").c_str(), Summary(reply, "points").c_str(),
                Summary(reply, "markers").c_str(), Summary(reply, "format").c_str());
    std::fflush(stdout);
  }
  if (cancelledOut) *cancelledOut = cancelled;
  return failed;
}

void AddImportCommand(CLI::App& app) {
  auto args = std::make_shared<ImportArgs>();
  CLI::App* sub = AddCommand(
      app, "import", "bring GPX, TCX, NMEA and other track files in as trips",
      "Each FILE becomes a new trip of the application chosen by --app, made by the data-control\n"
      "process (GpsDataControl.exe beside this program): GPX 1.0 and 1.1, TCX and NMEA 0183 are\n"
      "read directly; any other format gpsbabel reads goes through gpsbabel when it is installed\n"
      "(name it with --format, e.g. kml, garmin_fit, unicsv). A trip of the trip application\n"
      "joins the trip tree. A file that cannot be imported leaves no trip behind; Ctrl-C cancels\n"
      "the running import. Times are seconds since 1970 or YYYY-MM-DDThh:mm:ss (UTC).",
      [args] { RunImport(*args); });
  sub->add_option("FILE", args->files, "track files to import")->required();
  sub->add_option("--app", args->app, "the application the trips belong to: trip (default), sport, tracker")
      ->option_text("APP");
  sub->add_option("--format", args->format,
                  "the files' format: gpx, tcx, nmea, or a gpsbabel format (default: recognised)")
      ->option_text("F");
  sub->add_option("--name", args->name, "the trips' name (default: the file's own name or its title)");
  sub->add_option("--from", args->from, "leave out points before this time")->option_text("TIME");
  sub->add_option("--to", args->to, "leave out points after this time")->option_text("TIME");
  sub->add_option("--time-zone", args->timeZone,
                  "the zone the files' times are written in (+hh:mm or seconds east of UTC); taken off")
      ->option_text("ZONE");
  sub->add_flag("--verbose,-v", args->verbose, "print every progress report of the process");
}

}  // namespace navmisc::cli
