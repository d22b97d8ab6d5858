#include "navmisc/geo/optimize.h"

#include <algorithm>
#include <array>
#include <unordered_set>

#include "navmisc/geo/gps_helper.h"
#include "navmisc/geo/detail/douglas_peucker.h"
#include "navmisc/records/trip.h"

namespace navmisc {
namespace {

constexpr int kKept = WAYPOINT_ITEM_INFO::kFlagKept;

// The points of a track cross the passes as arrays: a point record is large and lives on its
// own, so every walk over the records costs a trip through memory, and the passes are arranged
// to touch each record as few times as possible. The entries of a list are distinct records
// (a track owns each of its points once).
using Entries = std::vector<WAYPOINT_ITEM_INFO*>;

// The points still at 10000 with their working records, in list order.
struct Working {
  Entries points;
  std::vector<sWayPoint> records;
};

void Advance(int* progress) {
  if (progress) *progress += 100;
}

bool Cancelled(const bool* keepGoing) { return keepGoing && !*keepGoing; }

const std::vector<double>& Tolerances() {
  static const std::vector<double> tolerances = [] {
    std::vector<double> t(kSmoothSteps + 1);
    for (int k = 0; k <= kSmoothSteps; ++k) t[k] = SmoothLevelTolerance(k);
    return t;
  }();
  return tolerances;
}

// Every point to 10000, then (more than 50 entries) Revise as its list wrapper runs it, with the
// points it does not keep at -2. Returns the points still at 10000.
Working LevelBadFixes(const Entries& entries) {
  const int n = static_cast<int>(entries.size());
  const bool revise = n > 50;
  Working working;
  // The wrapper's array: one record per non-null entry, in order, the rest left at the defaults.
  // It becomes the working records in place below.
  std::vector<sWayPoint>& all = working.records;
  all.resize(entries.size());
  int next = 0;
  for (WAYPOINT_ITEM_INFO* p : entries) {
    if (!p) continue;
    p->type = kLevelNeverDropped;
    if (revise) p->flags[kKept] = 0;
    all[next++] = ToWayPoint(*p);
  }
  if (revise) {
    CGPSHelper helper;
    int count = n;
    helper.Revise(all.data(), count);
  }
  // Entry k takes its mark from record k and its data from record `own` (its own record, at or
  // before k); the working records are written at `still`, at or before `own`, so nothing is
  // overwritten before it is read.
  size_t own = 0, still = 0;
  for (int k = 0; k < n; ++k) {
    WAYPOINT_ITEM_INFO* p = entries[k];
    if (!p) continue;
    if (revise) {
      // Record k answers for entry k, as in the wrapper (null entries shift the records).
      if (all[k].valid == 1) p->flags[kKept] = 1;
      if (!p->flags[kKept] && p->type == kLevelNeverDropped) p->type = kLevelBadFix;
    }
    if (p->type == kLevelNeverDropped) {
      sWayPoint record = all[own];
      record.valid = 1;
      all[still++] = record;
      working.points.push_back(p);
    }
    ++own;
  }
  all.resize(still);
  return working;
}

// Reduction over the working points when there are more than 100, with the points it does not
// keep at -1; the working points keep only those still at 10000.
void LevelStops(Working& working) {
  if (working.points.size() <= 100) return;
  CGPSHelper helper;
  int count = static_cast<int>(working.points.size());
  helper.Reduce(working.records.data(), count);
  size_t still = 0;
  for (size_t i = 0; i < working.points.size(); ++i) {
    WAYPOINT_ITEM_INFO* p = working.points[i];
    p->flags[kKept] = working.records[i].valid == 1 ? 1 : 0;
    if (!p->flags[kKept] && p->type == kLevelNeverDropped) p->type = kLevelStop;
    if (p->type != kLevelNeverDropped) continue;
    working.points[still] = p;
    working.records[still] = working.records[i];
    ++still;
  }
  working.points.resize(still);
  working.records.resize(still);
}

std::vector<int> KeepLevels(const std::vector<double>& xs, const std::vector<double>& ys) {
  return geo::SimplifyLevels(xs.data(), ys.data(), static_cast<int>(xs.size()), Tolerances());
}

// The smoothing steps from 100 down to 0. Every point's level is known up front and the steps
// only hand the levels out, so a cancelled run stops in exactly the state that one Smooth run
// per step would leave.
bool HandOutLevels(const Working& working, bool smoothing, int* progress, bool* keepGoing) {
  std::vector<int> levels;
  std::array<Entries, kSmoothSteps + 1> byLevel;
  if (smoothing) {
    std::vector<double> xs, ys;
    xs.reserve(working.records.size());
    ys.reserve(working.records.size());
    for (const sWayPoint& w : working.records) {
      // By value: a packed double must not be bound to a reference.
      const double lon = w.longitude, lat = w.latitude;
      xs.push_back(lon);
      ys.push_back(lat);
    }
    levels = KeepLevels(xs, ys);
    for (size_t i = 0; i < levels.size(); ++i) byLevel[levels[i]].push_back(working.points[i]);
  }
  for (int k = kSmoothSteps; k >= 0; --k) {
    for (WAYPOINT_ITEM_INFO* p : byLevel[k]) {
      if (p->type == kLevelNeverDropped) p->type = k;
    }
    Advance(progress);
    if (Cancelled(keepGoing)) {
      // Smooth at this step would have kept the points of level k or more. The others still
      // carry the mark of the reduction step, which kept every working point.
      for (size_t i = 0; i < levels.size(); ++i) {
        if (levels[i] < k) working.points[i]->flags[kKept] = 0;
      }
      return false;
    }
  }
  // Smooth with tolerance 0 keeps every point: the marks of the reduction step stand.
  return true;
}

}  // namespace

std::vector<int> SmoothKeepLevels(const CPtrList& points) {
  std::vector<double> xs, ys;
  for (const WAYPOINT_ITEM_INFO* p : Items<const WAYPOINT_ITEM_INFO>(points)) {
    if (!p) continue;
    xs.push_back(p->longitude);
    ys.push_back(p->latitude);
  }
  return KeepLevels(xs, ys);
}

bool OptimizeTrackPoints(CPtrList& points, bool ownsPoints, int optimise, int* progress,
                         bool* keepGoing) {
  if (ownsPoints && points.GetCount() == 1 && points.GetHead()) {
    // A lone fix still has to draw as a line: give it a twin one second later.
    auto* twin = new WAYPOINT_ITEM_INFO(static_cast<WAYPOINT_ITEM_INFO*>(points.GetHead()));
    twin->time = static_cast<int32_t>(static_cast<uint32_t>(twin->time) + 1u);  // wraps, never overflows
    points.AddTail(twin);
  }
  Working working;
  if (optimise) {
    Entries entries;
    entries.reserve(static_cast<size_t>(points.GetCount()));
    for (void* p : points) entries.push_back(static_cast<WAYPOINT_ITEM_INFO*>(p));
    working = LevelBadFixes(entries);
  }
  Advance(progress);
  if (optimise) LevelStops(working);
  Advance(progress);
  return HandOutLevels(working, optimise && working.points.size() > 100, progress, keepGoing);
}

int TrackDisplayLevel(const CPtrList& points, GPS_APP_PROG_TYPE product) {
  const long limit = product == GPS_APP_TRIP ? 1000 : 11000;
  // atLeast[L] = number of points whose level is L or more, for L in 0 .. 100.
  std::array<long, kSmoothSteps + 2> atLeast{};
  for (const WAYPOINT_ITEM_INFO* p : Items<const WAYPOINT_ITEM_INFO>(points)) {
    if (!p || p->type < 0) continue;
    ++atLeast[std::min(p->type, kSmoothSteps + 1)];
  }
  for (int L = kSmoothSteps; L >= 0; --L) atLeast[L] += atLeast[L + 1];
  for (int L = 0; L <= kSmoothSteps; ++L) {
    if (atLeast[L] < limit) return L;
  }
  return kSmoothSteps + 1;
}

}  // namespace navmisc

