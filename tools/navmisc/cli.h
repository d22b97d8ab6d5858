// Shared pieces of the navmisc command-line tool.
#pragma once

#include <chrono>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "navmisc/platform/cstring.h"
#include "navmisc/platform/datetime.h"
#include "navmisc/platform/types.h"

class BLOG_ITEM_INFO;
class TRACK_ITEM_INFO;
namespace CLI {
class App;
}

namespace navmisc::cli {

// Failures that end a command: the message goes to stderr and the exit code is 1 (2 for usage).
struct Failure {
  std::string message;
  int code = 1;
};
[[noreturn]] void Fail(const std::string& message, int code = 1);
[[noreturn]] void Usage(const std::string& message);

// Adds the options every command accepts, before or after the command's name (--data-root).
void AddGlobalOptions(CLI::App& app);

// Adds subcommand `name`: its one-line `description` shows in the command list, `details` under
// its own help. The callback sets the data root chosen on the command line (unless
// `usesDataRoot` is false) and then runs `run`, which fails by throwing Failure (see Fail).
CLI::App* AddCommand(CLI::App& app, const std::string& name, const std::string& description,
                     const std::string& details, std::function<void()> run, bool usesDataRoot = true);

// Dates and times as the user gives them: ISO 8601 ("2024-05-31", "2024-05-31T14:05:00Z",
// "2024-05-31T16:05+02:00"; UTC when no zone is given), and the older forms (dates
// "05/31/2024", times in seconds since 1970). Anything else is a usage error.
struct Date {
  int year, month, day;
};
Date ParseDate(const std::string& text);
long ParseTime(const std::string& text);
std::string DateText(const Date& date);  // "YYYY-MM-DD"
std::string TimeText(long time);         // "YYYY-MM-DDThh:mm:ssZ", or "-" for none

// Sets the data root (and the program folder) for this run.
void SetDataRoot(const std::string& root);
std::string DataRoot();

// Finds and reads (without its points) the trip that `name` names in any application folder of
// the data root: its id, the start of exactly one trip's id, or exactly one trip's name. Fails
// listing the candidates when none or several match.
std::unique_ptr<BLOG_ITEM_INFO> OpenTrip(const std::string& name);
// The track of `trip` that `name` names, the same way (its id, the start of one id, one name).
TRACK_ITEM_INFO& FindTrack(BLOG_ITEM_INFO& trip, const std::string& name);

// A progress line on stderr: drawn only when stderr is a terminal, and only once the work has
// taken more than a moment.
class ProgressBar {
 public:
  explicit ProgressBar(std::string label);
  // `done` of `total` as a bar and a percentage, or with `total` 0 a spinner and the time
  // taken; `note` follows ("1200 points"). Redrawn at most ten times a second.
  void Show(long long done, long long total, const std::string& note = "");
  // Ends the line with "LABEL: RESULT" when anything was drawn.
  void Finish(const std::string& result);

 private:
  std::string label_;
  std::chrono::steady_clock::time_point started_;
  std::chrono::steady_clock::time_point last_;
  bool draw_;
  bool drawn_ = false;
};

// Runs `work` on a worker thread while a progress bar follows `counter` up to `total` on stderr
// (only when stderr is a terminal). Ctrl-C clears `keepGoing`, so the work can stop cleanly;
// returns false when it was interrupted that way.
bool RunWithProgress(const std::string& label, int total, int& counter, bool& keepGoing,
                     const std::function<void()>& work);

// Fails unless the folder of the output file `path` exists and `path` is not a folder.
void CheckOutputFolder(const std::string& path);

// One run of `navmisc export`.
struct ExportRequest {
  std::string trip;             // as the user names it (see OpenTrip)
  std::string out;              // the file to write, or "-" for standard output
  std::string format;           // gpx, kml, kmz, tcx or csv, any case; empty: out's extension
  bool metric = false;          // csv only
  std::optional<int> sport;     // tcx only (default running)
  std::string track;            // one track (see FindTrack); empty: all
  std::optional<int> level;     // only the points kept at this display level
};
// Writes the document, with a progress bar, beside its target first and then in its place.
// Returns the files written ("-" for standard output). Fails with a message.
std::vector<std::string> RunExport(const ExportRequest& request);
// The demo's last step: each of the demo's trips (ids) in every export format.
void DemoExports(const std::string& root, const std::vector<std::string>& trips);

// The commands, each added to the program's parser with its options, help and callback.
void AddDemoCommand(CLI::App& app);
void AddTripsCommand(CLI::App& app);
void AddOptimizeCommand(CLI::App& app);
void AddPlotCommand(CLI::App& app);
void AddPlaceCommand(CLI::App& app);
void AddExportCommand(CLI::App& app);
void AddProfileCommand(CLI::App& app);
void AddTemplatesCommand(CLI::App& app);
void AddTimeZoneCommand(CLI::App& app);
void AddSummaryCommand(CLI::App& app);
void AddSportCommand(CLI::App& app);
void AddTrackerCommand(CLI::App& app);
void AddWhereCommand(CLI::App& app);
// `navmisc channel status`: the data-control channel and its process.
void AddChannelCommand(CLI::App& app);
// `navmisc net ...` (cmd_net.cpp): the web service through the data-control process.
void AddNetCommand(CLI::App& app);
// `navmisc device ...`: the logger through the data-control process.
void AddDeviceCommand(CLI::App& app);
// `navmisc photos add|list` and `navmisc geotag` (cmd_photos.cpp).
void AddPhotosCommand(CLI::App& app);
void AddGeotagCommand(CLI::App& app);
// `navmisc import FILE...`: track files in as trips, through the data-control process.
void AddImportCommand(CLI::App& app);
// What `navmisc import` asks of the process for every file.
struct ImportRequest {
  GPS_APP_PROG_TYPE app = GPS_APP_TRIP;
  std::string format;    // empty: recognised
  std::string name;      // empty: from the file
  COleDateTime from, to;  // zero: open
  int32_t timeZone = 0;  // seconds east of UTC of the files' times
  bool verbose = false;  // print every progress block
};
// Imports each file as a trip through the data-control process, started for the time of the
// call: a line per trip on stdout, a line per failure on stderr, a progress bar meanwhile.
// Ctrl-C cancels the running import and skips the rest (*cancelled is set). Returns the number
// of files that failed.
int ImportFiles(const std::vector<std::string>& files, const ImportRequest& request, bool* cancelled);
// The demo's import step: the exports of trip `tripId` come back in as trips.
void DemoImport(const std::string& root, const std::string& tripId);
// `navmisc help [COMMAND]`: the program's or a command's help.
void AddHelpCommand(CLI::App& app);

// The demo's geometry step (demo_geo.cpp): optimises the demo's trips (ids), draws one and
// places a photo on it.
void DemoGeometry(const std::vector<std::string>& trips);
// The demo's activity step (demo_activity.cpp): files the run `runId` as a sport activity and
// the tracker trip `trackerId` as a tracker activity, sets a where-am-I position, and shows the
// run's summary with calories.
void DemoActivities(const CString& runId, const CString& trackerId);
// The demo's logger step (demo_device.cpp): a logger folder with two days of NMEA logs under
// `root`, read into trips through the data-control process.
void DemoDevice(const std::string& root);

}  // namespace navmisc::cli
