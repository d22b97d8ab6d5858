// Shared pieces of the navmisc command-line tool.
#pragma once

#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "navmisc/platform/cstring.h"
#include "navmisc/platform/types.h"

class BLOG_ITEM_INFO;

namespace navmisc::cli {

// Failures that end a command: the message goes to stderr and the exit code is 1 (2 for usage).
struct Failure {
  std::string message;
  int code = 1;
};
[[noreturn]] void Fail(const std::string& message, int code = 1);
[[noreturn]] void Usage(const std::string& message);

// The arguments of a subcommand, with the options it knows.
class Args {
 public:
  explicit Args(std::vector<std::string> args) : args_(std::move(args)) {}
  // Removes and returns "--name VALUE" (or "--name=VALUE"); nullopt when absent.
  std::optional<std::string> Option(const std::string& name);
  // Removes "--name"; true when it was there.
  bool Flag(const std::string& name);
  // The remaining positional arguments; any unknown "--option" left is a usage error.
  std::vector<std::string> Positionals();

 private:
  std::vector<std::string> args_;
};

double ParseDouble(const std::string& text, const std::string& what);
long ParseTime(const std::string& text);  // seconds since 1970 or "YYYY-MM-DDThh:mm:ss[Z]"
std::string TimeText(long time);          // "YYYY-MM-DDThh:mm:ssZ", or "-" for none

// Sets the data root (and the program folder) for this run.
void SetDataRoot(const std::string& root);
std::string DataRoot();

// Finds and reads the trip whose id is `id`, in any application folder of the data root.
std::unique_ptr<BLOG_ITEM_INFO> OpenTrip(const std::string& id);

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

// Subcommands.
int CmdDemo(Args& args);
int CmdTrips(Args& args);
int CmdOptimize(Args& args);
int CmdPlot(Args& args);
int CmdPlace(Args& args);
int CmdExport(Args& args);
int CmdProfile(Args& args);
int CmdTemplates(Args& args);
int CmdTimeZone(Args& args);

// The demo's geometry step (demo_geo.cpp): optimises the sample trips, writes a plot.
void DemoGeometry();

}  // namespace navmisc::cli
