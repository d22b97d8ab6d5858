#include "navmisc/geotag/geotag.h"

#include <gtest/gtest.h>
#include <sys/stat.h>

#include <memory>
#include <string>
#include <vector>

#include "navmisc/geotag/fixtag_format.h"
#include "navmisc/platform/datetime.h"
#include "navmisc/platform/exif.h"
#include "navmisc/platform/files.h"
#include "navmisc/platform/process.h"
#include "navmisc/platform/resources.h"
#include "navmisc/platform/settings.h"
#include "navmisc/records/trip.h"
#include "photo_testutil.h"
#include "testutil.h"

namespace {

namespace fx = navmisc::fixtag;
using namespace navmisc::testutil;
using navmisc::kTinyJpeg;

// A stand-in for the tagging tool that shows what the library hands it: it keeps a copy of the
// command file and its arguments, appends prepared answers to the command file, and ends with a
// failure code that the library must not care about.
constexpr const char* kFakeTool =
    "#!/bin/sh\n"
    "dir=$(dirname \"$0\")\n"
    "printf '%s\\n' \"$0\" \"$@\" > \"$dir/args.txt\"\n"
    "cp \"$2\" \"$dir/seen.ini\"\n"
    "[ -f \"$dir/answers.ini\" ] && cat \"$dir/answers.ini\" >> \"$2\"\n"
    "exit 3\n";

class GeotagTest : public ::testing::Test {
 protected:
  GeotagTest() {
    MakeDir(toolDir_.path());
    WriteFileBytes(toolDir_ / fx::kProgram, kFakeTool);
    ::chmod(navmisc::NativePath(toolDir_ / fx::kProgram).c_str(), 0755);
    g_bOverwriteNoAsk = false;
  }
  ~GeotagTest() override {
    SetOverwriteView(nullptr);
    g_bOverwriteNoAsk = false;
  }

  CString CommandFile() const {
    return root_ / FormatString(L"%lX_profile.ini", navmisc::GetCurrentThreadId());
  }
  void Answer(const std::string& ini) { WriteFileBytes(toolDir_ / L"answers.ini", ini); }
  std::string Seen() const { return ReadFileBytes(toolDir_ / L"seen.ini"); }

  // A photo of `trip` whose file in the trip folder is the tiny JPEG, imported from `original`
  // (a JPEG too, when given).
  PHOTO_ITEM_INFO* AddPhoto(BLOG_ITEM_INFO& trip, const wchar_t* name,
                            const CString& original = {}) {
    auto* photo = new PHOTO_ITEM_INFO(&trip, nullptr, nullptr, nullptr);
    photo->itemName = name;
    photo->originalName = original;
    photo->latitude = 46.5;
    photo->longitude = 7.25;
    photo->altitude = 1500.0;
    photo->speed = 3600;
    trip.photos.AddTail(photo);
    WriteFileBytes(photo->GetFilePathName(), Bytes(kTinyJpeg));
    if (!original.IsEmpty()) WriteFileBytes(original, Bytes(kTinyJpeg));
    return photo;
  }

