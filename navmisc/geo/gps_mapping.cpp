#include "navmisc/geo/gps_mapping.h"

#include <algorithm>
#include <bit>
#include <climits>
#include <cmath>
#include <cstring>
#include <limits>
#include <unordered_map>
#include <vector>

#include "navmisc/geo/trace.h"
#include "navmisc/records/photo.h"
#include "navmisc/records/track.h"

// ---- CGPSMapping -------------------------------------------------------------------------------

CGPSMapping::CGPSMapping(const sWayPoint* points, int count) {
  if (!points || count <= 0) return;
  m_pPoints = new sWayPoint[static_cast<size_t>(count)];
  for (int i = 0; i < count; ++i) m_pPoints[i] = points[i];
  m_nCount = count;
}

CGPSMapping::~CGPSMapping() { delete[] m_pPoints; }

sWayPoint* CGPSMapping::_Expand2(const sWayPoint* p1, const sWayPoint* p2, int& count,
                                 int limit) {
  count = 0;
  if (!p1 || !p2) return nullptr;
  const long long span = static_cast<long long>(p2->time) - p1->time;
  long long n = span + 1;
  double step = 0.0;
  if (limit > 0 && n > limit) {
    step = static_cast<double>(n) / limit;
    n = limit;
  }
  if (n < 1) return nullptr;
  sWayPoint* out = new sWayPoint[static_cast<size_t>(n)];
  out[0] = *p1;
  if (n == 1) {
    count = 1;
    return out;
  }
  out[n - 1] = *p2;
  const double lat1 = p1->latitude, lon1 = p1->longitude;
  const double lat2 = p2->latitude, lon2 = p2->longitude;
  const int32_t speed =
      static_cast<int32_t>((static_cast<double>(p1->speed) + static_cast<double>(p2->speed)) * 0.5);
  const double altitude = (p1->altitude + p2->altitude) * 0.5;
  const double leg = GetDistance(lat1, lon1, lat2, lon2, DIS_KILOMETER) / static_cast<double>(n - 1);
  const double bearing = GetInitialBearing(lat1, lon1, lat2, lon2);
  for (long long k = 1; k <= n - 2; ++k) {
    sWayPoint& r = out[k];
    double lat = 0.0, lon = 0.0;
    GetDestinationPoint(lat1, lon1, bearing, static_cast<double>(k) * leg, lat, lon);
    r.latitude = lat;
    r.longitude = lon;
    r.altitude = altitude;
    r.speed = speed;
    r.time = step == 0.0 ? static_cast<int32_t>(p1->time + k)
                         : static_cast<int32_t>(p1->time + static_cast<long long>(k * step));
    r.valid = r.time != -1 ? 1 : 0;
    r.extraA = 0;
  }
  count = static_cast<int>(n);
  return out;
}

sWayPoint* CGPSMapping::_Expand(const sWayPoint* p1, const sWayPoint* p2, int& count) {
  return _Expand2(p1, p2, count, 0);
}

int CGPSMapping::MappingTimeToPoint(long time, sWayPoint& point) {
  if (!m_pPoints || m_nCount < 2) return 0;
  for (int i = 1; i < m_nCount; ++i) {
    navmisc::GeoTrace("\r\nType = %d", static_cast<int>(m_pPoints[i].extraA));
    const long t0 = m_pPoints[i - 1].time, t1 = m_pPoints[i].time;
    if (time == t0 || time == t1 || (t0 <= time && time <= t1)) {
      return _MapTimeOnLeg(i, time, point);
    }
  }
  return 0;
}

int CGPSMapping::_MapTimeOnLeg(int i, long time, sWayPoint& point) {
  // A time that a point carries is answered by that point, the leg's start first.
  if (time == m_pPoints[i - 1].time) {
    point = m_pPoints[i - 1];
    return 1;
  }
  if (time == m_pPoints[i].time) {
    point = m_pPoints[i];
    return 1;
  }
  return _MapTimeWithinLeg(i, time, point);
}

int CGPSMapping::_MapTimeWithinLeg(int i, long time, sWayPoint& point) {
  // A leg that starts at a point marked -8 is not interpolated: the logger was not moving along it.
  if (m_pPoints[i - 1].extraA == -8) {
    point = m_pPoints[i - 1];
    return 1;
  }
  int n = 0;
  navmisc::WayPointArray leg(_Expand2(&m_pPoints[i - 1], &m_pPoints[i], n, 1000));
  if (!leg || n < 2) return 0;
  for (int k = 1; k < n; ++k) {
    const long t0 = leg[k - 1].time, t1 = leg[k].time;
    if (t0 <= time && time <= t1) {
      point = (t1 - time) < (time - t0) ? leg[k] : leg[k - 1];
      return 1;
    }
  }
  return 0;
}

