// What the track-reader fuzz targets share: the document is read three times (pushed whole,
// pushed in pieces cut where its first bytes say, and pulled by the reader in such pieces), an
// XML document a fourth time in two parts at once where it can be cut, and the readings must
// agree (see Fuzz). The sink checks on the way that every call comes where it
// may and every value lies in its range.
#pragma once

#include <cstdint>
#include <cstdlib>
#include <algorithm>
#include <cstring>
#include <functional>
#include <memory>
#include <string>

#include "navmisc/import/detail/split_read.h"
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

// Two readings agree when both fail, or both read well with the same calls. A failed document is
// thrown away whole, and where it stops may depend on the cut: pulling, the parser reports a
// start tag before it has seen the tag's end.
inline bool Agree(const std::string& a, const std::string& b) {
  return Failed(a) ? Failed(b) : a == b;
}

// Bytes the parser converts before it parses them: a declared encoding, or UTF-16 or UCS-4 by
// their first bytes.
inline bool Converted(const uint8_t* data, size_t size) {
  const std::string head(reinterpret_cast<const char*>(data), std::min<size_t>(size, 200));
  const size_t line = head.find('>');
  return (size >= 2 && (data[0] == 0 || data[1] == 0 || data[0] >= 0xFE)) ||
         head.substr(0, line).find("encoding") != std::string::npos;
}

// Read in two parts, cut near where its second byte says; "" when the reading found no place to
// cut there.
inline std::string ReadSplit(const detail::ReaderFactory& make, const uint8_t* data, size_t size) {
  if (size < 2) return {};
  CheckingSink sink;
  detail::SplitInput input;
  input.size = size;
  input.head = std::string_view(reinterpret_cast<const char*>(data), size);
  input.readAt = [data, size](uint64_t offset, char* out, size_t room, std::string&) -> long {
    if (offset >= size) return 0;
    const size_t n = std::min<size_t>(room, size - offset);
    std::memcpy(out, data + offset, n);
    return static_cast<long>(n);
  };
  detail::SplitOutcome outcome;
  if (!detail::ReadInTwoParts(input, size * (1 + data[1] % 7) / 8, make, sink, {}, outcome)) return {};
  return sink.log + "|" + std::to_string(outcome.status.code);
}

inline int Fuzz(const MakeReader& make, const uint8_t* data, size_t size,
                const detail::ReaderFactory& makeXml = {}) {
  const size_t piece = size > 0 ? 1 + data[0] % 17 : 1;
  const std::string whole = ReadAll(make, data, size, size ? size : 1);
  const std::string pieces = ReadAll(make, data, size, piece);
  const std::string pulled = ReadAll(make, data, size, piece, true);
  // Pushed whole or in pieces, a plain document reads exactly the same. Converted bytes go
  // through the converter as they come, and where it gives up on a bad byte (or lets it pass)
  // depends on the cut, so only the ways that both stream must agree for those.
  if (!Converted(data, size) && whole != pieces) std::abort();
  if (!Agree(pieces, pulled)) std::abort();
  if (makeXml) {
    const std::string split = ReadSplit(makeXml, data, size);
    if (!split.empty() && !Agree(pieces, split)) std::abort();
  }
  return 0;
}

}  // namespace navmisc::import::fuzzing
