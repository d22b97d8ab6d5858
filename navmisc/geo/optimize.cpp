#include "navmisc/geo/optimize.h"

#include <algorithm>
#include <array>

#include "navmisc/geo/cleaning.h"
#include "navmisc/geo/detail/douglas_peucker.h"
#include "navmisc/records/trip.h"

namespace navmisc {
namespace {

constexpr int kKept = WAYPOINT_ITEM_INFO::kFlagKept;

std::vector<WAYPOINT_ITEM_INFO*> PointsAt(CPtrList& points, int level) {
  std::vector<WAYPOINT_ITEM_INFO*> out;
  for (WAYPOINT_ITEM_INFO* p : Items<WAYPOINT_ITEM_INFO>(points)) {
    if (p && p->type == level) out.push_back(p);
  }
  return out;
}

void ToList(const std::vector<WAYPOINT_ITEM_INFO*>& points, CPtrList& list) {
  list.RemoveAll();
  for (WAYPOINT_ITEM_INFO* p : points) list.AddTail(p);
}

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

// One Smooth run per level, from the coarsest down.
bool SmoothByRepeatedRuns(CPtrList& working, bool smoothing, int* progress, bool* keepGoing) {
  for (int k = kSmoothSteps; k >= 0; --k) {
    if (smoothing) {
      Smooth(working, SmoothLevelTolerance(k));
      for (WAYPOINT_ITEM_INFO* p : Items<WAYPOINT_ITEM_INFO>(working)) {
        if (p->flags[kKept] && p->type == kLevelNeverDropped) p->type = k;
      }
    }
    Advance(progress);
    if (Cancelled(keepGoing)) return false;
  }
  return true;
}

// The same outcome from one pass: every point's level is known up front, and the steps only hand
// the levels out, so a cancelled run stops in exactly the state the repeated runs would leave.
bool SmoothBySplitTree(CPtrList& working, bool smoothing, int* progress, bool* keepGoing) {
  std::vector<WAYPOINT_ITEM_INFO*> points;
  std::vector<int> levels;
  std::array<std::vector<WAYPOINT_ITEM_INFO*>, kSmoothSteps + 1> byLevel;
  if (smoothing) {
    for (WAYPOINT_ITEM_INFO* p : Items<WAYPOINT_ITEM_INFO>(working)) points.push_back(p);
    levels = SmoothKeepLevels(working);
    for (size_t i = 0; i < points.size(); ++i) byLevel[levels[i]].push_back(points[i]);
  }
  for (int k = kSmoothSteps; k >= 0; --k) {
    for (WAYPOINT_ITEM_INFO* p : byLevel[k]) {
      if (p->type == kLevelNeverDropped) p->type = k;
    }
    Advance(progress);
    if (Cancelled(keepGoing) || k == 0) {
      // The kept-marks that Smooth at this step would have left behind.
      for (size_t i = 0; i < points.size(); ++i) points[i]->flags[kKept] = levels[i] >= k ? 1 : 0;
      if (Cancelled(keepGoing)) return false;
    }
  }
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
  return geo::SimplifyLevels(xs.data(), ys.data(), static_cast<int>(xs.size()), Tolerances());
}

bool OptimizeTrackPoints(CPtrList& points, bool ownsPoints, int optimise, int* progress,
                         bool* keepGoing, SmoothLevelMethod method) {
  if (ownsPoints && points.GetCount() == 1 && points.GetHead()) {
    // A lone fix still has to draw as a line: give it a twin one second later.
    auto* twin = new WAYPOINT_ITEM_INFO(static_cast<WAYPOINT_ITEM_INFO*>(points.GetHead()));
    twin->time += 1;
    points.AddTail(twin);
  }
  if (optimise) {
    for (WAYPOINT_ITEM_INFO* p : Items<WAYPOINT_ITEM_INFO>(points)) {
      if (p) p->type = kLevelNeverDropped;
    }
    if (points.GetCount() > 50) {
      Revise(points);
      for (WAYPOINT_ITEM_INFO* p : Items<WAYPOINT_ITEM_INFO>(points)) {
        if (p && !p->flags[kKept] && p->type == kLevelNeverDropped) p->type = kLevelBadFix;
      }
    }
  }
  Advance(progress);

  CPtrList working;
  if (optimise) {
    ToList(PointsAt(points, kLevelNeverDropped), working);
    if (working.GetCount() > 100) {
      Reduction(working);
      for (WAYPOINT_ITEM_INFO* p : Items<WAYPOINT_ITEM_INFO>(working)) {
        if (!p->flags[kKept] && p->type == kLevelNeverDropped) p->type = kLevelStop;
      }
    }
    ToList(PointsAt(points, kLevelNeverDropped), working);
  }
  Advance(progress);

  const bool smoothing = optimise && working.GetCount() > 100;
  return method == SmoothLevelMethod::kRepeatedSmooth
             ? SmoothByRepeatedRuns(working, smoothing, progress, keepGoing)
             : SmoothBySplitTree(working, smoothing, progress, keepGoing);
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

void CreateOptimizeTrack(BLOG_ITEM_INFO* trip, CPtrList& oldTracks) {
  if (!trip) return;
  while (!trip->tracks.IsEmpty()) oldTracks.AddTail(trip->tracks.RemoveHead());
  for (TRACK_ITEM_INFO* old : navmisc::Items<TRACK_ITEM_INFO>(oldTracks)) {
    if (!old) continue;
    // The thinned copy can only be built as a non-owner: it never deletes or reloads the
    // points it shares with `old`.
    auto* thin = new TRACK_ITEM_INFO(trip, old->id, TRACK_ITEM_INFO::SharedPointsTag{});
    trip->tracks.AddTail(thin);
    for (WAYPOINT_ITEM_INFO* p : navmisc::Items<WAYPOINT_ITEM_INFO>(old->points)) {
      if (!p) continue;
      bool keep;
      if (p->type == navmisc::kLevelBadFix) keep = !trip->optRevise;
      else if (p->type == navmisc::kLevelStop) keep = !trip->optRedundance;
      else keep = p->type >= trip->optLevel;
      if (keep) thin->points.AddTail(p);
    }
  }
}

void RestoreOldTrack(BLOG_ITEM_INFO* trip, CPtrList& oldTracks) {
  if (!trip || oldTracks.IsEmpty()) return;
  while (!trip->tracks.IsEmpty()) {
    auto* thin = static_cast<TRACK_ITEM_INFO*>(trip->tracks.RemoveHead());
    if (!thin) continue;
    // A thinned track lets go of the shared points; a real track that was added to the thinned
    // trip is freed with its own points rather than leaked.
    if (!thin->OwnsPoints()) thin->points.RemoveAll();
    delete thin;
  }
  for (void* track : oldTracks) trip->tracks.AddTail(track);
}
