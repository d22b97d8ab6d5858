// Basic types shared by every part of the library.
#pragma once

#include <cstdint>

// The application of the suite that owns a trip or a profile. Each has its own data folder
// under the data root and its own user profile.
enum GPS_APP_PROG_TYPE : int32_t {
  GPS_APP_TRIP = 1,        // trip journal, data folder "Resource"
  GPS_APP_SPORT = 22,      // sport application, "SportRes"
  GPS_APP_TRACKER = 55,    // tracker application, "TrackerRes"
  GPS_APP_WHEREAMI = 1000  // where-am-I viewer, "WhereRes"
};

// A file time: 100-nanosecond intervals since 1601-01-01 00:00 UTC, in two 32-bit halves.
struct FILETIME {
  uint32_t dwLowDateTime = 0;
  uint32_t dwHighDateTime = 0;
};

// A screen point in pixels.
struct CPoint {
  long x = 0;
  long y = 0;
};

namespace navmisc {

// The data folder of an application type under the data root; nullptr for an unknown type.
const wchar_t* AppDataFolderName(GPS_APP_PROG_TYPE type);

}  // namespace navmisc
