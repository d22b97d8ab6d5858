// The working copy of a track point on which all geometry, cleaning and mapping runs, and the
// one builder that turns a track's point list into an array of them.
#pragma once

#include <cstdint>
#include <memory>

#include "navmisc/platform/lists.h"

// Arrays of this record are walked record by record by code that expects no padding between
// fields, so the record is byte-packed. Read its fields by value: a reference or pointer to a
// packed double may be misaligned.
#pragma pack(push, 1)
struct sWayPoint {
  double latitude = 0.0;   // degrees, north positive
  double longitude = 0.0;  // degrees, east positive
  double altitude = 0.0;   // metres
  int32_t speed = 0;       // the logger's speed, metres per hour
  int32_t time = -1;       // seconds since 1970
  uint8_t valid = 0;       // 1 = the point stays; the cleaning passes clear it to drop a point
  int32_t extraA = 0;      // carried along from the point record, not interpreted here
};
#pragma pack(pop)

static_assert(sizeof(sWayPoint) == 8 * 3 + 4 + 4 + 1 + 4, "sWayPoint must stay packed");

class WAYPOINT_ITEM_INFO;

// The working record of one point: its position, altitude, speed, time and extra value A, with
// `valid` set.
sWayPoint ToWayPoint(const WAYPOINT_ITEM_INFO& point);

// Builds the working array of `points` (WAYPOINT_ITEM_INFO*, in list order): exactly
// points.GetCount() records, one per non-null entry in order with `valid` set; null entries are
// skipped, so the array ends with that many default records (valid 0). Returns null for an empty
// list. The caller owns the array and frees it with delete[].
sWayPoint* CreateWayPointArray(const CPtrList& points);

namespace navmisc {

struct WayPointArrayDeleter {
  void operator()(sWayPoint* p) const { delete[] p; }
};
using WayPointArray = std::unique_ptr<sWayPoint[], WayPointArrayDeleter>;

// The same array as CreateWayPointArray, owned by a smart pointer.
inline WayPointArray MakeWayPointArray(const CPtrList& points) {
  return WayPointArray(CreateWayPointArray(points));
}

}  // namespace navmisc
