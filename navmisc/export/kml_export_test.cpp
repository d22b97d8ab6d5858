#include "navmisc/export/kml_export.h"

#include <cstdlib>

#include <gtest/gtest.h>
#include <unistd.h>

#include "navmisc/export/detail/test_support.h"
#include "navmisc/platform/datetime.h"
#include "navmisc/platform/user_locale.h"
#include "navmisc/records/trip.h"
#include "testutil.h"

namespace {

using namespace navmisc::exporttest;
using navmisc::testutil::DataRootScope;
using navmisc::testutil::ReadFileBytes;
using navmisc::testutil::TempDir;
using navmisc::testutil::WriteFileBytes;

const std::string kHead =
    "<?xml version=\"1.0\" encoding=\"UTF-8\"?><kml xmlns=\"http://earth.google.com/kml/2.1\">"
    "<Folder><name>@DATE@</name><open>1</open>";
const std::string kStyle =
    "<styleUrl>#default_copy0+nicon=http://maps.google.com/mapfiles/kml/pal4/icon15.png"
    "+hicon=http://maps.google.com/mapfiles/kml/pal4/icon7.png</styleUrl>";
const std::string kLineStyle =
    "<Style><LineStyle id=\"khLineStyle989\"><color>7f8000ff</color><width>4</width></LineStyle>"
    "</Style><LineString><tessellate>1</tessellate><coordinates>\r\n";
const std::string kTrackEnd = "</coordinates></LineString></Placemark>";
const std::string kMarkerIcon =
    "<Style><IconStyle><Icon><href>http://maps.google.com/mapfiles/kml/pal3/icon36.png</href>"
    "</Icon></IconStyle></Style>";
const std::string kPhotoIcon =
    "<Style><IconStyle><Icon><href>http://maps.google.com/mapfiles/kml/pal4/icon38.png</href>"
    "</Icon></IconStyle></Style>";

std::string PhotoPlacemark(const std::string& title, const std::string& time, const std::string& where,
                           const std::string& size, const std::string& src, const std::string& point) {
  return "\r\n<Placemark><name>" + title + "</name><description><![CDATA[#" + title + "<br><br><br>" +
         time + "<br>" + where + "<br><br><div class=\"pict\"><img class=\"pict\" " + size +
         " hspace=\"5\" src=\"" + src + "\" align=\"left\" border=\"1\"></img></div>]]></description>" +
         kStyle + kPhotoIcon + "<Point><coordinates>" + point + "</coordinates></Point></Placemark>";
}

// A trip folder with three photo files, and lists holding tracks, photos, markers, items that
// are skipped and null entries.
struct Fixture {
  TempDir root;
  DataRootScope scope{root.path()};
  BLOG_ITEM_INFO trip{GPS_APP_TRIP, L"T1", 0};
  CPtrList tracks, items;
  std::unique_ptr<TRACK_ITEM_INFO> t1, t2;
  std::vector<std::unique_ptr<PHOTO_ITEM_INFO>> owned;

  PHOTO_ITEM_INFO* Add(std::unique_ptr<PHOTO_ITEM_INFO> item) {
    owned.push_back(std::move(item));
    items.AddTail(owned.back().get());
    return owned.back().get();
  }
  PHOTO_ITEM_INFO* AddPhoto(const wchar_t* title, const wchar_t* file, double lat, double lon,
                            int32_t time, int width, int height) {
    PHOTO_ITEM_INFO* p = Add(MakeItem(PHOTO_ITEM_INFO::kTypePhoto, title, L"ignored", lat, lon, 7, time));
    p->trip = &trip;
    p->itemName = file;
    p->width = width;
    p->height = height;
    if (*file) WriteFileBytes(PathJoin(trip.GetResourcePath(), file), "picture " + CString(file).ToUtf8());
    return p;
  }

