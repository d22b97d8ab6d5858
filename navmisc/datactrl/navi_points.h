// Navigation points for the KV-11 family: the record an application uploads, and the 288-byte
// entry it becomes in the NAVI field of a KV-11 block (docs/data-control-channel.md, "NAVI").
#pragma once

#include <cstddef>
#include <cstdint>

// One navigation point as the application gives it.
struct NAVI_POINT_INFO {
  double dLatitude = 0;   // degrees, north positive
  double dLongitude = 0;  // degrees, east positive
  double dAltitude = 0;   // metres
  int32_t nIcon = 0;      // icon the tracker shows at the point
  int32_t nRadius = 0;    // metres around the point that count as arrived
  int32_t nFlag = 0;      // kind of point, for the tracker's own use
  int32_t nReserved = 0;
  uint8_t szText[256] = {};  // the point's text, as bytes
};

namespace navmisc::datactrl {

inline constexpr size_t kNaviEntryBytes = 288;
inline constexpr int kNaviMaxEntries = 100;
// Marks an entry that holds a point; an entry of zeros is an empty place.
inline constexpr int32_t kNaviEntryTag = 35670200;

// Writes `point` as one entry at `entry` (kNaviEntryBytes bytes, little-endian): the tag,
// latitude and longitude x 10,000,000 and the altitude, each truncated toward zero (values
// beyond the 32-bit range saturate), the four values, the 256 text bytes.
void PackNaviEntry(const NAVI_POINT_INFO& point, uint8_t* entry);
// Reads an entry back; false (point untouched) when it does not carry the tag.
bool UnpackNaviEntry(const uint8_t* entry, NAVI_POINT_INFO& point);
// The number of entries up to and including the last tagged one in a NAVI field of
// kNaviMaxEntries entries: the places that count, empty ones between them included.
int UsedNaviEntries(const uint8_t* navi);

}  // namespace navmisc::datactrl
