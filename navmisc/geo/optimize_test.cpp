#include "navmisc/geo/optimize.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <memory>
#include <string>
#include <tuple>
#include <vector>

#include "geo_reference.h"
#include "navmisc/platform/files.h"
#include "navmisc/records/trip.h"
#include "testutil.h"

namespace {

using navmisc::testing::MetresEast;
using navmisc::testing::MetresNorth;
using navmisc::testing::OptimizeTripLiterally;
using navmisc::testing::ProductScope;
constexpr int kKept = WAYPOINT_ITEM_INFO::kFlagKept;

struct TrackShape {
  uint32_t seed;
  int points;
};

// Tracks whose points all hold the old level `oldLevel`, in a trip whose display level is 42:
// noisy ones, or for seed 0 a walk east, 50 m per 5 s, with one wild fix (the sixth) 3 km off.
std::unique_ptr<BLOG_ITEM_INFO> MakeTrip(const std::vector<TrackShape>& shapes,
                                         const wchar_t* folder = L"OPT", int32_t oldLevel = 7) {
  auto trip = std::make_unique<BLOG_ITEM_INFO>(GPS_APP_TRIP, folder, 0);
  trip->optLevel = 42;
  for (const TrackShape& s : shapes) {
    auto* track = new TRACK_ITEM_INFO(trip.get());
    if (s.seed) navmisc::testing::AppendNoisyTrack(track->points, s.seed, s.points);
    for (int i = 0; s.seed == 0 && i < s.points; ++i) {
      auto* p = new WAYPOINT_ITEM_INFO(nullptr);
      std::tie(p->time, p->latitude, p->longitude, p->speed) =
          std::tuple(1000 + 5 * i, MetresNorth(i == 5 ? 3000 : 0), MetresEast(50.0 * i), 36000);
      track->points.AddTail(p);
    }
    for (void* p : track->points) static_cast<WAYPOINT_ITEM_INFO*>(p)->type = oldLevel;
    trip->tracks.AddTail(track);
  }
  return trip;
}

template <class T>
std::vector<T*> All(const CPtrList& list) {
  const auto items = navmisc::Items<T>(list);
  return {items.begin(), items.end()};
}
std::vector<WAYPOINT_ITEM_INFO*> PointsOf(const TRACK_ITEM_INFO* track) {
  return All<WAYPOINT_ITEM_INFO>(track->points);
}
std::vector<TRACK_ITEM_INFO*> TracksOf(const CPtrList& tracks) { return All<TRACK_ITEM_INFO>(tracks); }

void ExpectSameLevels(BLOG_ITEM_INFO& a, BLOG_ITEM_INFO& b, const std::string& what) {
  EXPECT_EQ(a.optLevel, b.optLevel) << what;
  const auto ta = TracksOf(a.tracks), tb = TracksOf(b.tracks);
  ASSERT_EQ(ta.size(), tb.size()) << what;
  for (size_t t = 0; t < ta.size(); ++t) {
    const auto pa = PointsOf(ta[t]), pb = PointsOf(tb[t]);
    ASSERT_EQ(pa.size(), pb.size()) << what;
    for (size_t i = 0; i < pa.size(); ++i) {
      const std::string where = what + ", track " + std::to_string(t) + ", point " + std::to_string(i);
      ASSERT_EQ(pa[i]->type, pb[i]->type) << where;
      ASSERT_EQ(pa[i]->flags[kKept], pb[i]->flags[kKept]) << where;
      ASSERT_EQ(pa[i]->time, pb[i]->time) << where;
    }
  }
}

// The one-pass levels against a separate Smooth run for every level, optimising or (off) only
// choosing the display level again. A cancel (the flag cleared before the work starts) stops
// after the first track's coarsest level: the display level stays 0 and the later tracks keep
// their old levels.
TEST(OptimizeWaypoint, LevelsEqualTheLiteralMethod) {
  const struct {
    std::vector<TrackShape> tracks;
    GPS_APP_PROG_TYPE product;
    bool cancel = false;
    int optimise = 1;
    int32_t oldLevel = 7;
  } cases[] = {
      {{{1, 3000}}, GPS_APP_TRIP},
      {{{2, 1500}, {3, 400}, {4, 120}}, GPS_APP_TRIP},
      {{{5, 2500}, {6, 1200}}, GPS_APP_SPORT},
      {{{7, 60}, {8, 101}, {9, 102}, {10, 1}}, GPS_APP_TRACKER},  // a lone fix gets a twin
      {{{11, 5000}}, GPS_APP_TRACKER},
      {{{21, 2000}, {22, 500}, {23, 300}}, GPS_APP_TRIP, true},
      // Revise runs on more than 50 points; Reduction and Smooth on more than 100 left after it.
      {{{0, 50}, {0, 51}, {0, 101}, {0, 102}}, GPS_APP_TRIP},
      // Off: 1200 points at 50 leave fewer than 1000 only above 50 (the other applications allow
      // 11000); points never dropped leave no level with fewer.
      {{{3, 1200}}, GPS_APP_TRIP, false, 0, 50},
      {{{3, 1200}}, GPS_APP_SPORT, false, 0, 50},
      {{{3, 1200}}, GPS_APP_TRIP, false, 0, navmisc::kLevelNeverDropped},
  };
  for (const auto& c : cases) {
    ProductScope product(c.product);
    auto fast = MakeTrip(c.tracks, L"OPT", c.oldLevel), literal = MakeTrip(c.tracks, L"OPT", c.oldLevel);
    int fastProgress = 0, literalProgress = 0;
    bool keepGoing = !c.cancel;
    fast->OptimizeWaypoint(c.product, c.optimise, &fastProgress, &keepGoing);
    OptimizeTripLiterally(*literal, c.product, c.optimise, &literalProgress, &keepGoing);
    const std::string what = "case " + std::to_string(&c - cases);
    ExpectSameLevels(*fast, *literal, what);
    EXPECT_EQ(fastProgress, literalProgress) << what;
    EXPECT_EQ(fastProgress, c.cancel ? 300 : static_cast<int>(c.tracks.size()) * 10300) << what;
    if (!c.cancel) continue;
    EXPECT_EQ(fast->optLevel, 0);
    for (TRACK_ITEM_INFO* later : TracksOf(fast->tracks)) {
      if (later == fast->tracks.GetHead()) continue;
      for (auto* p : PointsOf(later)) ASSERT_EQ(p->type, c.oldLevel);
    }
  }
}

// Thinned tracks share the point records of the real ones. Under AddressSanitizer every misuse
// below would show as a double free, a use after free or a leak.
TEST(OptimizeTrack, ThinnedTracksShareButNeverFreePoints) {
  navmisc::testutil::TempDir root;
  navmisc::testutil::DataRootScope scope(root.path());
  auto trip = MakeTrip({{31, 1500}, {32, 800}}, L"THIN");
  ASSERT_TRUE(MakeDir(trip->GetResourcePath()));
  trip->OptimizeWaypoint(GPS_APP_TRIP, 1, nullptr, nullptr);
  trip->optRevise = true;
  trip->optRedundance = false;  // stops stay in
  trip->optLevel = 20;
  const std::vector<TRACK_ITEM_INFO*> real = TracksOf(trip->tracks);

  CPtrList old;
  CreateOptimizeTrack(trip.get(), old);
  EXPECT_EQ(TracksOf(old), real);
  const std::vector<TRACK_ITEM_INFO*> thin = TracksOf(trip->tracks);
  ASSERT_EQ(thin.size(), 2u);
  for (size_t t = 0; t < thin.size(); ++t) {
    EXPECT_FALSE(thin[t]->OwnsPoints());
    EXPECT_EQ(thin[t]->id, real[t]->id);
    std::vector<WAYPOINT_ITEM_INFO*> expected = PointsOf(real[t]);
    std::erase_if(expected, [](const WAYPOINT_ITEM_INFO* p) {
      return p->type != navmisc::kLevelStop && (p->type == navmisc::kLevelBadFix || p->type < 20);
    });
    EXPECT_EQ(PointsOf(thin[t]), expected);
    EXPECT_LT(expected.size(), static_cast<size_t>(real[t]->points.GetCount()));
  }

  // Thinning again, saving, reloading and optimising while thinned leave the shared points be.
  CreateOptimizeTrack(trip.get(), old);
  EXPECT_EQ(TracksOf(trip->tracks), thin);
  EXPECT_EQ(old.GetCount(), 2);
  trip->WriteAllWaypoint(1, nullptr, nullptr);
  EXPECT_FALSE(FileExists(thin[0]->GetFilePathName()));
  trip->ReadAllWaypoint(1);
  trip->OptimizeWaypoint(GPS_APP_TRIP, 1, nullptr, nullptr);
  EXPECT_EQ(TracksOf(trip->tracks), thin);

  // A track made while thinned goes with the thinned ones; a real track put into the thinned
  // trip comes back once.
  auto* made = new TRACK_ITEM_INFO(trip.get());
  made->points.AddTail(new WAYPOINT_ITEM_INFO(nullptr));
  trip->tracks.AddTail(made);
  trip->tracks.AddTail(real[1]);
  CPtrList none;
  RestoreOldTrack(trip.get(), none);
  EXPECT_EQ(trip->tracks.GetCount(), 4);  // nothing to restore from
  RestoreOldTrack(trip.get(), old);
  old.RemoveAll();
  EXPECT_EQ(TracksOf(trip->tracks), real);

  // A thinned trip freed without its restore: the real tracks still own every point.
  CreateOptimizeTrack(trip.get(), old);
  trip.reset();
  navmisc::DeleteAll<TRACK_ITEM_INFO>(old);
}

}  // namespace
