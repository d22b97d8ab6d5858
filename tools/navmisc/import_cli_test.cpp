// navmisc import, run as a user runs it: the real command thread and GpsDataControl.exe.
#include <signal.h>
#include <sys/stat.h>
#include <unistd.h>

#include <gtest/gtest.h>

#include <cstdio>
#include <cstring>
#include <string>

#include "navmisc/platform/files.h"
#include "navmisc/platform/process.h"
#include "testutil.h"

namespace {

using navmisc::testutil::CommandResult;
using navmisc::testutil::HaveProgram;
using navmisc::testutil::RunCommand;
using navmisc::testutil::ShellQuote;
using navmisc::testutil::TempDir;
using navmisc::testutil::WriteFileBytes;

std::string Navmisc(const TempDir& root) {
  return ShellQuote(NAVMISC_TOOL_PATH) + " --data-root " + ShellQuote(root.path().ToUtf8());
}

// A GPX 1.1 track of `n` points a second apart from 2024-05-01T06:00:00Z, with fixes (so that
// gpsbabel's NMEA marks them valid).
std::string Track(int n) {
  std::string doc = "<?xml version=\"1.0\"?>\n<gpx version=\"1.1\" creator=\"t\" "
                    "xmlns=\"http://www.topografix.com/GPX/1/1\"><trk><name>Ride</name><trkseg>\n";
  char buf[200];
  for (int i = 0; i < n; ++i) {
    std::snprintf(buf, sizeof buf,
                  "<trkpt lat=\"%.6f\" lon=\"%.6f\"><ele>%d</ele><time>2024-05-01T%02d:%02d:%02dZ</time>"
                  "<sat>7</sat><fix>3d</fix></trkpt>\n",
                  47 + i * 1e-5, 8 + i * 1e-5, 400 + i % 50, 6 + i / 3600, i / 60 % 60, i % 60);
    doc += buf;
  }
  return doc + "</trkseg></trk></gpx>\n";
}

// The trip folders of an application's data folder.
int TripFolders(const TempDir& root, const wchar_t* app) {
  CStringList names;
  GetContent(root / app, L"*.*", names);
  int n = 0;
  for (const CString& name : names) n += IsDirectory(root / app + L"/" + name);
  return n;
}

TEST(ImportCommand, FilesOfOtherProgramsBecomeTrips) {
  TempDir root, files;
  const CString gpx = files / L"ride.gpx";
  WriteFileBytes(gpx, Track(30));
  std::string list = ShellQuote(gpx.ToUtf8());
  std::string expected = gpx.ToUtf8() + ": trip ";
  if (HaveProgram("gpsbabel")) {
    for (const char* out : {"gtrnctr ride.tcx", "nmea ride.nmea", "kml,track=1,points=0 ride.kml"}) {
      const std::string format(out, std::strchr(out, ' '));
      const std::string name = std::strchr(out, ' ') + 1;
      const std::string path = (files / CString::FromUtf8(name)).ToUtf8();
      ASSERT_EQ(RunCommand("gpsbabel -i gpx -f " + ShellQuote(gpx.ToUtf8()) + " -o " + format + " -F " +
                           ShellQuote(path)).status, 0) << format;
      list += " " + ShellQuote(path);
    }
  }
  CommandResult r = RunCommand(Navmisc(root) + " import " + list + " 2>&1");
  ASSERT_EQ(r.status, 0) << r.out;
  // The trips are named after the files, which name themselves nothing.
  for (const char* line : {"ride.gpx: trip ", "\"ride\" (1 tracks, 30 points, 0 markers; gpx)\n"}) {
    EXPECT_NE(r.out.find(line), std::string::npos) << r.out;
  }
  if (HaveProgram("gpsbabel")) {
    EXPECT_NE(r.out.find("\"ride\" (1 tracks, 30 points, 0 markers; tcx)"), std::string::npos) << r.out;
    EXPECT_NE(r.out.find("\"ride\" (1 tracks, 30 points, 0 markers; nmea)"), std::string::npos) << r.out;
    // gpsbabel's KML holds the timed track and its line again.
    EXPECT_NE(r.out.find("\"ride\" (2 tracks, 60 points, 0 markers; kml)"), std::string::npos) << r.out;
  }
  const CommandResult trips = RunCommand(Navmisc(root) + " trips");
  EXPECT_NE(trips.out.find(" 30 2024-05-01T06:00:00Z 2024-05-01T06:00:29Z"), std::string::npos) << trips.out;

  // The cut and the zone, into the sport application's folder: the file's times are read as
  // two hours ahead of UTC, and only 04:00:10 to 04:00:19 UTC is kept.
  r = RunCommand(Navmisc(root) + " import --app sport --time-zone +02:00 --from 2024-05-01T04:00:10 --to " +
                 "2024-05-01T04:00:19 --name Cut " + ShellQuote(gpx.ToUtf8()));
  ASSERT_EQ(r.status, 0) << r.out;
  EXPECT_NE(r.out.find("\"Cut\" (1 tracks, 10 points, 0 markers; gpx)"), std::string::npos) << r.out;
  const CommandResult sport = RunCommand(Navmisc(root) + " trips --app sport");
  EXPECT_NE(sport.out.find("2024-05-01T04:00:10Z 2024-05-01T04:00:19Z"), std::string::npos) << sport.out;
}

TEST(ImportCommand, BadFilesAreRefusedOneByOneAndLeaveNoTrip) {
  TempDir root, files;
  const struct {
    const wchar_t* name;
    std::string content;
    const char* message;
  } cases[] = {
      {L"broken.gpx", "<gpx><trk><trkseg></trk></gpx>", "line 1: not well-formed XML (Opening and ending tag mismatch: trkseg line 1 and trk)"},
      {L"bomb.gpx",
       "<?xml version=\"1.0\"?><!DOCTYPE gpx [<!ENTITY a \"aaaa\"><!ENTITY b \"&a;&a;&a;&a;\">]>"
       "<gpx><wpt lat=\"1\" lon=\"2\"><name>&b;</name></wpt></gpx>",
       "line 1: the document declares a document type"},
      {L"external.gpx", "<?xml version=\"1.0\"?><!DOCTYPE gpx SYSTEM \"/etc/passwd\"><gpx>&x;</gpx>",
       "line 1: the document declares a document type"},
      {L"range.gpx", "<gpx>\n<wpt lat=\"12\" lon=\"200\"/></gpx>", "line 2: lon \"200\" is out of range"},
      {L"checksum.nmea", "$GPRMC,120000,A,0100.0000,N,00200.0000,E,,,010124,,*00\r\n",
       "1 sentences with a bad checksum and none good"},
      {L"garbage.nmea", "\x01\x02\x03 binary\n\xff\xfe", "no NMEA sentence (first at line 1)"},
      {L"empty.gpx", "", "the file is empty"},
      {L"nothing.gpx", "<gpx version=\"1.1\"><metadata/></gpx>", "the file holds no track point and no waypoint"},
  };
  std::string list;
  for (const auto& c : cases) {
    WriteFileBytes(files / c.name, c.content);
    list += " " + ShellQuote((files / c.name).ToUtf8());
  }
  ASSERT_EQ(::mkfifo((files / L"pipe.gpx").ToUtf8().c_str(), 0600), 0);
  ASSERT_TRUE(MakeDir(files / L"folder.gpx"));
  WriteFileBytes(files / L"huge.nmea", "$GPGGA,");
  ASSERT_EQ(::truncate((files / L"huge.nmea").ToUtf8().c_str(), 1ll << 30), 0);  // a 1 GB line, sparse
  for (const wchar_t* name : {L"pipe.gpx", L"folder.gpx", L"huge.nmea"}) list += " " + ShellQuote((files / name).ToUtf8());

  const CommandResult r = RunCommand(Navmisc(root) + " import" + list + " 2>&1 >/dev/null");
  EXPECT_EQ(r.status, 1);
  for (const auto& c : cases) {
    const std::string line = "navmisc import: " + (files / c.name).ToUtf8() + ": " + c.message;
    EXPECT_NE(r.out.find(line), std::string::npos) << line << "\n" << r.out;
  }
  for (const char* line : {"pipe.gpx: not a regular file (Is a FIFO)", "folder.gpx: not a regular file (Is a directory)",
                           "huge.nmea: lines longer than 256 bytes and no NMEA sentence",
                           "navmisc import: 11 of 11 files not imported"}) {
    EXPECT_NE(r.out.find(line), std::string::npos) << line << "\n" << r.out;
  }
  EXPECT_EQ(TripFolders(root, L"Resource"), 0);
  EXPECT_FALSE(FileExists(root / L"Resource/RESOURCE_INFO.INI"));

  const CommandResult usage = RunCommand(Navmisc(root) + " import --app where x.gpx 2>&1");
  EXPECT_EQ(usage.status, 2);
  EXPECT_NE(usage.out.find("--app must be trip, sport or tracker"), std::string::npos) << usage.out;
}

TEST(ImportCommand, CtrlCCancelsTheRunningImportAndNoTripStays) {
  TempDir root, files;
  const CString big = files / L"big.gpx";
  WriteFileBytes(big, Track(400000));
  navmisc::ChildProcess cli;
  navmisc::SpawnOptions options;
  options.captureOutput = true;
  options.nullStdin = true;
  ASSERT_TRUE(cli.Start({NAVMISC_TOOL_PATH, "--data-root", root.path().ToUtf8(), "import", "--verbose",
                         big.ToUtf8()},
                        options));
  // Once the process reports progress the import runs: interrupt it there.
  std::string out;
  char buf[4096];
  ssize_t n;
  while (out.find("progress:") == std::string::npos && (n = cli.ReadOutput(buf, sizeof buf)) > 0) {
    out.append(buf, static_cast<size_t>(n));
  }
  ASSERT_NE(out.find("progress:"), std::string::npos) << out;
  ::kill(cli.pid(), SIGINT);
  while ((n = cli.ReadOutput(buf, sizeof buf)) > 0) out.append(buf, static_cast<size_t>(n));
  EXPECT_EQ(cli.Wait(), 130) << out << cli.errorOutput();
  EXPECT_EQ(out.find(": trip "), std::string::npos) << out;
  EXPECT_NE(cli.errorOutput().find("big.gpx: cancelled; no trip was made"), std::string::npos) << cli.errorOutput();
  EXPECT_EQ(TripFolders(root, L"Resource"), 0);
}

}  // namespace