  Fixture() {
    MakeDir(trip.GetResourcePath());
    trip.timeZoneShift = 3600;
    t1 = MakeTrack(L"R&D ride", {{25.1, 121.5, 12, 1000000000}, {9, 9, 9, -1}, {-25.25, -0.0000004, 0, 0}});
    t2 = MakeTrack(L"\u00dcberlingen", {{1, 1, 1, -1}});  // no point with a time
    tracks.AddTail(t1.get());
    tracks.AddTail(static_cast<void*>(nullptr));
    tracks.AddTail(t2.get());

    AddPhoto(L"Opera & ''harbour'' o'clock", L"p1.jpg", -33.856, 151.215, 1000000000, 4000, 3000);
    items.AddTail(static_cast<void*>(nullptr));
    Add(MakeItem(PHOTO_ITEM_INFO::kTypeMarker, L"Caf\u00e9 <b>", L"say \"hi\"\r\nbye", 48.5, 2.25, 0, 0));
    PHOTO_ITEM_INFO* p2 = AddPhoto(L"Z\u00fcrich \u2615", L"p2.png", 47.37, 8.54, -1, 600, 800);
    p2->originalTime = 1000003600;  // camera clock, one hour ahead of UTC
    p2->originalName = L"C:\\Pictures\\IMG_2.png";
    p2->url.url[0] = L"https://photos.example.org/2.png";
    Add(MakeItem(PHOTO_ITEM_INFO::kTypeLandmark, L"Peak", L"", 46.0, 7.5, 0, 0));
    Add(MakeItem(3, L"unknown kind", L"", 1, 1, 0, 0));
    AddPhoto(L"no file", L"", 1, 1, 0, 0, 0);
    PHOTO_ITEM_INFO* p3 = AddPhoto(L"untimed", L"p3.jpg", 0, 0, -1, 0, 0);
    p3->originalTime = -1;
  }

  std::string File(const char* name) const {
    return CString(root.path()).ToUtf8().substr(1) + "/Resource/T1/" + name;
  }

