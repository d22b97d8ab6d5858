#include "geolocate.h"

#include <nlohmann/json.hpp>

#include <charconv>
#include <cmath>

#include "navmisc/datactrl/dc_errors.h"
#include "navmisc/platform/lists.h"

namespace gpsdc {
namespace {

// More cells than a phone ever sees at once.
constexpr size_t kMaxCells = 64;
constexpr size_t kMaxAnswer = 64u << 10;

bool ReadInt(const CString& text, long long& value) {
  const std::string s = CString(text).Trim().ToUtf8();
  const auto [ptr, ec] = std::from_chars(s.data(), s.data() + s.size(), value);
  return !s.empty() && ec == std::errc() && ptr == s.data() + s.size();
}

}  // namespace

bool CellTowersJson(const std::vector<CString>& cells, std::string& json) {
  if (cells.empty() || cells.size() > kMaxCells) return false;
  nlohmann::json towers = nlohmann::json::array();
  for (const CString& cell : cells) {
    CxStringList fields;
    const int n = fields.Tokenize(cell, L",");
    if (n < 4 || n > 6) return false;
    long long v[5] = {0, 0, 0, 0, 0};
    int i = 0;
    std::string radio = "gsm";
    for (const CString& field : fields) {
      if (i == 5) {
        radio = CString(field).Trim().MakeLower().ToUtf8();
        if (radio != "gsm" && radio != "wcdma" && radio != "lte" && radio != "nr") return false;
      } else if (!ReadInt(field, v[i])) {
        return false;
      }
      ++i;
    }
    if (v[0] < 0 || v[1] < 0 || v[2] < 0 || v[3] < 0) return false;
    nlohmann::json tower = {{"radioType", radio},
                            {"mobileCountryCode", v[0]},
                            {"mobileNetworkCode", v[1]},
                            {"locationAreaCode", v[2]},
                            {"cellId", v[3]}};
    if (n >= 5) tower["signalStrength"] = v[4];
    towers.push_back(std::move(tower));
  }
  json = nlohmann::json{{"considerIp", false}, {"cellTowers", std::move(towers)}}.dump();
  return true;
}

bool ReadGeolocation(const std::string& text, CellPosition& position) {
  const nlohmann::json answer = nlohmann::json::parse(text, nullptr, false);
  if (!answer.is_object()) return false;
  const auto location = answer.find("location");
  if (location == answer.end() || !location->is_object()) return false;
  const auto lat = location->find("lat");
  const auto lng = location->find("lng");
  if (lat == location->end() || lng == location->end() || !lat->is_number() || !lng->is_number())
    return false;
  position.lat = lat->get<double>();
  position.lon = lng->get<double>();
  const auto accuracy = answer.find("accuracy");
  position.accuracy = accuracy != answer.end() && accuracy->is_number() ? accuracy->get<double>() : 0;
  return std::isfinite(position.lat) && std::isfinite(position.lon) && std::fabs(position.lat) <= 90 &&
         std::fabs(position.lon) <= 180;
}

int32_t Geolocate(const HttpClient& http, const std::string& url, const std::vector<CString>& cells,
                  CellPosition& position) {
  HttpRequest request;
  request.method = "POST";
  request.url = url;
  request.contentType = "application/json";
  request.maxBody = kMaxAnswer;
  if (!CellTowersJson(cells, request.body)) return DC_ERR_NET_BAD_REQUEST;
  const HttpResponse r = http.Perform(request);
  if (const int32_t e = r.Outcome()) return e;
  return ReadGeolocation(r.body, position) ? 0 : DC_ERR_NET_BAD_REPLY;
}

}  // namespace gpsdc
