#include "navmisc/import/detail/xml_track_reader.h"

#include <cstdio>

#include "navmisc/import/detail/values.h"
#include "navmisc/import/import_errors.h"

namespace navmisc::import::detail {
namespace {

// A value as quoted in a message: short, printable.
std::string Quoted(std::string_view text) {
  text = TrimSpace(text);
  std::string out = "\"";
  for (size_t i = 0; i < text.size() && i < 40; ++i) {
    const unsigned char c = static_cast<unsigned char>(text[i]);
    out += c < 0x20 ? '?' : static_cast<char>(c);
  }
  if (text.size() > 40) out += "...";
  return out + "\"";
}

}  // namespace

bool XmlTrackReader::Feed(const char* data, size_t size) {
  if (failed()) return false;
  if (!xml_.Feed(data, size)) return Fail(xml_.status().code, xml_.status().message);
  return true;
}

bool XmlTrackReader::Finish() {
  if (failed()) return false;
  return Settle(xml_.Finish());
}

bool XmlTrackReader::ReadFrom(const Source& source) {
  if (failed()) return false;
  return Settle(xml_.ReadAll(source));
}

bool XmlTrackReader::Settle(bool ok) {
  if (!ok) return Fail(xml_.status().code, xml_.status().message);
  AtEnd();
  if (!xml_.status().ok()) return Fail(xml_.status().code, xml_.status().message);
  return true;
}

std::string XmlTrackReader::SplitState() const {
  if (failed() || Capturing()) return {};
  std::string reader = StateBetweenPoints();
  if (reader.empty()) return {};
  std::string parser = xml_.ContentContext();
  if (parser.empty()) return {};
  return reader + '\n' + parser;
}

void XmlTrackReader::Text(std::string_view text) {
  if (Capturing()) AppendCapped(text_, text, kMaxText);
}

bool XmlTrackReader::EndOfField(size_t depth) {
  if (!Capturing()) return false;
  if (depth == fieldDepth_) {
    const int field = field_;
    field_ = kNoField;
    StoreField(field, text_);
  }
  return true;
}

void XmlTrackReader::StopAt(int32_t code, const std::string& message) {
  xml_.Stop(code, xml_.Where() + message);
}

bool XmlTrackReader::ReadNumber(std::string_view text, const char* what, bool (*inRange)(double),
                                double& out) {
  double v = 0;
  if (!ParseNumber(text, v)) {
    StopAt(DC_ERR_IMPORT_VALUE, std::string(what) + " " + Quoted(text) + " is not a number");
    return false;
  }
  if (inRange && !inRange(v)) {
    StopAt(DC_ERR_IMPORT_VALUE, std::string(what) + " " + Quoted(text) + " is out of range");
    return false;
  }
  out = v;
  return true;
}

bool XmlTrackReader::ReadTime(std::string_view text, const char* what, int64_t& out) {
  int64_t t = 0;
  if (!ParseIsoTime(text, t)) {
    StopAt(DC_ERR_IMPORT_VALUE, std::string(what) + " " + Quoted(text) + " is not a date and time");
    return false;
  }
  if (!TimeInRange(t)) {
    StopAt(DC_ERR_IMPORT_VALUE,
           std::string(what) + " " + Quoted(text) + " lies outside 1970 to 2038");
    return false;
  }
  out = t;
  return true;
}

bool XmlTrackReader::ReadCoordinate(const XmlAttributes& attributes, const char* name,
                                    const char* element, bool (*inRange)(double), double& out) {
  const std::optional<std::string_view> value = attributes.Find(name);
  if (!value) {
    StopAt(DC_ERR_IMPORT_MALFORMED, std::string("<") + element + "> without " + name);
    return false;
  }
  return ReadNumber(*value, name, inRange, out);
}

bool XmlTrackReader::Emit(bool accepted) {
  if (!accepted && !Stopped()) StopAt(DC_ERR_IMPORT_CANCELLED, "stopped");
  return accepted;
}

bool XmlTrackReader::EmitTrack(const ImportTrack& track) {
  ++counts_.tracks;
  return Emit(sink_.BeginTrack(track));
}
bool XmlTrackReader::EmitSegment() { return Emit(sink_.BeginSegment()); }
bool XmlTrackReader::EmitPoint(const ImportPoint& point) {
  ++counts_.points;
  return Emit(sink_.Point(point));
}
bool XmlTrackReader::EmitEndTrack() { return Emit(sink_.EndTrack()); }
bool XmlTrackReader::EmitMarker(ImportMarker& marker, const ImportPoint& where) {
  marker.latitude = where.latitude;
  marker.longitude = where.longitude;
  marker.altitude = where.altitude;
  marker.hasAltitude = where.hasAltitude;
  marker.time = where.time;
  ++counts_.markers;
  return Emit(sink_.Marker(marker));
}
bool XmlTrackReader::EmitDocument(const std::string& name, const std::string& description) {
  return Emit(sink_.Document(name, description));
}

}  // namespace navmisc::import::detail
