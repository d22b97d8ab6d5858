// The program's command line as a whole: options in any place, help everywhere.
#include <gtest/gtest.h>

#include <string>

#include "testutil.h"
#include "tool_test_support.h"

namespace {

using navmisc::testutil::CommandResult;
using navmisc::testutil::RunTool;
using navmisc::testutil::ShellQuote;
using navmisc::testutil::TempDir;

TEST(CommandLine, GlobalOptionsGoAnywhereAndEveryCommandExplainsItself) {
  TempDir root;
  const std::string dir = ShellQuote(root.path().ToUtf8());
  const struct {
    std::string args;
    int status;
    std::string shows;
  } cases[] = {
      // The data root before or after the command's name.
      {"--data-root " + dir + " trips", 1, "no trip tree under " + root.path().ToUtf8()},
      {"trips --data-root " + dir, 1, "no trip tree under " + root.path().ToUtf8()},
      {"trips --data-root=" + dir, 1, "no trip tree under " + root.path().ToUtf8()},
      {"trips --data-root", 2, "navmisc trips: --data-root: 1 required"},
      {"--data-root", 2, "navmisc: --data-root: 1 required"},
      {"", 2, "Usage: navmisc [OPTIONS] [SUBCOMMAND]"},
      {"frobnicate", 2, "unknown command 'frobnicate'"},
      {"trips --frobnicate", 2, "navmisc trips: The following argument was not expected: --frobnicate"},
      {"trips --app boat", 2, "--app: boat not in {trip,sport,tracker}"},
      {"--help", 0, "Subcommands:\n  demo"},
      {"help", 0, "Subcommands:\n  demo"},
      {"help export", 0, "Usage: navmisc export [OPTIONS] TRIP"},
      {"help frobnicate", 2, "no command 'frobnicate'"},
      {"--version", 0, "navmisc "},
  };
  for (const auto& c : cases) {
    const CommandResult r = RunTool(c.args);
    EXPECT_EQ(r.status, c.status) << c.args << "\n" << r.out;
    EXPECT_NE(r.out.find(c.shows), std::string::npos) << c.args << "\n" << r.out;
  }
  // Every command answers -h and --help with its own usage and nothing else.
  for (const char* command : {"demo", "trips", "optimize", "plot", "place", "export", "profile", "templates",
                              "timezone", "summary", "sport", "sport add", "tracker remove", "where set",
                              "where follow", "channel", "device", "import", "net", "help"}) {
    for (const char* flag : {"-h", "--help"}) {
      const CommandResult r = RunTool(std::string(command) + " " + flag);
      EXPECT_EQ(r.status, 0) << command << " " << flag << "\n" << r.out;
      EXPECT_EQ(r.out.find("Usage: navmisc " + std::string(command)), r.out.find('\n') + 1)
          << command << " " << flag << "\n" << r.out;
    }
  }
}

}  // namespace
