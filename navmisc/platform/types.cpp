#include "navmisc/platform/types.h"

namespace navmisc {

const wchar_t* AppDataFolderName(GPS_APP_PROG_TYPE type) {
  switch (type) {
    case GPS_APP_TRIP: return L"Resource";
    case GPS_APP_SPORT: return L"SportRes";
    case GPS_APP_TRACKER: return L"TrackerRes";
    case GPS_APP_WHEREAMI: return L"WhereRes";
  }
  return nullptr;
}

}  // namespace navmisc
