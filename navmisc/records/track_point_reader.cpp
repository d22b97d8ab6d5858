#include "navmisc/records/track_point_reader.h"

#include "navmisc/records/point_codec.h"
#include "navmisc/records/point_file_format.h"
#include "navmisc/records/trip.h"
#include "navmisc/records/user_profile.h"

namespace navmisc {

TrackPointReader::TrackPointReader() : reader_(point_file::kMaxLine) {}

bool TrackPointReader::Open(const TRACK_ITEM_INFO& track) {
  shift_ = track.trip ? GetProfileTimeShift(track.trip->appType) : 0;
  read_ = 0;
  copied_ = false;
  return reader_.Open(track.GetFilePathName());
}

bool TrackPointReader::Next(WAYPOINT_ITEM_INFO& p) {
  std::string_view line;
  if (reader_.Next(line)) {
    // A line that breaks off leaves the fields after the break at their defaults.
    p.time = -1;
    p.latitude = p.longitude = p.altitude = 0.0;
    p.speed = p.type = p.extraA = p.extraB = 0;
    p.course = -1;
    point_file::ScanPointLine(line, p);
    // Times stored by the old release need the profile's shift; the writer never removes it.
    p.time = static_cast<int32_t>(static_cast<uint32_t>(p.time) + static_cast<uint32_t>(shift_));
    if (++read_ == 1) first_ = WAYPOINT_ITEM_INFO(&p);
    return true;
  }
  // Every loaded track has at least two points.
  if (read_ != 1 || copied_) return false;
  copied_ = true;
  p = WAYPOINT_ITEM_INFO(&first_);
  p.time = static_cast<int32_t>(static_cast<uint32_t>(first_.time) + 1u);  // wraps, never overflows
  return true;
}

long long TrackPointReader::Count(const TRACK_ITEM_INFO& track) {
  LineReader reader(point_file::kMaxLine);
  if (!reader.Open(track.GetFilePathName())) return 0;
  long long lines = 0;
  std::string_view line;
  while (reader.Next(line)) ++lines;
  return lines == 1 ? 2 : lines;
}

}  // namespace navmisc
