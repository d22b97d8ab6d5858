#include "navmisc/datactrl/navi_points.h"

#include <cmath>
#include <cstring>
#include <initializer_list>
#include <limits>

namespace navmisc::datactrl {
namespace {

static_assert(sizeof(NAVI_POINT_INFO::szText) + 8 * 4 == kNaviEntryBytes);

// Truncates toward zero; a value beyond the 32-bit range (or not a number) saturates, so a
// broken coordinate can never wrap round into a valid-looking one.
int32_t TruncateToInt32(double value) {
  if (std::isnan(value)) return 0;
  if (value >= 2147483647.0) return std::numeric_limits<int32_t>::max();
  if (value <= -2147483648.0) return std::numeric_limits<int32_t>::min();
  return static_cast<int32_t>(value);
}

uint8_t* PutLE(uint8_t* p, int32_t v) {
  const auto u = static_cast<uint32_t>(v);
  for (int i = 0; i < 4; ++i) *p++ = static_cast<uint8_t>(u >> (8 * i));
  return p;
}

const uint8_t* GetLE(const uint8_t* p, int32_t& v) {
  uint32_t u = 0;
  for (int i = 0; i < 4; ++i) u |= static_cast<uint32_t>(*p++) << (8 * i);
  v = static_cast<int32_t>(u);
  return p;
}

}  // namespace

void PackNaviEntry(const NAVI_POINT_INFO& point, uint8_t* entry) {
  uint8_t* p = entry;
  p = PutLE(p, kNaviEntryTag);
  p = PutLE(p, TruncateToInt32(point.dLatitude * 10000000.0));
  p = PutLE(p, TruncateToInt32(point.dLongitude * 10000000.0));
  p = PutLE(p, TruncateToInt32(point.dAltitude));
  for (int32_t v : {point.nIcon, point.nRadius, point.nFlag, point.nReserved}) p = PutLE(p, v);
  std::memcpy(p, point.szText, sizeof point.szText);
}

bool UnpackNaviEntry(const uint8_t* entry, NAVI_POINT_INFO& point) {
  int32_t tag = 0;
  const uint8_t* p = GetLE(entry, tag);
  if (tag != kNaviEntryTag) return false;
  int32_t v[7];
  for (int32_t& x : v) p = GetLE(p, x);
  point.dLatitude = v[0] / 10000000.0;
  point.dLongitude = v[1] / 10000000.0;
  point.dAltitude = v[2];
  point.nIcon = v[3];
  point.nRadius = v[4];
  point.nFlag = v[5];
  point.nReserved = v[6];
  std::memcpy(point.szText, p, sizeof point.szText);
  return true;
}

int UsedNaviEntries(const uint8_t* navi) {
  for (int i = kNaviMaxEntries; i > 0; --i) {
    int32_t tag = 0;
    GetLE(navi + (i - 1) * kNaviEntryBytes, tag);
    if (tag == kNaviEntryTag) return i;
  }
  return 0;
}

}  // namespace navmisc::datactrl
