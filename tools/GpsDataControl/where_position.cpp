#include "where_position.h"

#include "navmisc/activity/where_store.h"
#include "navmisc/records/user_profile.h"

namespace gpsdc {

bool WherePosition::Prepare() {
  auto store = std::make_unique<WHEREIAM_DATA_NODE>();
  if (navmisc::activity::OpenWhereStore(*store) != navmisc::activity::WhereStoreOpen::kReady) return false;
  // The map script follows the where-am-I profile's page template.
  g_WhereMapInfo.ReadInfo();
  store_ = std::move(store);
  return true;
}

bool WherePosition::Write(long time, double longitude, double latitude, double altitude, double speed) {
  return store_ && store_->AddWhereItem(store_->itemType, time, longitude, latitude, altitude, speed);
}

}  // namespace gpsdc
