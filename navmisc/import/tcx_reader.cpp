// TCX (Training Center Database v2): each lap of an activity is a track with one segment per
// <Track>; each course is a track, its course points markers. Heart rate and cadence come from
// the trackpoint, speed and running cadence from its extensions (any vendor schema, by local
// name).
#include <vector>

#include "navmisc/import/detail/values.h"
#include "navmisc/import/detail/xml_track_reader.h"
#include "navmisc/import/import_errors.h"

namespace navmisc::import {
namespace {

using detail::XmlTrackReader;

enum class El : uint8_t {
  kOther, kRoot, kActivity, kLap, kTrack, kTrackpoint, kCourse, kCoursePoint, kPosition,
  kTime, kLatitude, kLongitude, kAltitude, kHeartRateBpm, kValue, kCadence, kExtensions,
  kSpeed, kRunCadence, kName, kNotes, kPointType,
};

constexpr std::pair<std::string_view, El> kTcxNames[] = {
    {"Trackpoint", El::kTrackpoint}, {"Time", El::kTime}, {"Position", El::kPosition},
    {"LatitudeDegrees", El::kLatitude}, {"LongitudeDegrees", El::kLongitude},
    {"AltitudeMeters", El::kAltitude}, {"HeartRateBpm", El::kHeartRateBpm}, {"Value", El::kValue},
    {"Cadence", El::kCadence}, {"Extensions", El::kExtensions}, {"Speed", El::kSpeed},
    {"RunCadence", El::kRunCadence}, {"Track", El::kTrack}, {"Lap", El::kLap},
    {"Activity", El::kActivity}, {"Course", El::kCourse}, {"CoursePoint", El::kCoursePoint},
    {"Name", El::kName}, {"Notes", El::kNotes}, {"PointType", El::kPointType},
    {"TrainingCenterDatabase", El::kRoot}};

enum class Field : uint8_t {
  kNone, kTime, kLatitude, kLongitude, kAltitude, kHeartRate, kCadence, kSpeed, kRunCadence,
  kCourseName, kMarkerName, kMarkerNotes, kMarkerType, kActivityNotes,
};

class TcxReader final : public XmlTrackReader {
 public:
  using XmlTrackReader::XmlTrackReader;
  std::string_view PointElement() const override { return "Trackpoint"; }

 private:
  std::string StateBetweenPoints() const override;
  void StartElement(detail::XmlName name, const detail::XmlAttributes& attributes) override;
  void EndElement() override;

  El At(size_t fromTop) const {
    return stack_.size() > fromTop ? stack_[stack_.size() - 1 - fromTop] : El::kOther;
  }
  Field FieldOf(El el) const;
  void StoreField(int field, std::string_view text) override;
  void EndPoint();

