#include "navmisc/export/tcx_export.h"

#include <cmath>

#include <gtest/gtest.h>

#include "navmisc/export/detail/test_support.h"
#include "navmisc/export/tcx_from_trip.h"
#include "testutil.h"

namespace {

using namespace navmisc::exporttest;
using navmisc::testutil::ReadFileBytes;
using navmisc::testutil::TempDir;
using navmisc::testutil::WriteFileBytes;

const std::string kHead =
    "<?xml version=\"1.0\" encoding=\"UTF-8\" standalone=\"no\" ?>\n<!--- Corvane verion:2.0 -->\n"
    "<TrainingCenterDatabase xmlns=\"http://www.garmin.com/xmlschemas/TrainingCenterDatabase/v2\" "
    "xmlns:xsi=\"http://www.w3.org/2001/XMLSchema-instance\" "
    "xsi:schemaLocation=\"http://www.garmin.com/xmlschemas/TrainingCenterDatabase/v2 "
    "http://www.garmin.com/xmlschemas/TrainingCenterDatabasev2.xsd\"><Folders></Folders>\n<Activities>";
const std::string kTail = "</Activity>\n</Activities>\n</TrainingCenterDatabase>\n";

// Two laps (and a null one): every figure and every kind of Trackpoint the document knows.
struct Fixture {
  CTcxActivities activity;
  std::unique_ptr<TRACK_ITEM_INFO> a, b;
  Fixture() {
    activity.Id = L"2001-09-09T01:46:40Z";
    activity.sportType = CTcxActivities::kRunning;
    // Each point with its presence flags and working distance, heart rate, cadence and speed.
    const struct {
      Pt pt;
      uint8_t flags;
      double distance;
      int hr, cadence;
      double speed;
    } points[] = {
        {{25.1, 121.5, 12, 1000000000}, 0x0F, 0, 120, 80, 2.5},
        {{1, 1, 1, 1000000001}, 0x00, 1, 1, 1, 1},        // no flags: left out
        {{0, 0, 0, 1000000010}, 0x02, 10, 130, 0, 0},     // heart rate only
        {{2, 2, 2, -1}, 0x0F, 2, 2, 2, 2},                // no time: left out
        {{45.0, 45.0, 9, 1000000020}, 0x01, 20, 0, 0, 0},  // 45/45 marks a point without a fix
        {{0, 0, 9, 1000000030}, 0x01, 30, 0, 0, 0},
        {{3, 3, 3, 1000000040}, 0x10, 3, 3, 3, 3},  // only bits the document does not know: left out
        {{-33.5, -70.25, -3, 1000000050}, 0x0D, 99.125, 0, 0, 0},
    };
    a = MakeTrack(L"a", {});
    for (const auto& w : points) {
      auto* p = new WAYPOINT_ITEM_INFO;
      std::tie(p->latitude, p->longitude, p->altitude, p->time) = std::tie(w.pt.lat, w.pt.lon, w.pt.alt, w.pt.time);
      p->flags[WAYPOINT_ITEM_INFO::kFlagPresence] = w.flags;
      std::tie(p->workDistance, p->workHeartRate, p->workCadence, p->workSpeed) =
          std::tie(w.distance, w.hr, w.cadence, w.speed);
      a->points.AddTail(p);
    }
    b = MakeTrack(L"b", {{5, 5, 5, 1000000100}});
    TcxLap* lap = activity.AddLap();
    lap->startTime = 1000000000;
    lap->totalTimeSeconds = 3599.9;
    lap->distanceMeters = 1234.5;
    lap->maximumSpeed = 3.25;
    lap->calories = 250;
    lap->averageHeartRate = 140;
    lap->maximumHeartRate = 171;
    lap->tracks.AddTail(a.get());
    lap->tracks.AddTail(static_cast<void*>(nullptr));
    activity.laps.AddTail(static_cast<void*>(nullptr));
    TcxLap* empty = activity.AddLap();
    empty->maximumSpeed = -1;
    empty->calories = -5;
    empty->tracks.AddTail(b.get());  // its one point has no flags
  }
};

const std::string kFullDocument =
    kHead +
    "<Activity Sport=\"Running\"><Id>2001-09-09T01:46:40Z</Id>\n"
    "<Lap StartTime=\"2001-09-09T01:46:40Z\"><TotalTimeSeconds>3599</TotalTimeSeconds>\n"
    "<DistanceMeters>1234.5000000</DistanceMeters>\n<MaximumSpeed>3.2500000</MaximumSpeed>\n"
    "<Calories>250</Calories>\n"
    "<AverageHeartRateBpm xsi:type=\"HeartRateInBeatsPerMinute_t\"><Value>140</Value>\n</AverageHeartRateBpm>\n"
    "<MaximumHeartRateBpm xsi:type=\"HeartRateInBeatsPerMinute_t\"><Value>171</Value>\n</MaximumHeartRateBpm>\n"
    "<Intensity>Active</Intensity>\n<TriggerMethod>Manual</TriggerMethod>\n"
    "<Track><Trackpoint><Time>2001-09-09T01:46:40</Time>\n"
    "<Position><LatitudeDegrees>25.1000000</LatitudeDegrees>\n"
    "<LongitudeDegrees>121.5000000</LongitudeDegrees>\n</Position>\n"
    "<AltitudeMeters>12.0000000</AltitudeMeters>\n<DistanceMeters>0.0000000</DistanceMeters>\n"
    "<HeartRateBpm xsi:type=\"HeartRateInBeatsPerMinute_t\"><Value>120</Value>\n</HeartRateBpm>\n"
    "<Cadence>80</Cadence>\n"
    "<Extensions><TPX xmlns=\"http://www.garmin.com/xmlschemas/ActivityExtension/v2\" CadenceSensor=\"Bike\">"
    "<Speed>2.5000000</Speed>\n</TPX>\n</Extensions>\n</Trackpoint>\n"
    "<Trackpoint><Time>2001-09-09T01:46:50</Time>\n<DistanceMeters>10.0000000</DistanceMeters>\n"
    "<HeartRateBpm xsi:type=\"HeartRateInBeatsPerMinute_t\"><Value>130</Value>\n</HeartRateBpm>\n</Trackpoint>\n"
    "<Trackpoint><Time>2001-09-09T01:47:00</Time>\n<DistanceMeters>20.0000000</DistanceMeters>\n</Trackpoint>\n"
    "<Trackpoint><Time>2001-09-09T01:47:10</Time>\n<DistanceMeters>30.0000000</DistanceMeters>\n</Trackpoint>\n"
    "<Trackpoint><Time>2001-09-09T01:47:30</Time>\n"
    "<Position><LatitudeDegrees>-33.5000000</LatitudeDegrees>\n"
    "<LongitudeDegrees>-70.2500000</LongitudeDegrees>\n</Position>\n"
    "<AltitudeMeters>-3.0000000</AltitudeMeters>\n<DistanceMeters>99.1250000</DistanceMeters>\n"
    "<Cadence>0</Cadence>\n"
    "<Extensions><TPX xmlns=\"http://www.garmin.com/xmlschemas/ActivityExtension/v2\" CadenceSensor=\"Bike\">"
    "<Speed>0.0000000</Speed>\n</TPX>\n</Extensions>\n</Trackpoint>\n"
    "</Track>\n</Lap>\n"
    "<Lap><TotalTimeSeconds>0</TotalTimeSeconds>\n<DistanceMeters>0.0000000</DistanceMeters>\n"
    "<Intensity>Active</Intensity>\n<TriggerMethod>Manual</TriggerMethod>\n<Track></Track>\n</Lap>\n" +
    kTail;

TEST(ExportTcx, WritesEveryElementByteForByte) {
  TempDir dir;
  Fixture f;
  ASSERT_EQ(ExportTcx(dir / L"out.tcx", f.activity), 1);
  EXPECT_EQ(ReadFileBytes(dir / L"out.tcx"), kFullDocument);
}

TEST(ExportTcx, SportIdAndRejectedActivities) {
  TempDir dir;
  // The document of an activity without laps, or "" for an empty file; "before" when the
  // activity was rejected and the file left alone.
  auto exportActivity = [&](const std::wstring& id, int32_t sport) {
    WriteFileBytes(dir / L"a.tcx", "before");
    CTcxActivities activity;
    activity.Id = id;
    activity.sportType = sport;
    const int result = ExportTcx(dir / L"a.tcx", activity);
    const std::string written = ReadFileBytes(dir / L"a.tcx");
    EXPECT_EQ(result, written == "before" ? 0 : 1);
    return written;
  };
  auto document = [](const char* sport, const std::string& id) {
    return kHead + "<Activity Sport=\"" + sport + "\"><Id>" + id + "</Id>\n" + kTail;
  };
  EXPECT_EQ(exportActivity(L"x", 7), document("Other", "x"));
  EXPECT_EQ(exportActivity(L"", 1), "before");
  EXPECT_EQ(exportActivity(L"x", -1), "before");
  EXPECT_EQ(exportActivity(L"x", 8), "before");
  // Text goes out raw, as UTF-8; sport 0 is biking.
  EXPECT_EQ(exportActivity(L"L\u00e4ufe & <Sprints> \u2615", 0),
            document("Biking", "L\xC3\xA4ufe & <Sprints> \xE2\x98\x95"));
  // The conversion buffer holds twice the document's length in characters. With n three-byte
  // characters in a frame of `frame` ASCII characters, frame + 3n bytes must fit 2 (frame + n):
  // n = frame still does, one more does not and leaves the file empty.
  const size_t frame = document("Biking", "").size();
  std::string cups;
  for (size_t i = 0; i < frame; ++i) cups += "\xE2\x98\x95";
  EXPECT_EQ(exportActivity(std::wstring(frame, L'\u2615'), 0), document("Biking", cups));
  EXPECT_EQ(exportActivity(std::wstring(frame + 1, L'\u2615'), 0), "");
  EXPECT_EQ(exportActivity(L"a\xD800z", 0), "");  // not Unicode: the conversion fails
}

TEST(FillTcxLap, DerivesTheLapFromTheTrackAndItsSamples) {
  // Timed points 10 s apart, due north by 0.001 degrees (111.19 m) each; between them a point
  // without a time and one without a fix. Heart-rate samples at 1009 (0: no reading), 1010 and
  // 1020, a cadence sample (0 rpm) at 1000.
  auto track = MakeTrack(L"t", {{10.000, 20, 0, 1000, 3600},
                                {11.000, 20, 0, -1, 0},
                                {10.001, 20, 0, 1010, 18000},
                                {0, 0, 0, 1015, 7200},
                                {10.002, 20, 0, 1020, 0}});
  for (auto [time, values] : {std::pair<int32_t, std::vector<uint8_t>>{1009, {0, 150}}, {1020, {171}}}) {
    auto* hr = new HEARTRATE_ITEM_INFO;
    hr->time = time;
    std::copy(values.begin(), values.end(), hr->values);
    track->heartRates.AddTail(hr);
  }
  auto* cad = new CYCLING_CADENCE_RPM_ITEM_INFO;
  cad->time = 1000;
  cad->values[0] = 0;
  track->cadences.AddTail(cad);

  TcxLap lap;
  ASSERT_TRUE(FillTcxLap(*track, lap, CTcxActivities::kRunning));
  // A track of no trip has no owner whose energy could be known: the lap gets the least
  // calories a lap may carry.
  EXPECT_EQ(std::tuple(lap.startTime, lap.totalTimeSeconds, lap.maximumSpeed, lap.calories),
            std::tuple(1000, 20.0, 5.0, 1));
  EXPECT_NEAR(lap.distanceMeters, 222.39, 0.01);  // not to the untimed point nor the one without a fix
  // (150 + 171) / 2, rounded.
  EXPECT_EQ(std::tuple(lap.averageHeartRate, lap.maximumHeartRate), std::tuple(161, 171));
  // Per point: which of position, heart rate, cadence (0 rpm is a reading) and speed it has, the
  // distance so far in metres, and the heart rate.
  using PointFigures = std::vector<std::tuple<int, long, int>>;
  PointFigures points;
  for (auto* p : navmisc::Items<WAYPOINT_ITEM_INFO>(track->points)) {
    const int flags = p->flags[WAYPOINT_ITEM_INFO::kFlagPresence];
    points.emplace_back(flags, std::lround(p->workDistance), p->workHeartRate);
  }
  EXPECT_EQ(points,
            (PointFigures{{0x0D, 0, 0}, {0x00, 0, 0}, {0x0B, 111, 150}, {0x08, 111, 0}, {0x0B, 222, 171}}));

  // One lap per track with timed points; the Id is the first lap's start.
  auto untimed = MakeTrack(L"u", {{1, 1, 1, -1}});
  CPtrList tracks;
  tracks.AddTail(untimed.get());
  tracks.AddTail(track.get());
  CTcxActivities activity;
  EXPECT_EQ(FillTcxActivity(tracks, CTcxActivities::kBiking, activity), 1);
  EXPECT_EQ(activity.Id, L"1970-01-01T00:16:40Z");
}

}  // namespace
