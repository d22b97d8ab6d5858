#include "where_position.h"

#include <memory>

#include "navmisc/platform/atomic_file.h"
#include "navmisc/platform/files.h"
#include "navmisc/platform/format.h"
#include "navmisc/platform/settings.h"
#include "navmisc/platform/shared_globals.h"
#include "navmisc/records/trip.h"
#include "navmisc/records/user_profile.h"

namespace gpsdc {
namespace {

constexpr const wchar_t* kStoreSection = L"SECTION";

CString StorePath() {
  return PathJoin(GetAppDataFolder(GPS_APP_WHEREAMI), L"WHERERES_INFO.INI");
}

// The held trip, when the store names one that reads.
std::unique_ptr<BLOG_ITEM_INFO> HeldTrip() {
  const unsigned long ini = RD_BEGIN(StorePath());
  if (!ini) return nullptr;
  const CString id = RD_STRING(ini, kStoreSection, L"whereiam_item_info");
  RD_END(ini);
  if (!IsPlainPathComponent(id)) return nullptr;
  auto trip = std::make_unique<BLOG_ITEM_INFO>(GPS_APP_WHEREAMI, id);
  return trip->ReadInfo() == 1 ? std::move(trip) : nullptr;
}

}  // namespace

std::string TrackDataScript(long time, double latitude, double longitude, double altitude,
                            double speed) {
  return navmisc::FormatA("track0 = [\n[%ld, %.6f, %.6f, %.3f, %.1f, 0, 0, 0]\n];", time,
                          latitude, longitude, altitude, speed * 0.001);
}

bool WherePosition::Prepare() {
  std::unique_ptr<BLOG_ITEM_INFO> trip = HeldTrip();
  if (!trip) {
    trip = std::make_unique<BLOG_ITEM_INFO>(GPS_APP_WHEREAMI);
    trip->WriteInfo(1, nullptr, nullptr);
    const unsigned long ini = WR_BEGIN(StorePath());
    WR_INT(ini, kStoreSection, L"whereiam_item_type", 0);
    WR_STRING(ini, kStoreSection, L"whereiam_item_info", trip->tripId);
    if (WR_END(ini) != 1) return false;
  }
  g_WhereMapInfo.ReadInfo();
  folder_ = trip->GetResourcePath();
  trackData_ = PathJoin(folder_, L"track_data.js");
  mapScript_ = PathJoin(g_szExecProgPath,
                        FormatString(L"Templates/%04d_%04d/js/gmap.js", g_WhereMapInfo.tempStyle,
                                     g_WhereMapInfo.tempMode));
  return true;
}

bool WherePosition::Write(long time, double longitude, double latitude, double altitude,
                          double speed) {
  if (trackData_.IsEmpty()) return false;
  const CString scripts = PathJoin(folder_, L"js");
  MakeDir(scripts);
  CopyFile(mapScript_, PathJoin(scripts, L"gmap.js"), false);
  // Replaced whole, so the map page never loads half a script.
  navmisc::AtomicFile file;
  return file.Open(trackData_) &&
         file.Write(TrackDataScript(time, latitude, longitude, altitude, speed)) && file.Commit();
}

}  // namespace gpsdc
