#include "navmisc/activity/where_store.h"

#include "navmisc/activity/store_file.h"
#include "navmisc/platform/atomic_file.h"
#include "navmisc/platform/files.h"
#include "navmisc/platform/format.h"
#include "navmisc/platform/settings.h"
#include "navmisc/platform/shared_globals.h"
#include "navmisc/records/trip.h"
#include "navmisc/records/user_profile.h"

namespace navmisc::activity {

std::string TrackDataScript(long time, double latitude, double longitude, double altitude, double speed) {
  return FormatA("track0 = [\n[%ld, %.6f, %.6f, %.3f, %.1f, 0, 0, 0]\n];", time, latitude, longitude, altitude,
                 speed * 0.001);
}

WhereStoreOpen OpenWhereStore(WHEREIAM_DATA_NODE& store, std::optional<WHERE_ITEM_TYPE> type) {
  if (store.ReadInfo(0, nullptr) == 1 && !store.readGuard.IsComplete()) return WhereStoreOpen::kUnreadable;
  if (store.item) return WhereStoreOpen::kReady;
  auto* trip = new BLOG_ITEM_INFO(GPS_APP_WHEREAMI, nullptr, 0);
  trip->name = L"Where am I";
  trip->fileName = trip->name;
  store.AddWhereItem(type.value_or(store.itemType), trip);
  return store.WriteInfo(true, 0, nullptr) ? WhereStoreOpen::kReady : WhereStoreOpen::kUnwritable;
}

}  // namespace navmisc::activity

WHEREIAM_DATA_NODE::~WHEREIAM_DATA_NODE() { delete item; }

WHEREIAM_DATA_NODE& WHEREIAM_DATA_NODE::operator=(const WHEREIAM_DATA_NODE& other) {
  if (this == &other) return *this;
  itemType = other.itemType;
  delete item;
  item = nullptr;
  if (other.item) {
    auto* trip = new BLOG_ITEM_INFO(GPS_APP_WHEREAMI, other.item->tripId, 0);
    if (trip->ReadInfo() == 1) item = trip;
    else delete trip;
  }
  return *this;
}

CString WHEREIAM_DATA_NODE::GetStorePathName() {
  return PathJoin(GetAppDataFolder(GPS_APP_WHEREAMI), L"WHERERES_INFO.INI");
}

CString WHEREIAM_DATA_NODE::GetMapScriptTemplatePathName() {
  return FormatString(L"%s/Templates/%04d_%04d/js/gmap.js", static_cast<const wchar_t*>(CString(g_szExecProgPath)),
                      g_WhereMapInfo.tempStyle, g_WhereMapInfo.tempMode);
}

CString WHEREIAM_DATA_NODE::GetTrackDataPathName() const {
  const CString folder = item ? item->GetResourcePath() : CString();
  return folder.IsEmpty() ? CString() : PathJoin(folder, L"track_data.js");
}

void WHEREIAM_DATA_NODE::AddWhereItem(WHERE_ITEM_TYPE type, BLOG_ITEM_INFO* trip) {
  if (item != trip) delete item;
  item = trip;
  itemType = type;
}

bool WHEREIAM_DATA_NODE::AddWhereItem(WHERE_ITEM_TYPE type, long time, double longitude, double latitude,
                                      double altitude, double speed) {
  itemType = type;
  const CString target = GetTrackDataPathName();
  if (target.IsEmpty()) return false;
  const CString folder = item->GetResourcePath();
  const CString scripts = PathJoin(folder, L"js");
  MakeDir(scripts);
  CopyFile(GetMapScriptTemplatePathName(), PathJoin(scripts, L"gmap.js"), false);

  navmisc::AtomicFile file;
  return file.Open(target) &&
         file.Write(navmisc::activity::TrackDataScript(time, latitude, longitude, altitude, speed)) && file.Commit();
}

int WHEREIAM_DATA_NODE::ReadInfo(unsigned long handle, const wchar_t* section) {
  readGuard.Begin();
  navmisc::activity::StoreFileReader file(handle, section, GetStorePathName());
  if (!file.ok()) return 0;
  const auto type = static_cast<WHERE_ITEM_TYPE>(RD_INT(file.handle(), file.section(), L"whereiam_item_type", 0));
  const CString id = RD_STRING(file.handle(), file.section(), L"whereiam_item_info", L"");
  if (!id.IsEmpty()) {
    auto* trip = IsPlainPathComponent(id) ? new BLOG_ITEM_INFO(GPS_APP_WHEREAMI, id, 0) : nullptr;
    if (trip && trip->ReadInfo() == 1) {
      AddWhereItem(type, trip);
    } else {
      delete trip;
      readGuard.Missed(L"the where-am-I trip \"" + id + L"\" cannot be read");
    }
  }
  readGuard.Finish();
  return 1;
}

bool WHEREIAM_DATA_NODE::WriteInfo(bool writeTrip, unsigned long handle, const wchar_t* section) {
  navmisc::activity::StoreFileWriter file(handle, section, GetStorePathName());
  if (!file.ok()) return false;
  if (item) {
    WR_INT(file.handle(), file.section(), L"whereiam_item_type", itemType);
    WR_STRING(file.handle(), file.section(), L"whereiam_item_info", item->tripId);
    if (writeTrip) item->WriteInfo(1, nullptr, nullptr);
  }
  return file.Finish();
}

void WHEREIAM_DATA_NODE::_FindAllUsedResource(CStringList& ids) {
  ids.RemoveAll();
  if (item) ids.AddTail(item->tripId);
}

int WHEREIAM_DATA_NODE::RemoveAllUnusedResource() {
  CStringList used;
  _FindAllUsedResource(used);
  // The ids name no folders here: every where-am-I trip lives in the one shared folder, which
  // must stay while a trip is held.
  if (item) used.AddTail(PathFileName(item->GetResourcePath()));
  return navmisc::RemoveUnusedResourceFolders(PathFolder(PathJoin(GetAppDataFolder(GPS_APP_WHEREAMI), L"dumy.file")),
                                              used, readGuard);
}
