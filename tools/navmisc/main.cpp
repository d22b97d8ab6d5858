// navmisc: the command-line front end of NavMiscLib.
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <iostream>
#include <map>

#include "cli.h"

namespace {

using navmisc::cli::Args;

constexpr const char* kHelp =
    "Usage: navmisc [--data-root DIR] COMMAND [ARGS]\n"
    "\n"
    "Keeps GPS logger trips on disk, cleans and simplifies tracks, places photos on them and\n"
    "exports them.\n"
    "\n"
    "Commands:\n"
    "  demo [DIR]        build a sample data root (a fresh temporary one without DIR) with\n"
    "                    profiles and trips, and show what the library does with it\n"
    "  trips [--app A]   list the trips (A = trip, sport, tracker, where; default trip)\n"
    "  optimize TRIP     set the optimisation levels of a trip's points and save it\n"
    "  plot TRIP -o FILE.svg\n"
    "                    draw a trip's tracks, points coloured by level\n"
    "  place TRIP (--time T | --lat LAT --lon LON) [--tolerance M]\n"
    "                    where a trip was at a time, or when it passed a position\n"
    "  export TRIP --format gpx|kml|kmz|tcx|csv [--metric] -o FILE\n"
    "                    write a trip as an interchange document\n"
    "  profile [--app A] [--on MM/DD/YYYY]\n"
    "                    show an application's user profile (A as for trips, or where)\n"
    "  templates [--language CODE]\n"
    "                    list the web-page templates of the program's catalogue\n"
    "  timezone          the local offset from UTC and whether the zone observes daylight\n"
    "                    saving\n"
    "\n"
    "Options:\n"
    "  --data-root DIR   the data folder (default $XDG_DATA_HOME/navmisc, else\n"
    "                    ~/.local/share/navmisc)\n"
    "  --help            this text; COMMAND --help for a command's own\n"
    "  --version         the program's version\n"
    "\n"
    "TRIP is a trip id as `navmisc trips` lists it. Times are seconds since 1970 or\n"
    "YYYY-MM-DDThh:mm:ss (UTC).\n";

std::string DefaultDataRoot() {
  if (const char* x = std::getenv("XDG_DATA_HOME"); x && *x) return std::string(x) + "/navmisc";
  const char* home = std::getenv("HOME");
  return std::string(home && *home ? home : "/tmp") + "/.local/share/navmisc";
}

}  // namespace

int main(int argc, char** argv) {
  std::vector<std::string> args(argv + 1, argv + argc);
  std::string root = DefaultDataRoot();
  size_t i = 0;
  for (; i < args.size(); ++i) {
    const std::string& a = args[i];
    if (a == "--help" || a == "-h") {
      std::fputs(kHelp, stdout);
      return 0;
    }
    if (a == "--version") {
      std::printf("navmisc %s\n", NAVMISC_VERSION);
      return 0;
    }
    if (a == "--data-root" && i + 1 < args.size()) {
      root = args[++i];
    } else if (a.rfind("--data-root=", 0) == 0) {
      root = a.substr(12);
    } else {
      break;
    }
  }
  if (i >= args.size()) {
    std::fputs(kHelp, stderr);
    return 2;
  }
  const std::string command = args[i];
  Args rest(std::vector<std::string>(args.begin() + static_cast<long>(i) + 1, args.end()));
  const std::map<std::string, int (*)(Args&)> commands = {
      {"demo", navmisc::cli::CmdDemo},
      {"trips", navmisc::cli::CmdTrips},
      {"export", navmisc::cli::CmdExport},
      {"profile", navmisc::cli::CmdProfile},
      {"templates", navmisc::cli::CmdTemplates},
      {"timezone", navmisc::cli::CmdTimeZone},
      {"optimize", navmisc::cli::CmdOptimize},
      {"plot", navmisc::cli::CmdPlot},
      {"place", navmisc::cli::CmdPlace},
  };
  auto it = commands.find(command);
  if (it == commands.end()) {
    std::fprintf(stderr, "navmisc: unknown command '%s' (see navmisc --help)\n", command.c_str());
    return 2;
  }
  try {
    if (command != "demo") navmisc::cli::SetDataRoot(root);
    return it->second(rest);
  } catch (const navmisc::cli::Failure& f) {
    std::fprintf(stderr, "navmisc %s: %s\n", command.c_str(), f.message.c_str());
    return f.code;
  } catch (const std::exception& e) {
    std::fprintf(stderr, "navmisc %s: %s\n", command.c_str(), e.what());
    return 1;
  }
}