  TempDir root_;
  DataRootScope rootScope_{root_.path()};
  TempDir toolDir_;
  ProgPathScope progScope_{toolDir_.path()};
};

bool Tagged(const CString& photo) {
  CExif2 exif;
  navmisc::ExifInfo info;
  return exif.GetExif(photo, info) && info.hasPosition;
}

TEST_F(GeotagTest, ReadRequestKeepsTheIndexOfSkippedEntriesAndConvertsAnswers) {
  TzScope tz("CST-8");  // 28800 s east of UTC, no daylight saving
  WriteFileBytes(root_ / L"stale.jpg", "x");
  const struct {
    const char* answers;  // keys of the tool's answer
    double latitude;
    int32_t speed;
    const wchar_t* comment;
    long time;  // -2: the file's creation time plus the zone shift
  } rows[] = {
      {"Latitude=47.5\nLongitude=8.25\nAltitude=410\nSpeed=12.5\nComment=c\nImage.XPComment=x\n"
       "Photo.UserComment=u\nPhoto.DateTimeOriginal=2012:05:17 08:30:00\nImage.DateTime=2001:01:01 "
       "00:00:00\n",
       47.5, 12500, L"c", DateTimeToLong(5, 17, 2012, 8, 30, 0)},
      {"Image.XPComment=x\nPhoto.UserComment=u\nImage.DateTime=2013:01:02 03:04:05\n", 0.0, 0, L"x",
       DateTimeToLong(1, 2, 2013, 3, 4, 5)},
      {"Photo.UserComment=u\nSpeed=1e300\nPhoto.DateTimeOriginal=garbage\n", 0.0, 0, L"u", -1},
      {"Speed=-0.0015\n", 0.0, -1, L"", -2},
  };
  std::vector<std::unique_ptr<_ExifImageInfo>> entries;
  CPtrList list;
  std::string answers;
  for (size_t i = 0; i < std::size(rows); ++i) {
    entries.push_back(std::make_unique<_ExifImageInfo>());
    entries.back()->path = root_ / L"stale.jpg";
    list.AddTail(entries.back().get());
    // A known photo between every two unknown ones: it is skipped but keeps its index.
    auto known = std::make_unique<_ExifImageInfo>();
    known->time = 5;
    list.AddTail(known.get());
    entries.push_back(std::move(known));
    answers += "[File." + std::to_string(2 * i) + "]\n" + rows[i].answers;
  }
  Answer(answers);
  EXPECT_EQ(GetPhotoInfor(list), 1);

  const std::string seen = Seen();
  EXPECT_NE(seen.find("[PROP]\nCount=8\n"), std::string::npos) << seen;
  EXPECT_NE(
      seen.find("[File.6]\nOld File=" + (root_ / L"stale.jpg").ToUtf8() + "\nReadOnly=true\n"),
      std::string::npos);
  EXPECT_EQ(seen.find("[File.1]"), std::string::npos) << "known photos are not asked for";
  EXPECT_EQ(ReadFileBytes(toolDir_ / L"args.txt"),
            (toolDir_ / fx::kProgram).ToUtf8() + "\n-ZE\n" + CommandFile().ToUtf8() + "\n");
  EXPECT_FALSE(FileExists(CommandFile())) << "the command file is cleared afterwards";

  FILETIME created;
  const long creation = GetFileCreationTime(root_ / L"stale.jpg", created) + 28800;
  for (size_t i = 0; i < std::size(rows); ++i) {
    const _ExifImageInfo& e = *entries[2 * i];
    EXPECT_EQ(e.latitude, rows[i].latitude) << i;
    EXPECT_EQ(e.speed, rows[i].speed) << i;
    EXPECT_EQ(e.comment, rows[i].comment) << i;
    EXPECT_EQ(e.time, rows[i].time == -2 ? creation : rows[i].time) << i;
    EXPECT_EQ(entries[2 * i + 1]->time, 5);
  }
  EXPECT_EQ(entries[0]->longitude, 8.25);
  EXPECT_EQ(entries[0]->altitude, 410.0);

  // The single form reads a known photo only when forced.
  _ExifImageInfo one;
  one.time = 7;
  Answer("[File.0]\nImage.DateTime=2013:01:02 03:04:05\n");
  EXPECT_EQ(GetPhotoInfor(&one, false), 0);
  EXPECT_EQ(one.time, 7);
  EXPECT_EQ(GetPhotoInfor(&one, true), 1);
  EXPECT_EQ(one.time, DateTimeToLong(1, 2, 2013, 3, 4, 5));
}

TEST_F(GeotagTest, WriteAndCopyRequestsFormTheCommandFile) {
  BLOG_ITEM_INFO trip(GPS_APP_TRIP);
  PHOTO_ITEM_INFO* photo = AddPhoto(trip, L"p.jpg");
  photo->description = L"a\r\nb\rc\nd\n\re";
  photo->speed = 36000;
  WriteFileBytes(CommandFile(), "left over from a crash");
  EXPECT_EQ(WriteGeoTagInfo(photo, false), 1);
  EXPECT_EQ(Seen(),
            "[PROP]\nCount=1\n\n[File.0]\nOld File=" + photo->GetFilePathName().ToUtf8() +
                "\nLatitude=46.5\nLongitude=7.25\nAltitude=1500\nSpeed=36\nComment=a b c d  e\n");
  EXPECT_FALSE(FileExists(CommandFile()));

  EXPECT_EQ(CopyExifGeoTagInfo(L"/photos/a b.jpg", L"/photos/\"quoted\".jpg"), 1);
  EXPECT_EQ(Seen(),
            "[PROP]\nCount=1\n\n[File.0]\nOld File=/photos/a b.jpg\n"
            "New File=/photos/\"quoted\".jpg\n");

  PHOTO_ITEM_INFO noFile(&trip, nullptr, nullptr, nullptr);
  bool no = false, yes = false;
  ::unlink(navmisc::NativePath(toolDir_ / L"seen.ini").c_str());
  EXPECT_EQ(WriteGeoTagInfo(&noFile, true), 0);
  EXPECT_EQ(CheckAndWriteGeoTagInfo(&noFile, no, yes), 0);
  EXPECT_FALSE(FileExists(toolDir_ / L"seen.ini")) << "no tool run for a photo without a file";
}

TEST_F(GeotagTest, WithoutTheToolEntriesGetTheDefaults) {
  TzScope tz("CST-8");
  ProgPathScope nowhere(root_ / L"no-such-folder");
  WriteFileBytes(root_ / L"a.jpg", Bytes(kTinyJpeg));
  _ExifImageInfo entry;
  entry.path = root_ / L"a.jpg";
  entry.latitude = 5.0;
  entry.comment = L"old";
  CPtrList list;
  list.AddTail(&entry);
  EXPECT_EQ(GetPhotoInfor(list), 0);
  FILETIME created;
  EXPECT_EQ(entry.time, GetFileCreationTime(entry.path, created) + 28800);
  EXPECT_EQ(entry.latitude, 0.0);
  EXPECT_EQ(entry.comment, L"");

  BLOG_ITEM_INFO trip(GPS_APP_TRIP);
  PHOTO_ITEM_INFO* photo = AddPhoto(trip, L"p.jpg");
  EXPECT_EQ(WriteGeoTagInfo(photo, false), 0);
  EXPECT_EQ(CopyExifGeoTagInfo(entry.path, photo->GetFilePathName()), 0);
  EXPECT_FALSE(FileExists(CommandFile()));
}

// A view that answers from a script and records what it was asked.
class ScriptedView : public COverwriteView {
 public:
  int AskOverwrite(const wchar_t* photoName, bool& noAsk) override {
    asked.push_back(photoName);
    presetNoAsk.push_back(noAsk);
    noAsk = tick;
    const int answer = answers.empty() ? IDNO : answers.front();
    if (!answers.empty()) answers.erase(answers.begin());
    return answer;
  }
  bool Confirm(const wchar_t* message) override {
    confirmations.push_back(message);
    return confirm;
  }

