#include "navmisc/geo/gps_helper.h"

#include <gtest/gtest.h>

#include <cmath>
#include <tuple>
#include <utility>
#include <vector>

#include "navmisc/records/items.h"

namespace {

// Opens the protected steps for the tests.
class Helper : public CGPSHelper {
 public:
  using CGPSHelper::_GetMinDistance;
};

struct Pos {
  double lat, lon;
};

// Reference distances from an independent vector formula on a sphere of 6371 km. Points less
// than a centimetre apart are 0 apart.
TEST(GpsHelper, DistancesMatchReferenceValuesInEveryUnit) {
  const struct {
    Pos a, b;
    double km;
  } cases[] = {
      {{51.5074, -0.1278}, {48.8566, 2.3522}, 343.55606034104176},
      {{40.7128, -74.0060}, {34.0522, -118.2437}, 3935.746254609723},
      {{0, 0}, {0, 1}, 111.19492664455873},
      {{0, 0}, {90, 0}, 10007.543398010286},
      {{0, 0}, {0, 180}, 20015.086796020572},
      {{47.1, 8.2}, {47.1, 8.2}, 0},
      {{47.1, 8.2}, {47.1, 8.2 + 1e-7}, 0},  // 7.6 mm
  };
  Helper h;
  constexpr auto kKm = CGPSHelper::DIS_KILOMETER;
  for (const auto& c : cases) {
    const double tol = c.km * 1e-12;  // relative: the two formulas agree to rounding
    EXPECT_NEAR(h.GetDistance(c.a.lat, c.a.lon, c.b.lat, c.b.lon, kKm), c.km, tol) << c.km;
    EXPECT_NEAR(h.GetDistance(c.b.lat, c.b.lon, c.a.lat, c.a.lon, kKm), c.km, tol) << c.km;
  }
  EXPECT_GT(h.GetDistance(47.1, 8.2, 47.1, 8.2 + 2e-7, CGPSHelper::DIS_METER), 0.0);  // 15 mm
  // London to Paris in the other units; an unknown unit gives 0.
  const std::pair<int, double> units[] = {
      {CGPSHelper::DIS_METER, 343556.06034104176}, {CGPSHelper::DIS_MILE, 213.32722880382374},
      {CGPSHelper::DIS_NAUTICAL_MILE, 185.37791063167464}, {-1, 0.0}, {4, 0.0}};
  for (const auto& [unit, want] : units) {
    const auto u = static_cast<CGPSHelper::DIS_UNIT>(unit);
    EXPECT_NEAR(h.GetDistance(51.5074, -0.1278, 48.8566, 2.3522, u), want, want * 1e-12) << unit;
  }
}

TEST(GpsHelper, BearingsAreTruncatedToWholeDegrees) {
  const struct {
    Pos a, b;
    double bearing;
  } cases[] = {
      {{51.5074, -0.1278}, {48.8566, 2.3522}, 148.0},  // 148.116
      {{40.7128, -74.0060}, {34.0522, -118.2437}, 273.0},  // -86.313
      {{0, 0}, {0, 1}, 90.0},
      {{0, 0}, {1, 0}, 0.0},
      {{0, 0}, {10, -0.07}, 359.0},  // -0.397: just west of north
      {{0, 0}, {10, 0.05}, 0.0},     // 0.284
      {{12.5, 7.5}, {12.5, 7.5}, 0.0},
      {{NAN, 0}, {1, 1}, 0.0},
  };
  Helper h;
  for (const auto& c : cases) {
    EXPECT_EQ(h.GetInitialBearing(c.a.lat, c.a.lon, c.b.lat, c.b.lon), c.bearing)
        << c.a.lat << "," << c.a.lon << " -> " << c.b.lat << "," << c.b.lon;
  }
}

TEST(GpsHelper, DestinationMidpointAndPointBetweenDoNotWrapLongitudes) {
  enum Op { kDestination, kMidpoint, kBetween };
  // Destination: b.lat is the bearing and arg the distance in km. Point between: arg in metres.
  const struct {
    Op op;
    Pos a, b;
    double arg;
    Pos to;
  } cases[] = {
      {kDestination, {51.5074, -0.1278}, {148.0, 0}, 343.5, {48.86015519537056, 2.360015702754934}},
      {kDestination, {-33.8688, 151.2093}, {100.0, 0}, 2000.0, {-35.07025447303475, 173.02100379635647}},
      // Across the antimeridian the longitude goes on past 180.
      {kDestination, {0, 179.5}, {90.0, 0}, 111.19492664455873, {0, 180.5}},
      {kMidpoint, {51.5074, -0.1278}, {48.8566, 2.3522}, 0, {50.18859487756828, 1.146617629030325}},
      {kMidpoint, {0, 170}, {0, -170}, 0, {0, 180}},  // the short way, through 180
      // 1000 m from (0,0) towards (1,1): the bearing 44.996 is cut to 44 before walking.
      {kBetween, {0, 0}, {1, 1}, 1000.0, {0.006469178231600001, 0.006247212839407895}},
  };
  Helper h;
  for (const auto& c : cases) {
    double lat = 99, lon = 99;
    if (c.op == kDestination) h.GetDestinationPoint(c.a.lat, c.a.lon, c.b.lat, c.arg, lat, lon);
    if (c.op == kMidpoint) h.GetMidiPoint(c.a.lat, c.a.lon, c.b.lat, c.b.lon, lat, lon);
    if (c.op == kBetween) h.GetPointBetween2Point(c.a.lat, c.a.lon, c.b.lat, c.b.lon, c.arg, lat, lon);
    EXPECT_NEAR(lat, c.to.lat, 1e-9) << c.op << " from " << c.a.lat << "," << c.a.lon;
    EXPECT_NEAR(lon, c.to.lon, 1e-9) << c.op << " from " << c.a.lat << "," << c.a.lon;
  }
}

TEST(GpsHelper, GpsDistanceUsesTheFirstArgumentAsBothLatitudes) {
  Helper h;
  const double eastWest = h.GetDistance(10, 20, 10, 21, CGPSHelper::DIS_KILOMETER);
  for (double c : {50.0, -80.0, 10.0, 0.0}) EXPECT_EQ(GetGpsDistance(10, 20, c, 21), eastWest) << c;
  EXPECT_NE(GetGpsDistance(10, 20, 50, 21), h.GetDistance(10, 20, 50, 21, CGPSHelper::DIS_KILOMETER));
}

TEST(GpsHelper, DistanceToSegmentsAndPolylines) {
  Helper h;
  const struct {
    Pos p;
    double km, where;
  } toEquatorLeg[] = {
      {{0.01, 0.5}, 1.1119492664455874, 0.5},  // beside the middle
      {{0.0, 2.0}, 111.19492664455873, 1.0},   // beyond the far end
      {{0.0, -1.0}, 111.19492664455873, 0.0},  // before the near end
      {{0.0, 0.25}, 0.0, 0.25},                // on it
  };
  for (const auto& c : toEquatorLeg) {
    double where = -1;
    EXPECT_NEAR(h._GetMinDistance(0, 0, 0, 1, c.p.lat, c.p.lon, &where), c.km, 1e-7) << c.p.lon;
    EXPECT_NEAR(where, c.where, 1e-4) << c.p.lon;
  }
  // The nearest of three legs is the northward one along 1 degree east.
  std::vector<sWayPoint> line(3);
  line[1].longitude = line[2].longitude = line[2].latitude = 1;
  double where = -1;
  EXPECT_NEAR(h.GetMinDistance(line.data(), 3, 0.5, 1.01, &where), 1.1119069268242912, 1e-6);
  EXPECT_NEAR(where, 0.5, 1e-3);
  EXPECT_EQ(h.GetMinDistance(line.data(), 0, 0.5, 1.01, &where), -1.0);
}

struct Plot {
  std::vector<CPoint> screen;
  long size;
  double deviation = -1;
};

Plot PlotOf(const std::vector<Pos>& track, long size, long margin) {
  std::vector<sWayPoint> records(track.size());
  for (size_t i = 0; i < track.size(); ++i) {
    records[i].latitude = track[i].lat;
    records[i].longitude = track[i].lon;
  }
  Plot plot{std::vector<CPoint>(track.size(), CPoint{-1, -1}), size};
  int count = static_cast<int>(track.size());
  Helper().MappingToXY(records.data(), count, plot.screen.data(), plot.size, margin, &plot.deviation);
  return plot;
}

TEST(GpsHelper, MappingToXYPlotsNorthUpAndCoarsensBySteps) {
  const std::vector<Pos> leg = {{0, 0}, {0, 0.01}};  // 1111.9 m east on the equator
  const std::vector<Pos> bend = {{0, 0}, {0.001, 0.0005}, {0, 0.001}};
  const struct {
    std::vector<Pos> track;
    long size, margin, expectSize;
    CPoint last;
    double deviation;
  } cases[] = {
      {{{47, 8}}, 400, 10, 20, {10, 10}, 0.5},  // one record: at the margin
      {leg, 0, 3, 1111 + 6, {1111 + 3, 3}, 0.5},  // sizes of 0 or less cannot loop for ever
      {leg, 2000, 5, 1111 + 10, {1111 + 5, 5}, 0.5},  // fits at one metre per pixel
      {leg, 1111, 5, 1111, {925 + 5, 5}, 0.5},        // at its own extent: 1111 / 1.2
      {leg, 500, 5, 500, {462 + 5, 5}, 0.5},          // 1111 / 2.2 = 505 is too wide; 2.4 fits
      // North up; the bend lies 111.2 m off the line from first to last.
      {bend, 1000, 0, 111, {111, 111}, 111.19 + 0.5},
  };
  for (const auto& c : cases) {
    const Plot plot = PlotOf(c.track, c.size, c.margin);
    EXPECT_EQ(plot.size, c.expectSize) << c.size;
    EXPECT_EQ(plot.screen.front().x, c.margin) << c.size;
    EXPECT_EQ(plot.screen.back().x, c.last.x) << c.size;
    EXPECT_EQ(plot.screen.back().y, c.last.y) << c.size;
    EXPECT_NEAR(plot.deviation, c.deviation, 0.01) << c.size;
  }
  EXPECT_EQ(PlotOf(bend, 1000, 0).screen[1].y, 0);
  const Plot none = PlotOf({}, 77, 0);  // nothing to plot: nothing is touched
  EXPECT_EQ(none.size, 77);
  EXPECT_EQ(none.deviation, -1);
}

TEST(GpsHelper, WayPointArrayKeepsListSlots) {
  CPtrList list;
  WAYPOINT_ITEM_INFO p1, p2;
  std::tie(p1.time, p1.speed, p1.extraA, p2.time) = std::tuple(10, 3600, -8, 20);
  for (void* entry : {static_cast<void*>(&p1), static_cast<void*>(nullptr), static_cast<void*>(&p2)}) list.AddTail(entry);
  navmisc::WayPointArray array = navmisc::MakeWayPointArray(list);
  // One record per list entry: the non-null points first, in order, then the defaults.
  const auto fields = [&](int i) {
    return std::tuple(+array[i].time, +array[i].speed, +array[i].extraA, +array[i].valid);
  };
  EXPECT_EQ(fields(0), std::tuple(10, 3600, -8, 1));
  EXPECT_EQ(fields(1), std::tuple(20, 0, 0, 1));
  EXPECT_EQ(fields(2), std::tuple(-1, 0, 0, 0));
  EXPECT_EQ(CreateWayPointArray(CPtrList()), nullptr);
}

}  // namespace
