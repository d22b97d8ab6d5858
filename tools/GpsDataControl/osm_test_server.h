// For the tests: a small web service on 127.0.0.1 that serves the part of OpenStreetMap's API
// 0.6 the data-control process uses (user details, GPS traces) and the cell geolocation API,
// and that can turn hostile on request.
#pragma once

#include <httplib.h>

#include <atomic>
#include <chrono>
#include <condition_variable>
#include <map>
#include <mutex>
#include <string>
#include <thread>

namespace gpsdc::testing {

class OsmTestServer {
 public:
  static constexpr const char* kToken = "good-token-0123456789";
  static constexpr const char* kUserId = "4711";
  static constexpr const char* kDisplayName = "Ann Example";

  // How every request is answered from now on.
  enum class Mode {
    kNormal,
    kError500,     // "500 Internal Server Error"
    kSilent,       // never answers
    kBrokenBody,   // 200 with a document cut short
    kHugeBody,     // 200 with an endless body
    kHugeHeaders,  // 200 with megabytes of header lines
    kRedirect,     // 302 to itself, for ever
    kSlowDrip,     // 200 with a byte of body every 100 ms, for ever
  };

  struct Trace {
    std::string name, description, tags, visibility, gpx, timestamp;
  };

  OsmTestServer() {
    server_.set_pre_routing_handler([this](const httplib::Request& req, httplib::Response& res) {
      ++requests_;
      return Hostile(req, res) ? httplib::Server::HandlerResponse::Handled
                               : httplib::Server::HandlerResponse::Unhandled;
    });
    server_.Get("/api/0.6/user/details", [this](const httplib::Request& req, httplib::Response& res) {
      if (!Authorized(req, res)) return;
      Xml(res, std::string("<user id=\"") + kUserId + "\" display_name=\"" + kDisplayName +
                   "\" account_created=\"2020-01-02T03:04:05Z\"><traces count=\"" +
                   std::to_string(Traces().size()) + "\"/></user>");
    });
    server_.Get("/api/0.6/user/gpx_files", [this](const httplib::Request& req, httplib::Response& res) {
      if (!Authorized(req, res)) return;
      std::string list;
      for (const auto& [id, t] : Traces()) list += TraceXml(id, t);
      Xml(res, list);
    });
    server_.Get(R"(/api/0.6/gpx/(\d+)/details)", [this](const httplib::Request& req, httplib::Response& res) {
      if (!Authorized(req, res)) return;
      const auto traces = Traces();
      const auto it = traces.find(std::stoi(req.matches[1]));
      if (it == traces.end()) return void(res.status = 404);
      Xml(res, TraceXml(it->first, it->second));
    });
    server_.Get(R"(/api/0.6/gpx/(\d+)/data.gpx)", [this](const httplib::Request& req, httplib::Response& res) {
      if (!Authorized(req, res)) return;
      const auto traces = Traces();
      const auto it = traces.find(std::stoi(req.matches[1]));
      if (it == traces.end()) return void(res.status = 404);
      res.set_content(it->second.gpx, "application/gpx+xml");
    });
    server_.Delete(R"(/api/0.6/gpx/(\d+))", [this](const httplib::Request& req, httplib::Response& res) {
      if (!Authorized(req, res)) return;
      std::lock_guard lock(mutex_);
      if (traces_.erase(std::stoi(req.matches[1])) == 0) res.status = 404;
    });
    server_.Post("/api/0.6/gpx/create", [this](const httplib::Request& req, httplib::Response& res) {
      if (!Authorized(req, res)) return;
      if (!req.has_file("file") || req.get_file_value("description").content.empty())
        return void(res.status = 400);
      std::lock_guard lock(mutex_);
      const int id = nextId_++;
      traces_[id] = {req.get_file_value("file").filename, req.get_file_value("description").content,
                     req.get_file_value("tags").content, req.get_file_value("visibility").content,
                     req.get_file_value("file").content,
                     "2024-05-01T10:00:0" + std::to_string(id % 10) + "Z"};
      res.set_content(std::to_string(id) + "\n", "text/plain");
    });
    server_.Post("/v1/geolocate", [this](const httplib::Request& req, httplib::Response& res) {
      {
        std::lock_guard lock(mutex_);
        geolocateBodies_.push_back(req.body);
        if (req.has_header("Authorization")) ++geolocateWithAuthorization_;
      }
      if (req.body.find("\"cellId\":404") != std::string::npos) {
        res.status = 404;
        res.set_content(R"({"error":{"code":404,"message":"Not found"}})", "application/json");
        return;
      }
      res.set_content(R"({"location":{"lat":54.3233,"lng":10.1228},"accuracy":1200.0})",
                      "application/json");
    });
    port_ = server_.bind_to_any_port("127.0.0.1");
    thread_ = std::thread([this] { server_.listen_after_bind(); });
    // Stopping works only once the loop runs.
    while (!server_.is_running()) std::this_thread::sleep_for(std::chrono::milliseconds(1));
  }

