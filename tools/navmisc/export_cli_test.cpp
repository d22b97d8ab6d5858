#include <string>

#include <gtest/gtest.h>

#include "navmisc/platform/files.h"
#include "navmisc/records/trip.h"
#include "testutil.h"

namespace {

using navmisc::testutil::DataRootScope;
using navmisc::testutil::ReadFileBytes;
using navmisc::testutil::RunCommand;
using navmisc::testutil::ShellQuote;
using navmisc::testutil::TempDir;
using navmisc::testutil::WriteFileBytes;

// A data root holding one saved trip: a short track and two photos, the second of which has
// lost its file.
struct SavedTrip {
  TempDir root;
  std::string id;
  std::string gonePhoto;
  SavedTrip() {
    DataRootScope scope(root.path());
    BLOG_ITEM_INFO trip(GPS_APP_TRIP, nullptr, 1);
    auto* track = new TRACK_ITEM_INFO(&trip);
    track->description = L"Walk";
    for (int i = 0; i < 5; ++i) {
      auto* p = new WAYPOINT_ITEM_INFO;
      p->time = 1714543200 + 10 * i;
      p->latitude = 47.37 + 0.001 * i;
      p->longitude = 8.54;
      p->altitude = 100;
      track->points.AddTail(p);
    }
    trip.tracks.AddTail(track);
    for (const wchar_t* title : {L"Here", L"Gone"}) {
      auto* photo = new PHOTO_ITEM_INFO(&trip, nullptr, nullptr, nullptr);
      photo->itemName = CString(title) + L".jpg";
      photo->title = title;
      trip.photos.AddTail(photo);
      gonePhoto = photo->GetFilePathName().ToUtf8();
    }
    WriteFileBytes(PathJoin(trip.GetResourcePath(), L"Here.jpg"), "jpeg");
    trip.WriteAllWaypoint(1, nullptr, nullptr);
    trip.WriteInfo(1, nullptr, nullptr);
    id = trip.tripId.ToUtf8();
  }
  // `navmisc --data-root ROOT ARGS`, standard error joined to standard output.
  navmisc::testutil::CommandResult Run(const std::string& args) const {
    return RunCommand(ShellQuote(NAVMISC_TOOL_PATH) + " --data-root " + ShellQuote(root.path().ToUtf8()) + " " +
                      args + " 2>&1 </dev/null");
  }
  std::string Out(const wchar_t* name) const { return ShellQuote((root / name).ToUtf8()); }
};

TEST(ExportCommand, WritesEachFormatOrSaysWhyNot) {
  SavedTrip s;
  const CString longName = CString::FromUtf8(std::string(300, 'n'));
  const struct {
    std::string format;  // and the options that go with it
    CString out;
    int status;
    std::string output;  // expected part of what the command prints
  } cases[] = {
      {"gpx", L"t.gpx", 0, "t.gpx\n"},
      {"kml", L"t.kml", 0, "t.kml\n"},
      {"tcx --sport 0", L"t.tcx", 0, "t.tcx\n"},
      {"csv --metric", L"t.csv", 0, "t.csv\n"},
      {"kmz", L"t.kmz", 1,
       "cannot add photo \"Gone\" (" + s.gonePhoto + ") to " + (s.root / L"t.kmz").ToUtf8() +
           ": No such file or directory"},
      {"gpx", L"missing/t.gpx", 1, "does not exist"},
      {"gpx", L"t.gpx/x.gpx", 1, "t.gpx is not a folder"},
      {"gpx", longName, 1, "cannot write " + (s.root / longName).ToUtf8() + ": File name too long"},
      {"svg", L"t.svg", 2, "--format: svg not in {gpx,kml,kmz,tcx,csv}"},
  };
  for (const auto& c : cases) {
    const std::string args = "export " + s.id + " --format " + c.format + " -o " + s.Out(c.out);
    const auto r = s.Run(args);
    EXPECT_EQ(r.status, c.status) << args << "\n" << r.out;
    EXPECT_NE(r.out.find(c.output), std::string::npos) << args << "\n" << r.out;
    if (c.status == 0) {
      EXPECT_FALSE(ReadFileBytes(s.root / c.out).empty()) << args;
    }
  }
  // The options reach the writers: the sport, and metric figures (an altitude of 100 m).
  EXPECT_NE(ReadFileBytes(s.root / L"t.tcx").find("<Activity Sport=\"Biking\">"), std::string::npos);
  EXPECT_NE(ReadFileBytes(s.root / L"t.csv").find("47.374000, 8.540000, 100.00,  0.00"), std::string::npos);
}

}  // namespace
