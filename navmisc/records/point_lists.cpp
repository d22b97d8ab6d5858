#include "navmisc/records/point_lists.h"

#include <string>

#include "navmisc/platform/line_reader.h"
#include "navmisc/records/point_codec.h"
#include "navmisc/records/track.h"

namespace navmisc::point_file {
namespace {

constexpr size_t kFlushAt = 1 << 16;

// One kind of file: its list in the track, its record type, and how a record becomes a line and
// a line a record.
template <class T>
struct Codec {
  using Record = T;
  CPtrList TRACK_ITEM_INFO::*list;
  void (*append)(std::string&, const T&);
  void (*parse)(std::string_view, T&);
};

void AppendHeartRate(std::string& out, const HEARTRATE_ITEM_INFO& r) {
  AppendHeartRateLine(out, r.time, r.values, HEARTRATE_ITEM_INFO::kValues);
}
void AppendCadence(std::string& out, const CYCLING_CADENCE_RPM_ITEM_INFO& r) {
  AppendHeartRateLine(out, r.time, r.values, CYCLING_CADENCE_RPM_ITEM_INFO::kValues);
}
void ParseHeartRate(std::string_view line, HEARTRATE_ITEM_INFO& r) {
  ParseByteSampleLine(line, r.time, r.values, HEARTRATE_ITEM_INFO::kValues);
}
void ParseCadence(std::string_view line, CYCLING_CADENCE_RPM_ITEM_INFO& r) {
  ParseByteSampleLine(line, r.time, r.values, CYCLING_CADENCE_RPM_ITEM_INFO::kValues);
}
void ParsePoint(std::string_view line, WAYPOINT_ITEM_INFO& p) { ScanPointLine(line, p); }

// Calls `f` with the codec of `kind`.
template <class F>
void WithCodec(Kind kind, F f) {
  switch (kind) {
    case Kind::kPoints:
      return f(Codec<WAYPOINT_ITEM_INFO>{&TRACK_ITEM_INFO::points, AppendPointLine, ParsePoint});
    case Kind::kCellFixes:
      return f(Codec<BASE_ITEM_INFO>{&TRACK_ITEM_INFO::cellFixes, AppendCellFixLine, ParseCellFixLine});
    case Kind::kHelpPoints:
      return f(Codec<WAYPOINT_ITEM_INFO>{&TRACK_ITEM_INFO::helpPoints, AppendHelpPointLine, ParseHelpPointLine});
    case Kind::kHeartRate:
      return f(Codec<HEARTRATE_ITEM_INFO>{&TRACK_ITEM_INFO::heartRates, AppendHeartRate, ParseHeartRate});
    case Kind::kCadence:
      return f(Codec<CYCLING_CADENCE_RPM_ITEM_INFO>{&TRACK_ITEM_INFO::cadences, AppendCadence, ParseCadence});
    case Kind::kWheelSpeed:
      return f(Codec<WHEEL_SPEED_ITEM_INFO>{&TRACK_ITEM_INFO::wheelSpeeds, AppendWheelSpeedLine, ParseWheelSpeedLine});
  }
}

}  // namespace

void ReadList(Kind kind, LineReader& lines, TRACK_ITEM_INFO& track, long shift) {
  WithCodec(kind, [&](auto codec) {
    using T = typename decltype(codec)::Record;
    CPtrList& list = track.*codec.list;
    DeleteAll<T>(list);
    std::string_view line;
    while (lines.Next(line)) {
      auto* rec = new T(static_cast<const T*>(nullptr));
      codec.parse(line, *rec);
      if constexpr (std::is_same_v<T, WAYPOINT_ITEM_INFO>) {
        // Times stored by the old release need the profile's shift; the writer never removes it.
        if (kind == Kind::kPoints)
          rec->time = static_cast<int32_t>(static_cast<uint32_t>(rec->time) + static_cast<uint32_t>(shift));
      }
      list.AddTail(rec);
    }
  });
}

void EncodeList(Kind kind, const TRACK_ITEM_INFO& track, const std::function<void(std::string_view)>& flush,
                int* counter, bool* keepGoing) {
  WithCodec(kind, [&](auto codec) {
    using T = typename decltype(codec)::Record;
    std::string buf;
    buf.reserve(kFlushAt + 512);
    for (const T* rec : Items<T>(track.*codec.list)) {
      if (keepGoing && !*keepGoing) break;
      if (rec) codec.append(buf, *rec);
      if (buf.size() >= kFlushAt) {
        flush(buf);
        buf.clear();
      }
      if (counter) ++*counter;
    }
    flush(buf);
  });
}

bool ListIsEmpty(Kind kind, const TRACK_ITEM_INFO& track) {
  bool empty = true;
  WithCodec(kind, [&](auto codec) { empty = (track.*codec.list).IsEmpty(); });
  return empty;
}

}  // namespace navmisc::point_file
