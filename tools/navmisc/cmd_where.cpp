// `navmisc where set` writes a position into the where-am-I trip's map script; `navmisc where
// follow` shows the live position of the where-am-I receiver (gpsd) through the data-control
// process (docs/activity-stores.md, docs/dongle.md).
#include <chrono>
#include <cmath>
#include <cstdio>
#include <memory>
#include <string>

#include <CLI/CLI.hpp>

#include "activity_cli.h"
#include "cli.h"
#include "device_channel.h"
#include "navmisc/activity/where_store.h"
#include "navmisc/datactrl/device_state.h"
#include "navmisc/platform/datetime.h"
#include "navmisc/platform/files.h"
#include "navmisc/records/trip.h"

namespace navmisc::cli {
namespace {

struct PositionOptions {
  WherePosition position;
  std::string time;
};

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

std::string SetWherePosition(const WherePosition& p) {
  WHEREIAM_DATA_NODE store;
  const CString path = WHEREIAM_DATA_NODE::GetStorePathName();
  switch (navmisc::activity::OpenWhereStore(store, WHERE_ITEM_TYPE(p.type))) {
    case navmisc::activity::WhereStoreOpen::kReady: break;
    case navmisc::activity::WhereStoreOpen::kUnreadable:
      Fail("the trip named by " + path.ToUtf8() + " cannot be read; it stays as it is");
    case navmisc::activity::WhereStoreOpen::kUnwritable: Fail("cannot write " + path.ToUtf8());
  }
  const long time = p.time == -1 ? GetCurDateTime() : p.time;
  if (!store.AddWhereItem(WHERE_ITEM_TYPE(p.type), time, p.lon, p.lat, p.alt, p.speedKmh * 1000.0)) {
    Fail("cannot write " + store.GetTrackDataPathName().ToUtf8());
  }
  if (!store.WriteInfo(true, 0, nullptr)) Fail("cannot write " + path.ToUtf8());
  const CString map = WHEREIAM_DATA_NODE::GetMapScriptTemplatePathName();
  if (!FileExists(map)) {
    std::fprintf(stderr, "navmisc where: note: no map script %s for the profile's page template; js/gmap.js was not copied\n",
                 map.ToUtf8().c_str());
  }
  return store.GetTrackDataPathName().ToUtf8();
}

void AddWhereCommand(CLI::App& app) {
  CLI::App* group = AddCommand(app, "where", "the where-am-I position: set it, or follow the live receiver", "", [] {}, false);
  group->require_subcommand(1);
  auto o = std::make_shared<PositionOptions>();
  WherePosition* p = &o->position;
  CLI::App* set = AddCommand(
      *group, "set", "write the position script of the where-am-I trip",
      "Writes the position into track_data.js of the where-am-I trip (WhereRes/MAP_HTML, made\n"
      "when there is none yet) with a copy of the page template's map script, and records the\n"
      "trip in WhereRes/WHERERES_INFO.INI. docs/activity-stores.md describes both files.",
      [o] {
        o->position.time = o->time.empty() ? -1 : ParseTime(o->time);
        std::printf("%s\n", SetWherePosition(o->position).c_str());
      });
  set->add_option("--lat", p->lat, "latitude, degrees north")->required()->check(CLI::Range(-90.0, 90.0));
  set->add_option("--lon", p->lon, "longitude, degrees east")->required()->check(CLI::Range(-180.0, 180.0));
  set->add_option("--alt", p->alt, "altitude, metres (default 0)");
  set->add_option("--speed", p->speedKmh, "speed, km/h (default 0)")->check(CLI::Range(0.0, 2000000.0));
  set->add_option("--time", o->time, "the time of the position (default now)")->option_text("TIME");
  set->add_option("--type", p->type, "the kind of item, kept for the application (default 0)");

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
