#include "navmisc/records/items.h"

#include <algorithm>

// ---- BASE_ITEM_INFO ---------------------------------------------------------

BASE_ITEM_INFO::BASE_ITEM_INFO(const BASE_ITEM_INFO* from) {
  if (!from) return;
  // The last attribute is deliberately left alone here: only full copies carry it.
  time = from->time;
  longitude = from->longitude;
  latitude = from->latitude;
  name = from->name;
  attr1 = from->attr1;
  attr2 = from->attr2;
  reserve = from->reserve;
  smallAttr = from->smallAttr;
}

BASE_ITEM_INFO::BASE_ITEM_INFO(const BASE_ITEM_INFO& other) : BASE_ITEM_INFO(&other) {
  lastAttr = other.lastAttr;
}

BASE_ITEM_INFO& BASE_ITEM_INFO::operator=(const BASE_ITEM_INFO& other) {
  if (this == &other) return *this;
  time = other.time;
  longitude = other.longitude;
  latitude = other.latitude;
  name = other.name;
  attr1 = other.attr1;
  attr2 = other.attr2;
  reserve = other.reserve;
  smallAttr = other.smallAttr;
  lastAttr = other.lastAttr;
  return *this;
}

BASE_ITEM_INFO::~BASE_ITEM_INFO() = default;

// ---- WAYPOINT_ITEM_INFO -----------------------------------------------------

WAYPOINT_ITEM_INFO::WAYPOINT_ITEM_INFO(const WAYPOINT_ITEM_INFO* from) : BASE_ITEM_INFO(from) {
  if (from) CopyFrom(*from);
  else reserve = -2.0;
}

WAYPOINT_ITEM_INFO::WAYPOINT_ITEM_INFO(const WAYPOINT_ITEM_INFO& other) : BASE_ITEM_INFO(other) {
  CopyFrom(other);
}

WAYPOINT_ITEM_INFO& WAYPOINT_ITEM_INFO::operator=(const WAYPOINT_ITEM_INFO& other) {
  if (this == &other) return *this;
  BASE_ITEM_INFO::operator=(other);
  CopyFrom(other);
  return *this;
}

WAYPOINT_ITEM_INFO::~WAYPOINT_ITEM_INFO() = default;

void WAYPOINT_ITEM_INFO::CopyFrom(const WAYPOINT_ITEM_INFO& o) {
  type = o.type;
  altitude = o.altitude;
  speed = o.speed;
  course = o.course;
  extraA = o.extraA;
  extraB = o.extraB;
  std::copy(std::begin(o.flags), std::end(o.flags), flags);
  // Working values belong to whatever processing produced them; a copy starts clean.
  workDistance = 0.0;
  workSpeed = 0.0;
  workHeartRate = 0;
  workCadence = 0;
}

bool operator==(const WAYPOINT_ITEM_INFO& a, const WAYPOINT_ITEM_INFO& b) {
  return a.type == b.type && a.time == b.time && a.latitude == b.latitude &&
         a.longitude == b.longitude && a.altitude == b.altitude && a.speed == b.speed &&
         a.extraA == b.extraA && a.course == b.course;
}

// ---- sensor samples ---------------------------------------------------------

namespace {

template <class Rec, class V>
void InitSamples(Rec& rec, const Rec* from, V fill) {
  if (from) {
    rec = *from;
  } else {
    std::fill(std::begin(rec.values), std::end(rec.values), fill);
  }
}

template <class V, size_t N>
int CountUntil(const V (&values)[N], V end) {
  return static_cast<int>(std::find(std::begin(values), std::end(values), end) - std::begin(values));
}

}  // namespace

HEARTRATE_ITEM_INFO::HEARTRATE_ITEM_INFO(const HEARTRATE_ITEM_INFO* from) {
  InitSamples(*this, from, kEnd);
}
HEARTRATE_ITEM_INFO::~HEARTRATE_ITEM_INFO() = default;
int HEARTRATE_ITEM_INFO::UsedCount() const { return CountUntil(values, kEnd); }

CYCLING_CADENCE_RPM_ITEM_INFO::CYCLING_CADENCE_RPM_ITEM_INFO(const CYCLING_CADENCE_RPM_ITEM_INFO* from) {
  InitSamples(*this, from, kEnd);
}
CYCLING_CADENCE_RPM_ITEM_INFO::~CYCLING_CADENCE_RPM_ITEM_INFO() = default;
int CYCLING_CADENCE_RPM_ITEM_INFO::UsedCount() const { return CountUntil(values, kEnd); }

WHEEL_SPEED_ITEM_INFO::WHEEL_SPEED_ITEM_INFO(const WHEEL_SPEED_ITEM_INFO* from) {
  InitSamples(*this, from, -1.0);
}
WHEEL_SPEED_ITEM_INFO::~WHEEL_SPEED_ITEM_INFO() = default;
int WHEEL_SPEED_ITEM_INFO::UsedCount() const { return CountUntil(values, -1.0); }

// ---- _PHOTO_ITEM_URL --------------------------------------------------------

_PHOTO_ITEM_URL& _PHOTO_ITEM_URL::operator=(const _PHOTO_ITEM_URL& other) {
  if (this == &other) return *this;
  dirty = other.dirty;
  isPublic = other.isPublic;
  serverId = other.serverId;
  std::copy(std::begin(other.url), std::end(other.url), url);
  std::copy(std::begin(other.width), std::end(other.width), width);
  std::copy(std::begin(other.height), std::end(other.height), height);
  dirty2 = other.dirty2;
  isPublic2 = other.isPublic2;
  server2 = other.server2;
  serverId2 = other.serverId2;
  std::copy(std::begin(other.url2), std::end(other.url2), url2);
  std::copy(std::begin(other.width2), std::end(other.width2), width2);
  std::copy(std::begin(other.height2), std::end(other.height2), height2);
  return *this;
}
