// The streaming readers on documents fed in pieces: what reaches the sink, and how bad
// documents end.
#include <gtest/gtest.h>

#include <charconv>
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <random>
#include <string>
#include <vector>

#include "navmisc/import/detail/recording_sink.h"
#include "navmisc/import/detail/values.h"
#include "navmisc/import/import_errors.h"
#include "navmisc/import/track_reader.h"

namespace {

using namespace navmisc::import;
using navmisc::import::testing::RecordingSink;

enum class Kind { kGpx, kTcx, kNmea };

std::unique_ptr<TrackReader> Make(Kind kind, ImportSink& sink, const NmeaOptions& nmea = {}) {
  switch (kind) {
    case Kind::kGpx: return MakeGpxReader(sink);
    case Kind::kTcx: return MakeTcxReader(sink);
    case Kind::kNmea: return MakeNmeaReader(sink, nmea);
  }
  return nullptr;
}

struct Outcome {
  ReadStatus status;
  std::vector<std::string> lines;
  ReadCounts counts;
};

// Reads `doc` handed over in pieces of `piece` bytes (0: all at once).
Outcome Read(Kind kind, const std::string& doc, size_t piece = 0, const NmeaOptions& nmea = {}) {
  RecordingSink sink;
  auto reader = Make(kind, sink, nmea);
  bool ok = true;
  const size_t step = piece ? piece : std::max<size_t>(doc.size(), 1);
  for (size_t i = 0; ok && i < doc.size(); i += step) ok = reader->Feed(doc.data() + i, std::min(step, doc.size() - i));
  if (ok) reader->Finish();
  return {reader->status(), sink.lines, reader->counts()};
}

std::string Joined(const std::vector<std::string>& lines) {
  std::string out;
  for (const auto& l : lines) out += l + "\n";
  return out;
}

// Every piece size gives the same reading as the whole document at once.
void ExpectSameInPieces(Kind kind, const std::string& doc, const std::string& expected) {
  for (size_t piece : {0, 1, 2, 7, 100}) {
    const Outcome o = Read(kind, doc, piece);
    EXPECT_TRUE(o.status.ok()) << "piece " << piece << ": " << o.status.message;
    EXPECT_EQ(Joined(o.lines), expected) << "piece " << piece;
  }
}

TEST(GpxReader, TracksSegmentsRoutesWaypointsAndSensorExtensions) {
  const std::string doc =
      "\xEF\xBB\xBF<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n"
      "<!-- written by hand -->\n"
      "<gpx version=\"1.1\" creator=\"t\" xmlns=\"http://www.topografix.com/GPX/1/1\"\n"
      "     xmlns:gpxtpx=\"http://www.garmin.com/xmlschemas/TrackPointExtension/v2\"\n"
      "     xmlns:gpxdata=\"http://www.cluetrust.com/XML/GPXDATA/1/0\">\n"
      " <metadata><name>Day &amp; night</name><desc>Two walks</desc><author><name>Ann</name></author>"
      "<time>2024-01-01T00:00:00Z</time></metadata>\n"
      " <wpt lat=\"47.5\" lon=\"-8.25\"><ele>410.5</ele><time>2024-05-01T06:00:10+02:00</time>"
      "<name>Fountain</name><cmt>comment</cmt><sym>Flag, Blue</sym></wpt>\n"
      " <wpt lat=\"-33.9\" lon=\"151.2\"><name>Bridge</name><desc>harbour</desc><cmt>ignored</cmt></wpt>\n"
      " <trk><name>Walk</name><desc>morning</desc><trkseg>\n"
      "  <trkpt lat=\"47.376887\" lon=\"8.541694\"><ele> 408.5 </ele><time>2024-05-01T06:00:00Z</time>"
      "<extensions><gpxtpx:TrackPointExtension><gpxtpx:hr>121</gpxtpx:hr><gpxtpx:cad>80</gpxtpx:cad>"
      "<gpxtpx:speed>1.5</gpxtpx:speed><gpxtpx:course>90</gpxtpx:course></gpxtpx:TrackPointExtension>"
      "</extensions></trkpt>\n"
      "  <trkpt lat=\"+47.377\" lon=\"8.5418\"><time>2024-05-01T06:00:05.750Z</time>"
      "<extensions><gpxdata:hr>122</gpxdata:hr><gpxdata:cadence>81</gpxdata:cadence></extensions></trkpt>\n"
      " </trkseg><trkseg>\n"
      "  <trkpt lat=\"47.4\" lon=\"8.6\"><name>not a marker</name></trkpt>\n"
      " </trkseg><trkseg/></trk>\n"
      " <trk><name>Empty</name></trk>\n"
      " <rte><name>Plan</name><rtept lat=\"1\" lon=\"2\"><name>A</name></rtept><rtept lat=\"3\" lon=\"4\"/></rte>\n"
      "</gpx>\n";
  ExpectSameInPieces(Kind::kGpx, doc,
                     "doc Day & night|Two walks\n"
                     "marker Fountain|comment|Flag, Blue 1714536010 47.500000,-8.250000 ele=410.500000\n"
                     "marker Bridge|harbour| -1 -33.900000,151.200000 ele=-\n"
                     "track track Walk|morning\n"
                     "segment\n"
                     "pt 1714543200 47.376887,8.541694 ele=408.500000 spd=1.5 crs=90 hr=121 cad=80\n"
                     "pt 1714543205 47.377000,8.541800 ele=- spd=-1 crs=-1 hr=122 cad=81\n"
                     "segment\n"
                     "pt -1 47.400000,8.600000 ele=- spd=-1 crs=-1 hr=-1 cad=-1\n"
                     "segment\n"
                     "end\n"
                     "track track Empty|\n"
                     "end\n"
                     "track route Plan|\n"
                     "segment\n"
                     "pt -1 1.000000,2.000000 ele=- spd=-1 crs=-1 hr=-1 cad=-1\n"
                     "pt -1 3.000000,4.000000 ele=- spd=-1 crs=-1 hr=-1 cad=-1\n"
                     "end\n");
}

TEST(GpxReader, Version10NamesSpeedAndCourseOfThePointWin) {
  // GPX 1.0: the document's name stands under <gpx>, points carry speed and course themselves;
  // an extension's value does not replace them. A document without a namespace reads the same.
  const std::string doc =
      "<gpx version=\"1.0\" xmlns=\"http://www.topografix.com/GPX/1/0\"><name>Old</name>"
      "<trk><trkseg><trkpt lat=\"10\" lon=\"20\"><ele>-5</ele><time>2001-02-03T04:05:06</time>"
      "<course>359.5</course><speed>2.25</speed><extensions><speed>9</speed><course>1</course>"
      "</extensions></trkpt></trkseg></trk></gpx>";
  const std::string expected =
      "doc Old|\n"
      "track track |\n"
      "segment\n"
      "pt 981173106 10.000000,20.000000 ele=-5.000000 spd=2.25 crs=359.5 hr=-1 cad=-1\n"
      "end\n";
  ExpectSameInPieces(Kind::kGpx, doc, expected);
  std::string bare = doc;
  bare.erase(bare.find(" xmlns="), std::string(" xmlns=\"http://www.topografix.com/GPX/1/0\"").size());
  EXPECT_EQ(Joined(Read(Kind::kGpx, bare).lines), expected);
}

TEST(GpxReader, LegacyEncodingsOfWindowsProgramsAreRead) {
  const std::string doc =
      "<?xml version=\"1.0\" encoding=\"windows-1252\"?><gpx><wpt lat=\"1\" lon=\"2\">"
      "<name>Caf\xE9 \x80</name></wpt></gpx>";
  EXPECT_EQ(Joined(Read(Kind::kGpx, doc).lines), "marker Caf\xC3\xA9 \xE2\x82\xAC|| -1 1.000000,2.000000 ele=-\n");
}

// Names of the structure met out of their place (a stray root inside a point, a <Track> deeper
// than its lap) are unknown content: they neither open a second track nor hand over a point
// outside a segment.
TEST(Readers, StructureOutOfPlaceOpensNothing) {
  const struct {
    Kind kind;
    std::string doc;
    const char* expected;
  } cases[] = {
      {Kind::kGpx,
       "<gpx><trk><trkseg><trkpt lat=\"1\" lon=\"2\"><fix>3<gpx><trk><trkseg><trkpt lat=\"5\" lon=\"6\"/>"
       "</trkseg></trk><wpt lat=\"7\" lon=\"8\"/></gpx></fix></trkpt></trkseg></trk></gpx>",
       "track track |\nsegment\npt -1 1.000000,2.000000 ele=- spd=-1 crs=-1 hr=-1 cad=-1\nend\n"},
      {Kind::kGpx, "<gpx><extensions><trk><trkseg><trkpt lat=\"1\" lon=\"2\"/></trkseg></trk></extensions></gpx>", ""},
      {Kind::kGpx, "<gpx><rte><trkseg><rtept lat=\"1\" lon=\"2\"/><trkpt lat=\"3\" lon=\"4\"/></trkseg></rte></gpx>",
       "track route |\nend\n"},
      {Kind::kTcx,
       "<TrainingCenterDatabase><Activities><Activity><Lap><Cadence>8<Track><Trackpoint><Time>"
       "2024-05-01T06:00:00Z</Time></Trackpoint></Track></Cadence><Track><Trackpoint><Time>"
       "2024-05-01T06:00:01Z</Time></Trackpoint><x><Trackpoint/></x></Track></Lap></Activity>"
       "</Activities></TrainingCenterDatabase>",
       "track lap Lap 1|\nsegment\npt 1714543201 - ele=- spd=-1 crs=-1 hr=-1 cad=-1\nend\n"},
  };
  for (const auto& c : cases) {
    const Outcome o = Read(c.kind, c.doc);
    EXPECT_TRUE(o.status.ok()) << c.doc << ": " << o.status.message;
    EXPECT_EQ(Joined(o.lines), c.expected) << c.doc;
  }
}

TEST(TcxReader, LapsTracksSamplesAndCourses) {
  const std::string doc =
      "<?xml version=\"1.0\"?>\n"
      "<TrainingCenterDatabase xmlns=\"http://www.garmin.com/xmlschemas/TrainingCenterDatabase/v2\"\n"
      " xmlns:ns3=\"http://www.garmin.com/xmlschemas/ActivityExtension/v2\">\n"
      "<Activities><Activity Sport=\"Biking\"><Id>2024-05-01T06:00:00Z</Id>\n"
      " <Lap StartTime=\"2024-05-01T06:00:00Z\"><TotalTimeSeconds>10</TotalTimeSeconds>"
      "<AverageHeartRateBpm><Value>99</Value></AverageHeartRateBpm><Cadence>77</Cadence>\n"
      "  <Track><Trackpoint><Time>2024-05-01T06:00:00Z</Time><Position><LatitudeDegrees>47.1"
      "</LatitudeDegrees><LongitudeDegrees>8.2</LongitudeDegrees></Position><AltitudeMeters>400"
      "</AltitudeMeters><DistanceMeters>0</DistanceMeters><HeartRateBpm><Value>130</Value>"
      "</HeartRateBpm><Cadence>85</Cadence><Extensions><ns3:TPX><ns3:Speed>4.5</ns3:Speed>"
      "</ns3:TPX></Extensions></Trackpoint>\n"
      "  <Trackpoint><Time>2024-05-01T06:00:01Z</Time><HeartRateBpm><Value>131</Value>"
      "</HeartRateBpm></Trackpoint></Track>\n"
      "  <Track><Trackpoint><Time>2024-05-01T06:00:09Z</Time><Position><LatitudeDegrees>47.2"
      "</LatitudeDegrees><LongitudeDegrees>8.3</LongitudeDegrees></Position><Extensions><TPX>"
      "<RunCadence>90</RunCadence></TPX></Extensions></Trackpoint></Track>\n"
      " </Lap>\n"
      " <Lap StartTime=\"2024-05-01T07:00:00Z\"><Track><Trackpoint><Time>2024-05-01T07:00:00Z"
      "</Time><Position><LatitudeDegrees>-1</LatitudeDegrees><LongitudeDegrees>-2"
      "</LongitudeDegrees></Position></Trackpoint></Track></Lap>\n"
      " <Notes>Evening ride</Notes></Activity></Activities>\n"
      "<Courses><Course><Name>Loop</Name><Lap><TotalTimeSeconds>5</TotalTimeSeconds>"
      "<BeginPosition><LatitudeDegrees>9</LatitudeDegrees><LongitudeDegrees>9</LongitudeDegrees>"
      "</BeginPosition></Lap>\n"
      " <Track><Trackpoint><Time>2024-06-01T00:00:00Z</Time><Position><LatitudeDegrees>5"
      "</LatitudeDegrees><LongitudeDegrees>6</LongitudeDegrees></Position></Trackpoint></Track>\n"
      " <CoursePoint><Name>Turn</Name><Time>2024-06-01T00:00:03Z</Time><Position>"
      "<LatitudeDegrees>5.5</LatitudeDegrees><LongitudeDegrees>6.5</LongitudeDegrees></Position>"
      "<AltitudeMeters>12</AltitudeMeters><PointType>Left</PointType><Notes>sharp</Notes>"
      "</CoursePoint></Course></Courses>\n"
      "</TrainingCenterDatabase>\n";
  ExpectSameInPieces(Kind::kTcx, doc,
                     "track lap Lap 1|\n"
                     "segment\n"
                     "pt 1714543200 47.100000,8.200000 ele=400.000000 spd=4.5 crs=-1 hr=130 cad=85\n"
                     "pt 1714543201 - ele=- spd=-1 crs=-1 hr=131 cad=-1\n"
                     "segment\n"
                     "pt 1714543209 47.200000,8.300000 ele=- spd=-1 crs=-1 hr=-1 cad=90\n"
                     "end\n"
                     "track lap Lap 2|\n"
                     "segment\n"
                     "pt 1714546800 -1.000000,-2.000000 ele=- spd=-1 crs=-1 hr=-1 cad=-1\n"
                     "end\n"
                     "doc |Evening ride\n"
                     "track course Loop|\n"
                     "segment\n"
                     "pt 1717200000 5.000000,6.000000 ele=- spd=-1 crs=-1 hr=-1 cad=-1\n"
                     "marker Turn|sharp|Left 1717200003 5.500000,6.500000 ele=12.000000\n"
                     "end\n");
}

// An NMEA sentence with its checksum.
std::string Nmea(const std::string& body) {
  unsigned sum = 0;
  for (char c : body) sum ^= static_cast<unsigned char>(c);
  char tail[8];
  std::snprintf(tail, sizeof tail, "*%02X\r\n", sum);
  return "$" + body + tail;
}

TEST(NmeaReader, FixesFromTheSentencesOfOneTimeAndTheDateAcrossMidnight) {
  const struct {
    const char* what;
    std::string log;
    std::string expected;
    NmeaOptions options;
  } cases[] = {
      {"GGA, RMC and VTG of one time make one point; the date carries over midnight",
       Nmea("GPGGA,235958.50,4807.0380,N,01131.0000,E,1,08,0.9,545.4,M,46.9,M,,") +
           Nmea("GPRMC,235958.50,A,4807.0380,N,01131.0000,E,022.4,084.4,311299,003.1,W") +
           Nmea("GPVTG,084.4,T,081.0,M,022.4,N,041.5,K") +
           Nmea("GNGGA,235959,4807.0390,N,01131.0010,E,2,08,0.9,545.5,M,46.9,M,,") +
           Nmea("GPVTG,,T,,M,,N,036.0,K,A") + Nmea("GPGSV,1,1,00") +
           Nmea("GPGGA,000001,4807.0400,S,01131.0020,W,1,08,0.9,546,M,46.9,M,,"),
       "track log |\n"
       "segment\n"
       "pt 946684798 48.117300,11.516667 ele=545.400000 spd=11.5236 crs=84.4 hr=-1 cad=-1\n"
       "pt 946684799 48.117317,11.516683 ele=545.500000 spd=10 crs=-1 hr=-1 cad=-1\n"
       "pt 946684801 -48.117333,-11.516700 ele=546.000000 spd=-1 crs=-1 hr=-1 cad=-1\n"
       "end\n",
       {}},
      {"fixes before the first date get it, the day before where midnight lies between",
       Nmea("GPGGA,235959,0100.0000,N,00200.0000,E,1,05,1,10,M,,M,,") +
           Nmea("GPGGA,000000,0100.0000,N,00200.0000,E,1,05,1,11,M,,M,,") +
           Nmea("GPRMC,000001,A,0100.0000,N,00200.0000,E,,,020100,,"),
       "track log |\n"
       "segment\n"
       "pt 946771199 1.000000,2.000000 ele=10.000000 spd=-1 crs=-1 hr=-1 cad=-1\n"
       "pt 946771200 1.000000,2.000000 ele=11.000000 spd=-1 crs=-1 hr=-1 cad=-1\n"
       "pt 946771201 1.000000,2.000000 ele=- spd=-1 crs=-1 hr=-1 cad=-1\n"
       "end\n",
       {}},
      {"ZDA dates a GGA log; no fix, void RMC, bad checksum and garbage are left out",
       "garbage line\r\n" + Nmea("GPZDA,120000.00,15,03,2024,00,00") +
           Nmea("GPGGA,120000,5000.0000,N,00100.0000,W,0,00,,,M,,M,,") +
           Nmea("GPRMC,120001,V,5000.0000,N,00100.0000,W,,,150324,,") +
           "$GPGGA,120002,5000.0000,N,00100.0000,W,1,05,1,10,M,,M,,*00\r\n" +
           Nmea("GPGGA,120003,5000.0000,N,00100.0000,W,1,05,1,10,M,,M,,") +
           "\x01\x02\xff binary\n" + Nmea("GPGGA,120004,9100.0000,N,00100.0000,W,1,05,1,10,M,,M,,") +
           "$GPGGA,120005,5000.0000,N,00100.0000,W,1,05,1,12,M,,M,,\n" + Nmea("PGRMZ,100,f,3"),
       "track log |\n"
       "segment\n"
       "pt 1710504003 50.000000,-1.000000 ele=10.000000 spd=-1 crs=-1 hr=-1 cad=-1\n"
       "pt 1710504005 50.000000,-1.000000 ele=12.000000 spd=-1 crs=-1 hr=-1 cad=-1\n"
       "end\n",
       {}},
      {"a log without any date takes the given day, carried over midnight",
       Nmea("GPGGA,235959,0100.0000,N,00200.0000,E,1,05,1,10,M,,M,,") +
           Nmea("GPGGA,000000,0100.0000,N,00200.0000,E,1,05,1,10,M,,M,,"),
       "track log |\n"
       "segment\n"
       "pt 86399 1.000000,2.000000 ele=10.000000 spd=-1 crs=-1 hr=-1 cad=-1\n"
       "pt 86400 1.000000,2.000000 ele=10.000000 spd=-1 crs=-1 hr=-1 cad=-1\n"
       "end\n",
       {0}},
      {"waypoints become markers", Nmea("GPWPL,4722.626,N,00832.508,E,Fountn"),
       "marker Fountn|| -1 47.377100,8.541800 ele=-\n", {}},
  };
  for (const auto& c : cases) {
    for (size_t piece : {0, 1, 5}) {
      const Outcome o = Read(Kind::kNmea, c.log, piece, c.options);
      EXPECT_TRUE(o.status.ok()) << c.what << ": " << o.status.message;
      EXPECT_EQ(Joined(o.lines), c.expected) << c.what << " (piece " << piece << ")";
    }
  }
  const Outcome skipped = Read(Kind::kNmea, cases[2].log);
  EXPECT_EQ(skipped.counts.skipped, 4u) << "garbage, bad checksum, binary line, latitude 91";
}

// Numbers take a quick path when written plainly; it must round exactly as the full reader does.
TEST(Readers, NumbersReadTheSameOnTheQuickAndTheFullPath) {
  std::mt19937_64 random(7);
  for (int i = 0; i < 200000; ++i) {
    char text[48];
    const int decimals = static_cast<int>(random() % 16);
    const uint64_t digits = random() % 1000000000000000ull;
    std::snprintf(text, sizeof text, "%s%llu", random() % 2 ? "-" : "", static_cast<unsigned long long>(digits));
    std::string s = text;
    const size_t at = s.size() - std::min<size_t>(decimals, s.size() - (s[0] == '-'));
    if (decimals > 0) s.insert(at, ".");
    double quick = 0, full = 0;
    ASSERT_TRUE(detail::ParseNumber(s, quick)) << s;
    ASSERT_EQ(std::from_chars(s.data(), s.data() + s.size(), full).ec, std::errc()) << s;
    ASSERT_EQ(quick, full) << s;
  }
  double v = 0;
  for (const char* good : {"1.", ".5", "-.5", " +12.25 ", "1e3", "1234567890123456.5", "-0"}) {
    EXPECT_TRUE(detail::ParseNumber(good, v)) << good;
  }
  EXPECT_TRUE(detail::ParseNumber("1234567890123456.5", v) && v == 1234567890123456.5);
  EXPECT_TRUE(detail::ParseNumber("1e3", v) && v == 1000.0);
  for (const char* bad : {"", ".", "-", "1.2.3", "1,5", "--1", "nan", "inf", "0x10", "12a", "1e999"}) {
    EXPECT_FALSE(detail::ParseNumber(bad, v)) << bad;
  }
}

TEST(Readers, BadDocumentsEndWithTheirCodeAndNothingAfter) {
  const std::string bomb =
      "<?xml version=\"1.0\"?><!DOCTYPE gpx [<!ENTITY a \"aaaaaaaaaa\"><!ENTITY b \"&a;&a;&a;&a;"
      "&a;&a;&a;&a;&a;&a;\"><!ENTITY c \"&b;&b;&b;&b;&b;&b;&b;&b;&b;&b;\">]><gpx><wpt lat=\"1\" "
      "lon=\"2\"><name>&c;&c;&c;</name></wpt></gpx>";
  const std::string external =
      "<?xml version=\"1.0\"?><!DOCTYPE gpx SYSTEM \"file:///etc/passwd\"><gpx>&xxe;</gpx>";
  std::string deep = "<gpx>";
  for (int i = 0; i < 300; ++i) deep += "<a>";
  const std::string pt = "<gpx><trk><trkseg><trkpt lat=\"1\" lon=\"2\">";
  const struct {
    Kind kind;
    std::string doc;
    int32_t code;
    const char* message;  // a part of the message
  } cases[] = {
      {Kind::kGpx, "", DC_ERR_IMPORT_EMPTY, "empty"},
      {Kind::kGpx, "  \n", DC_ERR_IMPORT_MALFORMED, "no root element"},
      {Kind::kGpx, "<gpx><trk></gpx>", DC_ERR_IMPORT_MALFORMED, "tag mismatch: trk line 1 and gpx"},
      {Kind::kGpx, "<gpx><wpt lat=\"1\" lon=\"2\"><name>a &unknown; b</name></wpt></gpx>",
       DC_ERR_IMPORT_MALFORMED, "Entity 'unknown' not defined"},
      {Kind::kGpx, pt, DC_ERR_IMPORT_MALFORMED, "ends before 4 elements are closed"},
      {Kind::kGpx, bomb, DC_ERR_IMPORT_DTD, "document type"},
      {Kind::kGpx, external, DC_ERR_IMPORT_DTD, "document type"},
      {Kind::kGpx, "<?xml version=\"1.0\" encoding=\"EBCDIC\"?><gpx/>", DC_ERR_IMPORT_MALFORMED, "encoding"},
      {Kind::kGpx, "<kml><Document/></kml>", DC_ERR_IMPORT_FORMAT, "root element is <kml>"},
      {Kind::kGpx, "<gpx>\n<trk><trkseg><trkpt lon=\"2\"/></trkseg></trk></gpx>", DC_ERR_IMPORT_MALFORMED,
       "line 2: <trkpt> without lat"},
      {Kind::kGpx, "<gpx><wpt lat=\"91\" lon=\"2\"/></gpx>", DC_ERR_IMPORT_VALUE, "lat \"91\" is out of range"},
      {Kind::kGpx, "<gpx><wpt lat=\"1\" lon=\"180.5\"/></gpx>", DC_ERR_IMPORT_VALUE, "out of range"},
      {Kind::kGpx, "<gpx><wpt lat=\"1\" lon=\"nan\"/></gpx>", DC_ERR_IMPORT_VALUE, "not a number"},
      {Kind::kGpx, "<gpx><wpt lat=\"1e999\" lon=\"2\"/></gpx>", DC_ERR_IMPORT_VALUE, "not a number"},
      {Kind::kGpx, pt + "<ele>1e6</ele></trkpt></trkseg></trk></gpx>", DC_ERR_IMPORT_VALUE, "elevation"},
      {Kind::kGpx, pt + "<time>2040-01-01T00:00:00Z</time></trkpt></trkseg></trk></gpx>",
       DC_ERR_IMPORT_VALUE, "outside 1970 to 2038"},
      {Kind::kGpx, pt + "<time>1969-12-31T23:59:59Z</time></trkpt></trkseg></trk></gpx>",
       DC_ERR_IMPORT_VALUE, "outside 1970 to 2038"},
      {Kind::kGpx, pt + "<time>2024-02-30T00:00:00Z</time></trkpt></trkseg></trk></gpx>",
       DC_ERR_IMPORT_VALUE, "not a date and time"},
      {Kind::kGpx, pt + "<extensions><hr>255</hr></extensions></trkpt></trkseg></trk></gpx>",
       DC_ERR_IMPORT_VALUE, "heart rate"},
      {Kind::kGpx, pt + "<speed>-1</speed></trkpt></trkseg></trk></gpx>", DC_ERR_IMPORT_VALUE, "speed"},
      {Kind::kGpx, deep, DC_ERR_IMPORT_MALFORMED, "nested more than 256"},
      {Kind::kTcx, "<gpx/>", DC_ERR_IMPORT_FORMAT, "not a TCX document"},
      {Kind::kTcx,
       "<TrainingCenterDatabase><Activities><Activity><Lap><Track><Trackpoint><Position>"
       "<LatitudeDegrees>north</LatitudeDegrees></Position></Trackpoint></Track></Lap></Activity>"
       "</Activities></TrainingCenterDatabase>",
       DC_ERR_IMPORT_VALUE, "LatitudeDegrees \"north\" is not a number"},
      {Kind::kNmea, "", DC_ERR_IMPORT_EMPTY, "empty"},
      {Kind::kNmea, "$GPGGA,120000,5000.0000,N,00100.0000,W,1,05,1,10,M,,M,,*00\n", DC_ERR_IMPORT_CHECKSUM,
       "1 sentences with a bad checksum"},
      {Kind::kNmea, "hello\nworld\n\x01\x02", DC_ERR_IMPORT_MALFORMED, "no NMEA sentence (first at line 1)"},
      {Kind::kNmea, Nmea("GPGGA,120000,5000.0000,N,00100.0000,W,1,05,1,10,M,,M,,"), DC_ERR_IMPORT_NO_DATE,
       "1 fixes but no date"},
      {Kind::kNmea, Nmea("GPGGA,120000,,,,,0,00,,,M,,M,,"), DC_ERR_IMPORT_NO_POINTS, "no position fix"},
      {Kind::kNmea, Nmea("GPRMC,120000,A,5060.0000,N,00100.0000,W,,,010124,,"), DC_ERR_IMPORT_VALUE,
       "out-of-range values"},
      {Kind::kNmea, Nmea("GPRMC,250000,A,5000.0000,N,00100.0000,W,,,010124,,"), DC_ERR_IMPORT_VALUE,
       "out-of-range values"},
      {Kind::kNmea, "$" + std::string(300, 'A') + "\n", DC_ERR_IMPORT_TOO_LONG, "longer than 256"},
  };
  for (const auto& c : cases) {
    // Pushed whole, pushed in pieces of 3 bytes, pulled in pieces of 3 bytes.
    for (const auto& [piece, pull] : {std::pair{size_t{0}, false}, {size_t{3}, false}, {size_t{3}, true}}) {
      RecordingSink sink;
      auto reader = Make(c.kind, sink);
      const size_t step = piece ? piece : std::max<size_t>(c.doc.size(), 1);
      bool finished = false;
      if (pull) {
        size_t at = 0;
        finished = reader->ReadFrom([&](char* out, size_t room) -> long {
          const size_t n = std::min({room, step, c.doc.size() - at});
          c.doc.copy(out, n, at);
          at += n;
          return static_cast<long>(n);
        });
      } else {
        bool ok = true;
        for (size_t i = 0; ok && i < c.doc.size(); i += step) {
          ok = reader->Feed(c.doc.data() + i, std::min(step, c.doc.size() - i));
        }
        finished = reader->Finish();
      }
      EXPECT_FALSE(finished) << c.doc.substr(0, 80);
      EXPECT_EQ(reader->status().code, c.code) << c.doc.substr(0, 80) << ": " << reader->status().message;
      EXPECT_NE(reader->status().message.find(c.message), std::string::npos)
          << reader->status().message << " lacks " << c.message;
      const size_t seen = sink.lines.size();
      EXPECT_FALSE(reader->Feed("<gpx/>", 6));
      EXPECT_FALSE(reader->Finish());
      EXPECT_EQ(sink.lines.size(), seen) << "a failed reader stays silent";
    }
  }
}

// The resident set now ("VmRSS") or at its peak ("VmHWM"), in KiB.
long StatusKiB(const std::string& key) {
  std::ifstream in("/proc/self/status");
  for (std::string line; std::getline(in, line);) {
    if (line.rfind(key + ":", 0) == 0) return std::atol(line.c_str() + key.size() + 1);
  }
  return 0;
}

// Starts a new peak from the present resident set, so that each case is measured alone (memory
// a sanitizer keeps back from earlier cases is not counted again).
void ResetPeak() { std::ofstream("/proc/self/clear_refs") << "5"; }

constexpr uint64_t kGiB = 1ull << 30;
// Text that streams through the parser costs time by the byte; a quarter of a gigabyte shows as well
// that nothing of it is kept.
constexpr uint64_t kStreamed = 256ull << 20;

// Feeds `head`, then `size` bytes of `fill` in 1 MiB pieces, then `tail`; or lets the reader pull
// the same bytes (`pull`).
void FeedHuge(TrackReader& reader, const std::string& head, char fill, uint64_t size, const std::string& tail,
              bool pull) {
  if (pull) {
    uint64_t at = 0;
    const uint64_t total = head.size() + size + tail.size();
    reader.ReadFrom([&](char* out, size_t room) -> long {
      size_t n = 0;
      for (; n < room && at < total; ++n, ++at) {
        out[n] = at < head.size() ? head[at] : at < head.size() + size ? fill : tail[at - head.size() - size];
      }
      return static_cast<long>(n);
    });
    return;
  }
  const std::string piece(1 << 20, fill);
  if (!reader.Feed(head.data(), head.size())) return;
  for (uint64_t done = 0; done < size; done += piece.size()) {
    if (!reader.Feed(piece.data(), piece.size())) return;
  }
  if (reader.Feed(tail.data(), tail.size())) reader.Finish();
}

TEST(Readers, GigabyteLinesAndTokensKeepMemoryBounded) {
  const struct {
    Kind kind;
    std::string head;
    char fill;
    uint64_t size;
    std::string tail;
    int32_t code;  // 0: reads well
  } cases[] = {
      // A huge name streams through and is cut; the document stays good.
      {Kind::kGpx, "<gpx><wpt lat=\"1\" lon=\"2\"><name>", 'n', kStreamed, "</name></wpt></gpx>", 0},
      // The parser would have to hold a whole attribute or tag; it is refused early.
      {Kind::kGpx, "<gpx><wpt lat=\"", '1', kGiB, "\" lon=\"2\"/></gpx>", DC_ERR_IMPORT_TOO_LONG},
      {Kind::kGpx, "<gpx><", 'x', kGiB, "/></gpx>", DC_ERR_IMPORT_TOO_LONG},
      {Kind::kTcx, "<TrainingCenterDatabase><!--", 'c', kGiB, "--></TrainingCenterDatabase>", DC_ERR_IMPORT_TOO_LONG},
      // A gigabyte without a line end in an NMEA log.
      {Kind::kNmea, "$GPGGA,", '7', kGiB, "\n", DC_ERR_IMPORT_TOO_LONG},
  };
  for (const auto& c : cases) {
    for (bool pull : {false, true}) {
      ResetPeak();
      const long before = StatusKiB("VmRSS");
      RecordingSink sink;
      auto reader = Make(c.kind, sink);
      FeedHuge(*reader, c.head, c.fill, c.size, c.tail, pull);
      const std::string what = c.head + (pull ? " (pulled)" : "");
      EXPECT_EQ(reader->status().code, c.code) << what << ": " << reader->status().message;
      if (c.code == 0) {
        ASSERT_EQ(sink.markers.size(), 1u);
        EXPECT_EQ(sink.markers[0].name, std::string(kMaxText, 'n'));
      }
      EXPECT_LT(StatusKiB("VmHWM") - before, 64 * 1024) << what << ": KiB of peak memory added";
    }
  }
}

TEST(Readers, ASinkThatSaysStopEndsTheReadingBetweenPoints) {
  std::string gpx = "<gpx><trk><trkseg>";
  std::string nmea;
  for (int i = 0; i < 10; ++i) {
    gpx += "<trkpt lat=\"1\" lon=\"" + std::to_string(i) + "\"/>";
    nmea += Nmea("GPRMC,1200" + std::to_string(10 + i) + ",A,0100.0000,N,00" + std::to_string(i) +
                 "00.0000,E,,,010124,,");
  }
  gpx += "</trkseg></trk></gpx>";
  for (const auto& [kind, doc] : {std::pair{Kind::kGpx, gpx}, std::pair{Kind::kNmea, nmea}}) {
    RecordingSink sink(4);
    auto reader = Make(kind, sink);
    EXPECT_FALSE(reader->Feed(doc.data(), doc.size()) && reader->Finish());
    EXPECT_EQ(reader->status().code, DC_ERR_IMPORT_CANCELLED);
    EXPECT_EQ(sink.points.size(), 4u);
    EXPECT_NE(sink.lines.back(), "end") << "the track is not closed as if complete";
  }
}

}  // namespace