  ~OsmTestServer() {
    {
      std::lock_guard lock(mutex_);
      released_ = true;
    }
    release_.notify_all();
    server_.stop();
    thread_.join();
  }

  int port() const { return port_; }
  std::string url() const { return "http://127.0.0.1:" + std::to_string(port_); }
  void SetMode(Mode mode) { mode_ = mode; }
  int requests() const { return requests_; }

  std::map<int, Trace> Traces() const {
    std::lock_guard lock(mutex_);
    return traces_;
  }
  std::vector<std::string> GeolocateBodies() const {
    std::lock_guard lock(mutex_);
    return geolocateBodies_;
  }
  int GeolocateWithAuthorization() const {
    std::lock_guard lock(mutex_);
    return geolocateWithAuthorization_;
  }

 private:
  static void Xml(httplib::Response& res, const std::string& inner) {
    res.set_content("<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n<osm version=\"0.6\" generator=\"test\">" +
                        inner + "</osm>\n",
                    "application/xml");
  }

  std::string TraceXml(int id, const Trace& t) const {
    std::string tags;
    for (size_t start = 0; start < t.tags.size();) {
      size_t comma = t.tags.find(',', start);
      if (comma == std::string::npos) comma = t.tags.size();
      std::string tag = t.tags.substr(start, comma - start);
      while (!tag.empty() && tag.front() == ' ') tag.erase(0, 1);
      if (!tag.empty()) tags += "<tag>" + tag + "</tag>";
      start = comma + 1;
    }
    return "<gpx_file id=\"" + std::to_string(id) + "\" name=\"" + t.name +
           "\" lat=\"54.3233\" lon=\"10.1228\" user=\"" + kDisplayName + "\" visibility=\"" +
           t.visibility + "\" pending=\"false\" timestamp=\"" + t.timestamp + "\"><description>" +
           t.description + "</description>" + tags + "</gpx_file>";
  }

  static bool Authorized(const httplib::Request& req, httplib::Response& res) {
    if (req.get_header_value("Authorization") == std::string("Bearer ") + kToken) return true;
    res.status = 401;
    res.set_content("Couldn't authenticate you", "text/plain");
    return false;
  }

  // Waits until the server goes away; true when it did.
  bool WaitReleased(std::chrono::milliseconds ms) {
    std::unique_lock lock(mutex_);
    return release_.wait_for(lock, ms, [this] { return released_; });
  }

  bool Hostile(const httplib::Request& req, httplib::Response& res) {
    switch (mode_.load()) {
      case Mode::kNormal:
        return false;
      case Mode::kError500:
        res.status = 500;
        res.set_content("Internal Server Error", "text/plain");
        return true;
      case Mode::kSilent:
        WaitReleased(std::chrono::minutes(5));
        return true;
      case Mode::kBrokenBody:
        res.set_content("<?xml version=\"1.0\"?><osm version=\"0.6\"><user id=\"47", "application/xml");
        return true;
      case Mode::kHugeBody:
        res.set_chunked_content_provider("application/xml", [this](size_t, httplib::DataSink& sink) {
          const std::string chunk(64 << 10, 'x');
          return !WaitReleased(std::chrono::milliseconds(0)) && sink.write(chunk.data(), chunk.size());
        });
        return true;
      case Mode::kHugeHeaders:
        for (int i = 0; i < 400; ++i) res.set_header("X-Filler-" + std::to_string(i), std::string(4000, 'h'));
        res.set_content("<osm/>", "application/xml");
        return true;
      case Mode::kRedirect:
        res.set_redirect(req.path);
        return true;
      case Mode::kSlowDrip:
        res.set_chunked_content_provider("application/xml", [this](size_t, httplib::DataSink& sink) {
          return !WaitReleased(std::chrono::milliseconds(100)) && sink.write("<", 1);
        });
        return true;
    }
    return false;
  }

  httplib::Server server_;
  int port_ = -1;
  std::thread thread_;
  std::atomic<Mode> mode_{Mode::kNormal};
  std::atomic<int> requests_{0};
  mutable std::mutex mutex_;
  std::condition_variable release_;
  bool released_ = false;
  std::map<int, Trace> traces_;
  int nextId_ = 1000;
  std::vector<std::string> geolocateBodies_;
  int geolocateWithAuthorization_ = 0;
};

}  // namespace gpsdc::testing