int CGPSMapping::MappingPointToTime(sWayPoint point, long& time, double tolerance) {
  if (!m_pPoints || m_nCount < 1) return 0;
  if (m_nCount == 1) {
    time = m_pPoints[0].time;
    return 1;
  }
  const double lat = point.latitude, lon = point.longitude;
  int best = -1;
  double bestDistance = 0.0;
  for (int i = 0; i + 1 < m_nCount; ++i) {
    if (lat == m_pPoints[i].latitude && lon == m_pPoints[i].longitude) {
      time = m_pPoints[i].time;
      return 1;
    }
    const double d = _GetMinDistance(m_pPoints[i].latitude, m_pPoints[i].longitude,
                                     m_pPoints[i + 1].latitude, m_pPoints[i + 1].longitude, lat,
                                     lon, nullptr);
    if (best < 0 || d < bestDistance) {
      best = i;
      bestDistance = d;
    }
  }
  return _MapPointNearLeg(best, lat, lon, time, tolerance);
}

int CGPSMapping::_MapPointNearLeg(int i, double latitude, double longitude, long& time,
                                  double tolerance) {
  int n = 0;
  navmisc::WayPointArray leg(_Expand2(&m_pPoints[i], &m_pPoints[i + 1], n, 1000));
  int found = -1;
  double foundDistance = 0.0;
  for (int k = 0; k < n; ++k) {
    const double d =
        GetDistance(leg[k].latitude, leg[k].longitude, latitude, longitude, DIS_KILOMETER) * 1000.0;
    if (!(d > tolerance) && (found < 0 || d < foundDistance)) {
      found = k;
      foundDistance = d;
    }
  }
  if (found < 0) return 0;
  time = leg[found].time;
  return 1;
}

// ---- the indexed copy of one track -------------------------------------------------------------

namespace {

using navmisc::geo::UnitVector;

// A working copy with two indexes that answer exactly as the plain scans do:
//  - times: when they never decrease, the enclosing leg is found by binary search (the plain
//    scan's first match is then the first leg whose end is not earlier than the time);
//  - positions: legs are grouped in blocks with a bounding cap on the sphere. A block whose cap
//    is farther than a distance already achieved cannot hold the nearest leg, so it is skipped;
//    the remaining legs are measured with the very same function, in order, with the same
//    "strictly nearer replaces" rule, so ties resolve as in the plain scan. The exact-position
//    shortcut of the plain scan (first recorded point equal to the position) is a hash lookup.
class IndexedTrack : public CGPSMapping {
 public:
  IndexedTrack(const sWayPoint* points, int count) : CGPSMapping(points, count) { Build(); }

  int TimeToPoint(long time, sWayPoint& point) {
    if (m_nCount < 2) return 0;
    if (!sorted_) return MappingTimeToPoint(time, point);
    const auto it = std::lower_bound(times_.begin(), times_.end(), time,
                                     [](int32_t a, long t) { return a < t; });
    if (it == times_.end()) return 0;
    const int i = std::max(1, static_cast<int>(it - times_.begin()));
    const long t0 = times_[i - 1], t1 = times_[i];
    if (!(t0 <= time && time <= t1)) return 0;
    return _MapTimeOnLeg(i, time, point);
  }

