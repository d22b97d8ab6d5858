#include <unistd.h>

#include <string>

#include <gtest/gtest.h>

#include "navmisc/platform/files.h"
#include "navmisc/records/trip.h"
#include "testutil.h"
#include "tool_test_support.h"

namespace {

using navmisc::testutil::CommandResult;
using navmisc::testutil::DataRootScope;
using navmisc::testutil::HaveProgram;
using navmisc::testutil::ReadFileBytes;
using navmisc::testutil::RunCommand;
using navmisc::testutil::ShellQuote;
using navmisc::testutil::TempDir;
using navmisc::testutil::WriteFileBytes;

size_t Count(const std::string& text, const std::string& what) {
  size_t n = 0;
  for (size_t at = 0; (at = text.find(what, at)) != std::string::npos; at += what.size()) ++n;
  return n;
}

// A data root holding two saved trips of one name. The first has two tracks (one with XML's
// special characters in its name), points of several optimisation levels, and a photo and a
// marker titled with those characters; the second one track of three points.
struct SavedTrips {
  TempDir root;
  std::string id, otherId;
  std::string gonePhoto;
  SavedTrips() {
    DataRootScope scope(root.path());
    BLOG_ITEM_INFO trip(GPS_APP_TRIP, nullptr, 1);
    trip.name = L"Zurich walk";
    trip.optLevel = 0;
    for (const wchar_t* name : {L"Walk & <talk> \"out\"", L"Back"}) {
      auto* track = new TRACK_ITEM_INFO(&trip);
      track->description = name;
      for (int i = 0; i < 5; ++i) {
        auto* p = new WAYPOINT_ITEM_INFO;
        p->time = 1714543200 + 10 * i + 1000 * trip.tracks.GetCount();
        p->latitude = 47.37 + 0.001 * i;
        p->longitude = 8.54;
        p->altitude = 100;
        p->type = i == 2 ? 50 : 0;  // one point kept at level 50
        track->points.AddTail(p);
      }
      trip.tracks.AddTail(track);
    }
    for (int type : {PHOTO_ITEM_INFO::kTypePhoto, PHOTO_ITEM_INFO::kTypeMarker}) {
      auto* item = new PHOTO_ITEM_INFO(&trip, nullptr, nullptr, nullptr);
      item->dataType = type;
      item->itemName = L"fish.jpg";
      item->title = L"Fish & <chips> \"here\"";
      item->description = L"a\r\nb & c";
      item->latitude = 47.371;
      item->longitude = 8.541;
      trip.photos.AddTail(item);
    }
    WriteFileBytes(PathJoin(trip.GetResourcePath(), L"fish.jpg"), "jpeg");
    trip.WriteAllWaypoint(1, nullptr, nullptr);
    trip.WriteInfo(1, nullptr, nullptr);
    id = trip.tripId.ToUtf8();

    BLOG_ITEM_INFO other(GPS_APP_TRIP, nullptr, 2);
    other.name = L"Zurich walk";
    auto* track = new TRACK_ITEM_INFO(&other);
    for (int i = 0; i < 3; ++i) {
      auto* p = new WAYPOINT_ITEM_INFO;
      p->time = 1714643200 + i;
      p->latitude = 46.0 + 0.001 * i;
      p->longitude = 7.0;
      track->points.AddTail(p);
    }
    other.tracks.AddTail(track);
    other.WriteAllWaypoint(1, nullptr, nullptr);
    other.WriteInfo(1, nullptr, nullptr);
    otherId = other.tripId.ToUtf8();
  }
  // `PREFIX navmisc --data-root ROOT ARGS`, standard error joined to standard output.
  CommandResult Run(const std::string& args, const std::string& prefix = "") const {
    return navmisc::testutil::RunTool("--data-root " + ShellQuote(root.path().ToUtf8()) + " " + args, prefix);
  }
  std::string Out(const wchar_t* name) const { return ShellQuote((root / name).ToUtf8()); }
  std::string Read(const wchar_t* name) const { return ReadFileBytes(root / name); }
};

TEST(ExportCommand, FormatsOptionsTripsAndTracksAsTheUserNamesThem) {
  SavedTrips s;
  // The ids share all but their last characters; the first's unique start and the shared name.
  const std::string prefix = s.id.substr(0, s.id.size() - 1);
  ASSERT_NE(s.otherId.rfind(prefix, 0), 0u) << s.id << " " << s.otherId;
  const CString longName = CString::FromUtf8(std::string(300, 'n') + ".gpx");
  const struct {
    std::string args;
    int status;
    std::string output;  // expected part of what the command prints
  } cases[] = {
      {"export " + s.id + " -o " + s.Out(L"t.gpx"), 0, (s.root / L"t.gpx").ToUtf8() + "\n"},
      {"export " + prefix + " -o " + s.Out(L"u.KML"), 0, "u.KML\n"},
      {"export " + s.otherId + " --format TCX --sport 0 -o " + s.Out(L"t.tcx"), 0, "t.tcx\n"},
      {"export " + s.id + " --metric -o " + s.Out(L"t.csv"), 0, "t.csv\n"},
      {"export " + s.id + " -o " + s.Out(L"t.kmz"), 0, "t.kmz\n"},
      {"export " + s.id + " --format gpx -o -", 0, "<?xml version=\"1.0\" encoding=\"UTF-8\" standalone=\"yes\" ?>"},
      {"export " + s.id + " --track Back -o " + s.Out(L"back.gpx"), 0, "back.gpx\n"},
      {"export " + s.id + " --level 50 -o " + s.Out(L"level.gpx"), 0, "level.gpx\n"},
      {"export " + s.id + " --level 60 -o " + s.Out(L"none.gpx"), 1, "no point keeps level 60 or more"},
      {"export " + s.id + " --track TK_ -o " + s.Out(L"x.gpx"), 1, "'TK_' names 2 tracks in trip " + s.id},
      {"export " + s.id + " --track Nope -o " + s.Out(L"x.gpx"), 1, "no track 'Nope' in trip " + s.id + "; there are:"},
      {"export 'Zurich walk' -o " + s.Out(L"x.gpx"), 1,
       "'Zurich walk' names 2 trips under " + s.root.path().ToUtf8() + "; give one's id:"},
      {"export Nowhere -o " + s.Out(L"x.gpx"), 1, "  " + s.otherId},
      {"export " + s.id + " -o " + s.Out(L"t.txt"), 2, "cannot tell the format from"},
      {"export " + s.id + " -o -", 2, "writing to standard output (-o -) needs --format"},
      {"export " + s.id + " --metric -o " + s.Out(L"x.gpx"), 2, "--metric applies to csv only, not gpx"},
      {"export " + s.id + " --sport 2 -o " + s.Out(L"x.kml"), 2, "--sport applies to tcx only, not kml"},
      {"export " + s.id + " --format svg -o " + s.Out(L"t.svg"), 2, "--format must be gpx, kml, kmz, tcx or csv"},
      {"export " + s.id + " -o " + s.Out(L"missing/t.gpx"), 1, "does not exist"},
      {"export " + s.id + " -o " + s.Out(L"t.gpx/x.gpx"), 1, "t.gpx is not a folder"},
      {"export " + s.id + " -o " + s.Out(longName), 1, "cannot write " + (s.root / longName).ToUtf8() + ": File name too long"},
  };
  for (const auto& c : cases) {
    const CommandResult r = s.Run(c.args);
    EXPECT_EQ(r.status, c.status) << c.args << "\n" << r.out;
    EXPECT_NE(r.out.find(c.output), std::string::npos) << c.args << "\n" << r.out;
  }
  // Both tracks and both items; the document on standard output is the file's.
  EXPECT_EQ(Count(s.Read(L"t.gpx"), "<trkpt "), 10u);
  EXPECT_EQ(Count(s.Read(L"t.gpx"), "<wpt "), 2u);
  EXPECT_EQ(s.Run("export " + s.id + " --format gpx -o - 2>/dev/null").out, s.Read(L"t.gpx"));
  EXPECT_NE(s.Read(L"u.KML").find("<kml xmlns"), std::string::npos);
  EXPECT_NE(s.Read(L"t.tcx").find("<Activity Sport=\"Biking\">"), std::string::npos);
  EXPECT_NE(s.Read(L"t.csv").find("47.374000, 8.540000, 100.00,  0.00"), std::string::npos);
  // One track; at level 50 one point of each track (the first and last points of a track are
  // kept by the simplification only when their level says so).
  EXPECT_EQ(Count(s.Read(L"back.gpx"), "<trk>"), 1u);
  EXPECT_NE(s.Read(L"back.gpx").find("<name>Back</name>"), std::string::npos);
  EXPECT_EQ(Count(s.Read(L"level.gpx"), "<trkpt "), 2u);
  EXPECT_EQ(Count(s.Read(L"level.gpx"), "<name>Back</name>"), 1u);
  for (const wchar_t* unwritten : {L"x.gpx", L"none.gpx", L"x.kml", L"t.svg"}) {
    EXPECT_FALSE(FileExists(s.root / unwritten)) << CString(unwritten).ToUtf8();
  }
}

TEST(ExportCommand, TitlesWithMarkupCharactersGiveWellFormedDocuments) {
  if (!HaveProgram("xmllint") || !HaveProgram("gpsbabel")) {
    GTEST_SKIP() << "xmllint or gpsbabel is not installed (scripts/setup.sh installs them)";
  }
  SavedTrips s;
  for (const wchar_t* name : {L"w.gpx", L"w.kml", L"w.tcx"}) {
    const CommandResult r = s.Run("export " + s.id + " -o " + s.Out(name));
    ASSERT_EQ(r.status, 0) << r.out;
    const CommandResult lint = RunCommand("xmllint --noout " + s.Out(name) + " 2>&1");
    EXPECT_EQ(lint.status, 0) << CString(name).ToUtf8() << "\n" << lint.out;
  }
  const CommandResult kmz = s.Run("export " + s.id + " -o " + s.Out(L"w.kmz"));
  ASSERT_EQ(kmz.status, 0) << kmz.out;
  EXPECT_EQ(RunCommand("unzip -p " + s.Out(L"w.kmz") + " w.kml | xmllint --noout - 2>&1").status, 0);
  // gpsbabel reads the texts back as they were written into the trip (and escapes them again
  // in the GPX it writes).
  for (const wchar_t* name : {L"w.gpx", L"w.kml"}) {
    const std::string in = CString(name).str().ends_with(L"gpx") ? "gpx" : "kml";
    const CommandResult back = RunCommand("gpsbabel -i " + in + " -f " + s.Out(name) + " -o gpx -F - 2>&1");
    EXPECT_EQ(back.status, 0) << back.out;
    EXPECT_NE(back.out.find("<name>Fish &amp; &lt;chips&gt; &quot;here&quot;</name>"), std::string::npos) << back.out;
    EXPECT_NE(back.out.find("<name>Walk &amp; &lt;talk&gt; &quot;out&quot;</name>"), std::string::npos) << back.out;
  }
}

TEST(ExportCommand, AFailedWriteKeepsThePreviousFileAndSaysWhy) {
  SavedTrips s;
  for (const wchar_t* name : {L"old.gpx", L"old.kmz", L"old.csv"}) {
    WriteFileBytes(s.root / name, "previous");
    // A file-size limit of 1 KiB: the shell ignores the signal so that the write fails with
    // EFBIG instead, as the disk would with ENOSPC.
    const CommandResult r = s.Run("export " + s.id + " -o " + s.Out(name), "trap '' XFSZ; ulimit -f 1; ");
    EXPECT_EQ(r.status, 1) << r.out;
    EXPECT_NE(r.out.find("cannot write " + (s.root / name).ToUtf8() + ": File too large"), std::string::npos) << r.out;
    EXPECT_EQ(s.Read(name), "previous");
  }
  // Nothing is left beside the targets.
  CStringList left;
  ASSERT_GE(GetContent(s.root.path(), L"*", left), 0);
  for (const CString& name : left) EXPECT_EQ(name.str().find(L".tmp-"), std::wstring::npos) << name.ToUtf8();
}

TEST(ExportCommand, ALinkNamedAsTheOutputIsReplacedNotFollowed) {
  SavedTrips s;
  WriteFileBytes(s.root / L"elsewhere.gpx", "someone else's file");
  ASSERT_EQ(::symlink(navmisc::NativePath(s.root / L"elsewhere.gpx").c_str(),
                      navmisc::NativePath(s.root / L"link.gpx").c_str()),
            0);
  const CommandResult r = s.Run("export " + s.id + " -o " + s.Out(L"link.gpx"));
  ASSERT_EQ(r.status, 0) << r.out;
  EXPECT_EQ(s.Read(L"elsewhere.gpx"), "someone else's file");
  EXPECT_NE(PathStatus(s.root / L"link.gpx"), 2);
  EXPECT_EQ(s.Read(L"link.gpx").rfind("<?xml", 0), 0u);
  char target[256];
  EXPECT_EQ(::readlink(navmisc::NativePath(s.root / L"link.gpx").c_str(), target, sizeof target), -1)
      << "link.gpx is now the document itself";
}

}  // namespace
