#include "config.h"

#include "navmisc/platform/files.h"
#include "navmisc/platform/settings.h"

namespace gpsdc {

Config ReadConfig(const wchar_t* root) {
  Config config;
  const unsigned long ini = RD_BEGIN(PathJoin(root, kConfigFileName));
  if (!ini) return config;
  config.devicePath = RD_STRING(ini, L"DEVICE", L"Path");
  config.serviceUrl = RD_STRING(ini, L"WEBSERVICE", L"Url", kDefaultServiceUrl);
  config.geolocateUrl = RD_STRING(ini, L"WEBSERVICE", L"GeolocateUrl", kDefaultGeolocateUrl);
  const int timeout = RD_INT(ini, L"WEBSERVICE", L"TimeoutSeconds", kDefaultTimeoutSeconds);
  if (timeout >= 1 && timeout <= 3600) config.timeoutSeconds = timeout;
  config.gpsdHost = RD_STRING(ini, L"DONGLE", L"Host", config.gpsdHost);
  config.gpsdPort = RD_STRING(ini, L"DONGLE", L"Port", config.gpsdPort);
  RD_END(ini);
  return config;
}

}  // namespace gpsdc
