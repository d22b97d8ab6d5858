// Positions from mobile-cell identities through the geolocation API that open cell databases
// offer (POST a JSON list of cell towers, get back a location and its accuracy).
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "http_client.h"
#include "navmisc/platform/cstring.h"

namespace gpsdc {

struct CellPosition {
  double lat = 0;       // degrees
  double lon = 0;       // degrees
  double accuracy = 0;  // metres
};

// The request body for the cells, each described as "MCC,MNC,LAC,CID[,SIGNAL_DBM[,RADIO]]"
// (RADIO: gsm, wcdma, lte or nr; gsm when left out). False when the list is empty, too long
// or a description does not read.
bool CellTowersJson(const std::vector<CString>& cells, std::string& json);

// Reads an answer; false when it holds no usable location.
bool ReadGeolocation(const std::string& json, CellPosition& position);

// Asks the service at `url` (no token is sent there). Returns 0, a DC_ERR_NET_* code or the
// HTTP status (404: the service knows none of the cells).
int32_t Geolocate(const HttpClient& http, const std::string& url, const std::vector<CString>& cells,
                  CellPosition& position);

}  // namespace gpsdc
