// navmisc: the command-line front end of NavMiscLib.
#include <cstdio>
#include <cstring>
#include <exception>
#include <string>

#include <CLI/CLI.hpp>

#include "cli.h"

namespace {

constexpr const char* kDescription =
    "Keeps GPS logger trips on disk, cleans and simplifies tracks, places photos on them and\n"
    "exports them.\n";

constexpr const char* kFooter =
    "TRIP is a trip's id as `navmisc trips` lists it. Times are seconds since 1970 or\n"
    "YYYY-MM-DDThh:mm:ss (UTC). `navmisc help COMMAND` or `navmisc COMMAND --help` explains a\n"
    "command.";

// The command that was given, for the prefix of error messages ("navmisc export: ...",
// "navmisc device read: ...").
std::string Prefix(const CLI::App& app) {
  std::string prefix = "navmisc";
  for (const CLI::App* at = &app; !at->get_subcommands().empty();) {
    at = at->get_subcommands().front();
    prefix += " " + at->get_name();
  }
  return prefix;
}

// The first argument that is neither an option nor an option's value: what the user meant as
// the command.
std::string FirstWord(int argc, char** argv) {
  for (int i = 1; i < argc; ++i) {
    if (std::strcmp(argv[i], "--data-root") == 0) {
      ++i;
    } else if (argv[i][0] != '-') {
      return argv[i];
    }
  }
  return {};
}

}  // namespace

int main(int argc, char** argv) {
  CLI::App app{kDescription, "navmisc"};
  app.footer(kFooter);  // each command sets its own
  app.set_version_flag("--version", std::string("navmisc ") + NAVMISC_VERSION);
  // One command a run; a second word is the command's argument even when it names a command.
  app.require_subcommand(0, 1);
  navmisc::cli::AddGlobalOptions(app);
  navmisc::cli::AddDemoCommand(app);
  navmisc::cli::AddTripsCommand(app);
  navmisc::cli::AddOptimizeCommand(app);
  navmisc::cli::AddPlotCommand(app);
  navmisc::cli::AddPlaceCommand(app);
  navmisc::cli::AddExportCommand(app);
  navmisc::cli::AddPhotosCommand(app);
  navmisc::cli::AddGeotagCommand(app);
  navmisc::cli::AddProfileCommand(app);
  navmisc::cli::AddTemplatesCommand(app);
  navmisc::cli::AddTimeZoneCommand(app);
  navmisc::cli::AddSummaryCommand(app);
  navmisc::cli::AddSportCommand(app);
  navmisc::cli::AddTrackerCommand(app);
  navmisc::cli::AddWhereCommand(app);
  navmisc::cli::AddChannelCommand(app);
  navmisc::cli::AddNetCommand(app);
  navmisc::cli::AddDeviceCommand(app);
  navmisc::cli::AddImportCommand(app);
  navmisc::cli::AddHelpCommand(app);

  try {
    app.parse(argc, argv);
  } catch (const CLI::ParseError& e) {
    if (e.get_exit_code() == static_cast<int>(CLI::ExitCodes::Success)) return app.exit(e);
    if (app.get_subcommands().empty() && !FirstWord(argc, argv).empty()) {
      std::fprintf(stderr, "navmisc: unknown command '%s' (see navmisc --help)\n", FirstWord(argc, argv).c_str());
    } else {
      std::fprintf(stderr, "%s: %s (see --help)\n", Prefix(app).c_str(), e.what());
    }
    return 2;
  } catch (const navmisc::cli::Failure& f) {
    std::fprintf(stderr, "%s: %s\n", Prefix(app).c_str(), f.message.c_str());
    return f.code;
  } catch (const std::exception& e) {
    std::fprintf(stderr, "%s: %s\n", Prefix(app).c_str(), e.what());
    return 1;
  }
  if (app.get_subcommands().empty()) {
    std::fputs(app.help().c_str(), stderr);
    return 2;
  }
  return 0;
}
