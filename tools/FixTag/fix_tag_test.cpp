// The tagging tool as its callers meet it: the real FixTag.exe on real photos of every format,
// what it writes read back by exiftool and by the exiv2 command, and what it reads from photos
// that exiftool wrote.
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <cmath>
#include <cstdlib>
#include <string>
#include <vector>

#include "navmisc/geotag/fixtag_format.h"
#include "navmisc/platform/files.h"
#include "navmisc/platform/settings.h"
#include "photo_testutil.h"
#include "testutil.h"

namespace {

namespace fx = navmisc::fixtag;
using namespace navmisc::testutil;
using navmisc::kTinyJpeg;

class FixTagTest : public ::testing::Test {
 protected:
  void SetUp() override {
    if (!HavePhotoReaders()) GTEST_SKIP() << "exiftool and exiv2 are needed (scripts/setup.sh)";
  }

  // A photo of the given format in the test folder.
  CString Photo(const std::string& name, const std::string& bytes) {
    const CString path = dir_ / CString::FromUtf8(name);
    WriteFileBytes(path, bytes);
    return path;
  }

  CString CommandFile() const { return dir_ / L"1A2B_profile.ini"; }

  TempDir dir_;
};

CString Section(int n) {
  return FormatString(fx::kFileSection, n);
}

struct WriteCase {
  const char* extension;
  double latitude, longitude, altitude, speed;
  const wchar_t* comment;
};

TEST_F(FixTagTest, WrittenTagsReadBackByExiftoolAndExiv2) {
  const WriteCase cases[] = {
      {"jpg", 47.3769123, -8.5417, -12.5, 36.0, L"Grüße aus Zürich"},
      {"png", -33.8688, 151.2093, 5.25, 0.5, L"png plain"},
      {"tif", 0.0000001, -179.9999999, 8848.86, 120.125, L"tif \u2713 \u6771\u4eac"},
      {"webp", -89.9999999, 0.5, 0.0, 0.0, L"webp"},
  };
  std::vector<CString> photos;
  const unsigned long w = WR_BEGIN(CommandFile());
  WR_INT(w, fx::kPropSection, fx::kCount, 4);
  for (int i = 0; i < 4; ++i) {
    const WriteCase& c = cases[i];
    photos.push_back(Photo(std::string("photo.") + c.extension, SamplePhotos()[i].bytes));
    WR_STRING(w, Section(i), fx::kOldFile, photos.back());
    WR_FLOAT(w, Section(i), fx::kLatitude, c.latitude);
    WR_FLOAT(w, Section(i), fx::kLongitude, c.longitude);
    WR_FLOAT(w, Section(i), fx::kAltitude, c.altitude);
    WR_FLOAT(w, Section(i), fx::kSpeed, c.speed);
    WR_STRING(w, Section(i), fx::kComment, c.comment);
  }
  ASSERT_EQ(WR_END(w), 1);
  ASSERT_EQ(RunFixTag(CommandFile()), 0);

  for (int i = 0; i < 4; ++i) {
    const WriteCase& c = cases[i];
    SCOPED_TRACE(c.extension);
    const auto v = Exiftool(photos[i], {"GPS:GPSVersionID", "GPS:GPSLatitudeRef", "GPS:GPSLatitude",
                                        "GPS:GPSLongitudeRef", "GPS:GPSLongitude",
                                        "GPS:GPSAltitudeRef", "GPS:GPSAltitude", "GPS:GPSSpeedRef",
                                        "GPS:GPSSpeed", "UserComment", "XPComment"});
    EXPECT_EQ(v[0], "2 3 0 0");
    EXPECT_EQ(v[1], c.latitude < 0 ? "S" : "N");
    EXPECT_NEAR(std::atof(v[2].c_str()), std::fabs(c.latitude), 1e-7);
    EXPECT_EQ(v[3], c.longitude < 0 ? "W" : "E");
    EXPECT_NEAR(std::atof(v[4].c_str()), std::fabs(c.longitude), 1e-7);
    EXPECT_EQ(v[5], c.altitude < 0 ? "1" : "0");
    EXPECT_NEAR(std::atof(v[6].c_str()), std::fabs(c.altitude), 1e-3);
    EXPECT_EQ(v[7], "K");
    EXPECT_NEAR(std::atof(v[8].c_str()), c.speed, 1e-3);
    EXPECT_EQ(v[9], CString(c.comment).ToUtf8());
    EXPECT_EQ(v[10], CString(c.comment).ToUtf8());

    auto gps = Exiv2Gps(photos[i]);
    EXPECT_NEAR(Exiv2Degrees(gps["Exif.GPSInfo.GPSLatitude"]), std::fabs(c.latitude), 1e-7);
    EXPECT_NEAR(Exiv2Degrees(gps["Exif.GPSInfo.GPSLongitude"]), std::fabs(c.longitude), 1e-7);
    EXPECT_EQ(gps["Exif.GPSInfo.GPSLatitudeRef"], c.latitude < 0 ? "S" : "N");
    EXPECT_EQ(gps["Exif.GPSInfo.GPSLongitudeRef"], c.longitude < 0 ? "W" : "E");
    EXPECT_EQ(gps["Exif.GPSInfo.GPSSpeedRef"], "K");
    EXPECT_EQ(gps["Exif.GPSInfo.GPSVersionID"], "2 3 0 0");
  }
  // The JPEG also carries the comment in its comment segment.
  EXPECT_EQ(Exiftool(photos[0], {"File:Comment"})[0], "Grüße aus Zürich");
}

TEST_F(FixTagTest, ReadsWhatExiftoolWrote) {
  const char* extensions[] = {"jpg", "png", "tif", "webp"};
  std::vector<CString> photos;
  for (int i = 0; i < 4; ++i) {
    photos.push_back(Photo(std::string("cam.") + extensions[i], SamplePhotos()[i].bytes));
    ASSERT_TRUE(ExiftoolWrite(
        photos.back(),
        "-GPSLatitude=33.8568 -GPSLatitudeRef=S -GPSLongitude=151.2153 -GPSLongitudeRef=E "
        "-GPSAltitude=104.5 -GPSAltitudeRef#=1 -GPSSpeed=10 -GPSSpeedRef=N "
        "'-DateTimeOriginal=2012:05:17 08:30:00' '-ModifyDate=2013:01:02 03:04:05' "
        "'-UserComment=user \xc3\xbc' '-XPComment=xp \xe2\x9c\x93'"))
        << extensions[i];
  }
  ASSERT_TRUE(ExiftoolWrite(photos[0], "'-Comment=file comment'"));
  // A photo with only a modification date, and one with no metadata at all.
  photos.push_back(Photo("plain.jpg", Bytes(kTinyJpeg)));
  ASSERT_TRUE(ExiftoolWrite(photos.back(), "'-ModifyDate=2013:01:02 03:04:05'"));
  photos.push_back(Photo("bare.jpg", Bytes(kTinyJpeg)));

  const unsigned long w = WR_BEGIN(CommandFile());
  WR_INT(w, fx::kPropSection, fx::kCount, static_cast<int>(photos.size()));
  for (size_t i = 0; i < photos.size(); ++i) {
    WR_STRING(w, Section(static_cast<int>(i)), fx::kOldFile, photos[i]);
    WR_STRING(w, Section(static_cast<int>(i)), fx::kReadOnly, fx::kTrue);
  }
  ASSERT_EQ(WR_END(w), 1);
  ASSERT_EQ(RunFixTag(CommandFile()), 0);

  const unsigned long r = RD_BEGIN(CommandFile());
  for (int i = 0; i < 4; ++i) {
    SCOPED_TRACE(extensions[i]);
    const CString s = Section(i);
    EXPECT_NEAR(RD_FLOAT(r, s, fx::kLatitude, 0), -33.8568, 1e-9);
    EXPECT_NEAR(RD_FLOAT(r, s, fx::kLongitude, 0), 151.2153, 1e-9);
    EXPECT_NEAR(RD_FLOAT(r, s, fx::kAltitude, 0), -104.5, 1e-9);
    EXPECT_NEAR(RD_FLOAT(r, s, fx::kSpeed, 0), 18.52, 1e-9) << "10 knots";
    EXPECT_EQ(RD_STRING(r, s, fx::kUserComment), L"user ü");
    EXPECT_EQ(RD_STRING(r, s, fx::kXPComment), L"xp \u2713");
    EXPECT_EQ(RD_STRING(r, s, fx::kDateTimeOriginal), L"2012:05:17 08:30:00");
    EXPECT_EQ(RD_STRING(r, s, fx::kDateTime), L"2013:01:02 03:04:05");
  }
  EXPECT_EQ(RD_STRING(r, Section(0), fx::kComment), L"file comment");
  EXPECT_EQ(RD_STRING(r, Section(4), fx::kDateTime), L"2013:01:02 03:04:05");
  EXPECT_FALSE(RD_EXISTS(r, Section(4), fx::kDateTimeOriginal));
  for (const wchar_t* key : {fx::kLatitude, fx::kLongitude, fx::kAltitude, fx::kSpeed, fx::kComment,
                             fx::kDateTime, fx::kError}) {
    EXPECT_FALSE(RD_EXISTS(r, Section(5), key)) << "nothing to report: " << CString(key).ToUtf8();
  }
  RD_END(r);
}

TEST_F(FixTagTest, GpsStampIsTheCaptureTimeInUtc) {
  navmisc::testutil::TzScope tz("JST-9");  // the tool inherits the zone
  const CString withOffset = Photo("offset.jpg", Bytes(kTinyJpeg));
  ASSERT_TRUE(ExiftoolWrite(withOffset,
                            "'-DateTimeOriginal=2012:05:17 08:30:00' -OffsetTimeOriginal=+02:00"));
  const CString local = Photo("local.jpg", Bytes(kTinyJpeg));
  ASSERT_TRUE(ExiftoolWrite(local, "'-DateTimeOriginal=2012:05:17 00:30:00'"));
  const CString stale = Photo("stale.jpg", Bytes(kTinyJpeg));
  ASSERT_TRUE(ExiftoolWrite(stale, "-GPSTimeStamp=10:00:00 -GPSDateStamp=2001:01:01"));

  const CString photos[] = {withOffset, local, stale};
  const unsigned long w = WR_BEGIN(CommandFile());
  WR_INT(w, fx::kPropSection, fx::kCount, 3);
  for (int i = 0; i < 3; ++i) {
    WR_STRING(w, Section(i), fx::kOldFile, photos[i]);
    WR_FLOAT(w, Section(i), fx::kLatitude, 35.0);
    WR_FLOAT(w, Section(i), fx::kLongitude, 139.0);
  }
  ASSERT_EQ(WR_END(w), 1);
  ASSERT_EQ(RunFixTag(CommandFile()), 0);
  const struct {
    std::string date, time;
  } expected[] = {{"2012:05:17", "06:30:00"}, {"2012:05:16", "15:30:00"}, {"-", "-"}};
  for (int i = 0; i < 3; ++i) {
    const auto v = Exiftool(photos[i], {"GPS:GPSDateStamp", "GPS:GPSTimeStamp"});
    EXPECT_EQ(v[0], expected[i].date) << i;
    EXPECT_EQ(v[1], expected[i].time) << i;
  }
}

TEST_F(FixTagTest, CopyRequestsReplaceTheTargetsGpsTags) {
  const CString from = Photo("from.jpg", Bytes(kTinyJpeg));
  ASSERT_TRUE(ExiftoolWrite(from,
                            "-GPSLatitude=12.25 -GPSLatitudeRef=N -GPSLongitude=3.5 "
                            "-GPSLongitudeRef=W -GPSImgDirection=270"));
  const CString to = Photo("to.png", Bytes(kTinyPng));
  ASSERT_TRUE(
      ExiftoolWrite(to, "-GPSLatitude=1 -GPSLatitudeRef=S -GPSAltitude=99 -UserComment=kept"));
  const CString untagged = Photo("untagged.jpg", Bytes(kTinyJpeg));
  const CString target2 = Photo("target2.jpg", Bytes(kTinyJpeg));
  const std::string target2Before = ReadFileBytes(target2);

  const unsigned long w = WR_BEGIN(CommandFile());
  WR_INT(w, fx::kPropSection, fx::kCount, 2);
  WR_STRING(w, Section(0), fx::kOldFile, from);
  WR_STRING(w, Section(0), fx::kNewFile, to);
  WR_STRING(w, Section(1), fx::kOldFile, untagged);
  WR_STRING(w, Section(1), fx::kNewFile, target2);
  ASSERT_EQ(WR_END(w), 1);
  EXPECT_EQ(RunFixTag(CommandFile()), 1) << "the second copy has nothing to copy";

  const auto v = Exiftool(
      to, {"GPS:GPSLatitude", "GPS:GPSLatitudeRef", "GPS:GPSLongitude", "GPS:GPSLongitudeRef",
           "GPS:GPSImgDirection", "GPS:GPSAltitude", "UserComment"});
  EXPECT_EQ(v, (std::vector<std::string>{"12.25", "N", "3.5", "W", "270", "-", "kept"}));
  EXPECT_EQ(ReadFileBytes(target2), target2Before);
  const unsigned long r = RD_BEGIN(CommandFile());
  EXPECT_EQ(RD_STRING(r, Section(1), fx::kError), L"the source photo has no GPS tags");
  EXPECT_FALSE(RD_EXISTS(r, Section(0), fx::kError));
  RD_END(r);
}

TEST_F(FixTagTest, BadPhotosGiveClearErrorsAndStayUnchanged) {
  const std::string jpeg = Bytes(kTinyJpeg);
  const struct {
    const char* name;
    std::string bytes;
    int mode;
    const wchar_t* error;
  } cases[] = {
      {"truncated.jpg", jpeg.substr(0, 40), 0644, L"Failed to read image data"},
      {"text.jpg", "not a photo at all\n", 0644, L"not a photo of a known format"},
      {"readonly.jpg", jpeg, 0444, L"the file is read-only"},
      {"empty.jpg", "", 0644, L"not a photo of a known format"},
  };
  const unsigned long w = WR_BEGIN(CommandFile());
  WR_INT(w, fx::kPropSection, fx::kCount, 7);
  int n = 0;
  std::vector<CString> paths;
  for (const auto& c : cases) {
    paths.push_back(Photo(c.name, c.bytes));
    ASSERT_EQ(::chmod(navmisc::NativePath(paths.back()).c_str(), c.mode), 0);
    WR_STRING(w, Section(n), fx::kOldFile, paths.back());
    WR_FLOAT(w, Section(n), fx::kLatitude, 1.0);
    WR_FLOAT(w, Section(n++), fx::kLongitude, 2.0);
  }
  const CString good = Photo("good.jpg", jpeg);
  const struct {
    CString path;
    double latitude;
    const wchar_t* error;
  } more[] = {
      {dir_ / L"missing.jpg", 1.0, L"cannot open: No such file or directory"},
      {dir_.path(), 1.0, L"not a regular file"},
      {good, 300.0, L"latitude or longitude out of range"},
  };
  for (const auto& m : more) {
    WR_STRING(w, Section(n), fx::kOldFile, m.path);
    WR_FLOAT(w, Section(n), fx::kLatitude, m.latitude);
    WR_FLOAT(w, Section(n++), fx::kLongitude, 2.0);
  }
  ASSERT_EQ(WR_END(w), 1);
  EXPECT_EQ(RunFixTag(CommandFile()), 1);

  const unsigned long r = RD_BEGIN(CommandFile());
  for (size_t i = 0; i < std::size(cases); ++i) {
    EXPECT_EQ(RD_STRING(r, Section(static_cast<int>(i)), fx::kError), cases[i].error)
        << cases[i].name;
    EXPECT_EQ(ReadFileBytes(paths[i]), cases[i].bytes) << cases[i].name;
  }
  for (size_t i = 0; i < std::size(more); ++i) {
    EXPECT_EQ(RD_STRING(r, Section(static_cast<int>(std::size(cases) + i)), fx::kError),
              more[i].error);
  }
  RD_END(r);
  EXPECT_EQ(ReadFileBytes(good), jpeg);
}

TEST_F(FixTagTest, UnusualMetadataIsReadExactlyOrLeftOut) {
  const CString odd = Photo("odd.jpg", Bytes(kTinyJpeg));
  ASSERT_TRUE(Exiv2Modify(
      odd,
      {"set Exif.GPSInfo.GPSLatitude 300/1 0/1 0/1", "set Exif.GPSInfo.GPSLongitude 10/1 0/1 0/1",
       "set Exif.GPSInfo.GPSAltitude 4000000000/1", "set Exif.GPSInfo.GPSSpeed 5/0",
       "set Exif.Photo.DateTimeOriginal 0000:00:00 00:00:00",
       "set Exif.Image.DateTime 2012:02:30 10:00:00"}));
  // Degrees as one fraction with seven decimals, and minutes with a fraction of their own.
  const CString precise = Photo("precise.jpg", Bytes(kTinyJpeg));
  ASSERT_TRUE(Exiv2Modify(precise, {"set Exif.GPSInfo.GPSLatitude 473769123/10000000 0/1 0/1",
                                    "set Exif.GPSInfo.GPSLongitude 8/1 325021/10000 0/1",
                                    "set Exif.GPSInfo.GPSLongitudeRef W"}));
  const CString longComment = Photo("long.jpg", Bytes(kTinyJpeg));
  const std::wstring text(10000, L'\u00e9');
  {
    const unsigned long w = WR_BEGIN(CommandFile());
    WR_INT(w, fx::kPropSection, fx::kCount, 1);
    WR_STRING(w, Section(0), fx::kOldFile, longComment);
    WR_FLOAT(w, Section(0), fx::kLatitude, 1.0);
    WR_FLOAT(w, Section(0), fx::kLongitude, 2.0);
    WR_STRING(w, Section(0), fx::kComment, CString(text));
    ASSERT_EQ(WR_END(w), 1);
    ASSERT_EQ(RunFixTag(CommandFile()), 0);
  }
  EXPECT_EQ(CString::FromUtf8(Exiftool(longComment, {"XPComment"})[0]).str(), text);

  // A count far beyond the sections that exist costs nothing: only what the file holds is read.
  const unsigned long w = WR_BEGIN(CommandFile());
  WR_INT(w, fx::kPropSection, fx::kCount, 2147483647);
  WR_STRING(w, Section(0), fx::kOldFile, odd);
  WR_STRING(w, Section(0), fx::kReadOnly, fx::kTrue);
  WR_STRING(w, Section(1), fx::kOldFile, precise);
  WR_STRING(w, Section(1), fx::kReadOnly, fx::kTrue);
  WR_STRING(w, Section(2147483646), fx::kOldFile, longComment);
  WR_STRING(w, Section(2147483646), fx::kReadOnly, fx::kTrue);
  ASSERT_EQ(WR_END(w), 1);
  ASSERT_EQ(RunFixTag(CommandFile()), 0);
  const unsigned long r = RD_BEGIN(CommandFile());
  for (const wchar_t* key : {fx::kLatitude, fx::kLongitude, fx::kAltitude, fx::kSpeed,
                             fx::kDateTimeOriginal, fx::kDateTime}) {
    EXPECT_FALSE(RD_EXISTS(r, Section(0), key)) << CString(key).ToUtf8();
  }
  EXPECT_NEAR(RD_FLOAT(r, Section(1), fx::kLatitude, 0), 47.3769123, 1e-12);
  EXPECT_NEAR(RD_FLOAT(r, Section(1), fx::kLongitude, 0), -(8 + 32.5021 / 60), 1e-12);
  EXPECT_EQ(RD_STRING(r, Section(2147483646), fx::kXPComment).str(), text);
  RD_END(r);
}

TEST_F(FixTagTest, UsageAndUnreadableCommandFiles) {
  const std::string tool = ShellQuote(FixTagPath().ToUtf8());
  EXPECT_EQ(RunCommand(tool + " 2>/dev/null").status, 2);
  EXPECT_EQ(RunCommand(tool + " -ZE 2>/dev/null").status, 2);
  EXPECT_EQ(RunCommand(tool + " -XX file 2>/dev/null").status, 2);
  EXPECT_EQ(RunFixTag(dir_ / L"missing.ini"), 2);
  const CommandResult help = RunCommand(tool + " --help");
  EXPECT_EQ(help.status, 0);
  EXPECT_NE(help.out.find("-ZE COMMANDFILE"), std::string::npos);
}

}  // namespace
