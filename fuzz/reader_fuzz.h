// What the track-reader fuzz targets share: the document is read twice, once whole and once in
// pieces cut where its first bytes say, and both readings must hand the sink the same calls in
// the same order and end the same way. The sink checks on the way that every call comes where
// it may and every value lies in its range.
#pragma once

#include <cstdint>
#include <cstdlib>
#include <functional>
#include <memory>
#include <string>

#include "navmisc/import/track_reader.h"

namespace navmisc::import::fuzzing {

class CheckingSink : public ImportSink {
 public:
  bool Document(const std::string& name, const std::string& description) override {
    Check(name.size() <= kMaxText && description.size() <= kMaxText);
    log += "D" + std::to_string(name.size()) + "," + std::to_string(description.size()) + ";";
    return true;
  }
  bool BeginTrack(const ImportTrack& t) override {
    Check(!inTrack_ && t.name.size() <= kMaxText);
    inTrack_ = true;
    inSegment_ = false;
    log += "T" + std::to_string(static_cast<int>(t.kind)) + t.name + ";";
    return true;
  }
  bool BeginSegment() override {
    Check(inTrack_);
    inSegment_ = true;
    log += "S;";
    return true;
  }
  bool Point(const ImportPoint& p) override {
    Check(inSegment_);
    Check(p.time == kNoTime || (p.time >= 0 && p.time <= 2147483647));
    Check(!p.hasPosition || (p.latitude >= -90 && p.latitude <= 90 && p.longitude >= -180 && p.longitude <= 180));
    Check(p.heartRate >= -1 && p.heartRate <= 254 && p.cadence >= -1 && p.cadence <= 254);
    Check(p.speed < 0 || p.speed <= 100000);
    Check(p.course < 0 || p.course <= 360);
    log += "P" + std::to_string(p.time) + "," + std::to_string(p.latitude) + "," + std::to_string(p.longitude) +
           "," + std::to_string(p.heartRate) + ";";
    return true;
  }
  bool EndTrack() override {
    Check(inTrack_);
    inTrack_ = inSegment_ = false;
    log += "E;";
    return true;
  }
  bool Marker(const ImportMarker& m) override {
    Check(m.latitude >= -90 && m.latitude <= 90 && m.longitude >= -180 && m.longitude <= 180);
    Check(m.name.size() <= kMaxText && m.description.size() <= kMaxText);
    log += "M" + m.name + ";";
    return true;
  }
  std::string log;

 private:
  static void Check(bool ok) {
    if (!ok) std::abort();
  }
  bool inTrack_ = false;
  bool inSegment_ = false;
};

using MakeReader = std::function<std::unique_ptr<TrackReader>(ImportSink&)>;

inline std::string ReadAll(const MakeReader& make, const uint8_t* data, size_t size, size_t piece) {
  CheckingSink sink;
  auto reader = make(sink);
  bool ok = true;
  for (size_t at = 0; ok && at < size; at += piece) {
    ok = reader->Feed(reinterpret_cast<const char*>(data) + at, std::min(piece, size - at));
  }
  if (ok) reader->Finish();
  // The parser words one fault differently by where the bytes were cut ("invalid token" whole,
  // "junk after document element" in pieces): the calls and the code must agree, the words not.
  return sink.log + "|" + std::to_string(reader->status().code);
}

inline int Fuzz(const MakeReader& make, const uint8_t* data, size_t size) {
  const size_t piece = size > 0 ? 1 + data[0] % 17 : 1;
  if (ReadAll(make, data, size, size ? size : 1) != ReadAll(make, data, size, piece)) std::abort();
  return 0;
}

}  // namespace navmisc::import::fuzzing
