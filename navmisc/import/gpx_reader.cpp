// GPX 1.0 and 1.1: tracks (trk, one segment per trkseg), routes (rte, one segment), waypoints
// (wpt, as markers); heart rate, cadence, speed and course also from the extension elements of
// the usual vendor schemas, found by their local names at any depth under a point's
// <extensions>.
#include <vector>

#include "navmisc/import/detail/values.h"
#include "navmisc/import/detail/xml_track_reader.h"
#include "navmisc/import/import_errors.h"

namespace navmisc::import {
namespace {

using detail::XmlTrackReader;

enum class El : uint8_t {
  kOther, kGpx, kMetadata, kName, kDesc, kCmt, kTrk, kTrkseg, kTrkpt, kRte, kRtept, kWpt,
  kEle, kTime, kSpeed, kCourse, kSym, kExtensions, kHeartRate, kCadence,
};

constexpr std::pair<std::string_view, El> kGpxNames[] = {
    {"trkpt", El::kTrkpt}, {"ele", El::kEle}, {"time", El::kTime}, {"extensions", El::kExtensions},
    {"hr", El::kHeartRate}, {"cad", El::kCadence}, {"speed", El::kSpeed}, {"course", El::kCourse},
    {"rtept", El::kRtept}, {"wpt", El::kWpt}, {"name", El::kName}, {"desc", El::kDesc},
    {"cmt", El::kCmt}, {"sym", El::kSym}, {"trkseg", El::kTrkseg}, {"trk", El::kTrk},
    {"rte", El::kRte}, {"metadata", El::kMetadata}, {"gpx", El::kGpx},
    {"heartrate", El::kHeartRate}, {"cadence", El::kCadence}};

// What the captured text of an element becomes.
enum class Field : uint8_t {
  kNone, kDocName, kDocDesc, kTrackName, kTrackDesc, kMarkerName, kMarkerDesc, kMarkerCmt,
  kMarkerSym, kEle, kTime, kSpeed, kCourse, kExtSpeed, kExtCourse, kHeartRate, kCadence,
};

class GpxReader final : public XmlTrackReader {
 public:
  using XmlTrackReader::XmlTrackReader;
  std::string_view PointElement() const override { return "trkpt"; }

 private:
  std::string StateBetweenPoints() const override;
  void StartElement(detail::XmlName name, const detail::XmlAttributes& attributes) override;
  void EndElement() override;
  void AtEnd() override { SendDocument(); }

  Field FieldOf(El el, El parent) const;
  void BeginPoint(El kind, const detail::XmlAttributes& attributes);
  void EndPoint();
  void StoreField(int field, std::string_view text) override;
  bool OpenPendingTrack();
  void SendDocument();

