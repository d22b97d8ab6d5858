// The logger side of GpsDataControl.exe ("/Tracer"), through the real process: finding the
// logger, reading its logs into trips, stopping a read, losing the logger, clearing.
#include <gtest/gtest.h>
#include <stdlib.h>
#include <unistd.h>

#include <algorithm>
#include <string>
#include <vector>

#include "channel_harness.h"
#include "logger_folder.h"
#include "navmisc/datactrl/dc_errors.h"
#include "navmisc/datactrl/device_commands.h"
#include "navmisc/datactrl/device_errors.h"
#include "navmisc/datactrl/device_state.h"
#include "navmisc/import/import_errors.h"
#include "navmisc/platform/files.h"
#include "navmisc/records/trip.h"
#include "navmisc/records/trip_tree.h"
#include "testutil.h"

namespace {

using navmisc::testutil::ChannelRun;
using navmisc::testutil::MakeLogger;
using navmisc::testutil::SyntheticGpx;
using navmisc::testutil::TempDir;
using navmisc::testutil::Until;
using navmisc::testutil::WriteFileBytes;

constexpr long kDay1 = 1714723200;  // 2024-05-03T08:00:00Z
constexpr long kDay2 = kDay1 + 86400;

// The trips of the trip tree: name and point count.
std::vector<std::pair<std::wstring, long>> TreeTrips() {
  std::vector<std::pair<std::wstring, long>> out;
  BLOG_TREE_NODE tree(nullptr);
  if (tree.ReadInfo(0, nullptr) != 1) return out;
  for (auto* trip : navmisc::Items<BLOG_ITEM_INFO>(tree.trips)) {
    trip->ReadAllWaypoint(1);
    long total = 0, kept = 0;
    trip->GetTrackInfo(total, kept);
    out.emplace_back(trip->name.str(), total);
  }
  return out;
}

// Folders in the trip application's data folder (trips, whole or not).
int TripFolders() {
  CStringList names;
  const int n = GetContent(GetAppDataFolder(GPS_APP_TRIP), L"*", names);
  int folders = 0;
  for (POSITION pos = names.GetHeadPosition(); pos;)
    folders += IsDirectory(PathJoin(GetAppDataFolder(GPS_APP_TRIP), names.GetNext(pos)));
  return n < 0 ? 0 : folders;
}

class Tracer : public ::testing::Test {
 protected:
  void SetUp() override {
    logger_ = run_.Path(L"logger");
    MakeLogger(logger_, 1, 501);
    run_.Configure("[DEVICE]\nPath=" + logger_.ToUtf8() + "\n");
  }
  void Log(const wchar_t* name, const std::string& text) {
    WriteFileBytes(PathJoin(PathJoin(logger_, L"LOG"), name), text);
  }
  const CDataControlCmdBlkKVDevice& Await(int32_t cmd, size_t n = 1) {
    EXPECT_TRUE(Until([&] { return run_.log().Devices(cmd).size() >= n; }, 60000)) << cmd;
    static CDataControlCmdBlkKVDevice none{};
    const auto replies = run_.log().Devices(cmd);
    last_ = replies.size() >= n ? replies[n - 1] : none;
    return last_;
  }