  detail::ElementNames<El, std::size(kTcxNames)> classify_{kTcxNames, El::kOther};
  std::vector<El> stack_;
  // The open trackpoint or course point and its place in the stack (0 = none).
  size_t point_depth_ = 0;
  bool point_is_marker_ = false;
  size_t extensions_depth_ = 0;
  ImportPoint point_;
  ImportMarker marker_;
  bool have_lat_ = false, have_lon_ = false;
  double lat_ = 0, lon_ = 0;
  // The open lap or course (a track of the sink) and its place in the stack (0 = none).
  size_t track_depth_ = 0;
  bool track_sent_ = false;
  // The <Track> whose segment the sink has open, and its place in the stack (0 = none).
  size_t segment_depth_ = 0;
  ImportTrack track_;
  int lap_number_ = 0;  // within the current activity
};

Field TcxReader::FieldOf(El el) const {
  const El parent = At(1);
  const bool inPoint = point_depth_ != 0 && stack_.size() == point_depth_ + 1;
  const bool inPosition = point_depth_ != 0 && parent == El::kPosition && stack_.size() == point_depth_ + 2;
  const bool inExtensions = extensions_depth_ != 0 && stack_.size() > extensions_depth_;
  switch (el) {
    case El::kTime: return inPoint ? Field::kTime : Field::kNone;
    case El::kLatitude: return inPosition ? Field::kLatitude : Field::kNone;
    case El::kLongitude: return inPosition ? Field::kLongitude : Field::kNone;
    case El::kAltitude: return inPoint ? Field::kAltitude : Field::kNone;
    case El::kValue:
      return parent == El::kHeartRateBpm && point_depth_ != 0 && !point_is_marker_ &&
                     stack_.size() == point_depth_ + 2
                 ? Field::kHeartRate
                 : Field::kNone;
    case El::kCadence: return inPoint && !point_is_marker_ ? Field::kCadence : Field::kNone;
    case El::kSpeed: return inExtensions ? Field::kSpeed : Field::kNone;
    case El::kRunCadence: return inExtensions ? Field::kRunCadence : Field::kNone;
    case El::kName:
      if (inPoint && point_is_marker_) return Field::kMarkerName;
      return parent == El::kCourse && track_depth_ != 0 && !track_sent_ ? Field::kCourseName : Field::kNone;
    case El::kNotes:
      if (inPoint && point_is_marker_) return Field::kMarkerNotes;
      return parent == El::kActivity ? Field::kActivityNotes : Field::kNone;
    case El::kPointType: return inPoint && point_is_marker_ ? Field::kMarkerType : Field::kNone;
    default: return Field::kNone;
  }
}

std::string TcxReader::StateBetweenPoints() const {
  // Inside the open segment of a lap the sink has had. The lap's number stays in the state: the
  // next lap's name follows from it.
  if (point_depth_ != 0 || extensions_depth_ != 0 || segment_depth_ == 0 || !track_sent_) return {};
  std::string out;
  for (const El el : stack_) out += static_cast<char>('A' + static_cast<int>(el));
  out += ' ' + std::to_string(track_depth_) + ' ' + std::to_string(segment_depth_) + ' ' +
         std::to_string(lap_number_);
  return out;
}

void TcxReader::StartElement(detail::XmlName name, const detail::XmlAttributes& /*attributes*/) {
  const El el = classify_(name);
  const bool root = stack_.empty();
  stack_.push_back(el);
  if (root) {
    if (el != El::kRoot) {
      StopAt(DC_ERR_IMPORT_FORMAT, "not a TCX document: the root element is <" +
                                       std::string(name.view().substr(0, 64)) + ">");
    }
    return;
  }
  if (Capturing()) return;
  const El parent = At(1);
  switch (el) {
    case El::kActivity:
      lap_number_ = 0;
      break;
    case El::kLap:
      // A course's laps only sum the course up; an activity's laps hold its tracks.
      if (parent != El::kActivity || track_depth_ != 0) break;
      track_depth_ = stack_.size();
      track_ = ImportTrack{TrackKind::kLap, "Lap " + std::to_string(++lap_number_), {}};
      track_sent_ = EmitTrack(track_);
      break;
    case El::kCourse:
      if (track_depth_ != 0) break;
      track_depth_ = stack_.size();
      track_ = ImportTrack{TrackKind::kCourse, {}, {}};
      track_sent_ = false;
      break;
    case El::kTrack:
      if (track_depth_ == 0 || stack_.size() != track_depth_ + 1) break;
      if (!track_sent_ && !(track_sent_ = EmitTrack(track_))) break;
      if (EmitSegment()) segment_depth_ = stack_.size();
      break;
    case El::kTrackpoint:
    case El::kCoursePoint:
      if (point_depth_ != 0) break;
      // A trackpoint belongs to the segment of the <Track> just above it; a <Track> anywhere
      // else opened none.
      if (el == El::kTrackpoint && (segment_depth_ == 0 || stack_.size() != segment_depth_ + 1)) break;
      if (el == El::kCoursePoint && parent != El::kCourse) break;
      point_depth_ = stack_.size();
      point_is_marker_ = el == El::kCoursePoint;
      point_ = ImportPoint{};
      marker_ = ImportMarker{};
      have_lat_ = have_lon_ = false;
      break;
    case El::kExtensions:
      if (point_depth_ != 0 && stack_.size() == point_depth_ + 1) extensions_depth_ = stack_.size();
      break;
    default:
      if (const Field f = FieldOf(el); f != Field::kNone) CaptureField(static_cast<int>(f), stack_.size());
      break;
  }
}

void TcxReader::EndElement() {
  if (stack_.empty()) return;
  const size_t depth = stack_.size();
  if (EndOfField(depth)) {
    stack_.pop_back();
    return;
  }
  if (depth == extensions_depth_) extensions_depth_ = 0;
  if (depth == point_depth_) {
    EndPoint();
  } else if (depth == segment_depth_) {
    segment_depth_ = 0;
  } else if (depth == track_depth_) {
    if (track_sent_) EmitEndTrack();
    track_depth_ = 0;
    track_sent_ = false;
  }
  stack_.pop_back();
}

void TcxReader::EndPoint() {
  point_depth_ = 0;
  extensions_depth_ = 0;
  if (have_lat_ && have_lon_) {
    point_.latitude = lat_;
    point_.longitude = lon_;
    point_.hasPosition = true;
  }
  if (!point_is_marker_) {
    EmitPoint(point_);
    return;
  }
  if (!point_.hasPosition) return;  // a course point names a place
  EmitMarker(marker_, point_);
}

void TcxReader::StoreField(int field, std::string_view text) {
  double v = 0;
  switch (static_cast<Field>(field)) {
    case Field::kNone: break;
    case Field::kTime: ReadTime(text, "Time", point_.time); break;
    case Field::kLatitude:
      have_lat_ = ReadNumber(text, "LatitudeDegrees", detail::LatitudeInRange, lat_);
      break;
    case Field::kLongitude:
      have_lon_ = ReadNumber(text, "LongitudeDegrees", detail::LongitudeInRange, lon_);
      break;
    case Field::kAltitude:
      if (ReadNumber(text, "AltitudeMeters", detail::AltitudeInRange, v)) {
        point_.altitude = v;
        point_.hasAltitude = true;
      }
      break;
    case Field::kHeartRate:
      if (ReadNumber(text, "HeartRateBpm", detail::SampleInRange, v)) point_.heartRate = static_cast<int>(v);
      break;
    case Field::kCadence:
      if (ReadNumber(text, "Cadence", detail::SampleInRange, v)) point_.cadence = static_cast<int>(v);
      break;
    case Field::kRunCadence:
      if (ReadNumber(text, "RunCadence", detail::SampleInRange, v) && point_.cadence < 0)
        point_.cadence = static_cast<int>(v);
      break;
    case Field::kSpeed: ReadNumber(text, "Speed", detail::SpeedInRange, point_.speed); break;
    case Field::kCourseName: track_.name = text; break;
    case Field::kMarkerName: marker_.name = text; break;
    case Field::kMarkerNotes: marker_.description = text; break;
    case Field::kMarkerType: marker_.symbol = text; break;
    case Field::kActivityNotes: EmitDocument({}, std::string(text)); break;
  }
}

}  // namespace

namespace detail {
std::unique_ptr<XmlTrackReader> NewTcxReader(ImportSink& sink) { return std::make_unique<TcxReader>(sink); }
}  // namespace detail

std::unique_ptr<TrackReader> MakeTcxReader(ImportSink& sink) { return detail::NewTcxReader(sink); }

}  // namespace navmisc::import
