// `navmisc where follow`: the live position of the where-am-I receiver (gpsd), through the
// data-control process (docs/dongle.md).
#include <chrono>
#include <cstdio>
#include <memory>

#include <CLI/CLI.hpp>

#include "cli.h"
#include "device_channel.h"
#include "navmisc/datactrl/device_state.h"
#include "navmisc/platform/files.h"
#include "navmisc/records/trip.h"

namespace navmisc::cli {
namespace {

void PrintPosition(const s_gps_info& p) {
  std::printf("%s  %11.6f %11.6f  %7.1f m  %6.1f km/h  course %3d  sats %2d\n",
              TimeText(p.tTime).c_str(), p.dLatitude, p.dLongitude, p.dAltitude, p.nSpeed / 1000.0,
              p.nCourse, p.nSatellites);
  std::fflush(stdout);
}

void Follow(int count, double seconds) {
  DeviceChannel channel(GPS_APP_WHEREAMI);
  std::printf("Map page position: %s\n",
              PathJoin(GetAppDataFolder(GPS_APP_WHEREAMI), L"MAP_HTML/track_data.js").ToUtf8().c_str());
  const auto end = std::chrono::steady_clock::now() +
                   std::chrono::milliseconds(seconds > 0 ? static_cast<long>(seconds * 1000) : 0);
  // Positions already known belong to an earlier run.
  s_gps_info known{};
  int32_t lastTime = datactrl::ReadGpsInfo(known) ? known.tTime : 0;
  bool connected = !channel.connected();
  int shown = 0;
  for (;;) {
    if (channel.connected() != connected) {
      connected = channel.connected();
      std::printf(connected ? "Receiver connected.\n"
                            : "Waiting for a receiver through gpsd ([DONGLE] in GpsDataControl.ini)...\n");
      std::fflush(stdout);
    }
    s_gps_info position;
    if (datactrl::ReadGpsInfo(position) && position.tTime != lastTime && position.nFixQuality > 0) {
      lastTime = position.tTime;
      PrintPosition(position);
      if (++shown == count) return;
    }
    if (seconds > 0 && std::chrono::steady_clock::now() >= end) break;
    bool interrupted = false;
    channel.WaitFor([] { return false; }, 200, &interrupted);
    if (interrupted || channel.ended()) break;
  }
  if (shown == 0) Fail("no position came from the receiver");
}

}  // namespace

void AddWhereCommand(CLI::App& app) {
  CLI::App* group = app.add_subcommand("where", "the where-am-I receiver");
  group->require_subcommand(1);
  group->fallthrough();
  auto count = std::make_shared<int>(0);
  auto seconds = std::make_shared<double>(0);
  CLI::App* follow = AddCommand(
      *group, "follow", "show the live position and keep the map page's position script with it",
      "Runs until Ctrl-C, --count positions or --seconds. The receiver is read through gpsd:\n"
      "[DONGLE] Host and Port in GpsDataControl.ini of the data root (default localhost:2947).",
      [count, seconds] { Follow(*count, *seconds); });
  follow->add_option("--count", *count, "stop after this many positions")->check(CLI::PositiveNumber);
  follow->add_option("--seconds", *seconds, "stop after this long")->check(CLI::PositiveNumber);
}

}  // namespace navmisc::cli
