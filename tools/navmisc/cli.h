// Shared pieces of the navmisc command-line tool.
#pragma once

#include <chrono>
#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "navmisc/platform/cstring.h"
#include "navmisc/platform/datetime.h"
#include "navmisc/platform/types.h"

class BLOG_ITEM_INFO;
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

long ParseTime(const std::string& text);  // seconds since 1970 or "YYYY-MM-DDThh:mm:ss[Z]"
std::string TimeText(long time);          // "YYYY-MM-DDThh:mm:ssZ", or "-" for none

// Sets the data root (and the program folder) for this run.
void SetDataRoot(const std::string& root);
std::string DataRoot();

// Finds and reads the trip whose id is `id`, in any application folder of the data root.
std::unique_ptr<BLOG_ITEM_INFO> OpenTrip(const std::string& id);

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

// Writes `trip` (points loaded) in one of the export formats; fails with a message. `counter`
// and `keepGoing` (may be null) follow and stop the export.
int ExportTrip(BLOG_ITEM_INFO& trip, const std::string& format, const std::string& out, bool metric,
               int sport, int* counter = nullptr, bool* keepGoing = nullptr);
// The demo's last step: every trip of the demo tree in every export format.
void DemoExports(const std::string& root);

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
// `navmisc channel status`: the data-control channel and its process.
void AddChannelCommand(CLI::App& app);
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
// The demo's import step: exported documents of the demo's trips come back in as trips.
void DemoImport(const std::string& root);
// `navmisc help [COMMAND]`: the program's or a command's help.
void AddHelpCommand(CLI::App& app);

// The demo's geometry step (demo_geo.cpp): optimises the sample trips, writes a plot.
void DemoGeometry();

}  // namespace navmisc::cli
