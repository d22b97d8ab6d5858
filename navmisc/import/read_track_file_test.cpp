// Reading files: formats recognised, files written by gpsbabel read back to the points they
// were made from, files that are not fit to read, progress and stopping.
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <gtest/gtest.h>

#include <cmath>
#include <ctime>
#include <string>
#include <vector>

#include "navmisc/import/detail/recording_sink.h"
#include "navmisc/import/import_errors.h"
#include "navmisc/import/read_track_file.h"
#include "testutil.h"

namespace {

using namespace navmisc::import;
using navmisc::import::testing::RecordingSink;
using navmisc::testutil::HaveProgram;
using navmisc::testutil::RunCommand;
using navmisc::testutil::ShellQuote;
using navmisc::testutil::TempDir;
using navmisc::testutil::WriteFileBytes;

TEST(TrackFileFormat, RecognisedFromContentThenExtension) {
  const struct {
    std::string head;
    const char* name;
    Format format;
    const char* converter;
  } cases[] = {
      {"\xEF\xBB\xBF<?xml version=\"1.0\"?>\n<!-- x --><gpx version=\"1.1\">", "a.xml", Format::kGpx, ""},
      {"<?xml version=\"1.0\"?><!DOCTYPE g><g:gpx xmlns:g=\"x\">", "a", Format::kGpx, ""},
      {"<TrainingCenterDatabase xmlns=\"x\">", "a.gpx", Format::kTcx, ""},
      {"<kml xmlns=\"http://www.opengis.net/kml/2.2\">", "a.xml", Format::kConverter, "kml"},
      {"header of the logger\r\n$GPGGA,1,2\r\n", "LOG0001.TXT", Format::kNmea, ""},
      {"$GPRMC,120000,A,", "x.dat", Format::kNmea, ""},
      {"whatever", "ride.GPX", Format::kGpx, ""},
      {"whatever", "ride.tcx", Format::kTcx, ""},
      {"whatever", "log.nma", Format::kNmea, ""},
      {"\x0e\x10\x2a", "ride.fit", Format::kConverter, "garmin_fit"},
      {"lat,lon", "points.CSV", Format::kConverter, "unicsv"},
      {"<html><body>", "page.html", Format::kAuto, ""},
      {"$ not nmea", "notes.txt", Format::kAuto, ""},
  };
  for (const auto& c : cases) {
    const FileFormat f = DetectFormat(c.head, c.name);
    EXPECT_EQ(f.format, c.format) << c.name;
    EXPECT_EQ(f.converterFormat, c.converter) << c.name;
  }
  FileFormat f;
  for (const char* name : {"GPX", "tcx", "Nmea", "auto", "", "kml", "unicsv,fields=lat+lon", "garmin_fit"}) {
    EXPECT_TRUE(ParseFormatName(name, f)) << name;
  }
  ASSERT_TRUE(ParseFormatName("kml", f));
  EXPECT_EQ(FormatName(f), "kml");
  ASSERT_TRUE(ParseFormatName("NMEA", f));
  EXPECT_EQ(FormatName(f), "nmea");
  for (const char* name : {"-f", "kml;rm", "a b", "../x", "kml\n"}) EXPECT_FALSE(ParseFormatName(name, f)) << name;
}

// A known track, written as GPX 1.1 with the extension gpsbabel reads heart rate and cadence
// from.
struct KnownPoint {
  double lat, lon, ele;
  int64_t time;
  int hr, cad;
};

std::vector<KnownPoint> KnownTrack() {
  std::vector<KnownPoint> pts;
  for (int i = 0; i < 30; ++i) {
    pts.push_back({47.37 + i * 0.0001, 8.54 + i * 0.00013, 400 + i * 0.5, 1714543200 + 5 * i, 100 + i, 70 + i});
  }
  return pts;
}

std::string IsoTime(int64_t t) {
  const time_t tt = static_cast<time_t>(t);
  struct tm tm;
  gmtime_r(&tt, &tm);
  char buf[32];
  std::strftime(buf, sizeof buf, "%Y-%m-%dT%H:%M:%SZ", &tm);
  return buf;
}

std::string KnownGpx(const std::vector<KnownPoint>& pts) {
  std::string doc =
      "<?xml version=\"1.0\"?>\n<gpx version=\"1.1\" creator=\"t\" xmlns=\"http://www.topografix.com/GPX/1/1\" "
      "xmlns:gpxtpx=\"http://www.garmin.com/xmlschemas/TrackPointExtension/v1\">\n<trk><name>Ride</name><trkseg>\n";
  char buf[512];
  for (const auto& p : pts) {
    std::snprintf(buf, sizeof buf,
                  "<trkpt lat=\"%.6f\" lon=\"%.6f\"><ele>%.1f</ele><time>%s</time><sat>7</sat><fix>3d</fix>"
                  "<extensions><gpxtpx:TrackPointExtension><gpxtpx:hr>%d</gpxtpx:hr><gpxtpx:cad>%d</gpxtpx:cad>"
                  "</gpxtpx:TrackPointExtension></extensions></trkpt>\n",
                  p.lat, p.lon, p.ele, IsoTime(p.time).c_str(), p.hr, p.cad);
    doc += buf;
  }
  return doc + "</trkseg></trk>\n</gpx>\n";
}

TEST(ReadTrackFile, FilesWrittenByGpsbabelReadBackToTheSamePoints) {
  if (!HaveProgram("gpsbabel")) GTEST_SKIP() << "gpsbabel is not installed";
  TempDir dir;
  const auto known = KnownTrack();
  WriteFileBytes(dir / L"known.gpx", KnownGpx(known));
  const struct {
    const char* format;   // gpsbabel's output format
    const wchar_t* file;
    double tolerance;     // degrees: the digits the format keeps
    bool samples;         // heart rate and cadence survive
  } cases[] = {
      {"gpx,gpxver=1.1", L"out.gpx", 1e-7, true},
      {"gtrnctr", L"out.tcx", 1e-7, true},
      {"nmea", L"out.nmea", 2e-5, false},
      {"kml,track=1,points=0", L"out.kml", 1e-6, false},
  };
  for (const auto& c : cases) {
    const CString out = dir / c.file;
    const auto r = RunCommand("gpsbabel -i gpx -f " + ShellQuote((dir / L"known.gpx").ToUtf8()) + " -o " +
                              c.format + " -F " + ShellQuote(out.ToUtf8()));
    ASSERT_EQ(r.status, 0) << c.format;
    RecordingSink sink;
    const ReadFileResult result = ReadTrackFile(out, sink, {});
    ASSERT_TRUE(result.status.ok()) << c.format << ": " << result.status.message;
    ASSERT_GE(sink.points.size(), known.size()) << c.format;
    for (size_t i = 0; i < known.size(); ++i) {
      const ImportPoint& p = sink.points[i];
      EXPECT_NEAR(p.latitude, known[i].lat, c.tolerance) << c.format << " point " << i;
      EXPECT_NEAR(p.longitude, known[i].lon, c.tolerance) << c.format << " point " << i;
      EXPECT_NEAR(p.altitude, known[i].ele, 0.01) << c.format << " point " << i;
      EXPECT_EQ(p.time, known[i].time) << c.format << " point " << i;
      if (c.samples) {
        EXPECT_EQ(p.heartRate, known[i].hr) << c.format << " point " << i;
        EXPECT_EQ(p.cadence, known[i].cad) << c.format << " point " << i;
      }
    }
  }
}

TEST(ReadTrackFile, FilesUnfitToReadGetTheirCodeWithoutBlocking) {
  TempDir dir;
  WriteFileBytes(dir / L"empty.gpx", "");
  WriteFileBytes(dir / L"noise.bin", "\x7f" "ELF not a track");
  ASSERT_EQ(::mkfifo((dir / L"pipe.gpx").ToUtf8().c_str(), 0600), 0);
  ASSERT_EQ(::mkdir((dir / L"folder.gpx").ToUtf8().c_str(), 0700), 0);
  // Gigabyte files without a line end, sparse so that they cost no disk.
  for (const auto& [name, head] : {std::pair{L"huge.gpx", std::string("<gpx><wpt lat=\"1\" lon=\"2\"><name>")},
                                   std::pair{L"huge.nmea", std::string("$GPGGA,")}}) {
    WriteFileBytes(dir / name, head);
    ASSERT_EQ(::truncate((dir / name).ToUtf8().c_str(), 1ll << 30), 0);
  }
  const struct {
    const wchar_t* name;
    const char* format;
    int32_t code;
  } cases[] = {
      {L"missing.gpx", "", DC_ERR_IMPORT_OPEN},
      {L"folder.gpx", "", DC_ERR_IMPORT_NOT_A_FILE},
      {L"pipe.gpx", "", DC_ERR_IMPORT_NOT_A_FILE},
      {L"empty.gpx", "", DC_ERR_IMPORT_EMPTY},
      {L"noise.bin", "", DC_ERR_IMPORT_FORMAT},
      {L"noise.bin", "gpx", DC_ERR_IMPORT_MALFORMED},
      {L"noise.bin", "nmea", DC_ERR_IMPORT_MALFORMED},
      {L"huge.gpx", "", DC_ERR_IMPORT_MALFORMED},   // a NUL byte is no XML
      {L"huge.nmea", "", DC_ERR_IMPORT_TOO_LONG},
  };
  for (const auto& c : cases) {
    ReadFileOptions options;
    ASSERT_TRUE(ParseFormatName(c.format, options.format));
    RecordingSink sink;
    const ReadFileResult r = ReadTrackFile(dir / c.name, sink, options);
    EXPECT_EQ(r.status.code, c.code) << CString(c.name).ToUtf8() << ": " << r.status.message;
    EXPECT_TRUE(sink.points.empty());
  }
}

TEST(ReadTrackFile, TheConverterIsNeededAndItsFailureTold) {
  TempDir dir;
  WriteFileBytes(dir / L"a.kml", "<kml xmlns=\"http://www.opengis.net/kml/2.2\"><Document/></kml>");
  WriteFileBytes(dir / L"bad.fit", "this is no FIT file");
  RecordingSink sink;
  ReadFileOptions options;
  options.converter = "/nonexistent/gpsbabel";
  EXPECT_EQ(ReadTrackFile(dir / L"a.kml", sink, options).status.code, DC_ERR_IMPORT_NO_CONVERTER);
  if (!HaveProgram("gpsbabel")) GTEST_SKIP() << "gpsbabel is not installed";
  const ReadFileResult bad = ReadTrackFile(dir / L"bad.fit", sink, {});
  EXPECT_EQ(bad.status.code, DC_ERR_IMPORT_CONVERTER) << bad.status.message;
  EXPECT_NE(bad.status.message.find("gpsbabel -i garmin_fit failed"), std::string::npos) << bad.status.message;
  EXPECT_EQ(ReadTrackFile(dir / L"a.kml", sink, {}).status.code, DC_ERR_IMPORT_NO_POINTS);
}

TEST(ReadTrackFile, ProgressEveryThousandPointsAndAStopHalfWay) {
  TempDir dir;
  std::string doc = "<gpx><trk><trkseg>";
  for (int i = 0; i < 2500; ++i) doc += "<trkpt lat=\"1\" lon=\"" + std::to_string(i % 180) + "\"/>";
  WriteFileBytes(dir / L"a.gpx", doc + "</trkseg></trk></gpx>");

  std::vector<uint64_t> seen;
  ReadFileOptions options;
  options.progress = [&](const ReadProgress& p) {
    seen.push_back(p.points);
    EXPECT_EQ(p.bytesTotal, doc.size() + 21);
    return true;
  };
  RecordingSink all;
  ASSERT_TRUE(ReadTrackFile(dir / L"a.gpx", all, options).status.ok());
  EXPECT_EQ(seen, (std::vector<uint64_t>{1000, 2000, 2500}));

  options.progress = [](const ReadProgress& p) { return p.points < 2000; };
  RecordingSink half;
  EXPECT_EQ(ReadTrackFile(dir / L"a.gpx", half, options).status.code, DC_ERR_IMPORT_CANCELLED);
  EXPECT_EQ(half.points.size(), 2000u);

  bool keepGoing = false;
  options = {};
  options.keepGoing = &keepGoing;
  RecordingSink none;
  EXPECT_EQ(ReadTrackFile(dir / L"a.gpx", none, options).status.code, DC_ERR_IMPORT_CANCELLED);
  EXPECT_TRUE(none.points.empty());
}

}  // namespace
