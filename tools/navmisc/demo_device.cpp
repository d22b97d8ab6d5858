// The demo's logger: a folder that looks like a logger mounted as USB storage, with two days of
// NMEA 0183 logs, read into trips through the data-control process like a real one.
#include <cmath>
#include <cstdio>
#include <string>

#include "cli.h"
#include "device_channel.h"
#include "listing.h"
#include "navmisc/datactrl/device_commands.h"
#include "navmisc/datactrl/device_state.h"
#include "navmisc/platform/atomic_file.h"
#include "navmisc/platform/datetime.h"
#include "navmisc/platform/files.h"
#include "navmisc/platform/format.h"
#include "navmisc/records/trip.h"
#include "navmisc/records/trip_tree.h"
#include "synthetic.h"

namespace navmisc::cli {
namespace {

// "$BODY*HH\r\n" with the checksum of BODY.
std::string Sentence(const std::string& body) {
  unsigned char sum = 0;
  for (char c : body) sum ^= static_cast<unsigned char>(c);
  return FormatA("$%s*%02X\r\n", body.c_str(), sum);
}

// Degrees as NMEA writes them: degrees and decimal minutes, then the hemisphere.
std::string Angle(double value, int degreeDigits, char positive, char negative) {
  const double a = std::fabs(value);
  const int degrees = static_cast<int>(a);
  return FormatA("%0*d%07.4f,%c", degreeDigits, degrees, (a - degrees) * 60.0,
                 value < 0 ? negative : positive);
}

// The RMC and GGA sentences of each point.
std::string NmeaLog(const TRACK_ITEM_INFO& track) {
  std::string log;
  for (const auto* p : Items<WAYPOINT_ITEM_INFO>(track.points)) {
    int y, mo, d, h, mi, s;
    GetDateTimeInfo(p->time, y, mo, d, h, mi, s);
    const std::string time = FormatA("%02d%02d%02d", h, mi, s);
    const std::string position = Angle(p->latitude, 2, 'N', 'S') + "," + Angle(p->longitude, 3, 'E', 'W');
    log += Sentence(FormatA("GPRMC,%s,A,%s,%.1f,%d,%02d%02d%02d,,", time.c_str(), position.c_str(),
                            p->speed / 1852.0, p->course, d, mo, y % 100));
    log += Sentence(FormatA("GPGGA,%s,%s,1,09,0.9,%.1f,M,48.0,M,,", time.c_str(), position.c_str(),
                            p->altitude));
  }
  return log;
}

bool WriteFile(const CString& path, const std::string& bytes) {
  AtomicFile file;
  return file.Open(path) && file.Write(bytes) && file.Commit();
}

}  // namespace

void DemoDevice(const std::string& root) {
  const CString logger = PathJoin(CString::FromUtf8(root), L"demo-logger");
  std::printf("\nA logger (a folder as a logger mounts over USB): %s\n", logger.ToUtf8().c_str());
  if (!MakeDir(PathJoin(logger, L"LOG")) ||
      !WriteFile(PathJoin(logger, L"GPSLOGGER.INI"),
                 "[LOGGER]\nModel=21\nSerial=4711\nFirmware=7.02\nTotalMemory=8192\n"))
    Fail("cannot make the demo logger in " + logger.ToUtf8());
  const int32_t day = static_cast<int32_t>(DateTimeToLong(5, 3, 2024, 7, 30, 0));
  for (int i = 0; i < 2; ++i) {
    TRACK_ITEM_INFO track(nullptr);
    synthetic::AddHike(track, 21 + i, day + i * 86400);
    const CString name = FormatString(L"LOG/2024-05-%02d.nmea", 3 + i);
    if (!WriteFile(PathJoin(logger, name), NmeaLog(track))) Fail("cannot write " + name.ToUtf8());
    std::printf("  %s: %d points\n", name.ToUtf8().c_str(), track.points.GetCount());
  }

  DeviceChannel channel(GPS_APP_TRIP, logger.ToUtf8());
  if (!channel.connected()) Fail("the data-control process does not see the demo logger");
  std::printf("  found: model %d, serial %d, %d KiB of %d KiB in use\n", g_wDeviceModelID,
              g_wDeviceSerialID, g_lUsedMemory, g_lTotolMemory);
  channel.Request(DC_DEVICE_READ_LOG, [] { DC_KVDEVICE_ReadLogData(); });
  channel.WaitDeviceReply();
  if (channel.lastError() != 0) Fail("reading the demo logger: " + DeviceErrorMessage(channel.lastError()));
  std::printf("  read: points from %s to %s\n",
              TimeText(CovertOleDateTimeToTimeT(channel.deviceReply().tPointStartTime)).c_str(),
              TimeText(CovertOleDateTimeToTimeT(channel.deviceReply().tPointEndTime)).c_str());
  std::puts("\nTrips, with the logger's:");
  BLOG_TREE_NODE tree(nullptr);
  if (tree.ReadInfo(0, nullptr) != 1) Fail("the trip tree cannot be read after the logger's trips");
  PrintTree(stdout, tree);
}

}  // namespace navmisc::cli