  std::vector<int> answers;
  bool tick = false;
  bool confirm = false;
  std::vector<CString> asked;
  std::vector<bool> presetNoAsk;
  std::vector<CString> confirmations;
};

TEST_F(GeotagTest, OverwriteQuestionDecidesWhetherTheOriginalIsTagged) {
  if (!HavePhotoReaders()) GTEST_SKIP() << "exiftool and exiv2 are needed (scripts/setup.sh)";
  ProgPathScope tools(CString::FromUtf8(NAVMISC_TOOLS_DIR));
  const struct {
    const char* name;
    bool noToAll, yesToAll, noAsk;
    int answer;  // 0: the view is not asked
    bool tick;   // the user ticks "do not ask again"
    bool originalTagged, noToAllAfter, yesToAllAfter, noAskAfter;
  } cases[] = {
      {"no to all", true, false, false, 0, false, false, true, false, false},
      {"yes to all", false, true, false, 0, false, true, false, true, false},
      {"do not ask", false, false, true, 0, false, true, false, false, true},
      {"yes", false, false, false, IDYES, false, true, false, false, false},
      {"no", false, false, false, IDNO, false, false, false, false, false},
      {"cancel", false, false, false, IDCANCEL, false, false, true, false, false},
      {"yes for all", false, false, false, IDYESTOALL, false, true, false, true, false},
      {"box ticked", false, false, false, IDNO, true, false, false, false, true},
      {"odd answer", false, false, false, 42, false, false, false, false, false},
  };
  BLOG_ITEM_INFO trip(GPS_APP_TRIP);
  int n = 0;
  for (const auto& c : cases) {
    SCOPED_TRACE(c.name);
    ScriptedView view;
    view.answers = {c.answer};
    view.tick = c.tick;
    SetOverwriteView(&view);
    g_bOverwriteNoAsk = c.noAsk;
    const CString original = root_ / FormatString(L"original%d.jpg", n);
    PHOTO_ITEM_INFO* photo = AddPhoto(trip, FormatString(L"copy%d.jpg", n++), original);
    bool noToAll = c.noToAll, yesToAll = c.yesToAll;
    EXPECT_EQ(CheckAndWriteGeoTagInfo(photo, noToAll, yesToAll), 1);
    EXPECT_TRUE(Tagged(photo->GetFilePathName())) << "the trip's copy is always tagged";
    EXPECT_EQ(Tagged(original), c.originalTagged);
    EXPECT_EQ(view.asked, c.answer ? std::vector<CString>{original} : std::vector<CString>{});
    EXPECT_EQ(noToAll, c.noToAllAfter);
    EXPECT_EQ(yesToAll, c.yesToAllAfter);
    EXPECT_EQ(g_bOverwriteNoAsk, c.noAskAfter);
  }
  SetOverwriteView(nullptr);
  COverwriteDlg nobody(L"x.jpg");
  EXPECT_EQ(nobody.DoModal(), IDNO) << "without anyone to ask, originals stay untouched";
}

TEST_F(GeotagTest, BatchAsksPhotoByPhotoAndTagsCopiesInOneRun) {
  if (!HavePhotoReaders()) GTEST_SKIP() << "exiftool and exiv2 are needed (scripts/setup.sh)";
  ProgPathScope tools(CString::FromUtf8(NAVMISC_TOOLS_DIR));
  BLOG_ITEM_INFO trip(GPS_APP_TRIP);
  std::vector<CString> originals;
  for (int i = 0; i < 4; ++i) {
    originals.push_back(root_ / FormatString(L"o%d.jpg", i));
    AddPhoto(trip, FormatString(L"c%d.jpg", i), originals.back());
  }
  ScriptedView view;
  view.answers = {IDNO, IDYES, IDYESTOALL};
  view.tick = false;
  SetOverwriteView(&view);
  bool noToAll = false, yesToAll = false, keepGoing = true;
  int counter = 0;
  EXPECT_EQ(CheckAndWriteGeoTagInfo(trip.photos, noToAll, yesToAll, &counter, &keepGoing), 1);
  EXPECT_EQ(counter, 4);
  EXPECT_EQ(view.asked.size(), 3u) << "yes for all answers for the last photo";
  EXPECT_TRUE(yesToAll);
  const bool expected[] = {false, true, true, true};
  for (int i = 0; i < 4; ++i) {
    EXPECT_EQ(Tagged(originals[i]), expected[i]) << i;
    EXPECT_TRUE(Tagged(static_cast<PHOTO_ITEM_INFO*>(trip.photos.GetAt(trip.photos.FindIndex(i)))
                           ->GetFilePathName()));
  }

  BLOG_ITEM_INFO other(GPS_APP_TRIP);
  PHOTO_ITEM_INFO* untouched = AddPhoto(other, L"u.jpg");
  keepGoing = false;
  EXPECT_EQ(CheckAndWriteGeoTagInfo(other.photos, noToAll, yesToAll, nullptr, &keepGoing), 0);
  EXPECT_FALSE(Tagged(untouched->GetFilePathName()));
}

TEST_F(GeotagTest, ProtectedOriginalsAreWrittenOnlyWithConsent) {
  const CString strings = root_ / L"strings.ini";
  WriteFileBytes(strings, "[STRINGS]\n9730=Write-protected:\n9731=Hidden:\n9732=Tag it anyway?\n");
  navmisc::SetResourceFile(strings);
  BLOG_ITEM_INFO trip(GPS_APP_TRIP);
  const struct {
    const wchar_t* name;
    int mode;
    bool consent;
    const char* question;
  } cases[] = {
      {L"ro.jpg", 0444, false, "Write-protected: %s\nTag it anyway?"},
      {L"ro2.jpg", 0444, true, "Write-protected: %s\nTag it anyway?"},
      {L".hidden.jpg", 0644, true, "Hidden: %s\nTag it anyway?"},
      {L"plain.jpg", 0644, false, nullptr},
  };
  for (const auto& c : cases) {
    const CString original = root_ / c.name;
    PHOTO_ITEM_INFO* photo = AddPhoto(trip, L"copy.jpg", original);
    ASSERT_EQ(::chmod(navmisc::NativePath(original).c_str(), c.mode), 0);
    ScriptedView view;
    view.confirm = c.consent;
    SetOverwriteView(&view);
    const bool written = c.consent || !c.question;
    EXPECT_EQ(WriteGeoTagInfoToOriginal(photo), written ? 1 : 0) << original.ToUtf8();
    EXPECT_EQ(Tagged(original), written);
    EXPECT_EQ(GetFileMode(original), c.mode) << "the protection is put back";
    if (c.question) {
      ASSERT_EQ(view.confirmations.size(), 1u);
      EXPECT_EQ(view.confirmations[0],
                FormatString(CString::FromUtf8(c.question), original.c_str()));
    } else {
      EXPECT_TRUE(view.confirmations.empty());
    }
  }
  navmisc::SetResourceFile(L"");
  ScriptedView agreeing;
  agreeing.confirm = true;
  SetOverwriteView(&agreeing);
  PHOTO_ITEM_INFO gone(&trip, nullptr, nullptr, nullptr);
  gone.originalName = root_ / L"deleted.jpg";
  EXPECT_EQ(WriteGeoTagInfoToOriginal(&gone), 0);
  EXPECT_EQ(WriteGeoTagInfoToOriginal(trip.photos), 4);
  EXPECT_EQ(agreeing.confirmations.size(), 3u);
}

TEST_F(GeotagTest, FileCreationTimeAsFileTimeAndLocalSeconds) {
  TzScope tz("CST-8");
  const CString path = root_ / L"new.jpg";
  WriteFileBytes(path, "x");
  long long seconds = 0;
  long nanos = 0;
  ASSERT_TRUE(GetFileBirthTime(path, seconds, nanos));
  FILETIME created;
  EXPECT_EQ(GetFileCreationTime(path, created), seconds)
      << "outside a daylight change, the same second";
  const unsigned long long ticks =
      static_cast<unsigned long long>(created.dwHighDateTime) << 32 | created.dwLowDateTime;
  EXPECT_EQ(ticks, static_cast<unsigned long long>(seconds + 11644473600LL) * 10000000ULL +
                       static_cast<unsigned long long>(nanos / 100));
  EXPECT_EQ(GetFileCreationTime(root_ / L"missing.jpg", created), 0);
}

}  // namespace