  int PointToTime(double lat, double lon, long& time, double tolerance) {
    if (m_nCount < 1) return 0;
    if (m_nCount == 1) {
      time = m_pPoints[0].time;
      return 1;
    }
    if (const auto hit = exact_.find(Key(lat, lon)); hit != exact_.end()) {
      time = m_pPoints[hit->second].time;
      return 1;
    }
    const UnitVector p = navmisc::geo::ToUnitVector(lat, lon);
    // Lower bounds per block, and an achieved distance from the most promising block.
    lower_.resize(blocks_.size());
    size_t start = 0;
    for (size_t b = 0; b < blocks_.size(); ++b) {
      const Block& blk = blocks_[b];
      lower_[b] = blk.bounded ? (navmisc::geo::AngleBetween(p, blk.centre) - blk.radius) *
                                    navmisc::geo::kEarthRadiusKm
                              : -std::numeric_limits<double>::infinity();
      if (lower_[b] < lower_[start]) start = b;
    }
    double achieved = std::numeric_limits<double>::infinity();
    for (int i = blocks_[start].first; i < blocks_[start].last; ++i) {
      const double d = LegDistance(i, p);
      if (d < achieved) achieved = d;
    }
    // The plain scan starts from leg 0 whatever its distance (even a NaN one, which nothing
    // then replaces) and moves on only to strictly nearer legs.
    int best = 0;
    double bestDistance = LegDistance(0, p);
    if (!std::isnan(bestDistance)) {
      for (size_t b = 0; b < blocks_.size(); ++b) {
        if (lower_[b] > achieved) continue;
        for (int i = blocks_[b].first; i < blocks_[b].last; ++i) {
          const double d = LegDistance(i, p);
          if (d < bestDistance) {
            best = i;
            bestDistance = d;
          }
        }
      }
    }
    return _MapPointNearLeg(best, lat, lon, time, tolerance);
  }

 private:
  static constexpr int kBlockLegs = 32;
  // Caps wider than this (radians) are not used for bounds; a track's legs never come close.
  static constexpr double kMaxCapRadius = 1.0;
  // Covers the rounding of the angles compared against the caps (radians, about 6 m), with a
  // wide margin even for a position nearly opposite the track, where asin loses the most.
  static constexpr double kCapSlack = 1e-6;

  struct Block {
    int first = 0, last = 0;  // legs [first, last), that is points first .. last
    UnitVector centre{0, 0, 0};
    double radius = 0.0;
    bool bounded = false;
  };
  struct PositionKey {
    uint64_t lat, lon;
    bool operator==(const PositionKey&) const = default;
  };
  struct KeyHash {
    size_t operator()(const PositionKey& k) const {
      return std::hash<uint64_t>()(k.lat * 0x9E3779B97F4A7C15ull ^ k.lon);
    }
  };
  // Adding 0.0 turns -0.0 into 0.0, which compares equal to it.
  static PositionKey Key(double lat, double lon) {
    return {std::bit_cast<uint64_t>(lat + 0.0), std::bit_cast<uint64_t>(lon + 0.0)};
  }

  double LegDistance(int i, const UnitVector& p) const {
    return navmisc::geo::SegmentDistanceKm(vectors_[i], vectors_[i + 1], p, nullptr);
  }

  void Build() {
    const int n = m_nCount;
    times_.resize(static_cast<size_t>(n));
    vectors_.resize(static_cast<size_t>(n));
    sorted_ = true;
    for (int i = 0; i < n; ++i) {
      times_[i] = m_pPoints[i].time;
      if (i > 0 && times_[i] < times_[i - 1]) sorted_ = false;
      vectors_[i] = navmisc::geo::ToUnitVector(m_pPoints[i].latitude, m_pPoints[i].longitude);
    }
    // The plain scan tests points 0 .. n-2 for an exact match and stops at the first.
    exact_.reserve(static_cast<size_t>(n));
    for (int i = 0; i + 1 < n; ++i) {
      const double lat = m_pPoints[i].latitude, lon = m_pPoints[i].longitude;
      if (std::isnan(lat) || std::isnan(lon)) continue;
      exact_.emplace(Key(lat, lon), i);
    }
    for (int first = 0; first + 1 < n; first += kBlockLegs) {
      Block blk;
      blk.first = first;
      blk.last = std::min(first + kBlockLegs, n - 1);
      double sx = 0, sy = 0, sz = 0;
      for (int j = blk.first; j <= blk.last; ++j) {
        sx += vectors_[j].x;
        sy += vectors_[j].y;
        sz += vectors_[j].z;
      }
      const double len = std::sqrt(sx * sx + sy * sy + sz * sz);
      if (len > 1e-9 && std::isfinite(len)) {
        blk.centre = {sx / len, sy / len, sz / len};
        double radius = 0.0;
        for (int j = blk.first; j <= blk.last; ++j) {
          radius = std::max(radius, navmisc::geo::AngleBetween(blk.centre, vectors_[j]));
        }
        blk.radius = radius + kCapSlack;
        blk.bounded = blk.radius < kMaxCapRadius;
      }
      blocks_.push_back(blk);
    }
  }

