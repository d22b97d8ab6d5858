// A track's points read from its point file one at a time, for work that looks at each point
// once (an export of a track too long to hold in memory).
#pragma once

#include "navmisc/platform/line_reader.h"
#include "navmisc/records/items.h"

class TRACK_ITEM_INFO;

namespace navmisc {

class TrackPointReader {
 public:
  TrackPointReader();
  TrackPointReader(const TrackPointReader&) = delete;
  TrackPointReader& operator=(const TrackPointReader&) = delete;

  // Opens `track`'s ".BIN" file. False when there is none (the track then has no points).
  bool Open(const TRACK_ITEM_INFO& track);
  // Fills `p` with the next point as TRACK_ITEM_INFO::ReadAllWaypoint loads it (times shifted by
  // the profile; a file of a single point yields that point and then a copy one second later).
  // False at the end. The fields a line holds are reset before it is read; the others keep what
  // `p` has, so pass the same default record each time.
  bool Next(WAYPOINT_ITEM_INFO& p);
  // The number of points Next yields for `track`, found by one pass over the file's lines.
  static long long Count(const TRACK_ITEM_INFO& track);

 private:
  LineReader reader_;
  long shift_ = 0;
  long long read_ = 0;
  bool copied_ = false;
  WAYPOINT_ITEM_INFO first_;
};

}  // namespace navmisc
