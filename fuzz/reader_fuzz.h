// What the track-reader fuzz targets share: the document is read three times (pushed whole,
// pushed in pieces cut where its first bytes say, and pulled by the reader in such pieces), and
// the readings must agree (see Fuzz). The sink checks on the way that every call comes where it
// may and every value lies in its range.
#pragma once

#include <cstdint>
#include <cstdlib>
#include <algorithm>
#include <cstring>
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

// Pushes the document in pieces of `piece` bytes, or lets the reader pull it (`pull`) in pieces
// of at most that size.
inline std::string ReadAll(const MakeReader& make, const uint8_t* data, size_t size, size_t piece,
                           bool pull = false) {
  CheckingSink sink;
  auto reader = make(sink);
  if (pull) {
    size_t at = 0;
    reader->ReadFrom([&](char* out, size_t room) -> long {
      const size_t n = std::min({room, piece, size - at});
      std::memcpy(out, data + at, n);
      at += n;
      return static_cast<long>(n);
    });
  } else {
    bool ok = true;
    for (size_t at = 0; ok && at < size; at += piece) {
      ok = reader->Feed(reinterpret_cast<const char*>(data) + at, std::min(piece, size - at));
    }
    if (ok) reader->Finish();
  }
  // The parser words one fault differently by where the bytes were cut: the calls and the code
  // are compared, the words not.
  return sink.log + "|" + std::to_string(reader->status().code);
}

inline bool Failed(const std::string& reading) { return reading.substr(reading.rfind('|')) != "|0"; }

inline int Fuzz(const MakeReader& make, const uint8_t* data, size_t size) {
  const size_t piece = size > 0 ? 1 + data[0] % 17 : 1;
  const std::string whole = ReadAll(make, data, size, size ? size : 1);
  const std::string pieces = ReadAll(make, data, size, piece);
  const std::string pulled = ReadAll(make, data, size, piece, true);
  // A document that reads well gives the same calls however it is cut and whether it is pushed
  // or pulled. One that fails must fail every way, but a failed document is thrown away whole and
  // where it stops may depend on the cut: the parser converts each piece from the declared
  // encoding before parsing it, so a byte the encoding lacks stops it at the piece that brings
  // it; and pulling, it reports a start tag before it has seen the tag's end.
  if (!Failed(whole) ? pieces != whole || pulled != whole : !Failed(pieces) || !Failed(pulled)) std::abort();
  return 0;
}

}  // namespace navmisc::import::fuzzing
