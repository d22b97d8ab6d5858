#include "where_position.h"

#include "navmisc/records/trip.h"
#include "navmisc/records/user_profile.h"

namespace gpsdc {

bool WherePosition::Prepare() {
  auto store = std::make_unique<WHEREIAM_DATA_NODE>();
  // A store that names a trip which does not read is left for the user to repair: replacing it
  // would leave that trip's folder to the next clean-up.
  if (store->ReadInfo(0, nullptr) == 1 && !store->readGuard.IsComplete()) return false;
  if (!store->item) {
    auto* trip = new BLOG_ITEM_INFO(GPS_APP_WHEREAMI, nullptr, 0);
    trip->name = L"Where am I";
    trip->fileName = trip->name;
    store->AddWhereItem(store->itemType, trip);
    if (!store->WriteInfo(true, 0, nullptr)) return false;
  }
  // The map script follows the where-am-I profile's page template.
  g_WhereMapInfo.ReadInfo();
  store_ = std::move(store);
  return true;
}

bool WherePosition::Write(long time, double longitude, double latitude, double altitude, double speed) {
  return store_ && store_->AddWhereItem(store_->itemType, time, longitude, latitude, altitude, speed);
}

}  // namespace gpsdc
