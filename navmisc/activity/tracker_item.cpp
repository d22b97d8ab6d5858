#include "navmisc/activity/tracker_item.h"

#include "navmisc/records/user_profile.h"

_TrackerItem::_TrackerItem(int32_t type, BLOG_ITEM_INFO* trip) : ActivityItem(type, trip, &g_TrackerMapInfo) {}

long _TrackerItem::GetTotalCalorie() {
  return _GetCalorie(whole.movingTime, whole.avgSpeed * 0.001, whole.duration - whole.movingTime);
}

long _TrackerItem::GetSelectedCalorie() {
  return _GetCalorie(selected.movingTime, selected.avgSpeed * 0.001, selected.duration - selected.movingTime);
}

long _TrackerItem::_GetCalorie(long, double, long) { return 0; }
