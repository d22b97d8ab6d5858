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
  const std::string longName(300, 'n');
  const struct {
    std::string args;
    int status;
    std::string output;  // expected part of what the command prints
  } cases[] = {
      {"export " + s.id + " --format gpx -o " + s.Out(L"t.gpx"), 0, "t.gpx\n"},
      {"export " + s.id + " --format kml -o " + s.Out(L"t.kml"), 0, "t.kml\n"},
      {"export " + s.id + " --format tcx --sport 0 -o " + s.Out(L"t.tcx"), 0, "t.tcx\n"},
      {"export " + s.id + " --format csv --metric -o " + s.Out(L"t.csv"), 0, "t.csv\n"},
      {"export " + s.id + " --format kmz -o " + s.Out(L"t.kmz"), 1,
       "cannot add photo \"Gone\" (" + s.gonePhoto + ") to " + (s.root / L"t.kmz").ToUtf8() +
           ": No such file or directory"},
      {"export " + s.id + " --format gpx -o " + s.Out(L"missing/t.gpx"), 1, "does not exist"},
      {"export " + s.id + " --format gpx -o " + s.Out(L"t.gpx/x.gpx"), 1, "t.gpx is not a folder"},
      {"export " + s.id + " --format gpx -o " + s.Out(CString::FromUtf8(longName)), 1,
       "cannot write " + (s.root / CString::FromUtf8(longName)).ToUtf8() + ": File name too long"},
      {"export " + s.id + " --format svg -o " + s.Out(L"t.svg"), 2, "--format must be"},
  };
  for (const auto& c : cases) {
    const auto r = s.Run(c.args);
    EXPECT_EQ(r.status, c.status) << c.args << "\n" << r.out;
    EXPECT_NE(r.out.find(c.output), std::string::npos) << c.args << "\n" << r.out;
  }
  EXPECT_EQ(ReadFileBytes(s.root / L"t.gpx").substr(0, 21), "<?xml version=\"1.0\" e");
  EXPECT_NE(ReadFileBytes(s.root / L"t.tcx").find("<Activity Sport=\"Biking\">"), std::string::npos);
  EXPECT_NE(ReadFileBytes(s.root / L"t.csv").find("47.374000, 8.540000, 0.00,  0.00"), std::string::npos);
}

}  // namespace
