#include "navmisc/geo/cleaning.h"

#include <gtest/gtest.h>

#include <numeric>
#include <vector>

#include "geo_reference.h"

namespace {

using navmisc::testing::ProductScope;
using navmisc::testing::MetresEast;
using navmisc::testing::MetresNorth;
using navmisc::testing::OwnedPoints;
using Indices = std::vector<int>;
constexpr int kKept = WAYPOINT_ITEM_INFO::kFlagKept;

// 20 fixes 5 s apart walking east at 10 m/s, with `edit` applied to fix i before it is added.
struct Fix {
  int32_t time;
  double north, east;
};
void AddWalk(OwnedPoints& track, int n, void (*edit)(int, Fix&)) {
  for (int i = 0; i < n; ++i) {
    Fix f{1000 + 5 * i, 0.0, 50.0 * i};
    edit(i, f);
    track.Add(f.time, MetresNorth(f.north), MetresEast(f.east));
  }
}

TEST(Revise, DropsFixesAfterLongGapsAndLoneFastJumps) {
  const struct {
    const char* name;
    int n;
    void (*edit)(int, Fix&);
    int dropped;
    Indices lost;
  } cases[] = {
      {"even", 20, [](int, Fix&) {}, 0, {}},
      {"gap before fix 10", 20, [](int i, Fix& f) { f.time += i >= 10 ? 295 : 0; }, 1, {10}},
      {"gap before the last fix", 20, [](int i, Fix& f) { f.time += i == 19 ? 295 : 0; }, 0, {}},
      {"spike at fix 8", 20, [](int i, Fix& f) { f.north += i == 8 ? 2000 : 0; }, 1, {8}},
      // Two wild fixes in a row: the second becomes the reference, and the good fix after it
      // is judged the spike.
      {"two wild fixes", 20, [](int i, Fix& f) { f.north += i == 8 || i == 9 ? 2000 : 0; }, 2, {8, 10}},
      {"fast last fix", 20, [](int i, Fix& f) { f.north += i == 19 ? 2000 : 0; }, 1, {19}},
      // The pass needs more than 4 points: 4 are all kept, spike or not.
      {"four fixes", 4, [](int i, Fix& f) { f.north += i == 1 ? 2000 : 0; }, 0, {}},
  };
  for (const auto& c : cases) {
    OwnedPoints track;
    AddWalk(track, c.n, c.edit);
    EXPECT_EQ(Revise(track.list), c.dropped) << c.name;
    EXPECT_EQ(track.Marked(false), c.lost) << c.name;
  }
  // Three points: neither pass runs, and both clear every mark.
  OwnedPoints three;
  AddWalk(three, 3, [](int i, Fix& f) { f.north += i == 1 ? 2000 : 0; });
  for (int (*pass)(CPtrList&) : {Revise, Reduction}) {
    for (auto* p : navmisc::Items<WAYPOINT_ITEM_INFO>(three.list)) p->flags[kKept] = 1;
    EXPECT_EQ(pass(three.list), 0);
    EXPECT_EQ(three.Marked(), Indices{});
  }
}

// Fixes 0 .. 19 moving east at 10 m/s; fix 20 only 0.5 m on, the slow fix that becomes the stop
// point; then fixes at `stop[k]` metres east of it (logger speed 500 m/h); then fixes leaving
// at 60 m per 5 s from where the stop ended.
void AddStop(OwnedPoints& track, const std::vector<double>& stop, int leaving) {
  const double lat = MetresNorth(0);
  int32_t t = 1000;
  for (int i = 0; i < 20; ++i, t += 5) track.Add(t, lat, MetresEast(50.0 * i));
  const double s = 950.5;
  track.Add(t, lat, MetresEast(s), 500);
  for (double m : stop) track.Add(t += 5, lat, MetresEast(s + m), 500);
  const double from = s + (stop.empty() ? 0.0 : std::max(0.0, stop.back()));
  for (int k = 1; k <= leaving; ++k) track.Add(t += 5, lat, MetresEast(from + 60.0 * k), 43200);
}

TEST(Reduction, DropsTheFixesOfAStopButItsFirstAndTheOneThatLeaves) {
  std::vector<double> jitter;
  for (int k = 0; k < 28; ++k) jitter.push_back(k % 2 ? 1.0 : -1.0);
  std::vector<double> creep;
  for (int k = 1; k <= 15; ++k) creep.push_back(5.0 * k);
  const struct {
    const char* name;
    GPS_APP_PROG_TYPE product;
    std::vector<double> stop;
    int leaving, dropped;
    int firstDropped;
  } cases[] = {
      // Fix 20 is the stop point; 21 .. 48 lie within a metre of it; fix 49 leaves for good.
      {"stop", GPS_APP_TRIP, jitter, 20, 28, 21},
      // Creeping off at 1 m/s: the leave radius is the mean leg (40.6 m), so the fixes up to
      // 40 m go; the sport application leaves at 3 m and keeps them all.
      {"creep", GPS_APP_TRIP, creep, 20, 8, 21},
      {"creep, sport", GPS_APP_SPORT, creep, 20, 0, 0},
      // The track ends in the stop: the last fix is never looked at and stays.
      {"ends stopped", GPS_APP_TRIP, jitter, 0, 27, 21},
      // Leaving with the last two fixes: the look-ahead of the second last stops at the last.
      {"leaves at the end", GPS_APP_TRIP, {1, -1, 1}, 2, 3, 21},
  };
  for (const auto& c : cases) {
    ProductScope product(c.product);
    OwnedPoints track;
    AddStop(track, c.stop, c.leaving);
    EXPECT_EQ(Reduction(track.list), c.dropped) << c.name;
    Indices lost(c.dropped);
    std::iota(lost.begin(), lost.end(), c.firstDropped);
    EXPECT_EQ(track.Marked(false), lost) << c.name;
  }
}

TEST(Smooth, KeepsTheShapeOfTheLine) {
  struct XY {
    double lon, lat;
  };
  const struct {
    const char* name;
    std::vector<XY> points;
    double tolerance;
    Indices kept;
  } cases[] = {
      {"tolerance 0", {{0, 0}, {1, 0.2}, {2, 0}, {3, 0}}, 0.0, {0, 1, 2, 3}},
      {"straight line", {{0, 0}, {0.5, 0}, {1.25, 0}, {3, 0}}, 1e-12, {0, 3}},
      {"straight north", {{8, 47}, {8, 47.01}, {8, 47.5}}, 1e-12, {0, 2}},
      // The perpendicular distance subtracts two squares: on a slanted line rounding leaves
      // about 1e-9 degrees, far below the finest level (1e-4).
      {"slanted line", {{8, 47}, {8.0075, 47.01}, {8.018, 47.024}, {8.03, 47.04}}, 1e-8, {0, 3}},
      {"zigzag", {{0, 0}, {1, 0.5}, {2, 0}, {3, 0.05}, {4, 0}}, 0.1, {0, 1, 2, 4}},
      // Beyond the far end the distance is to that end, behind the near end to that end.
      {"beyond the end", {{0, 0}, {3, 0}, {2, 0}}, 0.5, {0, 1, 2}},
      {"behind the start", {{0, 0}, {-1, 0}, {2, 0}}, 0.5, {0, 1, 2}},
      {"back to the start", {{0, 0}, {1, 0}, {0, 0}}, 0.5, {0, 1, 2}},
      {"tie: first wins", {{0, 0}, {1, 1}, {2, 1}, {3, 0}}, 0.9, {0, 1, 3}},
  };
  for (const auto& c : cases) {
    OwnedPoints track;
    for (size_t i = 0; i < c.points.size(); ++i) {
      track.Add(static_cast<int32_t>(i), c.points[i].lat, c.points[i].lon)->flags[0] = 1;
    }
    EXPECT_EQ(Smooth(track.list, c.tolerance), static_cast<int>(c.kept.size())) << c.name;
    EXPECT_EQ(track.Marked(), c.kept) << c.name;
  }
}

}  // namespace