void BLOG_ITEM_INFO::OptimizeWaypoint(GPS_APP_PROG_TYPE product, int optimise, int* progress,
                                      bool* keepGoing) {
  optLevel = 0;
  for (TRACK_ITEM_INFO* track : navmisc::Items<TRACK_ITEM_INFO>(tracks)) {
    if (!track) continue;
    if (!navmisc::OptimizeTrackPoints(track->points, track->OwnsPoints(), optimise, progress,
                                      keepGoing)) {
      return;
    }
    optLevel = std::max<int32_t>(optLevel, navmisc::TrackDisplayLevel(track->points, product));
  }
}

namespace {

bool IsThinned(BLOG_ITEM_INFO* trip) {
  for (TRACK_ITEM_INFO* t : navmisc::Items<TRACK_ITEM_INFO>(trip->tracks)) {
    if (t && !t->OwnsPoints()) return true;
  }
  return false;
}

bool PassesFilter(const BLOG_ITEM_INFO& trip, const WAYPOINT_ITEM_INFO& p) {
  if (p.type == navmisc::kLevelBadFix) return !trip.optRevise;
  if (p.type == navmisc::kLevelStop) return !trip.optRedundance;
  return p.type >= trip.optLevel;
}

}  // namespace

void CreateOptimizeTrack(BLOG_ITEM_INFO* trip, CPtrList& oldTracks) {
  // Thinning a thinned trip would park the non-owning copies among the real tracks, and the
  // restore would then bring them back as if they were real: the trip stays as it is instead.
  if (!trip || IsThinned(trip)) return;
  while (!trip->tracks.IsEmpty()) oldTracks.AddTail(trip->tracks.RemoveHead());
  for (TRACK_ITEM_INFO* old : navmisc::Items<TRACK_ITEM_INFO>(oldTracks)) {
    if (!old) continue;
    // The thinned copy can only be built as a non-owner: it never deletes, reloads or writes
    // the points it shares with `old`.
    auto* thin = new TRACK_ITEM_INFO(trip, old->id, TRACK_ITEM_INFO::SharedPointsTag{});
    trip->tracks.AddTail(thin);
    for (WAYPOINT_ITEM_INFO* p : navmisc::Items<WAYPOINT_ITEM_INFO>(old->points)) {
      if (p && PassesFilter(*trip, *p)) thin->points.AddTail(p);
    }
  }
}

void RestoreOldTrack(BLOG_ITEM_INFO* trip, CPtrList& oldTracks) {
  if (!trip || oldTracks.IsEmpty()) return;
  std::unordered_set<const void*> real(oldTracks.begin(), oldTracks.end());
  while (!trip->tracks.IsEmpty()) {
    auto* track = static_cast<TRACK_ITEM_INFO*>(trip->tracks.RemoveHead());
    // A real track that the caller put into the thinned trip comes back through oldTracks: it
    // is only taken off here, never destroyed, or the trip would get it back freed.
    if (!track || real.count(track)) continue;
    // A thinned copy lets go of the shared points when it is destroyed (it never owns them);
    // a track created while the trip was thinned owns its points and takes them along.
    delete track;
  }
  for (void* track : oldTracks) trip->tracks.AddTail(track);
}
