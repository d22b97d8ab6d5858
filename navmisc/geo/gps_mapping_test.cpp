#include "navmisc/geo/gps_mapping.h"

#include <gtest/gtest.h>

#include <array>
#include <cmath>
#include <memory>
#include <string>
#include <tuple>
#include <vector>

#include "geo_reference.h"
#include "navmisc/platform/format.h"
#include "navmisc/records/photo.h"
#include "navmisc/records/track.h"

namespace {

// Three fixes: 10 s northwards along 8 E (1112 m), then 3600 s eastwards along 47.01 N.
std::unique_ptr<TRACK_ITEM_INFO> MakeTrack(const wchar_t* id, int32_t start = 1000) {
  auto track = std::make_unique<TRACK_ITEM_INFO>(nullptr);
  track->id = id;
  const struct {
    int32_t dt;
    double lat, lon, alt;
    int32_t speed;
  } fixes[] = {{0, 47.0, 8.0, 100, 3600}, {10, 47.01, 8.0, 200, 7201}, {3610, 47.01, 8.1, 0, 0}};
  for (const auto& f : fixes) {
    auto* p = new WAYPOINT_ITEM_INFO(nullptr);
    std::tie(p->time, p->latitude, p->longitude, p->altitude, p->speed) =
        std::tuple(start + f.dt, f.lat, f.lon, f.alt, f.speed);
    track->points.AddTail(p);
  }
  return track;
}

std::unique_ptr<CGPSMapping> MappingOf(TRACK_ITEM_INFO& track) {
  navmisc::WayPointArray array = navmisc::MakeWayPointArray(track.points);
  return std::make_unique<CGPSMapping>(array.get(), track.points.GetCount());
}

TEST(Mapping, TimeToPointInterpolatesOnePointPerSecond) {
  auto track = MakeTrack(L"TK_A");
  const struct {
    long time;
    bool found;
    long answerTime;
    double lat, lon, alt;
    long speed;
  } cases[] = {
      {1000, true, 1000, 47.0, 8.0, 100, 3600},  // recorded fixes come back as they are
      {1010, true, 1010, 47.01, 8.0, 200, 7201},
      {4610, true, 4610, 47.01, 8.1, 0, 0},
      {999, false, 0, 0, 0, 0, 0},   // one second before the first fix
      {4611, false, 0, 0, 0, 0, 0},  // after the last
      // The 10-second leg: 11 records, record k k/10 of the way, speed and altitude the means.
      {1003, true, 1003, 47.003, 8.0, 150, 5400},
      // The 3600-second leg: 1000 records 3.601 s apart; the answer carries its record's time.
      // Record 500 is at +1800 s, record 501 at +1804 s: +1802 is a tie and goes to the earlier.
      {1010 + 1802, true, 1010 + 1800, NAN, NAN, 100, 3600},
      {1010 + 1803, true, 1010 + 1804, NAN, NAN, 100, 3600},
  };
  auto mapping = MappingOf(*track);
  for (const auto& c : cases) {
    sWayPoint answer;
    ASSERT_EQ(mapping->MappingTimeToPoint(c.time, answer), c.found ? 1 : 0) << c.time;
    double lat = -1, lon = -1, alt = -1;
    long speed = -1;
    EXPECT_EQ(track->MappingTimeToPoint(c.time, lat, lon, speed, alt), c.found) << c.time;
    if (!c.found) {
      EXPECT_EQ(std::tuple(lat, speed, alt), std::tuple(0.0, -1L, -1.0)) << c.time;  // only lat cleared
      continue;
    }
    EXPECT_EQ(+answer.time, c.answerTime) << c.time;
    EXPECT_EQ(speed, c.speed) << c.time;
    EXPECT_EQ(alt, c.alt) << c.time;
    if (!std::isnan(c.lat)) {
      EXPECT_NEAR(lat, c.lat, 1e-9) << c.time;
      EXPECT_NEAR(lon, c.lon, 1e-9) << c.time;
    }
  }
  // Along the eastward leg the records follow the whole-degree bearing (89, not 89.96), so the
  // interpolated points drift north of the great circle: 65 m in the middle.
  sWayPoint middle;
  ASSERT_EQ(mapping->MappingTimeToPoint(1010 + 1800, middle), 1);
  EXPECT_NEAR((+middle.latitude - 47.01) * 111195.0, 65.0, 0.5);
}

TEST(Mapping, LegAfterAPointMarkedMinus8IsNotInterpolated) {
  auto track = MakeTrack(L"TK_A");
  static_cast<WAYPOINT_ITEM_INFO*>(track->points.GetHead())->extraA = -8;
  sWayPoint answer;
  ASSERT_EQ(MappingOf(*track)->MappingTimeToPoint(1005, answer), 1);
  EXPECT_EQ(+answer.time, 1000);
  EXPECT_EQ(+answer.latitude, 47.0);
  EXPECT_EQ(+answer.extraA, -8);
}

TEST(Mapping, PointToTimeWithinTolerance) {
  auto track = MakeTrack(L"TK_A");
  const double offEast = 50.0 / 75827.66057517554;  // degrees of longitude for 50 m at 47.005 N
  const struct {
    double lat, lon, tolerance;
    long time;
  } cases[] = {
      {47.005, 8.0 + offEast, 30, -1},    // 50 m off, 30 m allowed
      {47.005, 8.0 + offEast, 60, 1005},  // the nearest interpolated second
      {47.0, 8.0, 1, 1000},               // a recorded fix, exactly
      {47.01, 8.1, 1, 4610},              // the last fix, found through its leg
      {47.5, 8.0, 1000, -1},              // 50 km away
  };
  for (const auto& c : cases) {
    EXPECT_EQ(track->MappingPointToTime(c.lat, c.lon, c.tolerance), c.time)
        << c.lat << "," << c.lon << " within " << c.tolerance;
  }

  // A single fix answers every position with its time, and no time with a position.
  TRACK_ITEM_INFO single(nullptr);
  single.points.AddTail(new WAYPOINT_ITEM_INFO(nullptr));
  static_cast<WAYPOINT_ITEM_INFO*>(single.points.GetHead())->time = 777;
  EXPECT_EQ(single.MappingPointToTime(-33.0, 151.0, 1.0), 777);
  double lat, lon, alt;
  long speed;
  EXPECT_FALSE(single.MappingTimeToPoint(777, lat, lon, speed, alt));
}

TEST(Mapping, PlacementPrefersTimeThenPositionThenClears) {
  auto a = MakeTrack(L"TK_A", 1000);
  auto b = MakeTrack(L"TK_B", 9000);
  for (void* v : b->points) static_cast<WAYPOINT_ITEM_INFO*>(v)->latitude += 1.0;  // 111 km north
  CPtrList tracks;
  tracks.AddTail(a.get());
  tracks.AddTail(b.get());
  const double offEast = 50.0 / 75827.66057517554;
  const struct {
    const char* name;
    const wchar_t* id;
    double lat, lon;
    long time;
    bool placed;
    const wchar_t* placedOn;
    double placedLat, placedLon;
    long placedTime;
  } cases[] = {
      {"time wins over position", L"", 48.005, 8.0, 1005, true, L"TK_A", 47.005, 8.0, 1005},
      {"named track first, then any", L"TK_B", 0, 0, 1005, true, L"TK_A", 47.005, 8.0, 1005},
      {"named track by time", L"TK_B", 0, 0, 9005, true, L"TK_B", 48.005, 8.0, 9005},
      {"position snaps onto the track", L"", 47.005, 8.0 + offEast, 50000, true, L"TK_A", 47.005,
       8.0, 1005},
      {"position of the second track", L"TK_A", 48.005, 8.0, -1, true, L"TK_B", 48.005, 8.0, 9005},
      {"too far", L"TK_A", 47.5, 8.0, 50000, false, L"", 0, 0, -1},
      {"nothing to go by", L"TK_A", 0, 0, 0, false, L"", 0, 0, -1},
  };
  for (const auto& c : cases) {
    CString id = c.id;
    double lat = c.lat, lon = c.lon, alt = -5;
    long speed = -5, time = c.time;
    EXPECT_EQ(MappingGPSAndTrack(tracks, 60.0, id, lat, lon, alt, speed, time), c.placed) << c.name;
    EXPECT_EQ(id, c.placedOn) << c.name;
    EXPECT_NEAR(lat, c.placedLat, 1e-9) << c.name;
    EXPECT_NEAR(lon, c.placedLon, 1e-9) << c.name;
    EXPECT_EQ(time, c.placedTime) << c.name;
    if (!c.placed) {
      EXPECT_EQ(std::tuple(alt, speed), std::tuple(0.0, 0L)) << c.name;
    }
  }

  // Track ids match exactly, case included.
  double lat = 0, lon = 0, alt = 0;
  long speed = 0;
  EXPECT_EQ(GetTrackGPSFromTime(tracks, 1005, lat, lon, alt, speed, L"tk_a"), nullptr);
  EXPECT_EQ(GetTrackGPSFromTime(tracks, 1005, lat, lon, alt, speed, L"TK_A"), a.get());

  // The photo form works on the photo's own fields.
  PHOTO_ITEM_INFO photo;
  photo.playbackTime = 1005;
  EXPECT_TRUE(MappingGPSAndTrack(tracks, 60.0, &photo));
  EXPECT_EQ(std::tuple(photo.trackItemId, photo.speed, photo.altitude),
            std::tuple(CString(L"TK_A"), 5400, 150.0));
  EXPECT_NEAR(photo.latitude, 47.005, 1e-9);
}

TEST(Mapping, PhotoAndTrackListsStayInOrder) {
  // Inserted in this order (name, placed, playback time, original time): placed photos by
  // playback time, then the placed ones without it and the unplaced ones by original time;
  // equal keys go before the photos already there.
  const std::tuple<const char*, bool, int32_t, int32_t> shapes[] = {
      {"P1", true, 100, 0}, {"U1", false, 0, 5}, {"P2", true, 50, 0}, {"N1", true, 0, 30},
      {"P3", true, 100, 0}, {"N2", true, 0, 10}, {"U2", false, 0, 1}, {"U3", false, 0, 5}};
  std::vector<std::unique_ptr<PHOTO_ITEM_INFO>> photos;
  CPtrList list;
  std::string order;
  for (const auto& [name, placed, playback, original] : shapes) {
    PHOTO_ITEM_INFO& photo = *photos.emplace_back(std::make_unique<PHOTO_ITEM_INFO>());
    std::tie(photo.photoId, photo.playbackTime, photo.originalTime) =
        std::tuple(CString::FromUtf8(name), playback, original);
    photo.latitude = photo.longitude = placed ? 1.0 : 0.0;
    InsertItemToPhotoList(list, &photo);
  }
  for (void* v : list) order += static_cast<PHOTO_ITEM_INFO*>(v)->photoId.ToUtf8() + " ";
  EXPECT_EQ(order, "P2 P3 P1 N2 N1 U2 U3 U1 ");

  // Tracks by their first point's time; an equal start goes after.
  auto b = MakeTrack(L"b", 200), a = MakeTrack(L"a", 100), a2 = MakeTrack(L"a2", 100);
  CPtrList tracks;
  for (TRACK_ITEM_INFO* t : {b.get(), a.get(), a2.get()}) InsertItemToTrackList(tracks, t);
  std::string ids;
  for (void* v : tracks) ids += static_cast<TRACK_ITEM_INFO*>(v)->id.ToUtf8() + " ";
  EXPECT_EQ(ids, "a a2 b ");
}

// Inside a TrackMappingScope the answers come from an indexed copy of each track: they must be
// those of the plain search. The placement benchmark compares many on a clean track; here one
// time is out of order (the index must notice) or repeated (the first leg must answer).
TEST(Mapping, ScopedAnswersEqualThePlainSearch) {
  for (auto [changed, from] : {std::pair<size_t, size_t>{1500, 10}, {193, 192}}) {
    TRACK_ITEM_INFO track(nullptr);
    navmisc::testing::AppendNoisyTrack(track.points, 8, 3001);
    const auto items = navmisc::Items<WAYPOINT_ITEM_INFO>(track.points);
    const std::vector<WAYPOINT_ITEM_INFO*> fixes(items.begin(), items.end());
    fixes[changed]->time = fixes[from]->time;
    // At every third fix (1500 and 192 among them, and the first and last): up to 3 s either
    // side of its time, and from its own position to 5 km north of it.
    const auto ask = [&] {
      std::vector<std::string> out;
      for (size_t i = 0; i < fixes.size(); i += 3) {
        double lat = -1, lon = -1, alt = -1;
        long speed = -1;
        const long when = fixes[i]->time + static_cast<long>(i % 7) - 3;
        const bool found = track.MappingTimeToPoint(when, lat, lon, speed, alt);
        const double north = std::array{0.0, 1e-4, 5e-4, 0.01, 0.05}[i % 5];
        const long time = track.MappingPointToTime(fixes[i]->latitude + north, fixes[i]->longitude,
                                                   i % 2 ? 30.0 : 5000.0);
        out.push_back(navmisc::FormatA("%d %.12f %.12f %ld %.6f %ld", found, lat, lon, speed, alt, time));
      }
      return out;
    };
    const std::vector<std::string> plain = ask();
    navmisc::TrackMappingScope scope;
    ASSERT_EQ(ask(), plain) << "fix " << changed << " at the time of fix " << from;
  }
}

}  // namespace
