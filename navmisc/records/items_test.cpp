#include "navmisc/records/items.h"

#include <gtest/gtest.h>

#include <regex>
#include <string>
#include <tuple>
#include <vector>

#include "navmisc/records/photo.h"

namespace {

// A point with every field away from its default, working values included.
WAYPOINT_ITEM_INFO FilledPoint() {
  WAYPOINT_ITEM_INFO p(nullptr);
  std::tie(p.time, p.longitude, p.latitude, p.name, p.attr1, p.attr2, p.reserve, p.smallAttr) =
      std::tuple(1000, 121.5, 25.04, L"n", 1, 2, 3.5, 4);
  std::tie(p.lastAttr, p.type, p.altitude, p.speed, p.course, p.extraA, p.extraB) =
      std::tuple(77, 12, 10.25, 3600, 90, 5, 6);
  p.flags[0] = 1;
  p.flags[3] = 9;
  std::tie(p.workDistance, p.workSpeed, p.workHeartRate, p.workCadence) =
      std::tuple(1.5, 2.5, 120, 80);
  return p;
}

// Every field a copy carries (all but the last attribute and the working values), comparable
// and printable in one piece.
auto Stored(const WAYPOINT_ITEM_INFO& p) {
  return std::tuple(p.time, p.longitude, p.latitude, p.name.str(), p.attr1, p.attr2, p.reserve,
                    int{p.smallAttr}, p.type, p.altitude, p.speed, p.course, p.extraA, p.extraB,
                    std::vector<int>(std::begin(p.flags), std::end(p.flags)));
}
auto Working(const WAYPOINT_ITEM_INFO& p) {
  return std::tuple(p.workDistance, p.workSpeed, p.workHeartRate, p.workCadence);
}

TEST(WaypointRecord, DefaultsAndCopyRules) {
  const WAYPOINT_ITEM_INFO fresh(nullptr);
  EXPECT_EQ(Stored(fresh), std::tuple(-1, 0.0, 0.0, std::wstring(), 0, 0, -2.0, 0, 0, 0.0, 0, -1,
                                      0, 0, std::vector<int>(4, 0)));
  EXPECT_EQ(Working(fresh), std::tuple(0.0, 0.0, 0, 0));
  EXPECT_EQ(fresh.lastAttr, 0u);
  EXPECT_EQ(BASE_ITEM_INFO(nullptr).reserve, 0.0) << "only a waypoint starts at -2.0";

  // The pointer constructor leaves the last attribute out; every copy drops the working values,
  // assignment included, whatever the target held before.
  const WAYPOINT_ITEM_INFO src = FilledPoint();
  WAYPOINT_ITEM_INFO byPointer(&src), byCopy(src), assigned = FilledPoint();
  assigned = src;
  const std::tuple<const char*, const WAYPOINT_ITEM_INFO*, uint32_t> copies[] = {
      {"pointer", &byPointer, 0u}, {"copy", &byCopy, 77u}, {"assignment", &assigned, 77u}};
  for (const auto& [how, copy, lastAttr] : copies) {
    EXPECT_EQ(Stored(*copy), Stored(src)) << how;
    EXPECT_EQ(Working(*copy), Working(fresh)) << how;
    EXPECT_EQ(copy->lastAttr, lastAttr) << how;
  }

  BASE_ITEM_INFO baseSrc(nullptr);
  baseSrc.lastAttr = 5;
  baseSrc.name = L"cell";
  BASE_ITEM_INFO basePtr(&baseSrc), baseCopy(baseSrc), baseAssigned;
  baseAssigned = baseSrc;
  EXPECT_EQ(basePtr.name, L"cell");
  EXPECT_EQ(basePtr.lastAttr, 0u);
  EXPECT_EQ(baseCopy.lastAttr, 5u);
  EXPECT_EQ(baseAssigned.lastAttr, 5u);
}

TEST(WaypointRecord, EqualityComparesTheTrackFieldsOnly) {
  const WAYPOINT_ITEM_INFO a = FilledPoint();
  struct Case {
    const char* what;
    void (*change)(WAYPOINT_ITEM_INFO&);
    bool equal;
  };
  const Case cases[] = {
      {"name", [](WAYPOINT_ITEM_INFO& p) { p.name = L"other"; }, true},
      {"extraB", [](WAYPOINT_ITEM_INFO& p) { p.extraB = 99; }, true},
      {"type", [](WAYPOINT_ITEM_INFO& p) { p.type = -1; }, false},
      {"time", [](WAYPOINT_ITEM_INFO& p) { p.time += 1; }, false},
      {"latitude", [](WAYPOINT_ITEM_INFO& p) { p.latitude += 1e-12; }, false},
      {"longitude", [](WAYPOINT_ITEM_INFO& p) { p.longitude -= 1e-12; }, false},
      {"altitude", [](WAYPOINT_ITEM_INFO& p) { p.altitude = 0; }, false},
      {"speed", [](WAYPOINT_ITEM_INFO& p) { p.speed = 1; }, false},
      {"extraA", [](WAYPOINT_ITEM_INFO& p) { p.extraA = 0; }, false},
      {"course", [](WAYPOINT_ITEM_INFO& p) { p.course = -1; }, false},
  };
  for (const Case& c : cases) {
    WAYPOINT_ITEM_INFO b(a);
    c.change(b);
    EXPECT_EQ(a == b, c.equal) << c.what;
  }
}

TEST(SampleRecords, DefaultsMarkAnEmptyRecordAndCopiesAreWhole) {
  HEARTRATE_ITEM_INFO hr(nullptr);
  EXPECT_EQ(std::tuple(hr.time, hr.UsedCount()), std::tuple(-1, 0));
  hr.values[0] = 60;
  hr.values[1] = 61;
  HEARTRATE_ITEM_INFO hrCopy(&hr);
  EXPECT_EQ(std::tuple(hrCopy.UsedCount(), int{hrCopy.values[1]}), std::tuple(2, 61));
  const CYCLING_CADENCE_RPM_ITEM_INFO cs(nullptr);
  for (uint8_t v : cs.values) EXPECT_EQ(v, 255);
  WHEEL_SPEED_ITEM_INFO ws(nullptr);
  for (double v : ws.values) EXPECT_EQ(v, -1.0);
  ws.values[0] = 3.5;
  EXPECT_EQ(WHEEL_SPEED_ITEM_INFO(&ws).UsedCount(), 1);
}

TEST(PhotoRecord, UrlDefaultsAndNewIds) {
  _PHOTO_ITEM_URL url;
  EXPECT_EQ(std::tuple(url.dirty, url.isPublic, url.dirty2, url.isPublic2),
            std::tuple(true, true, true, false));
  url.url[4] = L"x";
  url = url;  // self-assignment keeps the content
  EXPECT_EQ(url.url[4], L"x");

  PHOTO_ITEM_INFO photo(nullptr, L"a", L"b", L"c");
  const std::regex idForm("PH_[0-9A-F]{16}");
  EXPECT_TRUE(std::regex_match(photo.photoId.ToUtf8(), idForm)) << photo.photoId.ToUtf8();
  PHOTO_ITEM_INFO other(nullptr, L"a", L"b", L"c");
  EXPECT_NE(photo.photoId, other.photoId);
  EXPECT_TRUE(std::regex_match(NewItemId(L"TK_").ToUtf8(), std::regex("TK_[0-9A-F]{16}")));
}

}  // namespace
