#include "osm_api.h"

#include <charconv>

#include "navmisc/datactrl/dc_errors.h"
#include "navmisc/platform/datetime.h"
#include "xml_reader.h"

namespace gpsdc {
namespace {

// "gpx:trkpt" and "trkpt" alike.
std::string_view LocalName(std::string_view name) {
  const size_t colon = name.rfind(':');
  return colon == std::string_view::npos ? name : name.substr(colon + 1);
}

bool ParseDouble(std::string_view text, double& value) {
  const char* end = text.data() + text.size();
  const auto [ptr, ec] = std::from_chars(text.data(), end, value);
  return ec == std::errc() && ptr == end;
}

std::string Attribute(const XmlAttributes& a, const char* name) {
  const auto it = a.find(name);
  return it == a.end() ? std::string() : it->second;
}

// Seconds since 1970 of an XML date-time ("2024-05-01T08:30:15Z", with or without fractions
// of a second, "Z" or an offset); -1 when it is none.
long ParseXmlTime(std::string_view text) {
  if (text.size() < 19) return -1;
  long offset = 0;
  std::string_view rest = text.substr(19);
  if (!rest.empty() && rest.front() == '.') {
    size_t digits = 1;
    while (digits < rest.size() && rest[digits] >= '0' && rest[digits] <= '9') ++digits;
    rest.remove_prefix(digits);
  }
  if (rest.size() == 6 && (rest[0] == '+' || rest[0] == '-') && rest[3] == ':') {
    int hours = 0, minutes = 0;
    if (std::from_chars(rest.data() + 1, rest.data() + 3, hours).ec != std::errc() ||
        std::from_chars(rest.data() + 4, rest.data() + 6, minutes).ec != std::errc())
      return -1;
    offset = (hours * 3600L + minutes * 60L) * (rest[0] == '+' ? 1 : -1);
  } else if (!(rest.empty() || rest == "Z")) {
    return -1;
  }
  const long seconds = ConvertStdStringTimeT(CString::FromUtf8(text.substr(0, 19)));
  return seconds == -1 ? -1 : seconds - offset;
}

}  // namespace

bool IsTraceId(const std::string& id) {
  return !id.empty() && id.size() <= 18 &&
         id.find_first_not_of("0123456789") == std::string::npos;
}

bool ReadTraces(const std::string& xml, std::vector<OsmTrace>& traces) {
  traces.clear();
  bool inTrace = false;
  XmlHandlers h;
  h.start = [&](const std::string& name, const XmlAttributes& a) {
    if (LocalName(name) != "gpx_file") return;
    inTrace = true;
    OsmTrace& t = traces.emplace_back();
    t.id = Attribute(a, "id");
    t.name = Attribute(a, "name");
    t.visibility = Attribute(a, "visibility");
    t.timestamp = Attribute(a, "timestamp");
    t.owner = Attribute(a, "user");
    t.pending = Attribute(a, "pending") == "true";
    t.hasPosition = ParseDouble(Attribute(a, "lat"), t.lat) && ParseDouble(Attribute(a, "lon"), t.lon);
  };
  h.end = [&](const std::string& name, const std::string& text) {
    const std::string_view local = LocalName(name);
    if (local == "gpx_file") inTrace = false;
    if (!inTrace) return;
    if (local == "description") traces.back().description = text;
    if (local == "tag") traces.back().tags.push_back(text);
  };
  std::string root;
  if (!ReadXml(xml, h, &root) || LocalName(root) != "osm") return false;
  // Every trace needs its identity: the commands that follow a list name traces by it.
  for (const OsmTrace& t : traces)
    if (!IsTraceId(t.id)) return false;
  return true;
}

bool ReadGpxPoints(const std::string& gpx, std::vector<DC_NET_POINT_INFO>& points,
                   size_t maxPoints) {
  points.clear();
  bool inPoint = false;
  bool tooMany = false;
  XmlHandlers h;
  h.start = [&](const std::string& name, const XmlAttributes& a) {
    if (LocalName(name) != "trkpt" || tooMany) return;
    if (points.size() == maxPoints) {
      tooMany = true;
      return;
    }
    DC_NET_POINT_INFO& p = points.emplace_back();
    ParseDouble(Attribute(a, "lat"), p.dLatitude);
    ParseDouble(Attribute(a, "lon"), p.dLongitude);
    inPoint = true;
  };
  h.end = [&](const std::string& name, const std::string& text) {
    const std::string_view local = LocalName(name);
    if (local == "trkpt") inPoint = false;
    if (!inPoint || tooMany) return;
    if (local == "ele") {
      ParseDouble(text, points.back().dAltitude);
    } else if (local == "time") {
      const long t = ParseXmlTime(text);
      if (t != -1) points.back().oleTime = CovertTimeTToOleDateTime(t);
    }
  };
  std::string root;
  return ReadXml(gpx, h, &root) && LocalName(root) == "gpx" && !tooMany;
}

bool IsGpxDocument(const std::string& gpx) {
  std::string root;
  return ReadXml(gpx, XmlHandlers{}, &root) && LocalName(root) == "gpx";
}

OsmApi::OsmApi(const HttpClient& http, std::string baseUrl) : http_(http), base_(std::move(baseUrl)) {
  while (!base_.empty() && base_.back() == '/') base_.pop_back();
}

HttpResponse OsmApi::Get(const std::string& token, const std::string& path, size_t maxBody) const {
  HttpRequest request;
  request.url = base_ + path;
  request.bearerToken = &token;
  request.maxBody = maxBody;
  return http_.Perform(request);
}

int32_t OsmApi::UserDetails(const std::string& token, OsmUser& user) const {
  const HttpResponse r = Get(token, "/api/0.6/user/details", kMaxXmlAnswer);
  if (const int32_t e = r.Outcome()) return e;
  user = {};
  XmlHandlers h;
  h.start = [&](const std::string& name, const XmlAttributes& a) {
    if (LocalName(name) != "user" || !user.id.empty()) return;
    user.id = Attribute(a, "id");
    user.displayName = Attribute(a, "display_name");
  };
  std::string root;
  if (!ReadXml(r.body, h, &root) || LocalName(root) != "osm" || user.id.empty())
    return DC_ERR_NET_BAD_REPLY;
  return 0;
}

int32_t OsmApi::ListTraces(const std::string& token, std::vector<OsmTrace>& traces) const {
  const HttpResponse r = Get(token, "/api/0.6/user/gpx_files", kMaxXmlAnswer);
  if (const int32_t e = r.Outcome()) return e;
  return ReadTraces(r.body, traces) ? 0 : DC_ERR_NET_BAD_REPLY;
}

int32_t OsmApi::TraceDetails(const std::string& token, const std::string& id,
                             OsmTrace& trace) const {
  const HttpResponse r = Get(token, "/api/0.6/gpx/" + id + "/details", kMaxXmlAnswer);
  if (const int32_t e = r.Outcome()) return e;
  std::vector<OsmTrace> traces;
  if (!ReadTraces(r.body, traces) || traces.size() != 1) return DC_ERR_NET_BAD_REPLY;
  trace = std::move(traces.front());
  return 0;
}

int32_t OsmApi::TracePoints(const std::string& token, const std::string& id,
                            std::vector<DC_NET_POINT_INFO>& points) const {
  const HttpResponse r = Get(token, "/api/0.6/gpx/" + id + "/data.gpx", kMaxGpxAnswer);
  if (const int32_t e = r.Outcome()) return e;
  if (ReadGpxPoints(r.body, points)) return 0;
  return points.size() >= kMaxTracePoints ? DC_ERR_NET_TOO_LARGE : DC_ERR_NET_BAD_REPLY;
}

int32_t OsmApi::Upload(const std::string& token, const OsmUpload& upload, std::string& id) const {
  HttpRequest request;
  request.method = "POST";
  request.url = base_ + "/api/0.6/gpx/create";
  request.bearerToken = &token;
  request.form = {{"file", upload.gpx, upload.fileName, "application/gpx+xml"},
                  {"description", upload.description, "", ""},
                  {"tags", upload.tags, "", ""},
                  {"visibility", upload.visibility, "", ""}};
  const HttpResponse r = http_.Perform(request);
  if (const int32_t e = r.Outcome()) return e;
  // The answer is the new trace's number, as plain text.
  id = r.body;
  while (!id.empty() && (id.back() == '\n' || id.back() == '\r' || id.back() == ' ')) id.pop_back();
  return IsTraceId(id) ? 0 : DC_ERR_NET_BAD_REPLY;
}

int32_t OsmApi::Delete(const std::string& token, const std::string& id) const {
  HttpRequest request;
  request.method = "DELETE";
  request.url = base_ + "/api/0.6/gpx/" + id;
  request.bearerToken = &token;
  return http_.Perform(request).Outcome();
}

}  // namespace gpsdc
