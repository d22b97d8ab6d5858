// navmisc device ... and navmisc where follow, run as a user runs them: the real command thread,
// the real process, a logger folder.
#include <gtest/gtest.h>

#include <string>

#include "channel_harness.h"
#include "navmisc/platform/data_root.h"
#include "navmisc/platform/files.h"
#include "testutil.h"

namespace {

using navmisc::testutil::CommandResult;
using navmisc::testutil::ReadFileBytes;
using navmisc::testutil::RunCommand;
using navmisc::testutil::ShellQuote;
using navmisc::testutil::TempDir;
using navmisc::testutil::WriteFileBytes;

class DeviceCommand : public ::testing::Test {
 protected:
  void SetUp() override {
    navmisc::testutil::MakeLogger(logger_, 21, 9);
    WriteFileBytes(logger_ + L"/LOG/2024-05-03.gpx", navmisc::testutil::SyntheticGpx(1714723200, 1200));
  }
  void TearDown() override { navmisc::RemovePerRootObjects(root_.path()); }

  CommandResult Run(const std::string& args, const std::string& logger = "") {
    return RunCommand("XDG_CONFIG_HOME=" + ShellQuote(config_.path().ToUtf8()) + " " +
                      ShellQuote(NAVMISC_TOOL_PATH) + " --data-root " + ShellQuote(root_.path().ToUtf8()) +
                      " " + args +
                      (args.starts_with("device")
                           ? " --logger " + ShellQuote(logger.empty() ? logger_.ToUtf8() : logger)
                           : std::string()) +
                      " 2>&1 </dev/null");
  }
  void Expect(const std::string& args, int status, const std::string& shows) {
    const CommandResult r = Run(args);
    EXPECT_EQ(r.status, status) << args << "\n" << r.out;
    EXPECT_NE(r.out.find(shows), std::string::npos) << args << "\n" << r.out;
  }

  TempDir root_, config_, files_;
  const CString logger_ = files_ / L"logger";
};

TEST_F(DeviceCommand, EverySubcommandThroughTheProcess) {
  Expect("device status", 0, "Model:      KV-8 (code 21)\nIdentity:   SN:2100000009\n");
  const CommandResult none = Run("device status", (files_ / L"none").ToUtf8());
  EXPECT_EQ(none.status, 1);
  EXPECT_NE(none.out.find("navmisc device status: no logger is connected"), std::string::npos) << none.out;

  Expect("device settings", 0, "nInterval=5\n");
  Expect("device settings", 0, "[KV-11]\n");
  Expect("device settings --set nInterval=30 --set NAME=Ann", 0, "Settings written.");
  Expect("device settings", 0, "nInterval=30\n");
  Expect("device settings", 0, "NAME=Ann\n");
  Expect("device settings --set bogus=1", 2, "no setting 'bogus'");
  Expect("device settings --set bAccOn=7", 2, "bAccOn: '7' is not a whole number from 0 to 1");
  Expect("device settings --set nInterval", 2, "--set takes KEY=VALUE");

  WriteFileBytes(files_ / L"navi.gpx",
                 "<gpx version=\"1.1\" creator=\"t\" xmlns=\"http://www.topografix.com/GPX/1/1\">"
                 "<wpt lat=\"51.12345678\" lon=\"7.5\"><name>Harbour</name></wpt>"
                 "<rte><rtept lat=\"51.2\" lon=\"7.6\"/><rtept lat=\"51.3\" lon=\"7.7\"/></rte></gpx>");
  Expect("device navi " + ShellQuote((files_ / L"navi.gpx").ToUtf8()), 0, "3 navigation points written.");
  EXPECT_EQ(ReadFileBytes(logger_ + L"/NAVI.DAT").size(), 3u * 288);

  Expect("device modes", 0,
         "Settings file: " + (config_ / L"vorla/device_21_9.ini").ToUtf8() + " (not written yet: the defaults)");
  Expect("device modes", 0, "5    Mode 6                 5s      on      on        3s     30    0");

  Expect("device read --clear", 0, "Read 1 trip, points from 2024-05-03T08:00:00Z to 2024-05-03T08:19:59Z");
  EXPECT_FALSE(FileExists(logger_ + L"/LOG/2024-05-03.gpx"));
  Expect("trips", 0, "2024-05-03");
  Expect("device read", 0, "The logger holds no points.");

  Expect("device clear", 1, "the log was not cleared (answer yes, or give --yes)");
  Expect("device clear --yes", 0, "The logger's memory is clear.");
  Expect("device reset", 1, "the logger was not reset (answer yes, or give --yes)");
  Expect("device reset --yes", 0, "factory values");
  Expect("device settings", 0, "nInterval=5\n");
  EXPECT_FALSE(FileExists(logger_ + L"/NAVI.DAT"));
  Expect("device --help", 0, "Usage: navmisc device");
}

TEST(DemoCommand, ReadsItsLoggerThroughTheProcess) {
  TempDir root;
  const CommandResult r = RunCommand(ShellQuote(NAVMISC_TOOL_PATH) + " demo " +
                                     ShellQuote(root.path().ToUtf8()) + " 2>&1 </dev/null");
  navmisc::RemovePerRootObjects(root.path());
  ASSERT_EQ(r.status, 0) << r.out;
  for (const char* shows : {"LOG/2024-05-03.nmea: 3060 points", "found: model 21, serial 4711",
                            " 2024-05-03                        1     3060 2024-05-03T07:30:05Z",
                            " 2024-05-04                        1     3060 2024-05-04T07:30:05Z"})
    EXPECT_NE(r.out.find(shows), std::string::npos) << shows << "\n" << r.out;
}

TEST(WhereCommand, FollowsTheReceiver) {
  if (!navmisc::testutil::HaveProgram("gpsfake") || !navmisc::testutil::HaveProgram("setsid"))
    GTEST_SKIP() << "gpsfake (Debian package gpsd-clients, with gpsd) is not installed";
  TempDir root;
  const int port = navmisc::testutil::FreePort();
  WriteFileBytes(root / L"GpsDataControl.ini",
                 "[DONGLE]\nHost=127.0.0.1\nPort=" + std::to_string(port) + "\n");
  navmisc::testutil::GpsFake gpsfake;
  ASSERT_TRUE(gpsfake.Start(port, NAVMISC_TEST_DATA_DIR "/dongle.nmea"));
  const CommandResult r = RunCommand("timeout 60 " + ShellQuote(NAVMISC_TOOL_PATH) + " --data-root " +
                                     ShellQuote(root.path().ToUtf8()) +
                                     " where follow --count 3 --seconds 30 2>&1 </dev/null");
  navmisc::RemovePerRootObjects(root.path());
  EXPECT_EQ(r.status, 0) << r.out;
  EXPECT_NE(r.out.find("Receiver connected."), std::string::npos) << r.out;
  // Three positions of the log, 2024-05-03 from 08:00 on, ten knots to the north-east.
  size_t lines = 0;
  for (size_t at = r.out.find("2024-05-03T08:00:"); at != std::string::npos;
       at = r.out.find("2024-05-03T08:00:", at + 1))
    ++lines;
  EXPECT_EQ(lines, 3u) << r.out;
  EXPECT_NE(r.out.find("18.5 km/h  course  45"), std::string::npos) << r.out;
  EXPECT_TRUE(FileExists(root / L"WhereRes/MAP_HTML/track_data.js"));
}

}  // namespace
