// navmisc summary, sport, tracker and where, run as a user runs them on the demo's data root.
#include <gtest/gtest.h>

#include <cstdio>
#include <string>

#include "navmisc/export/detail/test_support.h"
#include "navmisc/platform/files.h"
#include "testutil.h"

namespace {

using navmisc::testutil::CommandResult;
using navmisc::testutil::ReadFileBytes;
using navmisc::testutil::RunCommand;
using navmisc::testutil::ShellQuote;
using navmisc::testutil::TempDir;
using navmisc::testutil::WriteFileBytes;

struct Demo {
  TempDir root;
  std::string out;
  Demo() {
    const CommandResult r = Run("demo " + ShellQuote(root.path().ToUtf8()));
    EXPECT_EQ(r.status, 0) << r.out;
    out = r.out;
  }
  // `navmisc --data-root ROOT ARGS`, standard error joined to standard output.
  CommandResult Run(const std::string& args) const {
    return RunCommand(ShellQuote(NAVMISC_TOOL_PATH) + " --data-root " + ShellQuote(root.path().ToUtf8()) + " " + args +
                      " 2>&1 </dev/null");
  }
  CString Path(const wchar_t* name) const { return root / name; }
  // The id that follows `label` in `text` ("filed 2405..._123 (Morning run)").
  static std::string IdAfter(const std::string& text, const std::string& label) {
    const size_t at = text.find(label);
    return at == std::string::npos ? "" : text.substr(at + label.size(), text.find(' ', at + label.size()) - at - label.size());
  }
};

bool Shows(const CommandResult& r, const std::string& text) { return r.out.find(text) != std::string::npos; }

TEST(ActivityCommands, TheDemoFilesItsActivitiesAndSumsTheRunUp) {
  Demo d;
  for (const wchar_t* file : {L"SportRes/SPORTRES_INFO.INI", L"TrackerRes/TRACKERRES_INFO.INI",
                              L"WhereRes/WHERERES_INFO.INI", L"WhereRes/MAP_HTML/track_data.js",
                              L"WhereRes/MAP_HTML/js/gmap.js"}) {
    EXPECT_TRUE(FileExists(d.Path(file))) << CString(file).ToUtf8();
  }
  EXPECT_NE(d.out.find("calories         "), std::string::npos) << d.out;
  const std::string run = Demo::IdAfter(d.out, "filed ");
  ASSERT_FALSE(run.empty()) << d.out;

  // The list shows what the store file holds; the summary the run's figures.
  const CommandResult list = d.Run("sport list");
  EXPECT_EQ(list.status, 0) << list.out;
  EXPECT_TRUE(Shows(list, "2024-05\n  01 06:00  running    Morning run")) << list.out;
  const CommandResult json = d.Run("summary " + run + " --json");
  ASSERT_EQ(json.status, 0) << json.out;
  int moving = 0, duration = 0;
  double kcal = 0, resting = 0;
  ASSERT_EQ(std::sscanf(json.out.c_str() + json.out.find("\"duration_s\""), "\"duration_s\": %d", &duration), 1);
  ASSERT_EQ(std::sscanf(json.out.c_str() + json.out.find("\"moving_time_s\""), "\"moving_time_s\": %d", &moving), 1);
  ASSERT_EQ(std::sscanf(json.out.c_str() + json.out.find("\"calories_kcal\""), "\"calories_kcal\": %lf, \"resting_kcal\": %lf",
                        &kcal, &resting), 2);
  EXPECT_EQ(duration, 1800);
  EXPECT_GT(moving, 1780) << "a run without a stop";
  EXPECT_GT(kcal, resting);
  EXPECT_GT(resting, 0.0);
  // The run as TCX (a run by default) carries the same calories in its one lap, and it and every
  // TCX the demo wrote are valid TCX.
  const CommandResult exported = d.Run("export " + run + " -o " + ShellQuote(d.Path(L"run.tcx").ToUtf8()));
  ASSERT_EQ(exported.status, 0) << exported.out;
  const std::string tcx = ReadFileBytes(d.Path(L"run.tcx"));
  int lapCalories = -1;
  ASSERT_NE(tcx.find("<Calories>"), std::string::npos) << tcx.substr(0, 2000);
  ASSERT_EQ(std::sscanf(tcx.c_str() + tcx.find("<Calories>"), "<Calories>%d<", &lapCalories), 1);
  EXPECT_EQ(tcx.find("<Calories>", tcx.find("<Calories>") + 1), std::string::npos) << "one lap";
  EXPECT_NEAR(lapCalories, kcal, 1.0);
  const std::string schemas = navmisc::exporttest::SchemaDir();
  if (navmisc::testutil::HaveProgram("xmllint") && !schemas.empty()) {
    const CommandResult valid = RunCommand("cd " + ShellQuote((d.root / L"exports").ToUtf8()) +
                                           " && ls *.tcx | wc -l && xmllint --noout --nonet --schema " +
                                           ShellQuote(schemas + "/tcx2-with-ax2.xsd") + " *.tcx ../run.tcx 2>&1");
    EXPECT_EQ(valid.status, 0) << valid.out;
    EXPECT_EQ(valid.out.rfind("3\n", 0), 0u) << "the three demo trips\n" << valid.out;
  } else {
    std::printf("note: the demo's TCX files not checked against the schema: xmllint or the schemas are missing\n");
  }
  // A selection: the first ten minutes, as a ride.
  const CommandResult part = d.Run("summary " + run + " --sport cycling --from 2024-05-01T06:00:00 --to 2024-05-01T06:10:00");
  EXPECT_EQ(part.status, 0) << part.out;
  EXPECT_TRUE(Shows(part, "cycling\n")) << part.out;
  EXPECT_TRUE(Shows(part, "duration         0:30:00                  0:10:00")) << part.out;

  // The same run through gpxpy, for the moving time beside ours.
  const std::string python = navmisc::testutil::PythonWithModule("gpxpy");
  if (!python.empty()) {
    const std::string gpx = (d.root / L"run.gpx").ToUtf8();
    ASSERT_EQ(d.Run("export " + run + " --format gpx -o " + ShellQuote(gpx)).status, 0);
    const CommandResult theirs = RunCommand(python + " -c 'import gpxpy,sys; print(int(gpxpy.parse(open(sys.argv[1])).get_moving_data().moving_time))' " +
                                            ShellQuote(gpx));
    ASSERT_EQ(theirs.status, 0) << theirs.out;
    std::printf("demo run: moving time %d s, gpxpy get_moving_data() %s", moving, theirs.out.c_str());
    EXPECT_NEAR(std::stoi(theirs.out), moving, 30);
  }

  // Removing the activity deletes its copy of the trip, and only that.
  const CString copy = d.Path(CString(L"SportRes/") + CString::FromUtf8(run));
  EXPECT_TRUE(IsDirectory(copy));
  const CommandResult removed = d.Run("sport remove " + run);
  EXPECT_EQ(removed.status, 0) << removed.out;
  EXPECT_TRUE(Shows(removed, "1 unused trip folder deleted")) << removed.out;
  EXPECT_FALSE(FileExists(copy));
  EXPECT_TRUE(Shows(d.Run("sport list"), "sport activities of Demo User"));
  EXPECT_EQ(d.Run("sport remove " + run).status, 1);
  const CommandResult tracker = d.Run("tracker list");
  EXPECT_TRUE(Shows(tracker, "Tracker day in London")) << tracker.out;
}

TEST(ActivityCommands, RefusesWhatWouldLoseActivitiesAndSaysWhy) {
  Demo d;
  const std::string walk = Demo::IdAfter(d.Run("trips").out, "My trips             ");
  ASSERT_FALSE(walk.empty());
  const struct {
    std::string args;
    int status;
    std::string shows;
  } usage[] = {
      {"sport add " + walk + " --type swimming", 2, "--type must be running, cycling or 2 to 6"},
      {"sport add nosuchtrip", 1, "no trip 'nosuchtrip'"},
      {"summary " + walk + " --from 2024-05-02T10:00:00 --to 2024-05-02T09:00:00", 2, "--to lies before --from"},
      {"where set --lat 91 --lon 0", 2, "--lat"},
      {"sport", 2, "A subcommand is required"},
  };
  for (const auto& c : usage) {
    const CommandResult r = d.Run(c.args);
    EXPECT_EQ(r.status, c.status) << c.args << "\n" << r.out;
    EXPECT_TRUE(Shows(r, c.shows)) << c.args << "\n" << r.out;
  }
  // A trip of the sport store that cannot be read any more: listing says so, adding and
  // removing refuse, and no trip folder is deleted.
  const CString store = d.Path(L"SportRes/SPORTRES_INFO.INI");
  WriteFileBytes(store, ReadFileBytes(store) + "[sport_item_(1)]\ntype=1\nres_info=gone\n");
  WriteFileBytes(store, [&] {
    std::string s = ReadFileBytes(store);
    s.replace(s.find("sport_item_count=1"), 18, "sport_item_count=2");
    return s;
  }());
  MakeDir(d.Path(L"SportRes/stray"));
  const CommandResult list = d.Run("sport list");
  EXPECT_EQ(list.status, 0) << list.out;
  EXPECT_TRUE(Shows(list, "note: not every activity named by")) << list.out;
  EXPECT_TRUE(Shows(list, "reads: the trip gone of activity sport_item_(1) cannot be read")) << list.out;
  for (const std::string& args : {"sport add " + walk, "sport remove " + Demo::IdAfter(d.out, "filed ")}) {
    const CommandResult r = d.Run(args);
    EXPECT_EQ(r.status, 1) << args << "\n" << r.out;
    EXPECT_TRUE(Shows(r, "cannot be read; the store is left as it is")) << args << "\n" << r.out;
  }
  EXPECT_TRUE(IsDirectory(d.Path(L"SportRes/stray")));

  // A new position replaces the old one in the map script.
  const CommandResult where = d.Run("where set --lat 25.1 --lon 121.5 --alt 12 --speed 36 --time 1000000000");
  EXPECT_EQ(where.status, 0) << where.out;
  EXPECT_EQ(ReadFileBytes(d.Path(L"WhereRes/MAP_HTML/track_data.js")),
            "track0 = [\n[1000000000, 25.100000, 121.500000, 12.000, 36.0, 0, 0, 0]\n];");
}

}  // namespace
