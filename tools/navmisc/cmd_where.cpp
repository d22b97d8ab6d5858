#include <cmath>
#include <cstdio>
#include <memory>
#include <string>

#include <CLI/CLI.hpp>

#include "activity_cli.h"
#include "cli.h"
#include "navmisc/activity/where_store.h"
#include "navmisc/platform/datetime.h"
#include "navmisc/platform/files.h"
#include "navmisc/records/trip.h"

namespace navmisc::cli {
namespace {

struct PositionOptions {
  WherePosition position;
  std::string time;
};

}  // namespace

std::string SetWherePosition(const WherePosition& p) {
  WHEREIAM_DATA_NODE store;
  const CString path = WHEREIAM_DATA_NODE::GetStorePathName();
  if (store.ReadInfo(0, nullptr) == 1 && !store.readGuard.IsComplete()) {
    Fail("the trip named by " + path.ToUtf8() + " cannot be read; it stays as it is");
  }
  if (!store.item) {
    auto* trip = new BLOG_ITEM_INFO(GPS_APP_WHEREAMI, nullptr, 0);
    trip->name = L"Where am I";
    trip->fileName = trip->name;
    store.AddWhereItem(WHERE_ITEM_TYPE(p.type), trip);
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
  CLI::App* group = AddCommand(app, "where", "the where-am-I position: set", "", [] {}, false);
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
}

}  // namespace navmisc::cli
