// The web service: OpenStreetMap's API 0.6, its user details and GPS traces
// (docs/web-service.md). Each call makes one or two HTTP exchanges and returns the command's
// outcome: 0, a DC_ERR_NET_* code, or the HTTP status of a refusal.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "http_client.h"
#include "navmisc/datactrl/cmd_blocks.h"

namespace gpsdc {

struct OsmUser {
  std::string id;
  std::string displayName;
};

// One trace as the service lists it.
struct OsmTrace {
  std::string id;
  std::string name;  // the uploaded file's name
  std::string description;
  std::string visibility;  // private, public, trackable or identifiable
  std::string timestamp;   // of the upload, "YYYY-MM-DDThh:mm:ssZ"
  std::string owner;       // the user's display name
  std::vector<std::string> tags;
  bool pending = false;  // not yet imported by the service
  bool hasPosition = false;
  double lat = 0;
  double lon = 0;
};

// What an upload sends besides the file.
struct OsmUpload {
  std::string gpx;  // the document
  std::string fileName;
  std::string description;
  std::string tags;        // comma-separated
  std::string visibility;  // private, public, trackable or identifiable
};

// Limits on what the service may send back.
inline constexpr size_t kMaxXmlAnswer = 16u << 20;
inline constexpr size_t kMaxGpxAnswer = 32u << 20;
// The most points a downloaded trace may have: its reply block has to fit the queue.
inline constexpr size_t kMaxTracePoints = 200000;

class OsmApi {
 public:
  // `baseUrl`: the service's address, as "https://api.openstreetmap.org".
  OsmApi(const HttpClient& http, std::string baseUrl);

  int32_t UserDetails(const std::string& token, OsmUser& user) const;
  int32_t ListTraces(const std::string& token, std::vector<OsmTrace>& traces) const;
  int32_t TraceDetails(const std::string& token, const std::string& id, OsmTrace& trace) const;
  int32_t TracePoints(const std::string& token, const std::string& id,
                      std::vector<DC_NET_POINT_INFO>& points) const;
  // On success `id` is the new trace's identity.
  int32_t Upload(const std::string& token, const OsmUpload& upload, std::string& id) const;
  int32_t Delete(const std::string& token, const std::string& id) const;

 private:
  HttpResponse Get(const std::string& token, const std::string& path, size_t maxBody) const;

  const HttpClient& http_;
  std::string base_;
};

// Reads the gpx_file elements of an answer; false when it is not such a document.
bool ReadTraces(const std::string& xml, std::vector<OsmTrace>& traces);
// Reads the track points of a GPX document (at most `maxPoints`); false when it is not a
// well-formed GPX document or has more points.
bool ReadGpxPoints(const std::string& gpx, std::vector<DC_NET_POINT_INFO>& points,
                   size_t maxPoints = kMaxTracePoints);
// Whether `gpx` is a well-formed document whose root element is "gpx".
bool IsGpxDocument(const std::string& gpx);
// Whether `id` can be a trace's identity (decimal digits, not too many).
bool IsTraceId(const std::string& id);

}  // namespace gpsdc
