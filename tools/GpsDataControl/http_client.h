// One HTTP exchange with the web service over libcurl, within bounds: certificates are always
// checked, redirects are never followed, the answer's size and the time it may take are
// limited, and the process's end cuts a running exchange short. The access token goes only
// into the Authorization header of the request it is given to.
#pragma once

#include <atomic>
#include <chrono>
#include <cstdint>
#include <string>
#include <vector>

namespace gpsdc {

// A part of a multipart form: a field, or a file when `fileName` is set.
struct FormPart {
  std::string name;
  std::string value;
  std::string fileName;
  std::string contentType;
};

struct HttpRequest {
  std::string method = "GET";  // GET, POST or DELETE
  std::string url;
  const std::string* bearerToken = nullptr;  // sent as "Authorization: Bearer ..."
  std::string body;                          // a POST body, with its content type
  std::string contentType;
  std::vector<FormPart> form;                // or a multipart form
  size_t maxBody = 1u << 20;                 // bytes of the answer's body that are accepted
};

struct HttpResponse {
  int32_t error = 0;  // 0 when an answer came, else a DC_ERR_NET_* code
  long status = 0;    // the answer's HTTP status
  std::string body;
  // The command's outcome: the transport's error; else 0 for a status 200-299; else the status.
  int32_t Outcome() const;
};

// Whether `url` may be used for the web service: https to any host, or plain http to the
// loopback address only (127.0.0.1, [::1], localhost).
bool IsUsableServiceUrl(const std::string& url);

class HttpClient {
 public:
  // `timeout` bounds each exchange from start to end; `cancel` turning true ends a running one
  // with DC_ERR_NET_CANCELLED.
  HttpClient(std::chrono::milliseconds timeout, const std::atomic<bool>& cancel);
  HttpResponse Perform(const HttpRequest& request) const;

 private:
  std::chrono::milliseconds timeout_;
  const std::atomic<bool>& cancel_;
};

// Starts libcurl for the process; once, before the first exchange.
void InitHttp();

}  // namespace gpsdc
