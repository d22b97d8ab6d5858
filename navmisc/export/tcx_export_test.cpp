#include "navmisc/export/tcx_export.h"

#include <gtest/gtest.h>

#include "navmisc/export/detail/test_support.h"
#include "navmisc/export/detail/xml_tree.h"
#include "navmisc/export/tcx_from_trip.h"
#include "testutil.h"

namespace {

using namespace navmisc::exporttest;
using navmisc::exportdetail::XmlDocument;
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

// Sets the TCX working values and presence flags of point `index`.
void SetWork(TRACK_ITEM_INFO& track, int index, uint8_t flags, double distance, int hr, int cadence,
             double speed) {
  auto* p = static_cast<WAYPOINT_ITEM_INFO*>(track.points.GetAt(track.points.FindIndex(index)));
  p->flags[WAYPOINT_ITEM_INFO::kFlagPresence] = flags;
  p->workDistance = distance;
  p->workHeartRate = hr;
  p->workCadence = cadence;
  p->workSpeed = speed;
}

// Two laps (and a null one): every figure and every kind of Trackpoint the document knows.
struct Fixture {
  CTcxActivities activity;
  std::unique_ptr<TRACK_ITEM_INFO> a, b;
  Fixture() {
    activity.Id = L"2001-09-09T01:46:40Z";
    activity.sportType = CTcxActivities::kRunning;
    a = MakeTrack(L"a", {{25.1, 121.5, 12, 1000000000},
                         {1, 1, 1, 1000000001},
                         {0, 0, 0, 1000000010},
                         {2, 2, 2, -1},
                         {45.0, 45.0, 9, 1000000020},
                         {0, 0, 9, 1000000030},
                         {3, 3, 3, 1000000040},
                         {-33.5, -70.25, -3, 1000000050}});
    SetWork(*a, 0, 0x0F, 0, 120, 80, 2.5);
    SetWork(*a, 1, 0x00, 1, 1, 1, 1);     // no flags: left out
    SetWork(*a, 2, 0x02, 10, 130, 0, 0);  // heart rate only
    SetWork(*a, 3, 0x0F, 2, 2, 2, 2);     // no time: left out
    SetWork(*a, 4, 0x01, 20, 0, 0, 0);    // 45/45 marks a point without a fix
    SetWork(*a, 5, 0x01, 30, 0, 0, 0);
    SetWork(*a, 6, 0x10, 3, 3, 3, 3);     // only bits the document does not know: left out
    SetWork(*a, 7, 0x0D, 99.125, 0, 0, 0);
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
  WriteFileBytes(dir / L"out.tcx", std::string(10000, 'x'));
  ASSERT_EQ(::chmod(navmisc::NativePath(dir / L"out.tcx").c_str(), 0444), 0);
  int counter = 0;
  ASSERT_EQ(ExportTcx(dir / L"out.tcx", f.activity, &counter, nullptr), 1);
  EXPECT_EQ(ReadFileBytes(dir / L"out.tcx"), kFullDocument);
  EXPECT_EQ(counter, 9);  // every point of the laps' tracks

  CommaLocale locale;
  if (!locale.ok()) GTEST_SKIP() << "no comma-decimal locale installed (scripts/setup.sh makes de_DE.UTF-8)";
  ASSERT_EQ(ExportTcx(dir / L"de.tcx", f.activity), 1);
  EXPECT_EQ(ReadFileBytes(dir / L"de.tcx"), kFullDocument);
}

TEST(ExportTcx, SportTypesAndRejectedActivities) {
  TempDir dir;
  const struct {
    const wchar_t* id;
    int32_t sport;
    const char* text;  // null: rejected
  } cases[] = {{L"x", 0, "Biking"}, {L"x", 1, "Running"}, {L"x", 2, "Other"}, {L"x", 7, "Other"},
               {L"", 1, nullptr},   {L"x", -1, nullptr},  {L"x", 8, nullptr}};
  for (const auto& c : cases) {
    WriteFileBytes(dir / L"a.tcx", "before");
    CTcxActivities activity;
    activity.Id = c.id;
    activity.sportType = c.sport;
    const int result = ExportTcx(dir / L"a.tcx", activity);
    if (!c.text) {
      EXPECT_EQ(result, 0) << c.sport;
      EXPECT_EQ(ReadFileBytes(dir / L"a.tcx"), "before") << "a rejected activity touches no file";
      continue;
    }
    EXPECT_EQ(result, 1);
    EXPECT_EQ(ReadFileBytes(dir / L"a.tcx"),
              kHead + "<Activity Sport=\"" + c.text + "\"><Id>x</Id>\n" + kTail);
  }
}

TEST(ExportTcx, TextIsUtf8UnlessItOutgrowsTheConversionBuffer) {
  TempDir dir;
  auto exportId = [&](const std::wstring& id) {
    CTcxActivities activity;
    activity.Id = id;
    EXPECT_EQ(ExportTcx(dir / L"u.tcx", activity), 1);
    return ReadFileBytes(dir / L"u.tcx");
  };
  auto document = [](const std::string& id) {
    return kHead + "<Activity Sport=\"Biking\"><Id>" + id + "</Id>\n" + kTail;
  };
  // Raw, without escaping.
  EXPECT_EQ(exportId(L"L\u00e4ufe & <Sprints> \u2615"), document("L\xC3\xA4ufe & <Sprints> \xE2\x98\x95"));
  // The conversion buffer holds twice the document's length in characters. With n three-byte
  // characters in a frame of `frame` ASCII characters, frame + 3n bytes must fit 2 (frame + n):
  // n = frame still does, one more does not and leaves the file empty.
  const size_t frame = document("").size();
  std::string cups;
  for (size_t i = 0; i < frame; ++i) cups += "\xE2\x98\x95";
  EXPECT_EQ(exportId(std::wstring(frame, L'\u2615')), document(cups));
  EXPECT_EQ(exportId(std::wstring(frame + 1, L'\u2615')), "");
  // Not Unicode: the conversion fails.
  EXPECT_EQ(exportId(L"a\xD800z"), "");
}

TEST(ExportTcx, UnwritableTargetAndStoppedExportLeaveNoDocument) {
  TempDir dir;
  Fixture f;
  WriteFileBytes(dir / L"file", "x");
  for (const CString& target : {dir / L"missing/out.tcx", dir / L"file/out.tcx", dir.path()}) {
    EXPECT_EQ(ExportTcx(target, f.activity), 0) << target.ToUtf8();
  }
  bool keepGoing = false;
  EXPECT_EQ(ExportTcx(dir / L"stop.tcx", f.activity, nullptr, &keepGoing), 0);
  EXPECT_FALSE(FileExists(dir / L"stop.tcx"));
}

TEST(XmlDocument, StartTagParsing) {
  const struct {
    const wchar_t* tag;
    bool ok;
    std::wstring rendered;
  } cases[] = {
      {L"Root", true, L"<Root></Root>\n"},
      {L"Root a=\"1\" b=\"two words\"", true, L"<Root a=\"1\" b=\"two words\"></Root>\n"},
      {L"Root a=\"1\"  b=\"2\"", true, L"<Root a=\"1\"  b=\"2\"></Root>\n"},  // the name keeps a blank
      {L"Root loose", true, L"<Root></Root>\n"},                             // no "=": ignored
      {L"Root a=\"1\" loose", true, L"<Root a=\"1\"></Root>\n"},
      {L"Root a=\"1", false, L""},
      {L"Root a=1", false, L""},
      {L"br/", true, L"<br/>"},
  };
  for (const auto& c : cases) {
    XmlDocument doc;
    auto* node = doc.CreateNode(c.tag);
    EXPECT_EQ(node != nullptr, c.ok) << c.tag;
    if (node) {
      EXPECT_EQ(doc.Render(L"<?x?>"), L"<?x?>" + c.rendered) << c.tag;
    }
  }
}

TEST(FillTcxLap, DerivesTheLapFromTheTrackAndItsSamples) {
  // Three timed points 10 s apart, due north by 0.001 degrees (111.19 m) each, with one point
  // without a time between them and heart rate and cadence samples for two of them.
  auto track = MakeTrack(L"t", {{10.000, 20, 0, 1000, 3600},
                                {11.000, 20, 0, -1, 0},
                                {10.001, 20, 0, 1010, 18000},
                                {0, 0, 0, 1015, 7200},
                                {10.002, 20, 0, 1020, 0}});
  auto* hr = new HEARTRATE_ITEM_INFO;
  hr->time = 1009;
  hr->values[0] = 0;    // 1009
  hr->values[1] = 150;  // 1010
  hr->values[2] = 255;
  track->heartRates.AddTail(hr);
  auto* hr2 = new HEARTRATE_ITEM_INFO;
  hr2->time = 1020;
  hr2->values[0] = 171;
  hr2->values[1] = 255;
  track->heartRates.AddTail(hr2);
  auto* cad = new CYCLING_CADENCE_RPM_ITEM_INFO;
  cad->time = 1000;
  cad->values[0] = 0;
  cad->values[1] = 255;
  track->cadences.AddTail(cad);

  TcxLap lap;
  ASSERT_TRUE(FillTcxLap(*track, lap));
  EXPECT_EQ(lap.startTime, 1000);
  EXPECT_EQ(lap.totalTimeSeconds, 20);
  EXPECT_NEAR(lap.distanceMeters, 222.39, 0.01);
  EXPECT_DOUBLE_EQ(lap.maximumSpeed, 5.0);
  EXPECT_EQ(lap.averageHeartRate, 161);  // (150 + 171) / 2 rounded; a 0 sample is no reading
  EXPECT_EQ(lap.maximumHeartRate, 171);
  EXPECT_EQ(lap.calories, 0);
  const struct {
    uint8_t flags;
    double distance;
    int hr, cadence;
  } want[] = {{0x0D, 0, 0, 0}, {0x00, 0, 0, 0}, {0x0B, 111.19, 150, 0}, {0x08, 111.19, 0, 0},
              {0x0B, 222.39, 171, 0}};
  int i = 0;
  for (auto* p : navmisc::Items<WAYPOINT_ITEM_INFO>(track->points)) {
    EXPECT_EQ(p->flags[WAYPOINT_ITEM_INFO::kFlagPresence], want[i].flags) << i;
    EXPECT_NEAR(p->workDistance, want[i].distance, 0.01) << i;
    EXPECT_EQ(p->workHeartRate, want[i].hr) << i;
    ++i;
  }

  auto untimed = MakeTrack(L"u", {{1, 1, 1, -1}});
  TcxLap other;
  other.calories = 9;
  EXPECT_FALSE(FillTcxLap(*untimed, other));
  EXPECT_EQ(other.calories, 9);

  CPtrList tracks;
  tracks.AddTail(untimed.get());
  tracks.AddTail(track.get());
  CTcxActivities activity;
  EXPECT_EQ(FillTcxActivity(tracks, CTcxActivities::kBiking, activity), 1);
  EXPECT_EQ(activity.Id, L"1970-01-01T00:16:40Z");
}

}  // namespace
