#include "navmisc/export/gpx_export.h"

#include <gtest/gtest.h>

#include "navmisc/export/detail/test_support.h"
#include "testutil.h"

namespace {

using navmisc::exporttest::MakeItem;
using navmisc::exporttest::MakeTrack;
using navmisc::testutil::ReadFileBytes;
using navmisc::testutil::TempDir;

const std::string kPrologue =
    "<?xml version=\"1.0\" encoding=\"UTF-8\" standalone=\"yes\" ?>\r\n"
    "<gpx creator=\"Corvane https://navmisc.example.org/1.1\" version=\"1.0\" "
    "xmlns=\"http://www.topografix.com/GPX/1/0\" "
    "xmlns:xsi=\"http://www.w3.org/2001/XMLSchema-instance\" "
    "xsi:schemaLocation=\"http://www.topografix.com/GPX/1/0 http://www.topografix.com/GPX/1/0/gpx.xsd\">";

// Records of every kind the document distinguishes, in lists with null entries; the tracks list
// is filled first to show that waypoints still come first.
struct Fixture {
  CPtrList tracks, items;
  std::unique_ptr<TRACK_ITEM_INFO> t1, t2;
  std::unique_ptr<PHOTO_ITEM_INFO> a, b, c;
  Fixture() {
    t1 = MakeTrack(L"Track 1", {{25.1, 121.5, 12, 1000000000, 36000},
                                {9, 9, 9, -1, 0},
                                {25.1005, 121.5005, 13.25, 1000000010, 1800},
                                {-45.5, -170.25, -1.5, 1000086399, 3599},
                                {1, 2, 0, 0, 1}});
    t2 = MakeTrack(L"\u00dcber", {{1, 1, 1, -1}, {2, 2, 2, -1}});
    tracks.AddTail(t1.get());
    tracks.AddTail(static_cast<void*>(nullptr));
    tracks.AddTail(t2.get());
    a = MakeItem(0, L"a", L"b\r\nsecond line", 25.1, 121.5, 12, 1000000000);
    b = MakeItem(1, L"Caf\u00e9 \u2615", L"", -33.856, 151.215, -3.5, 0);
    c = MakeItem(0, L"x&<y>", L"l1\nl2\r\nl3", 0.0000004, -0.0000006, 0, -1);
    items.AddTail(a.get());
    items.AddTail(static_cast<void*>(nullptr));
    items.AddTail(b.get());
    items.AddTail(c.get());
  }
};

const std::string kFullDocument =
    kPrologue +
    "\r\n<wpt lat=\"25.100000\" lon=\"121.500000\">\r\n<ele>12.000000</ele>\r\n"
    "<time>2001-09-09T01:46:40Z</time>\r\n<name>a</name>\r\n<desc>b&#13;second line</desc>\r\n"
    "<sym>Waypoint</sym>\r\n</wpt>"
    "\r\n<wpt lat=\"-33.856000\" lon=\"151.215000\">\r\n<ele>-3.500000</ele>\r\n"
    "<name>Caf\xC3\xA9 \xE2\x98\x95</name>\r\n<desc></desc>\r\n<sym>Waypoint</sym>\r\n</wpt>"
    "\r\n<wpt lat=\"0.000000\" lon=\"-0.000001\">\r\n<ele>0.000000</ele>\r\n"
    "<name>x&<y></name>\r\n<desc>l1\nl2&#13;l3</desc>\r\n<sym>Waypoint</sym>\r\n</wpt>"
    "\r\n<trk>\r\n<name>Track 1</name>\r\n<desc>Color:004000ff</desc>\r\n<trkseg>"
    "\r\n<trkpt lat=\"25.100000\" lon=\"121.500000\">\r\n<ele>12.000000</ele>\r\n"
    "<time>2001-09-09T01:46:40Z</time>\r\n<speed>10.00</speed>\r\n</trkpt>"
    "\r\n<trkpt lat=\"25.100500\" lon=\"121.500500\">\r\n<ele>13.250000</ele>\r\n"
    "<time>2001-09-09T01:46:50Z</time>\r\n<speed>0.50</speed>\r\n</trkpt>"
    "\r\n<trkpt lat=\"-45.500000\" lon=\"-170.250000\">\r\n<ele>-1.500000</ele>\r\n"
    "<time>2001-09-10T01:46:39Z</time>\r\n<speed>1.00</speed>\r\n</trkpt>"
    "\r\n<trkpt lat=\"1.000000\" lon=\"2.000000\">\r\n<ele>0.000000</ele>\r\n"
    "<time>1970-01-01T00:00:00Z</time>\r\n<speed>0.00</speed>\r\n</trkpt>"
    "\r\n</trkseg>\r\n</trk>"
    "\r\n<trk>\r\n<name>\xC3\x9C" "ber</name>\r\n<desc>Color:004000ff</desc>\r\n<trkseg>\r\n</trkseg>\r\n</trk>"
    "\r\n</gpx>";

TEST(ExportGpx, WritesEveryElementByteForByte) {
  TempDir dir;
  Fixture f;
  CPtrList none;
  ASSERT_EQ(ExportGpx(dir / L"e.gpx", none, none), 1);
  EXPECT_EQ(ReadFileBytes(dir / L"e.gpx"), kPrologue + "\r\n</gpx>");
  ASSERT_EQ(ExportGpx(dir / L"out.gpx", f.tracks, f.items), 1);
  EXPECT_EQ(ReadFileBytes(dir / L"out.gpx"), kFullDocument);
}

TEST(ExportGpx, LongTitlesAreCutAtWholeCharacters) {
  // The text buffers hold 2047 bytes: a two-byte character that would end at byte 2048 is left
  // out whole; one that ends at byte 2047 stays.
  TempDir dir;
  for (size_t prefix : {2046u, 2045u}) {
    auto item = MakeItem(0, (std::wstring(prefix, L'a') + L"\u00e9").c_str(), L"", 0, 0, 0, 0);
    CPtrList tracks, items;
    items.AddTail(item.get());
    ASSERT_EQ(ExportGpx(dir / L"long.gpx", tracks, items), 1);
    const std::string name = std::string(prefix, 'a') + (prefix == 2045 ? "\xC3\xA9" : "");
    const std::string doc = ReadFileBytes(dir / L"long.gpx");
    EXPECT_NE(doc.find("<name>" + name + "</name>"), std::string::npos) << prefix;
  }
}

}  // namespace
