// navmisc channel status, run as a user runs it: the real command thread and process.
#include <gtest/gtest.h>

#include <dirent.h>

#include <string>

#include "navmisc/platform/data_root.h"
#include "navmisc/platform/files.h"
#include "channel_harness.h"
#include "testutil.h"

namespace {

using navmisc::testutil::CommandResult;
using navmisc::testutil::RunCommand;
using navmisc::testutil::ShellQuote;
using navmisc::testutil::TempDir;
using navmisc::testutil::WriteFileBytes;

CommandResult Channel(const TempDir& root, const std::string& args) {
  return RunCommand(ShellQuote(NAVMISC_TOOL_PATH) + " --data-root " + ShellQuote(root.path().ToUtf8()) +
                    " channel " + args + " 2>&1 </dev/null");
}

// The shared objects this user has for `root`.
int ObjectsOf(const TempDir& root) {
  const std::string prefix =
      navmisc::PerRootObjectName("", navmisc::CanonicalDataRoot(root.path())).substr(1);
  int n = 0;
  DIR* dir = ::opendir("/dev/shm");
  while (const dirent* e = dir ? ::readdir(dir) : nullptr) n += std::string(e->d_name).starts_with(prefix);
  if (dir) ::closedir(dir);
  return n;
}

TEST(ChannelCommand, StatusStartsTheProcessAsksAndEndsTheChannel) {
  TempDir root;
  CommandResult r = Channel(root, "status");
  EXPECT_EQ(r.status, 0) << r.out;
  // Without a configuration the web service is the public one, reachable until an exchange fails.
  EXPECT_EQ(r.out, "device:          not connected\nweb service:     connected\n");
  // The queues are gone with the channel; only the shared state blocks stay.
  EXPECT_EQ(ObjectsOf(root), 2);

  navmisc::testutil::MakeLogger(root / L"logger", 1, 1);
  WriteFileBytes(root / L"GpsDataControl.ini",
                 "[DEVICE]\nPath=" + (root / L"logger").ToUtf8() + "\n[WEBSERVICE]\nUrl=https://example.org\n");
  r = Channel(root, "status --verbose");
  EXPECT_EQ(r.status, 0) << r.out;
  // The process's announcement, then the two replies, then the summary.
  const std::string device = "block: kind 4 (connection status), device id \"\", error 0, source 1, connected 1\n";
  const std::string net = "block: kind 4 (connection status), device id \"\", error 0, source 2, connected 1\n";
  EXPECT_EQ(r.out, device + net + device + net + "device:          connected\nweb service:     connected\n");
  navmisc::RemovePerRootObjects(root.path());

  r = Channel(root, "");
  EXPECT_EQ(r.status, 2) << r.out;
  EXPECT_NE(r.out.find("navmisc channel: A subcommand is required"), std::string::npos) << r.out;
}

}  // namespace