  bool sorted_ = true;
  std::vector<int32_t> times_;
  std::vector<UnitVector> vectors_;
  std::vector<Block> blocks_;
  std::vector<double> lower_;
  std::unordered_map<PositionKey, int, KeyHash> exact_;
};

struct ListStamp {
  int count = 0;
  const void* head = nullptr;
  const void* tail = nullptr;
  bool operator==(const ListStamp&) const = default;
};

ListStamp StampOf(const CPtrList& points) {
  ListStamp s;
  s.count = points.GetCount();
  if (s.count > 0) {
    s.head = points.GetHead();
    s.tail = points.GetTail();
  }
  return s;
}

thread_local navmisc::TrackMappingScope* t_scope = nullptr;

}  // namespace

namespace navmisc {

struct TrackMappingScope::Impl {
  struct Entry {
    ListStamp stamp;
    std::unique_ptr<IndexedTrack> index;
  };
  std::unordered_map<const CPtrList*, Entry> entries;

  IndexedTrack& For(const CPtrList& points) {
    Entry& e = entries[&points];
    const ListStamp stamp = StampOf(points);
    if (!e.index || !(e.stamp == stamp)) {
      WayPointArray array = MakeWayPointArray(points);
      e.index = std::make_unique<IndexedTrack>(array.get(), points.GetCount());
      e.stamp = stamp;
    }
    return *e.index;
  }
};

TrackMappingScope::TrackMappingScope() : impl_(std::make_unique<Impl>()), previous_(t_scope) {
  t_scope = this;
}

TrackMappingScope::~TrackMappingScope() { t_scope = previous_; }

}  // namespace navmisc

// ---- per track ---------------------------------------------------------------------------------

bool TRACK_ITEM_INFO::MappingTimeToPoint(long time, double& latitude, double& longitude,
                                         long& speed, double& altitude) {
  latitude = 0.0;
  longitude = 0.0;
  sWayPoint answer;
  int found = 0;
  if (t_scope) {
    found = t_scope->impl().For(points).TimeToPoint(time, answer);
  } else {
    navmisc::WayPointArray array = navmisc::MakeWayPointArray(points);
    CGPSMapping mapping(array.get(), points.GetCount());
    array.reset();
    found = mapping.MappingTimeToPoint(time, answer);
  }
  if (!found) return false;
  latitude = answer.latitude;
  longitude = answer.longitude;
  speed = answer.speed;
  altitude = answer.altitude;
  return true;
}

long TRACK_ITEM_INFO::MappingPointToTime(double latitude, double longitude, double tolerance) {
  long time = -1;
  int found = 0;
  if (t_scope) {
    found = t_scope->impl().For(points).PointToTime(latitude, longitude, time, tolerance);
  } else {
    navmisc::WayPointArray array = navmisc::MakeWayPointArray(points);
    CGPSMapping mapping(array.get(), points.GetCount());
    array.reset();
    sWayPoint where;
    where.latitude = latitude;
    where.longitude = longitude;
    found = mapping.MappingPointToTime(where, time, tolerance);
  }
  return found ? time : -1;
}

// ---- over a trip's tracks ----------------------------------------------------------------------

namespace {

bool Tried(const TRACK_ITEM_INFO* track, const wchar_t* trackId) {
  return track && (!trackId || !trackId[0] || track->id == trackId);
}

// The track's point at `time` into the outputs, which stay untouched when the track has none.
bool PointAt(TRACK_ITEM_INFO& track, long time, double& latitude, double& longitude,
             double& altitude, long& speed) {
  double lat = 0.0, lon = 0.0, alt = 0.0;
  long spd = 0;
  if (!track.MappingTimeToPoint(time, lat, lon, spd, alt)) return false;
  latitude = lat;
  longitude = lon;
  altitude = alt;
  speed = spd;
  return true;
}

}  // namespace

TRACK_ITEM_INFO* GetTrackGPSFromTime(const CPtrList& tracks, long time, double& latitude,
                                     double& longitude, double& altitude, long& speed,
                                     const wchar_t* trackId) {
  for (const TRACK_ITEM_INFO* c : navmisc::Items<const TRACK_ITEM_INFO>(tracks)) {
    auto* track = const_cast<TRACK_ITEM_INFO*>(c);
    if (Tried(track, trackId) && PointAt(*track, time, latitude, longitude, altitude, speed)) {
      return track;
    }
  }
  return nullptr;
}

