// Track files into trips: what a saved trip holds, the cut and the zone, and that a failed
// import leaves nothing behind.
#include "navmisc/import/trip_import.h"

#include <gtest/gtest.h>

#include <string>

#include "navmisc/import/import_errors.h"
#include "navmisc/platform/atomic_file.h"
#include "navmisc/platform/files.h"
#include "navmisc/records/trip.h"
#include "navmisc/records/trip_tree.h"
#include "record_fixture.h"

namespace {

using namespace navmisc::import;
using navmisc::Items;
using navmisc::testutil::ReadFileBytes;
using navmisc::testutil::WriteFileBytes;

class TripImport : public navmisc::testutil::RecordTest {
 protected:
  CString File(const wchar_t* name, const std::string& content) {
    const CString path = files_ / name;
    WriteFileBytes(path, content);
    return path;
  }
  // The entries of an application's data folder.
  static CStringList Folders(GPS_APP_PROG_TYPE type) {
    CStringList names;
    GetContent(GetAppDataFolder(type), L"*.*", names);
    return names;
  }
  // Imports one file; the trip id, or the failure.
  static ReadStatus Import(const CString& path, TripImportOptions options, CString* id = nullptr,
                           ReadFileOptions read = {}) {
    TripImporter importer(options);
    ReadStatus s = importer.Begin();
    if (s.ok()) s = importer.AddFile(path, read).status;
    if (s.ok()) s = importer.Commit();
    if (s.ok() && id) *id = importer.tripId();
    return s;
  }
  static TripImportOptions App(GPS_APP_PROG_TYPE type) {
    TripImportOptions o;
    o.appType = type;
    return o;
  }
  navmisc::testutil::TempDir files_;
};

const char kRide[] =
    "<?xml version=\"1.0\"?>\n"
    "<gpx version=\"1.1\" xmlns=\"http://www.topografix.com/GPX/1/1\" "
    "xmlns:tp=\"http://www.garmin.com/xmlschemas/TrackPointExtension/v2\">"
    "<metadata><name>Lake ride</name><desc>windy</desc></metadata>"
    "<wpt lat=\"47.5\" lon=\"8.5\"><ele>400</ele><time>2024-05-01T06:00:30Z</time><name>Cafe</name>"
    "<desc>cake</desc></wpt>"
    "<wpt lat=\"47.6\" lon=\"8.6\"><name>Hill</name></wpt>"
    "<trk><name>Out</name><trkseg>"
    "<trkpt lat=\"47.1\" lon=\"8.1\"><ele>401.5</ele><time>2024-05-01T06:00:00Z</time><extensions>"
    "<tp:TrackPointExtension><tp:hr>120</tp:hr><tp:cad>80</tp:cad><tp:speed>2.5</tp:speed>"
    "<tp:course>359.6</tp:course></tp:TrackPointExtension></extensions></trkpt>"
    "<trkpt lat=\"47.2\" lon=\"8.2\"><time>2024-05-01T06:00:01Z</time><extensions>"
    "<tp:TrackPointExtension><tp:hr>121</tp:hr></tp:TrackPointExtension></extensions></trkpt>"
    "<trkpt lat=\"47.3\" lon=\"8.3\"><time>2024-05-01T06:00:05Z</time><extensions>"
    "<tp:TrackPointExtension><tp:hr>125</tp:hr></tp:TrackPointExtension></extensions></trkpt>"
    "</trkseg><trkseg>"
    "<trkpt lat=\"47.4\" lon=\"8.4\"><time>2024-05-01T06:01:00Z</time></trkpt>"
    "</trkseg></trk>"
    "<trk><name>Back</name><trkseg><trkpt lat=\"-47.4\" lon=\"-8.4\"><time>2024-05-01T07:00:00Z</time>"
    "</trkpt></trkseg></trk></gpx>";

TEST_F(TripImport, AFileBecomesASavedTripInTheTripTree) {
  CString id;
  ASSERT_TRUE(Import(File(L"ride.gpx", kRide), {}, &id).ok());

  BLOG_TREE_NODE tree(nullptr);
  ASSERT_EQ(tree.ReadInfo(0, nullptr), 1) << "a tree is made for the first trip";
  ASSERT_EQ(tree.trips.GetCount(), 1);
  BLOG_ITEM_INFO* trip = static_cast<BLOG_ITEM_INFO*>(tree.trips.GetHead());
  EXPECT_EQ(trip->tripId, id);
  EXPECT_EQ(trip->name, L"Lake ride");
  EXPECT_EQ(trip->description, L"windy");
  trip->ReadAllWaypoint(1);

  const struct {
    const wchar_t* name;
    std::vector<std::string> bin;  // the point lines
    std::string hr, cad;           // the side files
  } tracks[] = {
      {L"Out",
       {"1714543200,47.100000,8.100000,401.500000,9000,0,0,0,0",
        "1714543201,47.200000,8.200000,0.000000,0,0,-1,0,0",
        "1714543205,47.300000,8.300000,0.000000,0,0,-1,0,0"},
       "1714543200,120,121,255\r\n1714543205,125,255\r\n", "1714543200,80,255\r\n"},
      {L"Out (2)", {"1714543260,47.400000,8.400000,0.000000,0,0,-1,0,0"}, "", ""},
      {L"Back", {"1714546800,-47.400000,-8.400000,0.000000,0,0,-1,0,0"}, "", ""},
  };
  ASSERT_EQ(trip->tracks.GetCount(), 3);
  int n = 0;
  for (TRACK_ITEM_INFO* t : Items<TRACK_ITEM_INFO>(trip->tracks)) {
    const auto& want = tracks[n++];
    EXPECT_EQ(t->description, want.name);
    std::string bin;
    for (const auto& line : want.bin) bin += line + "\r\n";
    EXPECT_EQ(ReadFileBytes(t->GetFilePathName()), bin) << CString(want.name).ToUtf8();
    EXPECT_EQ(FileExists(t->GetHeartRateFilePathName()) ? ReadFileBytes(t->GetHeartRateFilePathName()) : "", want.hr);
    EXPECT_EQ(FileExists(t->GetCyclingCadenceFilePathName()) ? ReadFileBytes(t->GetCyclingCadenceFilePathName()) : "",
              want.cad);
  }
  ASSERT_EQ(trip->photos.GetCount(), 2);
  const auto* cafe = static_cast<PHOTO_ITEM_INFO*>(trip->photos.GetHead());
  const auto* hill = static_cast<PHOTO_ITEM_INFO*>(trip->photos.GetTail());
  EXPECT_EQ(cafe->dataType, PHOTO_ITEM_INFO::kTypeMarker);
  EXPECT_EQ(cafe->title, L"Cafe");
  EXPECT_EQ(cafe->description, L"cake");
  EXPECT_EQ(cafe->playbackTime, 1714543230);
  EXPECT_DOUBLE_EQ(cafe->altitude, 400.0);
  EXPECT_EQ(hill->title, L"Hill");
  EXPECT_EQ(hill->playbackTime, 0) << "no time";
  EXPECT_DOUBLE_EQ(hill->latitude, 47.6);

  // A second import joins the tree beside the first.
  TripImportOptions named;
  named.name = L"Again";
  ASSERT_TRUE(Import(File(L"second.gpx", kRide), named).ok());
  BLOG_TREE_NODE again(nullptr);
  ASSERT_EQ(again.ReadInfo(0, nullptr), 1);
  ASSERT_EQ(again.trips.GetCount(), 2);
  EXPECT_EQ(static_cast<BLOG_ITEM_INFO*>(again.trips.GetTail())->name, L"Again");
}

TEST_F(TripImport, TheZoneComesOffAndTheCutKeepsTheRange) {
  CString id;
  // The file's times are two hours ahead of UTC; keep 06:00:01 to 06:01:00 UTC.
  TripImportOptions options;
  options.timeZone = 7200;
  options.cutStart = 1714543201;
  options.cutEnd = 1714543260;
  std::string ride = kRide;
  for (size_t at; (at = ride.find("T06:")) != std::string::npos;) ride.replace(at, 4, "T08:");
  for (size_t at; (at = ride.find("T07:")) != std::string::npos;) ride.replace(at, 4, "T09:");
  ASSERT_TRUE(Import(File(L"ride.gpx", ride), options, &id).ok());
  BLOG_ITEM_INFO trip(GPS_APP_TRIP, id);
  ASSERT_EQ(trip.ReadInfo(), 1);
  trip.ReadAllWaypoint(1);
  std::vector<int32_t> times;
  for (TRACK_ITEM_INFO* t : Items<TRACK_ITEM_INFO>(trip.tracks)) {
    for (WAYPOINT_ITEM_INFO* p : Items<WAYPOINT_ITEM_INFO>(t->points)) times.push_back(p->time);
  }
  // Tracks of a single point load with a copy one second later.
  EXPECT_EQ(times, (std::vector<int32_t>{1714543201, 1714543205, 1714543260, 1714543261}));
  ASSERT_EQ(trip.photos.GetCount(), 2) << "the timed marker lies in the range, the other has no time";

  options.cutStart = 1800000000;
  options.cutEnd = kNoTime;
  const ReadStatus none = Import(File(L"late.gpx", ride), options);
  EXPECT_EQ(none.code, DC_ERR_IMPORT_NO_POINTS);
  EXPECT_NE(none.message.find("time range"), std::string::npos);
}

TEST_F(TripImport, SportAndTrackerTripsStandInTheirOwnFolders) {
  for (GPS_APP_PROG_TYPE type : {GPS_APP_SPORT, GPS_APP_TRACKER}) {
    CString id;
    ASSERT_TRUE(Import(File(L"ride.gpx", kRide), App(type), &id).ok());
    BLOG_ITEM_INFO trip(type, id);
    EXPECT_EQ(trip.ReadInfo(), 1);
    EXPECT_EQ(trip.tracks.GetCount(), 3);
  }
  EXPECT_FALSE(FileExists(GetAppDataFolder(GPS_APP_TRIP) + L"/RESOURCE_INFO.INI")) << "not in the trip tree";
  EXPECT_EQ(Import(File(L"ride.gpx", kRide), App(GPS_APP_WHEREAMI)).code, DC_ERR_IMPORT_APP);
}

TEST_F(TripImport, AFailedImportLeavesNoTripAndTheTreeAsItWas) {
  ASSERT_TRUE(Import(File(L"ride.gpx", kRide), {}).ok());
  const CString treeFile = GetAppDataFolder(GPS_APP_TRIP) + L"/RESOURCE_INFO.INI";
  const std::string tree = ReadFileBytes(treeFile);
  const int folders = Folders(GPS_APP_TRIP).GetCount();

  std::string broken = kRide;
  broken.replace(broken.rfind("</trk>"), 6, "</trkk>");
  std::string manyPoints = "<gpx><trk><trkseg>";
  for (int i = 0; i < 3000; ++i) manyPoints += "<trkpt lat=\"1\" lon=\"2\"/>";
  manyPoints += "</trkseg></trk></gpx>";
  const CString many = File(L"many.gpx", manyPoints);

  // Malformed after two tracks were written.
  EXPECT_EQ(Import(File(L"broken.gpx", broken), {}).code, DC_ERR_IMPORT_MALFORMED);
  // Stopped half way.
  ReadFileOptions stop;
  stop.progress = [](const ReadProgress& p) { return p.points < 2000; };
  EXPECT_EQ(Import(many, {}, nullptr, stop).code, DC_ERR_IMPORT_CANCELLED);
  // The disk fills up while the points are written.
  navmisc::testing::FailAtomicWritesAfter(20000);
  EXPECT_EQ(Import(many, {}).code, DC_ERR_IMPORT_WRITE);
  navmisc::testing::FailAtomicWritesAfter(-1);
  // Nothing to import.
  EXPECT_EQ(Import(File(L"empty.gpx", "<gpx><trk/></gpx>"), {}).code, DC_ERR_IMPORT_NO_POINTS);

  EXPECT_EQ(Folders(GPS_APP_TRIP).GetCount(), folders);
  EXPECT_EQ(ReadFileBytes(treeFile), tree);

  // A tree file that cannot be read is never written over; the new trip goes.
  WriteFileBytes(treeFile, "[SECTION]\r\nsomething=else\r\n");
  const ReadStatus unreadable = Import(File(L"ride.gpx", kRide), {});
  EXPECT_EQ(unreadable.code, DC_ERR_IMPORT_WRITE);
  EXPECT_NE(unreadable.message.find("cannot be read"), std::string::npos);
  EXPECT_EQ(ReadFileBytes(treeFile), "[SECTION]\r\nsomething=else\r\n");
  EXPECT_EQ(Folders(GPS_APP_TRIP).GetCount(), folders);
}

TEST_F(TripImport, SeveralFilesMakeOneTripAndAnEmptyOneAddsNothing) {
  TripImporter importer({});
  ASSERT_TRUE(importer.Begin().ok());
  EXPECT_TRUE(importer.AddFile(File(L"a.gpx", kRide), {}).status.ok());
  EXPECT_EQ(importer.AddFile(File(L"empty.nmea", ""), {}).status.code, DC_ERR_IMPORT_EMPTY);
  const std::string log =
      "$GPRMC,120000,A,0100.0000,N,00200.0000,E,,,010124,,*1B\r\n"
      "$GPRMC,120001,A,0100.0000,N,00200.0000,E,,,010124,,*1A\r\n";
  EXPECT_TRUE(importer.AddFile(File(L"day2.nmea", log), {}).status.ok());
  ASSERT_TRUE(importer.Commit().ok());
  EXPECT_EQ(importer.tracks(), 4);
  EXPECT_EQ(importer.keptPoints(), 7u);
  EXPECT_EQ(importer.firstPoint().time, 1714543200);
  EXPECT_EQ(importer.lastPoint().time, 1704110401);

  BLOG_ITEM_INFO trip(GPS_APP_TRIP, importer.tripId());
  ASSERT_EQ(trip.ReadInfo(), 1);
  EXPECT_EQ(trip.name, L"Lake ride");
  EXPECT_EQ(static_cast<TRACK_ITEM_INFO*>(trip.tracks.GetTail())->description, L"day2")
      << "a log's track is named after its file";
}

}  // namespace
