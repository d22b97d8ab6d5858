// The data-control process's configuration: "GpsDataControl.ini" in the data root
// (docs/data-control-channel.md, "Configuration").
#pragma once

#include "navmisc/platform/cstring.h"

namespace gpsdc {

inline constexpr const wchar_t* kConfigFileName = L"GpsDataControl.ini";

// The web service's defaults: OpenStreetMap's API, and an open cell database that answers the
// geolocation API.
inline constexpr const wchar_t* kDefaultServiceUrl = L"https://api.openstreetmap.org";
inline constexpr const wchar_t* kDefaultGeolocateUrl = L"https://api.beacondb.net/v1/geolocate";
inline constexpr int kDefaultTimeoutSeconds = 120;

struct Config {
  CString devicePath;  // [DEVICE] Path: where the logger appears
  CString serviceUrl = kDefaultServiceUrl;      // [WEBSERVICE] Url: the web service's address
  CString geolocateUrl = kDefaultGeolocateUrl;  // [WEBSERVICE] GeolocateUrl
  int timeoutSeconds = kDefaultTimeoutSeconds;  // [WEBSERVICE] TimeoutSeconds: per exchange
  // [DONGLE] Host and Port: the gpsd that serves the where-am-I receiver.
  CString gpsdHost = L"localhost";
  CString gpsdPort = L"2947";
};

// Reads the configuration of the data root `root`; a missing file or key leaves its default
// (an empty device path). A time-out outside 1 to 3600 seconds reads as the default.
Config ReadConfig(const wchar_t* root);

}  // namespace gpsdc
