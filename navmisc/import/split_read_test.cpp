// Long files read in two parts at once: whatever the document, the reading must be the one a
// reading in one piece gives, cut or not.
#include <gtest/gtest.h>

#include <cstdio>
#include <string>
#include <vector>

#include "navmisc/import/detail/recording_sink.h"
#include "navmisc/import/import_errors.h"
#include "navmisc/import/read_track_file.h"
#include "testutil.h"

namespace {

using namespace navmisc::import;
using navmisc::import::testing::RecordingSink;
using navmisc::testutil::TempDir;
using navmisc::testutil::WriteFileBytes;

struct Reading {
  ReadFileResult result;
  std::vector<std::string> lines;
};

Reading Read(const TempDir& dir, const std::string& bytes, const char* name, bool split, uint64_t stopAt = 0) {
  const CString path = dir / CString::FromUtf8(name);
  WriteFileBytes(path, bytes);
  RecordingSink sink(stopAt);
  ReadFileOptions options;
  options.splitFrom = split ? 1 : UINT64_MAX;
  Reading r;
  r.result = ReadTrackFile(path, sink, options);
  r.lines = std::move(sink.lines);
  return r;
}

std::string Trkpt(int i) {
  char buf[300];
  std::snprintf(buf, sizeof buf,
                "<trkpt lat=\"%.6f\" lon=\"%.6f\"><ele>%d.5</ele><time>2024-05-01T%02d:%02d:%02dZ</time>"
                "<extensions><gpxtpx:TrackPointExtension><gpxtpx:hr>%d</gpxtpx:hr></gpxtpx:TrackPointExtension>"
                "</extensions></trkpt>\n",
                47.0 + i * 1e-5, 8.0 + i * 2e-5, 400 + i % 50, i / 3600 % 24, i / 60 % 60, i % 60, 100 + i % 60);
  return buf;
}

// A GPX document with waypoints before and after the tracks, two segments and a route. `middle`
// goes between the points of the first segment, halfway; `declaration` replaces the plain one.
std::string Gpx(int points, const std::string& middle = {}, const std::string& declaration = {}) {
  std::string doc = declaration.empty() ? "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n" : declaration;
  doc += "<gpx version=\"1.1\" creator=\"t\" xmlns=\"http://www.topografix.com/GPX/1/1\" "
         "xmlns:gpxtpx=\"http://www.garmin.com/xmlschemas/TrackPointExtension/v1\">\n"
         "<metadata><name>Two parts</name></metadata>\n"
         "<wpt lat=\"47.1\" lon=\"8.1\"><name>Start</name></wpt>\n"
         "<trk><name>Ride</name><trkseg>\n";
  for (int i = 0; i < points; ++i) {
    if (i == points / 2) doc += middle;
    doc += Trkpt(i);
  }
  doc += "</trkseg><trkseg>\n" + Trkpt(points) + Trkpt(points + 1) +
         "</trkseg></trk>\n<wpt lat=\"47.2\" lon=\"8.2\"><name>End &amp; more</name></wpt>\n"
         "<rte><name>Back</name><rtept lat=\"47.3\" lon=\"8.3\"/></rte>\n</gpx>\n";
  return doc;
}

std::string Tcx(int points, int laps) {
  std::string doc = "<?xml version=\"1.0\"?>\n<TrainingCenterDatabase "
                    "xmlns=\"http://www.garmin.com/xmlschemas/TrainingCenterDatabase/v2\">"
                    "<Activities><Activity Sport=\"Biking\"><Id>2024-05-01T10:00:00Z</Id>\n";
  for (int lap = 0; lap < laps; ++lap) {
    doc += "<Lap StartTime=\"2024-05-01T10:00:00Z\"><Track>\n";
    for (int i = 0; i < points / laps; ++i) {
      char buf[300];
      std::snprintf(buf, sizeof buf,
                    "<Trackpoint><Time>2024-05-01T10:%02d:%02dZ</Time><Position><LatitudeDegrees>%.6f"
                    "</LatitudeDegrees><LongitudeDegrees>8.5</LongitudeDegrees></Position>"
                    "<HeartRateBpm><Value>%d</Value></HeartRateBpm></Trackpoint>\n",
                    i / 60 % 60, i % 60, 47.0 + i * 1e-5, 90 + i % 70);
      doc += buf;
    }
    doc += "</Track></Lap>\n";
  }
  return doc + "</Activity></Activities></TrainingCenterDatabase>\n";
}

void ExpectSameReading(const Reading& split, const Reading& whole, const std::string& what) {
  EXPECT_EQ(split.result.status.code, whole.result.status.code) << what;
  EXPECT_EQ(split.result.status.message, whole.result.status.message) << what;
  EXPECT_EQ(split.result.counts.points, whole.result.counts.points) << what;
  EXPECT_EQ(split.result.counts.tracks, whole.result.counts.tracks) << what;
  EXPECT_EQ(split.result.counts.markers, whole.result.counts.markers) << what;
  EXPECT_EQ(split.lines, whole.lines) << what;
  EXPECT_EQ(whole.result.parts, 1) << what;
}

TEST(SplitReading, ReadsWhatOnePieceReads) {
  TempDir dir;
  std::string comment = "<!-- " + std::string(70000, ' ') + "<trkpt lat=\"1\" lon=\"2\"> -->\n";
  // A second track whose points lie straight under <trk>: between them the reader stands
  // elsewhere than at the first track's first point.
  std::string bare = Gpx(2000);
  const size_t at = bare.find("<trkpt", bare.size() / 3);
  bare.insert(at, "</trkseg></trk>\n<trk><name>Bare</name>\n");
  const size_t end = bare.find("</trkseg><trkseg>");
  bare.replace(end, 17, "</trk><trk><trkseg>\n");
  const struct {
    const char* name;
    std::string doc;
    int parts;
  } cases[] = {
      {"plain.gpx", Gpx(3000), 2},
      {"one-lap.tcx", Tcx(3000, 1), 2},
      // The second lap's name follows from the first: the cut in the second is not taken.
      {"two-laps.tcx", Tcx(3000, 4), 1},
      // The only point near the cut is in a comment.
      {"comment.gpx", Gpx(2000, comment), 1},
      {"latin1.gpx", Gpx(2000, "<!-- caf\xE9 -->", "<?xml version=\"1.0\" encoding=\"ISO-8859-1\"?>\n"), 1},
      {"bare.gpx", bare, 1},
  };
  for (const auto& c : cases) {
    const Reading whole = Read(dir, c.doc, c.name, false);
    const Reading split = Read(dir, c.doc, c.name, true);
    ASSERT_TRUE(whole.result.status.ok()) << c.name << ": " << whole.result.status.message;
    EXPECT_GT(whole.result.counts.points, 1000u) << c.name;
    EXPECT_EQ(split.result.parts, c.parts) << c.name;
    ExpectSameReading(split, whole, c.name);
  }
}

TEST(SplitReading, FailuresAfterTheCutAreThoseOfOnePiece) {
  TempDir dir;
  const std::string good = Gpx(3000);
  const size_t late = good.find("<trkpt", good.size() * 3 / 4);
  std::string badValue = good;
  badValue.replace(badValue.find("lat=\"", late) + 5, 2, "95");
  std::string badTag = good;
  badTag.insert(late, "<trkpt lat=\"1\" lon=\"1\"></trkseg>");
  std::string junk = good + "<trkpt/>";
  const struct {
    const char* name;
    std::string doc;
    int32_t code;
  } cases[] = {
      {"value.gpx", badValue, DC_ERR_IMPORT_VALUE},
      {"tag.gpx", badTag, DC_ERR_IMPORT_MALFORMED},
      {"cut-short.gpx", good.substr(0, good.size() * 4 / 5), DC_ERR_IMPORT_MALFORMED},
      {"junk.gpx", junk, DC_ERR_IMPORT_MALFORMED},
  };
  for (const auto& c : cases) {
    const Reading whole = Read(dir, c.doc, c.name, false);
    const Reading split = Read(dir, c.doc, c.name, true);
    EXPECT_EQ(whole.result.status.code, c.code) << c.name << ": " << whole.result.status.message;
    EXPECT_EQ(split.result.parts, 2) << c.name;
    ExpectSameReading(split, whole, c.name);
  }
  // The sink stops the reading in the second part: at the same point as in one piece.
  const Reading whole = Read(dir, good, "stop.gpx", false, 2600);
  const Reading split = Read(dir, good, "stop.gpx", true, 2600);
  EXPECT_EQ(whole.result.status.code, DC_ERR_IMPORT_CANCELLED);
  EXPECT_EQ(split.result.parts, 2);
  ExpectSameReading(split, whole, "stopped");
}

}  // namespace
