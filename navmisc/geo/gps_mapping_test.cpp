#include "navmisc/geo/gps_mapping.h"

#include <gtest/gtest.h>

#include <cmath>
#include <memory>
#include <random>
#include <string>
#include <tuple>
#include <vector>

#include "geo_reference.h"
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
      {1005, true, 1005, 47.005, 8.0, 150, 5400},
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
  EXPECT_EQ(photo.trackItemId, L"TK_A");
  EXPECT_NEAR(photo.latitude, 47.005, 1e-9);
  EXPECT_EQ(photo.speed, 5400);
  EXPECT_EQ(photo.altitude, 150.0);
}

TEST(Mapping, PhotoAndTrackListsStayInOrder) {
  // Inserted in this order (name, placed, playback time, original time); equal keys go before
  // the photos already there.
  const std::tuple<const char*, bool, int32_t, int32_t> shapes[] = {
      {"P1", true, 100, 0}, {"U1", false, 0, 5}, {"P2", true, 50, 0}, {"N1", true, 0, 30},
      {"P3", true, 100, 0}, {"N2", true, 0, 10}, {"U2", false, 0, 1}, {"U3", false, 0, 5}};
  std::vector<std::unique_ptr<PHOTO_ITEM_INFO>> photos;
  CPtrList list;
  for (const auto& [name, placed, playback, original] : shapes) {
    photos.push_back(std::make_unique<PHOTO_ITEM_INFO>());
    PHOTO_ITEM_INFO& photo = *photos.back();
    photo.photoId = CString::FromUtf8(name);
    photo.latitude = photo.longitude = placed ? 1.0 : 0.0;
    photo.playbackTime = playback;
    photo.originalTime = original;
    InsertItemToPhotoList(list, &photo);
  }
  std::string order;
  for (void* v : list) order += static_cast<PHOTO_ITEM_INFO*>(v)->photoId.ToUtf8() + " ";
  EXPECT_EQ(order, "P2 P3 P1 N2 N1 U2 U3 U1 ");

  std::vector<std::unique_ptr<TRACK_ITEM_INFO>> tracks;
  CPtrList trackList;
  for (auto [id, start] : {std::pair{L"c", 300}, {L"a", 100}, {L"b", 200}, {L"a2", 100}}) {
    tracks.push_back(MakeTrack(id, start));
    InsertItemToTrackList(trackList, tracks.back().get());
  }
  std::string ids;
  for (void* v : trackList) ids += static_cast<TRACK_ITEM_INFO*>(v)->id.ToUtf8() + " ";
  EXPECT_EQ(ids, "a a2 b c ");
}

// Inside a TrackMappingScope the answers come from an indexed copy of each track: they must be
// those of the plain search for every kind of question.
TEST(Mapping, ScopedAnswersEqualThePlainSearch) {
  std::mt19937 rng(99);
  std::uniform_real_distribution<double> uni(0.0, 1.0);
  for (int variant = 0; variant < 3; ++variant) {
    TRACK_ITEM_INFO track(nullptr);
    navmisc::testing::AppendNoisyTrack(track.points, 7 + variant, 3000);
    const auto items = navmisc::Items<WAYPOINT_ITEM_INFO>(track.points);
    const std::vector<WAYPOINT_ITEM_INFO*> fixes(items.begin(), items.end());
    if (variant == 1) fixes[1500]->time = fixes[10]->time;  // times out of order
    if (variant == 2) fixes[200]->time = fixes[199]->time;  // a repeated time
    const int32_t first = fixes.front()->time, last = fixes.back()->time;
    struct Question {
      long time;
      double lat, lon, tolerance;
    };
    std::vector<Question> questions;
    for (int q = 0; q < 300; ++q) {
      const WAYPOINT_ITEM_INFO* f = fixes[static_cast<size_t>(uni(rng) * fixes.size())];
      const double spread = q % 3 == 0 ? 0.0 : q % 3 == 1 ? 0.0005 : 0.05;
      questions.push_back({q % 5 == 0 ? f->time : first - 5 + static_cast<long>(uni(rng) * (last - first + 10)),
                           f->latitude + (uni(rng) - 0.5) * spread,
                           f->longitude + (uni(rng) - 0.5) * spread, q % 2 ? 30.0 : 5000.0});
    }
    questions.push_back({last, fixes.back()->latitude, fixes.back()->longitude, 1.0});
    questions.push_back({first, NAN, 8.0, 1.0});
    auto ask = [&](const Question& q) {
      double lat = -1, lon = -1, alt = -1;
      long speed = -1;
      const bool found = track.MappingTimeToPoint(q.time, lat, lon, speed, alt);
      const long time = track.MappingPointToTime(q.lat, q.lon, q.tolerance);
      char text[160];
      std::snprintf(text, sizeof text, "%d %.12f %.12f %ld %.6f %ld", found, lat, lon, speed, alt, time);
      return std::string(text);
    };
    std::vector<std::string> plain;
    for (const Question& q : questions) plain.push_back(ask(q));
    navmisc::TrackMappingScope scope;
    for (size_t i = 0; i < questions.size(); ++i) {
      ASSERT_EQ(ask(questions[i]), plain[i]) << "variant " << variant << ", question " << i;
    }
  }
}

}  // namespace
