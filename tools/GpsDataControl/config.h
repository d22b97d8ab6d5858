// The data-control process's configuration: "GpsDataControl.ini" in the data root
// (docs/data-control-channel.md, "Configuration").
#pragma once

#include "navmisc/platform/cstring.h"

namespace gpsdc {

inline constexpr const wchar_t* kConfigFileName = L"GpsDataControl.ini";

struct Config {
  CString devicePath;  // [DEVICE] Path: where the logger appears
  CString serviceUrl;  // [WEBSERVICE] Url: the web service's address
  // [DONGLE] Host and Port: the gpsd that serves the where-am-I receiver.
  CString gpsdHost = L"localhost";
  CString gpsdPort = L"2947";
};

// Reads the configuration of the data root `root`; a missing file or key leaves its value
// empty.
Config ReadConfig(const wchar_t* root);

}  // namespace gpsdc
