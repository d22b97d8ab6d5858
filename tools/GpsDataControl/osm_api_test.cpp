// The readers of the service's answers, the cell request and the address rule.
#include <gtest/gtest.h>

#include "geolocate.h"
#include "http_client.h"
#include "navmisc/platform/datetime.h"
#include "osm_api.h"

namespace {

using namespace gpsdc;

TEST(OsmAnswers, TracesAreReadOrRefused) {
  std::vector<OsmTrace> traces;
  ASSERT_TRUE(ReadTraces(
      "<?xml version=\"1.0\"?><osm version=\"0.6\">"
      "<gpx_file id=\"836619\" name=\"a &amp; b.gpx\" lat=\"52.0194\" lon=\"8.51807\" user=\"Ann\""
      " visibility=\"identifiable\" pending=\"true\" timestamp=\"2010-10-09T09:24:19Z\">"
      "<description>PHP upload</description><tag>test</tag><tag>php</tag></gpx_file>"
      "<gpx_file id=\"2\" name=\"n\" visibility=\"private\" pending=\"false\" timestamp=\"x\"/>"
      "</osm>",
      traces));
  ASSERT_EQ(traces.size(), 2u);
  EXPECT_EQ(traces[0].id, "836619");
  EXPECT_EQ(traces[0].name, "a & b.gpx");
  EXPECT_EQ(traces[0].description, "PHP upload");
  EXPECT_EQ(traces[0].tags, (std::vector<std::string>{"test", "php"}));
  EXPECT_TRUE(traces[0].pending);
  EXPECT_TRUE(traces[0].hasPosition);
  EXPECT_DOUBLE_EQ(traces[0].lon, 8.51807);
  EXPECT_FALSE(traces[1].hasPosition);
  EXPECT_TRUE(traces[1].description.empty());

  for (const char* bad : {"", "<osm><gpx_file id=\"1\"></osm>", "<html>oops</html>",
                          "<osm><gpx_file id=\"../1\"/></osm>", "<osm><gpx_file/></osm>",
                          "<!DOCTYPE osm [<!ENTITY a \"aaaa\">]><osm>&a;</osm>"})
    EXPECT_FALSE(ReadTraces(bad, traces)) << bad;
  EXPECT_TRUE(ReadTraces("<osm/>", traces));
  EXPECT_TRUE(traces.empty());
}

TEST(OsmAnswers, GpxPointsAndTheirTimes) {
  std::vector<DC_NET_POINT_INFO> points;
  ASSERT_TRUE(ReadGpxPoints(
      "<gpx:gpx xmlns:gpx=\"http://www.topografix.com/GPX/1/0\"><gpx:trk><gpx:trkseg>"
      "<gpx:trkpt lat=\"1.5\" lon=\"-2.25\"><gpx:ele>10</gpx:ele><gpx:time>2024-05-01T08:30:15Z</gpx:time></gpx:trkpt>"
      "<gpx:trkpt lat=\"1.6\" lon=\"-2.3\"><gpx:time>2024-05-01T08:30:16.999Z</gpx:time></gpx:trkpt>"
      "<gpx:trkpt lat=\"1.7\" lon=\"-2.4\"><gpx:time>2024-05-01T07:30:17-01:00</gpx:time></gpx:trkpt>"
      "<gpx:trkpt lat=\"1.8\" lon=\"-2.5\"><gpx:time>yesterday</gpx:time></gpx:trkpt>"
      "</gpx:trkseg></gpx:trk><gpx:wpt lat=\"9\" lon=\"9\"><gpx:ele>99</gpx:ele></gpx:wpt></gpx:gpx>",
      points));
  ASSERT_EQ(points.size(), 4u);
  const long t0 = ConvertStdStringTimeT(L"2024-05-01T08:30:15");
  EXPECT_DOUBLE_EQ(points[0].dLatitude, 1.5);
  EXPECT_DOUBLE_EQ(points[0].dLongitude, -2.25);
  EXPECT_DOUBLE_EQ(points[0].dAltitude, 10);
  EXPECT_EQ(CovertOleDateTimeToTimeT(points[0].oleTime), t0);
  EXPECT_EQ(CovertOleDateTimeToTimeT(points[1].oleTime), t0 + 1);
  EXPECT_EQ(CovertOleDateTimeToTimeT(points[2].oleTime), t0 + 2);
  EXPECT_EQ(CovertOleDateTimeToTimeT(points[3].oleTime), -1) << "an unreadable time stays unset";

  const std::string three = "<gpx><trk><trkseg><trkpt lat=\"1\" lon=\"1\"/><trkpt lat=\"1\" lon=\"1\"/>"
                            "<trkpt lat=\"1\" lon=\"1\"/></trkseg></trk></gpx>";
  EXPECT_TRUE(ReadGpxPoints(three, points, 3));
  EXPECT_FALSE(ReadGpxPoints(three, points, 2)) << "more points than the reply can carry";
  EXPECT_FALSE(ReadGpxPoints("<kml/>", points));
  EXPECT_TRUE(IsGpxDocument(three));
  EXPECT_FALSE(IsGpxDocument(three.substr(0, three.size() - 1)));
}

TEST(CellRequest, DescriptionsBecomeTowers) {
  std::string json;
  ASSERT_TRUE(CellTowersJson({L"1,2,3,4"}, json));
  EXPECT_EQ(json, R"({"cellTowers":[{"cellId":4,"locationAreaCode":3,"mobileCountryCode":1,)"
                  R"("mobileNetworkCode":2,"radioType":"gsm"}],"considerIp":false})");
  for (const wchar_t* bad : {L"", L"1,2,3", L"1,2,3,4,5,gsm,7", L"1,2,3,-4", L"1,2,3,4,strong",
                             L"1,2,3,4,-60,5g", L"1,2,3,99999999999999999999"})
    EXPECT_FALSE(CellTowersJson({bad}, json)) << CString(bad).ToUtf8();
  EXPECT_FALSE(CellTowersJson({}, json));
  EXPECT_FALSE(CellTowersJson(std::vector<CString>(65, L"1,2,3,4"), json));

  CellPosition p;
  EXPECT_TRUE(ReadGeolocation(R"({"location":{"lat":-33.5,"lng":151.25},"accuracy":25})", p));
  EXPECT_DOUBLE_EQ(p.lat, -33.5);
  EXPECT_DOUBLE_EQ(p.lon, 151.25);
  EXPECT_DOUBLE_EQ(p.accuracy, 25);
  for (const char* bad : {"", "[]", R"({"location":{"lat":"1","lng":2}})", R"({"location":{"lat":91,"lng":2}})",
                          R"({"accuracy":5})", R"({"location":{"lat":1})"})
    EXPECT_FALSE(ReadGeolocation(bad, p)) << bad;
}

TEST(ServiceAddress, HttpsOrTheLoopback) {
  for (const char* good : {"https://api.openstreetmap.org", "https://192.0.2.1:8443/x",
                           "http://127.0.0.1:8080", "http://[::1]:80/", "http://LOCALHOST:1"})
    EXPECT_TRUE(IsUsableServiceUrl(good)) << good;
  for (const char* bad : {"http://api.openstreetmap.org", "http://127.0.0.1.example.org",
                          "http://10.0.0.1", "ftp://127.0.0.1", "file:///etc/passwd", "", "not a url",
                          "http://user@evil.example#@127.0.0.1"})
    EXPECT_FALSE(IsUsableServiceUrl(bad)) << bad;
}

}  // namespace
