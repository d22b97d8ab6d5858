#include "navmisc/geo/waypoint_array.h"

#include "navmisc/records/items.h"

sWayPoint* CreateWayPointArray(const CPtrList& points) {
  const int count = points.GetCount();
  if (count <= 0) return nullptr;
  sWayPoint* array = new sWayPoint[static_cast<size_t>(count)];
  int k = 0;
  for (const WAYPOINT_ITEM_INFO* p : navmisc::Items<const WAYPOINT_ITEM_INFO>(points)) {
    if (p) array[k++] = ToWayPoint(*p);
  }
  return array;
}

sWayPoint ToWayPoint(const WAYPOINT_ITEM_INFO& p) {
  sWayPoint w;
  w.latitude = p.latitude;
  w.longitude = p.longitude;
  w.altitude = p.altitude;
  w.speed = p.speed;
  w.time = p.time;
  w.extraA = p.extraA;
  w.valid = 1;
  return w;
}
