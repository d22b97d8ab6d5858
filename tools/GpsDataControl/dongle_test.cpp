// The where-am-I receiver ("/Dongle") through gpsd: gpsfake replays an NMEA log on a private
// port, the real process follows it.
#include <gtest/gtest.h>
#include <unistd.h>

#include <cmath>
#include <cstdio>
#include <string>

#include "channel_harness.h"
#include "navmisc/datactrl/dc_errors.h"
#include "navmisc/datactrl/device_commands.h"
#include "navmisc/datactrl/device_state.h"
#include "navmisc/platform/files.h"
#include "navmisc/platform/settings.h"
#include "navmisc/platform/shared_globals.h"
#include "navmisc/records/trip.h"
#include "testutil.h"

namespace {

using navmisc::testutil::ChannelRun;
using navmisc::testutil::FreePort;
using navmisc::testutil::GpsFake;
using navmisc::testutil::ReadFileBytes;
using navmisc::testutil::TempDir;
using navmisc::testutil::Until;
using navmisc::testutil::WriteFileBytes;

constexpr long kLogStart = 1714723200;  // 2024-05-03T08:00:00Z, the log's first fix

bool LastDeviceStatus(const ChannelRun& run, bool connected) {
  for (auto it = run.log().statuses.rbegin(); it != run.log().statuses.rend(); ++it)
    if (it->nSource == DC_SOURCE_DEVICE) return it->bConnected == connected;
  return false;
}

TEST(Dongle, FollowsTheReceiverThroughGpsd) {
  if (!navmisc::testutil::HaveProgram("gpsfake") || !navmisc::testutil::HaveProgram("setsid"))
    GTEST_SKIP() << "gpsfake (Debian package gpsd-clients, with gpsd) is not installed";
  ChannelRun run(GPS_APP_WHEREAMI);
  // The program folder with the map page's script template of the where-am-I profile (style 2,
  // mode 1 by default) beside the process.
  TempDir program;
  ASSERT_EQ(::symlink(NAVMISC_TOOLS_DIR "/GpsDataControl.exe",
                      (program / L"GpsDataControl.exe").ToUtf8().c_str()), 0);
  ASSERT_TRUE(MakeDir(program / L"Templates/0002_0001/js"));
  WriteFileBytes(program / L"Templates/0002_0001/js/gmap.js", "// map page\n");
  navmisc::SetSharedText(g_szExecProgPath, program.path());

  const int port = FreePort();
  run.Configure("[DONGLE]\nHost=127.0.0.1\nPort=" + std::to_string(port) + "\n");
  GpsFake gpsfake;
  ASSERT_TRUE(gpsfake.Start(port, NAVMISC_TEST_DATA_DIR "/dongle.nmea"));
  run.Start();

  // The receiver comes, and the shared state follows its fixes.
  ASSERT_TRUE(Until([&] { return LastDeviceStatus(run, true); }, 30000));
  EXPECT_TRUE(g_bDeviceConnected);
  // gpsd's first report of a stream may be a 2D fix without altitude; two seconds on it reports
  // whole fixes.
  s_gps_info first{}, fix{};
  ASSERT_TRUE(Until([&] { return navmisc::datactrl::ReadGpsInfo(first); }, 30000));
  ASSERT_TRUE(Until([&] { return navmisc::datactrl::ReadGpsInfo(fix) && fix.tTime >= first.tTime + 2; }, 30000));
  const long k = fix.tTime - kLogStart;
  ASSERT_GE(k, 0);
  ASSERT_LT(k, 60);
  EXPECT_NEAR(fix.dLatitude, 47.0 + k * 1e-4, 1e-6);
  EXPECT_NEAR(fix.dLongitude, 8.0 + k * 1e-4, 1e-6);
  EXPECT_NEAR(fix.dAltitude, 400.0 + k % 10, 0.01);
  EXPECT_NEAR(fix.nSpeed, 18520, 5);  // 10 knots in metres per hour
  EXPECT_EQ(fix.nCourse, 45);
  EXPECT_GT(fix.nFixQuality, 0);
  EXPECT_STRNE(g_szDeviceId, "");

  // The where-am-I store holds a trip whose map page follows the position.
  const CString page = PathJoin(GetAppDataFolder(GPS_APP_WHEREAMI), L"MAP_HTML");
  ASSERT_TRUE(Until([&] { return FileExists(PathJoin(page, L"track_data.js")); }, 30000));
  const unsigned long store = RD_BEGIN(PathJoin(GetAppDataFolder(GPS_APP_WHEREAMI), L"WHERERES_INFO.INI"));
  ASSERT_NE(store, 0u);
  EXPECT_FALSE(RD_STRING(store, L"SECTION", L"whereiam_item_info").IsEmpty());
  RD_END(store);
  EXPECT_EQ(ReadFileBytes(PathJoin(page, L"js/gmap.js")), "// map page\n");
  long time = 0;
  double lat = 0, lon = 0, alt = 0, kmh = 0;
  const std::string script = ReadFileBytes(PathJoin(page, L"track_data.js"));
  ASSERT_EQ(std::sscanf(script.c_str(), "track0 = [\n[%ld, %lf, %lf, %lf, %lf, 0, 0, 0]\n];", &time, &lat,
                        &lon, &alt, &kmh), 5) << script;
  EXPECT_NEAR(lat, 47.0 + (time - kLogStart) * 1e-4, 1e-6);
  EXPECT_NEAR(lon, 8.0 + (time - kLogStart) * 1e-4, 1e-6);
  EXPECT_NEAR(kmh, 18.5, 0.05);
  EXPECT_EQ(script.substr(script.size() - 13), ", 0, 0, 0]\n];");

  // A receiver keeps no log and no settings.
  DC_KVDEVICE_ReadLogData();
  ASSERT_TRUE(Until([&] { return !run.log().devices.empty(); }));
  EXPECT_EQ(run.log().devices[0].nLastError, DC_ERR_NOT_AVAILABLE);

  // gpsd goes: so does the receiver.
  gpsfake.Stop();
  ASSERT_TRUE(Until([&] { return LastDeviceStatus(run, false); }, 30000));
  EXPECT_FALSE(g_bDeviceConnected);
}

}  // namespace