  detail::ElementNames<El, std::size(kGpxNames)> classify_{kGpxNames, El::kOther};
  std::vector<El> stack_;
  // The open point element (trkpt, rtept or wpt) and its place in the stack.
  El point_kind_ = El::kOther;
  size_t point_depth_ = 0;
  size_t extensions_depth_ = 0;  // of the point's <extensions>, 0 when not inside
  ImportPoint point_;
  ImportMarker marker_;
  // The open track or route; it goes to the sink once its name is known (at its first segment).
  bool track_open_ = false;
  bool track_pending_ = false;
  bool segment_open_ = false;
  ImportTrack track_;
  std::string doc_name_, doc_desc_;
  bool doc_sent_ = false;
};

Field GpxReader::FieldOf(El el, El parent) const {
  const bool inPoint = point_kind_ != El::kOther && stack_.size() == point_depth_ + 2;
  const bool inExtensions = extensions_depth_ != 0 && stack_.size() > extensions_depth_;
  switch (el) {
    case El::kName:
    case El::kDesc: {
      const bool name = el == El::kName;
      if (parent == El::kMetadata || parent == El::kGpx) return name ? Field::kDocName : Field::kDocDesc;
      if ((parent == El::kTrk || parent == El::kRte) && track_pending_)
        return name ? Field::kTrackName : Field::kTrackDesc;
      if (parent == El::kWpt) return name ? Field::kMarkerName : Field::kMarkerDesc;
      return Field::kNone;
    }
    case El::kCmt: return parent == El::kWpt ? Field::kMarkerCmt : Field::kNone;
    case El::kSym: return parent == El::kWpt ? Field::kMarkerSym : Field::kNone;
    case El::kEle: return inPoint ? Field::kEle : Field::kNone;
    case El::kTime: return inPoint ? Field::kTime : Field::kNone;
    case El::kSpeed: return inPoint ? Field::kSpeed : inExtensions ? Field::kExtSpeed : Field::kNone;
    case El::kCourse: return inPoint ? Field::kCourse : inExtensions ? Field::kExtCourse : Field::kNone;
    case El::kHeartRate: return inExtensions ? Field::kHeartRate : Field::kNone;
    case El::kCadence: return inExtensions ? Field::kCadence : Field::kNone;
    default: return Field::kNone;
  }
}

std::string GpxReader::StateBetweenPoints() const {
  // Inside an open segment of a track whose start the sink has had; the track's name, the point
  // and the marker are all reset before they are used again.
  if (point_kind_ != El::kOther || extensions_depth_ != 0 || !track_open_ || track_pending_ || !segment_open_)
    return {};
  std::string out(stack_.size() + 1, '\0');
  for (size_t i = 0; i < stack_.size(); ++i) out[i] = static_cast<char>('A' + static_cast<int>(stack_[i]));
  out.back() = doc_sent_ ? 'd' : '-';
  return out;
}

void GpxReader::StartElement(detail::XmlName name, const detail::XmlAttributes& attributes) {
  const El el = classify_(name);
  const El parent = stack_.empty() ? El::kOther : stack_.back();
  const bool root = stack_.empty();
  stack_.push_back(el);
  if (root) {
    if (el != El::kGpx) {
      StopAt(DC_ERR_IMPORT_FORMAT, "not a GPX document: the root element is <" +
                                       std::string(name.view().substr(0, 64)) + ">");
    }
    return;
  }
  if (Capturing()) return;  // an element inside a text we collect
  // Tracks, routes and waypoints count only in their place under the root: the same names deeper
  // down (a stray <gpx> inside a point, say) are unknown content, never a second open track.
  const size_t depth = stack_.size();
  switch (el) {
    case El::kTrk:
    case El::kRte:
      if (parent != El::kGpx || depth != 2) break;
      SendDocument();
      track_open_ = track_pending_ = true;
      segment_open_ = false;
      track_ = ImportTrack{el == El::kTrk ? TrackKind::kTrack : TrackKind::kRoute, {}, {}};
      break;
    case El::kTrkseg:
      if (parent != El::kTrk || depth != 3 || !OpenPendingTrack()) break;
      segment_open_ = EmitSegment();
      break;
    case El::kTrkpt:
    case El::kRtept:
      if (!(el == El::kTrkpt && stack_[1] == El::kTrk && ((parent == El::kTrkseg && depth == 4) || depth == 3)) &&
          !(el == El::kRtept && parent == El::kRte && depth == 3))
        break;
      if (!OpenPendingTrack()) break;
      if (!segment_open_ && !(segment_open_ = EmitSegment())) break;
      BeginPoint(el, attributes);
      break;
    case El::kWpt:
      if (parent != El::kGpx || depth != 2) break;
      SendDocument();
      BeginPoint(el, attributes);
      break;
    case El::kExtensions:
      if (point_kind_ != El::kOther && stack_.size() == point_depth_ + 2)
        extensions_depth_ = stack_.size();
      break;
    default:
      if (const Field f = FieldOf(el, parent); f != Field::kNone) CaptureField(static_cast<int>(f), stack_.size());
      break;
  }
}

void GpxReader::EndElement() {
  if (stack_.empty()) return;
  const El el = stack_.back();
  const size_t depth = stack_.size();
  if (EndOfField(depth)) {
    stack_.pop_back();
    return;
  }
  if (depth == extensions_depth_) extensions_depth_ = 0;
  if (point_kind_ != El::kOther && depth == point_depth_ + 1) {
    EndPoint();
  } else if (el == El::kTrkseg && depth == 3) {
    segment_open_ = false;
  } else if ((el == El::kTrk || el == El::kRte) && depth == 2 && track_open_) {
    if (OpenPendingTrack()) EmitEndTrack();
    track_open_ = segment_open_ = false;
  }
  stack_.pop_back();
}

void GpxReader::BeginPoint(El kind, const detail::XmlAttributes& attributes) {
  point_ = ImportPoint{};
  if (kind == El::kWpt) marker_ = ImportMarker{};  // its texts cost; only waypoints use it
  const char* element = kind == El::kWpt ? "wpt" : kind == El::kRtept ? "rtept" : "trkpt";
  if (!ReadCoordinate(attributes, "lat", element, detail::LatitudeInRange, point_.latitude) ||
      !ReadCoordinate(attributes, "lon", element, detail::LongitudeInRange, point_.longitude))
    return;
  point_.hasPosition = true;
  point_kind_ = kind;
  point_depth_ = stack_.size() - 1;
}

void GpxReader::EndPoint() {
  const El kind = point_kind_;
  point_kind_ = El::kOther;
  extensions_depth_ = 0;
  if (kind != El::kWpt) {
    EmitPoint(point_);
    return;
  }
  EmitMarker(marker_, point_);
}

void GpxReader::StoreField(int field, std::string_view text) {
  double v = 0;
  switch (static_cast<Field>(field)) {
    case Field::kNone: break;
    case Field::kDocName: doc_name_ = text; break;
    case Field::kDocDesc: doc_desc_ = text; break;
    case Field::kTrackName: track_.name = text; break;
    case Field::kTrackDesc: track_.description = text; break;
    case Field::kMarkerName: marker_.name = text; break;
    case Field::kMarkerDesc: marker_.description = text; break;
    case Field::kMarkerCmt:
      // A comment stands in for a missing description.
      if (marker_.description.empty()) marker_.description = text;
      break;
    case Field::kMarkerSym: marker_.symbol = text; break;
    case Field::kEle:
      if (ReadNumber(text, "elevation", detail::AltitudeInRange, v)) {
        point_.altitude = v;
        point_.hasAltitude = true;
      }
      break;
    case Field::kTime: ReadTime(text, "time", point_.time); break;
    case Field::kSpeed: ReadNumber(text, "speed", detail::SpeedInRange, point_.speed); break;
    case Field::kCourse: ReadNumber(text, "course", detail::CourseInRange, point_.course); break;
    case Field::kExtSpeed:
      if (ReadNumber(text, "speed", detail::SpeedInRange, v) && point_.speed < 0) point_.speed = v;
      break;
    case Field::kExtCourse:
      if (ReadNumber(text, "course", detail::CourseInRange, v) && point_.course < 0) point_.course = v;
      break;
    case Field::kHeartRate:
      if (ReadNumber(text, "heart rate", detail::SampleInRange, v)) point_.heartRate = static_cast<int>(v);
      break;
    case Field::kCadence:
      if (ReadNumber(text, "cadence", detail::SampleInRange, v)) point_.cadence = static_cast<int>(v);
      break;
  }
}

bool GpxReader::OpenPendingTrack() {
  if (!track_open_) return false;
  if (!track_pending_) return true;
  track_pending_ = false;
  return EmitTrack(track_);
}

void GpxReader::SendDocument() {
  if (doc_sent_) return;
  doc_sent_ = true;
  if (!doc_name_.empty() || !doc_desc_.empty()) EmitDocument(doc_name_, doc_desc_);
}

}  // namespace

namespace detail {
std::unique_ptr<XmlTrackReader> NewGpxReader(ImportSink& sink) { return std::make_unique<GpxReader>(sink); }
}  // namespace detail

std::unique_ptr<TrackReader> MakeGpxReader(ImportSink& sink) { return detail::NewGpxReader(sink); }

}  // namespace navmisc::import