  // The document with the picture sources given.
  std::string Expected(const std::string& src1, const std::string& src2, const std::string& src3) const {
    return kHead +
           "<Placemark><name>R&D ride</name><description>R&D ride</description>" + kStyle + kLineStyle +
           "121.500000,25.100000,0 -0.000000,-25.250000,0 " + kTrackEnd +
           "<Placemark><name>\xC3\x9C" "berlingen</name><description>\xC3\x9C" "berlingen</description>" +
           kStyle + kLineStyle + kTrackEnd +
           PhotoPlacemark("Opera &amp; &apos;harbour&apos; o'clock", "2001-09-09T01:46:40",
                          "N -33.856000, E 151.215000", "width=\"320\" height=\"240\"", src1,
                          "151.215000,-33.856000,0") +
           "\r\n<Placemark><name>Caf\xC3\xA9 &lt;b&gt;</name><description><![CDATA[Caf\xC3\xA9 &lt;b&gt;<br>"
           "say &quot;hi&quot;\r\nbye<br>]]></description>" + kStyle + kMarkerIcon +
           "<Point><coordinates>2.250000,48.500000,0</coordinates></Point></Placemark>" +
           PhotoPlacemark("Z\xC3\xBCrich \xE2\x98\x95", "2001-09-09T01:46:40", "N 47.370000, E 8.540000",
                          "width=\"240\" height=\"320\"", src2, "8.540000,47.370000,0") +
           "\r\n<Placemark><name>Peak</name><description><![CDATA[Peak<br><br>]]></description>" + kStyle +
           kMarkerIcon + "<Point><coordinates>7.500000,46.000000,0</coordinates></Point></Placemark>" +
           PhotoPlacemark("untimed", "", "N 0.000000, E 0.000000", "width=\"320\" height=\"240\"", src3,
                          "0.000000,0.000000,0") +
           "</Folder></kml>";
  }
};

TEST(ExportKml, WritesEveryPlacemarkByteForByteInEachPictureMode) {
  Fixture f;
  const std::string file1 = "file:///" + f.File("p1.jpg");
  const std::string file2 = "file:///" + f.File("p2.png");
  const std::string file3 = "file:///" + f.File("p3.jpg");
  // Only the second photo has another stored path and an address.
  const std::pair<int, std::string> cases[] = {
      {0, file2}, {1, "file:///C:/Pictures/IMG_2.png"}, {2, "https://photos.example.org/2.png"}};
  CPtrList none;
  ASSERT_EQ(ExportKml(f.root / L"empty.kml", none, none, 0), 1);
  EXPECT_EQ(MaskKmlDate(ReadFileBytes(f.root / L"empty.kml")), kHead + "</Folder></kml>");
  for (const auto& [mode, src2] : cases) {
    const long before = GetCurDateTime();
    ASSERT_EQ(ExportKml(f.root / L"out.kml", f.tracks, f.items, mode), 1);
    const long after = GetCurDateTime();
    std::string name;
    EXPECT_EQ(MaskKmlDate(ReadFileBytes(f.root / L"out.kml"), &name), f.Expected(file1, src2, file3))
        << "mode " << mode;
    // The Folder name is the local date and time of the call, as the user writes them.
    bool found = false;
    for (long t = before; t <= after && !found; ++t) found = name == UserDateTimeText(t).ToUtf8();
    EXPECT_TRUE(found) << name;
  }
}

TEST(ExportKmz, PacksNumberedPhotoCopiesThenTheDocument) {
  if (!HaveProgram("unzip")) GTEST_SKIP() << "unzip is not installed (scripts/setup.sh installs it)";
  Fixture f;
  TempDir scratch;
  const char* oldTmp = std::getenv("TMPDIR");
  const std::string saved = oldTmp ? oldTmp : "";
  setenv("TMPDIR", scratch.path().ToUtf8().c_str(), 1);
  const int result = ExportKmz(f.root / L"trip.kmz", f.tracks, f.items);
  CStringList left;
  const int leftCount = GetContent(scratch.path(), L"*.*", left);
  if (oldTmp) setenv("TMPDIR", saved.c_str(), 1);
  else unsetenv("TMPDIR");

  ASSERT_EQ(result, 1);
  EXPECT_EQ(leftCount, 0) << "the per-call scratch folder is removed";
  const std::string kmz = ShellQuote((f.root / L"trip.kmz").ToUtf8());
  EXPECT_EQ(RunCommand("unzip -Z1 " + kmz).out, "1.jpg\n2.png\n3.jpg\ntrip.kml\n");
  EXPECT_EQ(RunCommand("unzip -p " + kmz + " 2.png").out, "picture p2.png");
  EXPECT_EQ(MaskKmlDate(RunCommand("unzip -p " + kmz + " trip.kml").out), f.Expected("1.jpg", "2.png", "3.jpg"));
}

TEST(ExportKmz, PhotoThatCannotBeAddedIsNamed) {
  if (!HaveProgram("unzip")) GTEST_SKIP() << "unzip is not installed (scripts/setup.sh installs it)";
  Fixture f;
  // The second photo's file has gone; the first one still makes it into the archive.
  const PHOTO_ITEM_INFO* gone = f.owned[2].get();
  ASSERT_TRUE(DeleteFile(gone->GetFilePathName()));
  KmzExportFailure failure;
  ExportControl control;
  EXPECT_EQ(ExportKmz(f.root / L"trip.kmz", f.tracks, f.items, &failure, control), 0);
  EXPECT_EQ(control.error, "No such file or directory");
  EXPECT_EQ(failure.stage, KmzExportFailure::kAddFile);
  EXPECT_EQ(failure.photo, gone);
  EXPECT_EQ(PathFileName(failure.file), L"2.png");
  EXPECT_EQ(failure.message, L"No such file or directory");
  EXPECT_EQ(RunCommand("unzip -Z1 " + ShellQuote((f.root / L"trip.kmz").ToUtf8())).out, "1.jpg\n");
}

TEST(ExportKmz, PhotoLinkedOutsideTheDataRootIsNotPacked) {
  if (!HaveProgram("unzip")) GTEST_SKIP() << "unzip is not installed (scripts/setup.sh installs it)";
  Fixture f;
  TempDir outside;
  WriteFileBytes(outside / L"secret", "not for the archive");
  const PHOTO_ITEM_INFO* linked = f.owned[2].get();  // p2.png
  const std::string photo = navmisc::NativePath(linked->GetFilePathName());
  ASSERT_EQ(unlink(photo.c_str()), 0);
  ASSERT_EQ(symlink(navmisc::NativePath(outside / L"secret").c_str(), photo.c_str()), 0);
  KmzExportFailure failure;
  ExportControl control;
  EXPECT_EQ(ExportKmz(f.root / L"trip.kmz", f.tracks, f.items, &failure, control), 0);
  EXPECT_EQ(failure.stage, KmzExportFailure::kAddFile);
  EXPECT_EQ(failure.photo, linked);
  EXPECT_NE(failure.message.Find(L"leads outside the data root"), -1) << failure.message.ToUtf8();
  const std::string kmz = ShellQuote((f.root / L"trip.kmz").ToUtf8());
  EXPECT_EQ(RunCommand("unzip -p " + kmz).out.find("not for the archive"), std::string::npos);
}

}  // namespace