TRACK_ITEM_INFO* GetTrackTimeFromGPS(const CPtrList& tracks, double tolerance, double& latitude,
                                     double& longitude, double& altitude, long& speed, long& time,
                                     const wchar_t* trackId) {
  for (const TRACK_ITEM_INFO* c : navmisc::Items<const TRACK_ITEM_INFO>(tracks)) {
    auto* track = const_cast<TRACK_ITEM_INFO*>(c);
    if (!Tried(track, trackId)) continue;
    const long t = track->MappingPointToTime(latitude, longitude, tolerance);
    if (t == -1) continue;
    time = t;
    if (PointAt(*track, t, latitude, longitude, altitude, speed)) return track;
  }
  return nullptr;
}

bool MappingGPSAndTrack(const CPtrList& tracks, double tolerance, CString& trackId,
                        double& latitude, double& longitude, double& altitude, long& speed,
                        long& time) {
  if (time > 0) {
    TRACK_ITEM_INFO* track =
        GetTrackGPSFromTime(tracks, time, latitude, longitude, altitude, speed, trackId);
    if (!track && !trackId.IsEmpty()) {
      track = GetTrackGPSFromTime(tracks, time, latitude, longitude, altitude, speed, L"");
    }
    if (track) {
      trackId = track->id;
      return true;
    }
  }
  if (latitude != 0.0 && longitude != 0.0) {
    time = -1;
    TRACK_ITEM_INFO* track = GetTrackTimeFromGPS(tracks, tolerance, latitude, longitude,
                                                 altitude, speed, time, trackId);
    if (!track && !trackId.IsEmpty()) {
      track = GetTrackTimeFromGPS(tracks, tolerance, latitude, longitude, altitude, speed, time,
                                  L"");
    }
    if (track) {
      trackId = track->id;
      return true;
    }
  }
  trackId.Empty();
  time = -1;
  latitude = longitude = altitude = 0.0;
  speed = 0;
  return false;
}

bool MappingGPSAndTrack(const CPtrList& tracks, double tolerance, PHOTO_ITEM_INFO* photo) {
  if (!photo) return false;
  long speed = photo->speed;
  long time = photo->playbackTime;
  const bool placed = MappingGPSAndTrack(tracks, tolerance, photo->trackItemId, photo->latitude,
                                         photo->longitude, photo->altitude, speed, time);
  photo->speed = static_cast<int32_t>(speed);
  photo->playbackTime = static_cast<int32_t>(time);
  return placed;
}

// ---- keeping lists in order --------------------------------------------------------------------

namespace {

bool Unplaced(const PHOTO_ITEM_INFO* p) { return p->latitude == 0.0 && p->longitude == 0.0; }

// True when `photo` belongs before `entry`.
bool PhotoGoesBefore(const PHOTO_ITEM_INFO* photo, const PHOTO_ITEM_INFO* entry) {
  if (Unplaced(photo)) return Unplaced(entry) && entry->originalTime >= photo->originalTime;
  if (photo->playbackTime >= 1) {
    return Unplaced(entry) || entry->playbackTime < 1 || entry->playbackTime >= photo->playbackTime;
  }
  return Unplaced(entry) || (entry->playbackTime < 1 && entry->originalTime >= photo->originalTime);
}

long StartTime(const TRACK_ITEM_INFO* track) {
  if (track->points.IsEmpty() || !track->points.GetHead()) return LONG_MAX;
  return static_cast<const WAYPOINT_ITEM_INFO*>(track->points.GetHead())->time;
}

}  // namespace

void InsertItemToPhotoList(CPtrList& photos, PHOTO_ITEM_INFO* photo) {
  if (!photo) return;
  for (POSITION pos = photos.GetHeadPosition(); pos;) {
    const POSITION at = pos;
    const auto* entry = static_cast<const PHOTO_ITEM_INFO*>(photos.GetNext(pos));
    if (entry && PhotoGoesBefore(photo, entry)) {
      photos.InsertBefore(at, photo);
      return;
    }
  }
  photos.AddTail(photo);
}

void InsertItemToTrackList(CPtrList& tracks, TRACK_ITEM_INFO* track) {
  if (!track) return;
  const long start = StartTime(track);
  for (POSITION pos = tracks.GetHeadPosition(); pos;) {
    const POSITION at = pos;
    const auto* entry = static_cast<const TRACK_ITEM_INFO*>(tracks.GetNext(pos));
    if (entry && StartTime(entry) > start) {
      tracks.InsertBefore(at, track);
      return;
    }
  }
  tracks.AddTail(track);
}