  ChannelRun run_;
  CString logger_;
  CDataControlCmdBlkKVDevice last_{};
};

TEST_F(Tracer, ReadTurnsEachLogIntoATripAndClearsOnlyWhatWasRead) {
  Log(L"2024-05-03.gpx", SyntheticGpx(kDay1, 1500));
  Log(L"2024-05-04.GPX", SyntheticGpx(kDay2, 40));
  Log(L"empty.nmea", "");
  Log(L"notes.txt", "not a log");
  ASSERT_EQ(::symlink("/etc/hostname", (logger_ + L"/LOG/outside.gpx").ToUtf8().c_str()), 0);
  run_.Start();
  ASSERT_TRUE(Until([] { return g_bDeviceConnected; }));
  EXPECT_EQ(std::tuple(g_wDeviceModelID, g_wDeviceSerialID, g_dDeviceVersion, g_lTotolMemory),
            std::tuple(uint16_t{1}, 501, 7.02, 16384));
  EXPECT_STREQ(g_szDeviceId, "SN:0100000501");
  EXPECT_GT(g_lUsedMemory, 100);

  // With clear-after-download set, no log may go before it was read.
  g_bClearLog = true;
  DC_KVDEVICE_ClearLogData();
  EXPECT_EQ(Await(DC_DEVICE_CLEAR_LOG).nLastError, DC_ERR_LOG_NOT_READ);
  EXPECT_TRUE(FileExists(logger_ + L"/LOG/2024-05-03.gpx"));

  DC_KVDEVICE_ReadLogData();
  const CDataControlCmdBlkKVDevice& read = Await(DC_DEVICE_READ_LOG);
  ASSERT_EQ(read.nLastError, 0);
  EXPECT_EQ(CovertOleDateTimeToTimeT(read.tPointStartTime), kDay1);
  EXPECT_EQ(CovertOleDateTimeToTimeT(read.tPointEndTime), kDay2 + 39);
  // One trip per log, named after it.
  EXPECT_EQ(TreeTrips(),
            (std::vector<std::pair<std::wstring, long>>{{L"2024-05-03", 1500}, {L"2024-05-04", 40}}));
  // Progress for each log (three of them) and each thousand points, ending complete.
  const auto& progress = run_.log().progress;
  ASSERT_GE(progress.size(), 4u);
  for (const auto& p : progress) EXPECT_EQ(std::pair(p.nSource, p.nTotalOfDatabaseProcess), std::pair(1, 3));
  EXPECT_EQ(progress.back().nProcessed, progress.back().nTotalOfProcess);
  EXPECT_EQ(progress.back().nDatabaseProcessed, 3);
  // The read logs are gone, the rest stays.
  EXPECT_FALSE(FileExists(logger_ + L"/LOG/2024-05-03.gpx"));
  EXPECT_FALSE(FileExists(logger_ + L"/LOG/empty.nmea"));
  EXPECT_TRUE(FileExists(logger_ + L"/LOG/notes.txt"));
  EXPECT_EQ(PathStatus(logger_ + L"/LOG/outside.gpx"), 0);
  EXPECT_TRUE(FileExists(L"/etc/hostname"));

  // A new log, not read yet, blocks the clear; once read, the clear goes.
  Log(L"2024-05-05.gpx", SyntheticGpx(kDay2 + 86400, 10));
  DC_KVDEVICE_ClearLogData();
  EXPECT_EQ(Await(DC_DEVICE_CLEAR_LOG, 2).nLastError, DC_ERR_LOG_NOT_READ);
  g_bClearLog = false;
  DC_KVDEVICE_ReadLogData();
  EXPECT_EQ(Await(DC_DEVICE_READ_LOG, 2).nLastError, 0);
  EXPECT_TRUE(FileExists(logger_ + L"/LOG/2024-05-05.gpx"));
  g_bClearLog = true;
  DC_KVDEVICE_ClearLogData();
  EXPECT_EQ(Await(DC_DEVICE_CLEAR_LOG, 3).nLastError, 0);
  EXPECT_FALSE(FileExists(logger_ + L"/LOG/2024-05-05.gpx"));
  EXPECT_EQ(TreeTrips().size(), 3u);
}

TEST_F(Tracer, ABrokenLogFailsTheWholeReadAndKeepsEveryLog) {
  Log(L"a.gpx", SyntheticGpx(kDay1, 20));
  Log(L"b.gpx", "<gpx><trk><trkseg><trkpt lat=\"91\" lon=\"0\"></trkpt></trkseg></trk></gpx>");
  g_bClearLog = true;
  run_.Start();
  DC_KVDEVICE_ReadLogData();
  EXPECT_EQ(Await(DC_DEVICE_READ_LOG).nLastError, DC_ERR_IMPORT_VALUE);
  EXPECT_EQ(TripFolders(), 0);
  EXPECT_TRUE(TreeTrips().empty());
  EXPECT_TRUE(FileExists(logger_ + L"/LOG/a.gpx"));
  EXPECT_TRUE(FileExists(logger_ + L"/LOG/b.gpx"));
}

TEST_F(Tracer, CancelStopsTheReadBetweenPointsAndLeavesNoTrip) {
  Log(L"a.gpx", SyntheticGpx(kDay1, 30));
  Log(L"b.gpx", SyntheticGpx(kDay2, 200000));
  g_bClearLog = true;
  run_.Start();
  bool asked = false;
  // Half way: once the long log has begun.
  run_.log().onReply = [&](const CDataControlCmdBlk& block) {
    const auto& p = static_cast<const CDataControlProgressCmdBlk&>(block);
    if (block.nCmdType == DC_CMD_PROGRESS && p.nDatabaseProcessed == 1 && p.nProcessed > 1 && !asked) {
      asked = true;
      DC_KVDEVICE_CancelRead();
    }
  };
  DC_KVDEVICE_ReadLogData();
  EXPECT_EQ(Await(DC_DEVICE_READ_LOG).nLastError, DC_ERR_IMPORT_CANCELLED);
  EXPECT_TRUE(asked);
  // The cancel has its own answer, after the read.
  EXPECT_EQ(Await(DC_DEVICE_CANCEL_READ).nLastError, 0);
  EXPECT_LT(run_.log().progress.back().nProcessed, run_.log().progress.back().nTotalOfProcess);
  EXPECT_EQ(TripFolders(), 0);
  EXPECT_TRUE(TreeTrips().empty());
  EXPECT_TRUE(FileExists(logger_ + L"/LOG/a.gpx"));
  EXPECT_TRUE(FileExists(logger_ + L"/LOG/b.gpx"));
}

TEST_F(Tracer, ALoggerUnpluggedDuringAReadLeavesNoTripAndIsAnnounced) {
  Log(L"a.gpx", SyntheticGpx(kDay1, 200000));
  run_.Start();
  ASSERT_TRUE(Until([] { return g_bDeviceConnected; }));
  run_.log().onReply = [&](const CDataControlCmdBlk& block) {
    if (block.nCmdType == DC_CMD_PROGRESS &&
        static_cast<const CDataControlProgressCmdBlk&>(block).nProcessed > 1 && FileExists(logger_))
      RemoveDir(logger_);
  };
  DC_KVDEVICE_ReadLogData();
  EXPECT_EQ(Await(DC_DEVICE_READ_LOG).nLastError, DC_ERR_DEVICE_GONE);
  EXPECT_EQ(TripFolders(), 0);
  EXPECT_TRUE(TreeTrips().empty());
  // The watcher tells the application, and the shared state follows.
  ASSERT_TRUE(Until([&] {
    const auto& s = run_.log().statuses;
    return !s.empty() && s.back().nSource == 1 && !s.back().bConnected;
  }));
  EXPECT_FALSE(g_bDeviceConnected);
  EXPECT_EQ(g_wDeviceModelID, 0);
  DC_KVDEVICE_ReadSetting();
  EXPECT_EQ(Await(DC_DEVICE_READ_SETTING).nLastError, DC_ERR_NO_DEVICE);
}

TEST(LoggerSearch, NamedFolderConfiguredPathThenMountedVolumes) {
  TempDir dir;
  const CString named = dir / L"named", configured = dir / L"configured", mounted = dir / L"usb stick";
  for (const CString& d : {named, configured, mounted}) MakeLogger(d, 4, 1);
  ASSERT_TRUE(MakeDir(dir / L"plain"));
  const std::string escaped = (dir / L"usb\\040stick").ToUtf8();
  WriteFileBytes(dir / L"mounts",
                 "proc /proc proc rw 0 0\n"
                 "/dev/sdb1 " + (dir / L"plain").ToUtf8() + " vfat rw 0 0\n"
                 "/dev/sdc1 " + named.ToUtf8() + " ext4 rw 0 0\n"
                 "/dev/sdd1 " + escaped + " vfat rw,nosuid 0 0\n");
  const std::string mounts = (dir / L"mounts").ToUtf8();
  ::unsetenv(gpsdc::kLoggerVariable);
  gpsdc::Config config;
  // Mounted volumes: removable file systems only (ext4 outside /media is not looked at).
  EXPECT_EQ(gpsdc::FindLogger(config, mounts.c_str()), mounted);
  config.devicePath = configured;
  EXPECT_EQ(gpsdc::FindLogger(config, mounts.c_str()), configured);
  ::setenv(gpsdc::kLoggerVariable, named.ToUtf8().c_str(), 1);
  EXPECT_EQ(gpsdc::FindLogger(config, mounts.c_str()), named);
  // A named folder that is no logger is no logger; nothing else is searched.
  ::setenv(gpsdc::kLoggerVariable, (dir / L"plain").ToUtf8().c_str(), 1);
  EXPECT_EQ(gpsdc::FindLogger(config, mounts.c_str()), L"");
  ::unsetenv(gpsdc::kLoggerVariable);
  config.devicePath = dir / L"missing";
  EXPECT_EQ(gpsdc::FindLogger(config, mounts.c_str()), L"");
}

TEST(LoggerFolder, SettingsKeepTheIdentityAndFactoryValuesStandInForBadOnes) {
  TempDir dir;
  MakeLogger(dir.path(), 18, 7,
             "Identity=M:0018-IMEI:356789\n[SETTINGS]\nnInterval=oops\nnVsleep=30\nbAccOn=0\n"
             "[KV11]\nSERVER_PORT=99999999999\nNAME=Tracker\n");
  gpsdc::LoggerFolder logger;
  ASSERT_TRUE(logger.Open(dir.path()));
  EXPECT_EQ(logger.identity().identity, L"SN:18356789");
  CDataControlCmdBlkKVDevice device;
  logger.ReadSettings(device);
  EXPECT_EQ(std::tuple(device.nInterval, device.nVsleep, device.bAccOn, device.bEnableLED),
            std::tuple(5, 30, uint8_t{0}, uint8_t{1}));
  auto kv11 = std::make_unique<CDataControlCmdBlkKVDevice11>();
  logger.ReadSettings(*kv11);
  EXPECT_EQ(std::tuple(kv11->SERVER_PORT, std::string(kv11->NAME)), std::tuple(8018, std::string("Tracker")));

  device.nInterval = 60;
  ASSERT_TRUE(logger.WriteSettings(device));
  gpsdc::LoggerFolder again;
  ASSERT_TRUE(again.Open(dir.path()));
  EXPECT_EQ(again.identity().identity, L"SN:18356789");
  again.ReadSettings(device);
  again.ReadSettings(*kv11);
  EXPECT_EQ(std::tuple(device.nInterval, std::string(kv11->NAME)), std::tuple(60, std::string("Tracker")));

  // A folder without a description file, or one without a model code, is no logger.
  EXPECT_FALSE(gpsdc::LoggerFolder().Open(dir / L"LOG"));
  WriteFileBytes(dir / L"GPSLOGGER.INI", "[LOGGER]\nSerial=3\n");
  EXPECT_FALSE(gpsdc::LoggerFolder().Open(dir.path()));
}

}  // namespace
