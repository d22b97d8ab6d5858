// For the tests of the readers: a sink that writes down what it receives, one line per call,
// and can stop the reading after a number of points.
#pragma once

#include <cstdio>
#include <string>
#include <vector>

#include "navmisc/import/track_reader.h"

namespace navmisc::import::testing {

class RecordingSink : public ImportSink {
 public:
  // Stop (return false) at point number `stopAt` (counting from 1); 0 never.
  explicit RecordingSink(uint64_t stopAt = 0) : stopAt_(stopAt) {}

  bool Document(const std::string& name, const std::string& description) override {
    lines.push_back("doc " + name + "|" + description);
    return true;
  }
  bool BeginTrack(const ImportTrack& t) override {
    static const char* kKinds[] = {"track", "route", "lap", "course", "log"};
    lines.push_back(std::string("track ") + kKinds[static_cast<int>(t.kind)] + " " + t.name + "|" +
                    t.description);
    return true;
  }
  bool BeginSegment() override {
    lines.push_back("segment");
    return true;
  }
  bool EndTrack() override {
    lines.push_back("end");
    return true;
  }
  bool Point(const ImportPoint& p) override {
    points.push_back(p);
    char buf[200];
    std::snprintf(buf, sizeof buf, "pt %lld %s ele=%s spd=%g crs=%g hr=%d cad=%d",
                  static_cast<long long>(p.time), Position(p.hasPosition, p.latitude, p.longitude).c_str(),
                  p.hasAltitude ? Num(p.altitude).c_str() : "-", p.speed, p.course, p.heartRate, p.cadence);
    lines.push_back(buf);
    return stopAt_ == 0 || points.size() < stopAt_;
  }
  bool Marker(const ImportMarker& m) override {
    markers.push_back(m);
    lines.push_back("marker " + m.name + "|" + m.description + "|" + m.symbol + " " +
                    std::to_string(m.time) + " " + Position(true, m.latitude, m.longitude) +
                    " ele=" + (m.hasAltitude ? Num(m.altitude) : "-"));
    return true;
  }

  std::vector<std::string> lines;
  std::vector<ImportPoint> points;
  std::vector<ImportMarker> markers;

 private:
  static std::string Num(double v) {
    char buf[40];
    std::snprintf(buf, sizeof buf, "%.6f", v);
    return buf;
  }
  static std::string Position(bool has, double lat, double lon) {
    return has ? Num(lat) + "," + Num(lon) : "-";
  }
  uint64_t stopAt_;
};

}  // namespace navmisc::import::testing
