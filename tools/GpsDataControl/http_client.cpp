#include "http_client.h"

#include <curl/curl.h>

#include <algorithm>
#include <memory>
#include <mutex>

#include "navmisc/datactrl/dc_errors.h"

namespace gpsdc {
namespace {

// Headers of one answer beyond this are a hostile server's, not the web service's.
constexpr size_t kMaxHeaderBytes = 256u << 10;
constexpr long kMaxConnectMs = 30000;
constexpr const char* kUserAgent = "NavMiscLib-GpsDataControl/1";

struct Transfer {
  HttpResponse* response;
  size_t maxBody;
  size_t headerBytes = 0;
  bool tooLarge = false;
  const std::atomic<bool>* cancel;
};

size_t OnBody(char* data, size_t, size_t n, void* user) {
  auto& t = *static_cast<Transfer*>(user);
  if (t.response->body.size() + n > t.maxBody) {
    t.tooLarge = true;
    return 0;  // ends the transfer with a write error
  }
  t.response->body.append(data, n);
  return n;
}

size_t OnHeader(char*, size_t, size_t n, void* user) {
  auto& t = *static_cast<Transfer*>(user);
  t.headerBytes += n;
  if (t.headerBytes > kMaxHeaderBytes) {
    t.tooLarge = true;
    return 0;
  }
  return n;
}

int OnProgress(void* user, curl_off_t, curl_off_t, curl_off_t, curl_off_t) {
  return static_cast<Transfer*>(user)->cancel->load() ? 1 : 0;
}

int32_t TransportError(CURLcode code, const Transfer& t) {
  if (t.tooLarge) return DC_ERR_NET_TOO_LARGE;
  switch (code) {
    case CURLE_OPERATION_TIMEDOUT:
      return DC_ERR_NET_TIMEOUT;
    case CURLE_COULDNT_RESOLVE_HOST:
    case CURLE_COULDNT_RESOLVE_PROXY:
    case CURLE_COULDNT_CONNECT:
      return DC_ERR_NET_UNREACHABLE;
    case CURLE_SSL_CONNECT_ERROR:
    case CURLE_PEER_FAILED_VERIFICATION:
    case CURLE_SSL_CERTPROBLEM:
    case CURLE_SSL_CIPHER:
    case CURLE_SSL_CACERT_BADFILE:
    case CURLE_SSL_ISSUER_ERROR:
    case CURLE_SSL_PINNEDPUBKEYNOTMATCH:
    case CURLE_SSL_INVALIDCERTSTATUS:
    case CURLE_SSL_CRL_BADFILE:
    case CURLE_USE_SSL_FAILED:
      return DC_ERR_NET_TLS;
    case CURLE_ABORTED_BY_CALLBACK:
      return DC_ERR_NET_CANCELLED;
    case CURLE_UNSUPPORTED_PROTOCOL:
    case CURLE_URL_MALFORMAT:
      return DC_ERR_NET_BAD_ADDRESS;
    default:
      return DC_ERR_NET_TRANSFER;
  }
}

struct UrlParts {
  std::string scheme;
  std::string host;
};

bool SplitUrl(const std::string& url, UrlParts& parts) {
  std::unique_ptr<CURLU, decltype(&curl_url_cleanup)> u(curl_url(), &curl_url_cleanup);
  if (!u || curl_url_set(u.get(), CURLUPART_URL, url.c_str(), 0) != CURLUE_OK) return false;
  for (auto [part, out] : {std::pair{CURLUPART_SCHEME, &parts.scheme},
                           std::pair{CURLUPART_HOST, &parts.host}}) {
    char* value = nullptr;
    if (curl_url_get(u.get(), part, &value, 0) != CURLUE_OK) return false;
    *out = value;
    curl_free(value);
  }
  std::transform(parts.host.begin(), parts.host.end(), parts.host.begin(),
                 [](unsigned char c) { return static_cast<char>(std::tolower(c)); });
  return true;
}

using Easy = std::unique_ptr<CURL, decltype(&curl_easy_cleanup)>;
using Headers = std::unique_ptr<curl_slist, decltype(&curl_slist_free_all)>;
using Mime = std::unique_ptr<curl_mime, decltype(&curl_mime_free)>;

}  // namespace

int32_t HttpResponse::Outcome() const {
  if (error) return error;
  return status >= 200 && status <= 299 ? 0 : static_cast<int32_t>(status);
}

bool IsUsableServiceUrl(const std::string& url) {
  UrlParts parts;
  if (!SplitUrl(url, parts)) return false;
  if (parts.scheme == "https") return true;
  return parts.scheme == "http" &&
         (parts.host == "127.0.0.1" || parts.host == "[::1]" || parts.host == "localhost");
}

void InitHttp() {
  static std::once_flag once;
  std::call_once(once, [] { curl_global_init(CURL_GLOBAL_DEFAULT); });
}

HttpClient::HttpClient(std::chrono::milliseconds timeout, const std::atomic<bool>& cancel)
    : timeout_(timeout), cancel_(cancel) {}

HttpResponse HttpClient::Perform(const HttpRequest& request) const {
  HttpResponse response;
  UrlParts parts;
  if (!IsUsableServiceUrl(request.url) || !SplitUrl(request.url, parts)) {
    response.error = DC_ERR_NET_BAD_ADDRESS;
    return response;
  }
  Easy easy(curl_easy_init(), &curl_easy_cleanup);
  if (!easy) {
    response.error = DC_ERR_NET_TRANSFER;
    return response;
  }
  CURL* h = easy.get();
  Transfer transfer{&response, request.maxBody, 0, false, &cancel_};
  Headers headers(nullptr, &curl_slist_free_all);
  Mime mime(nullptr, &curl_mime_free);
  auto header = [&headers](const std::string& line) {
    headers.reset(curl_slist_append(headers.release(), line.c_str()));
  };

  curl_easy_setopt(h, CURLOPT_URL, request.url.c_str());
  // Only the address's own scheme, and no redirects: an answer elsewhere is not the service's,
  // and the token must not follow it.
  curl_easy_setopt(h, CURLOPT_PROTOCOLS_STR, parts.scheme.c_str());
  curl_easy_setopt(h, CURLOPT_FOLLOWLOCATION, 0L);
  curl_easy_setopt(h, CURLOPT_NOSIGNAL, 1L);
  curl_easy_setopt(h, CURLOPT_USERAGENT, kUserAgent);
  const long timeoutMs = static_cast<long>(timeout_.count());
  curl_easy_setopt(h, CURLOPT_TIMEOUT_MS, timeoutMs);
  curl_easy_setopt(h, CURLOPT_CONNECTTIMEOUT_MS, std::min(timeoutMs, kMaxConnectMs));
  curl_easy_setopt(h, CURLOPT_WRITEFUNCTION, OnBody);
  curl_easy_setopt(h, CURLOPT_WRITEDATA, &transfer);
  curl_easy_setopt(h, CURLOPT_HEADERFUNCTION, OnHeader);
  curl_easy_setopt(h, CURLOPT_HEADERDATA, &transfer);
  curl_easy_setopt(h, CURLOPT_NOPROGRESS, 0L);
  curl_easy_setopt(h, CURLOPT_XFERINFOFUNCTION, OnProgress);
  curl_easy_setopt(h, CURLOPT_XFERINFODATA, &transfer);
  if (request.bearerToken) {
    curl_easy_setopt(h, CURLOPT_HTTPAUTH, CURLAUTH_BEARER);
    curl_easy_setopt(h, CURLOPT_XOAUTH2_BEARER, request.bearerToken->c_str());
  }
  header("Expect:");  // send bodies at once, without waiting for "100 Continue"
  if (request.method == "POST") {
    if (!request.form.empty()) {
      mime.reset(curl_mime_init(h));
      for (const FormPart& p : request.form) {
        curl_mimepart* part = curl_mime_addpart(mime.get());
        curl_mime_name(part, p.name.c_str());
        curl_mime_data(part, p.value.data(), p.value.size());
        if (!p.fileName.empty()) curl_mime_filename(part, p.fileName.c_str());
        if (!p.contentType.empty()) curl_mime_type(part, p.contentType.c_str());
      }
      curl_easy_setopt(h, CURLOPT_MIMEPOST, mime.get());
    } else {
      curl_easy_setopt(h, CURLOPT_POST, 1L);
      curl_easy_setopt(h, CURLOPT_POSTFIELDS, request.body.data());
      curl_easy_setopt(h, CURLOPT_POSTFIELDSIZE_LARGE, static_cast<curl_off_t>(request.body.size()));
      if (!request.contentType.empty()) header("Content-Type: " + request.contentType);
    }
  } else if (request.method != "GET") {
    curl_easy_setopt(h, CURLOPT_CUSTOMREQUEST, request.method.c_str());
  }
  curl_easy_setopt(h, CURLOPT_HTTPHEADER, headers.get());

  const CURLcode code = curl_easy_perform(h);
  if (code != CURLE_OK) {
    response.error = TransportError(code, transfer);
    response.body.clear();
    return response;
  }
  curl_easy_getinfo(h, CURLINFO_RESPONSE_CODE, &response.status);
  return response;
}

}  // namespace gpsdc
