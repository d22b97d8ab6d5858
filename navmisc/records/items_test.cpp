#include "navmisc/records/items.h"

#include <gtest/gtest.h>

#include <regex>

#include "navmisc/records/photo.h"

namespace {

WAYPOINT_ITEM_INFO FilledPoint() {
  WAYPOINT_ITEM_INFO p(nullptr);
  p.time = 1000;
  p.longitude = 121.5;
  p.latitude = 25.04;
  p.name = L"n";
  p.attr1 = 1;
  p.attr2 = 2;
  p.reserve = 3.5;
  p.smallAttr = 4;
  p.lastAttr = 77;
  p.type = 12;
  p.altitude = 10.25;
  p.speed = 3600;
  p.course = 90;
  p.extraA = 5;
  p.extraB = 6;
  p.flags[0] = 1;
  p.flags[3] = 9;
  p.workDistance = 1.5;
  p.workSpeed = 2.5;
  p.workHeartRate = 120;
  p.workCadence = 80;
  return p;
}

void ExpectSameStoredFields(const WAYPOINT_ITEM_INFO& a, const WAYPOINT_ITEM_INFO& b) {
  EXPECT_EQ(a.time, b.time);
  EXPECT_EQ(a.longitude, b.longitude);
  EXPECT_EQ(a.latitude, b.latitude);
  EXPECT_EQ(a.name, b.name);
  EXPECT_EQ(a.attr1, b.attr1);
  EXPECT_EQ(a.attr2, b.attr2);
  EXPECT_EQ(a.reserve, b.reserve);
  EXPECT_EQ(a.smallAttr, b.smallAttr);
  EXPECT_EQ(a.type, b.type);
  EXPECT_EQ(a.altitude, b.altitude);
  EXPECT_EQ(a.speed, b.speed);
  EXPECT_EQ(a.course, b.course);
  EXPECT_EQ(a.extraA, b.extraA);
  EXPECT_EQ(a.extraB, b.extraB);
  for (int i = 0; i < 4; ++i) EXPECT_EQ(a.flags[i], b.flags[i]);
}

void ExpectWorkingValuesZero(const WAYPOINT_ITEM_INFO& p) {
  EXPECT_EQ(p.workDistance, 0.0);
  EXPECT_EQ(p.workSpeed, 0.0);
  EXPECT_EQ(p.workHeartRate, 0);
  EXPECT_EQ(p.workCadence, 0);
}

TEST(WaypointRecord, DefaultsFromNullPointer) {
  WAYPOINT_ITEM_INFO p(nullptr);
  EXPECT_EQ(p.time, -1);
  EXPECT_EQ(p.course, -1);
  EXPECT_EQ(p.reserve, -2.0);
  EXPECT_EQ(p.latitude, 0.0);
  EXPECT_EQ(p.longitude, 0.0);
  EXPECT_EQ(p.altitude, 0.0);
  EXPECT_EQ(p.speed, 0);
  EXPECT_EQ(p.type, 0);
  EXPECT_EQ(p.extraA, 0);
  EXPECT_EQ(p.extraB, 0);
  EXPECT_TRUE(p.name.IsEmpty());
  BASE_ITEM_INFO base(nullptr);
  EXPECT_EQ(base.time, -1);
  EXPECT_EQ(base.reserve, 0.0);  // only a waypoint starts at -2.0
}

TEST(WaypointRecord, CopiesKeepStoredFieldsAndDropWorkingValues) {
  const WAYPOINT_ITEM_INFO src = FilledPoint();

  WAYPOINT_ITEM_INFO byPointer(&src);
  ExpectSameStoredFields(byPointer, src);
  ExpectWorkingValuesZero(byPointer);
  EXPECT_EQ(byPointer.lastAttr, 0u) << "the pointer constructor does not carry the last attribute";

  WAYPOINT_ITEM_INFO byCopy(src);
  ExpectSameStoredFields(byCopy, src);
  ExpectWorkingValuesZero(byCopy);
  EXPECT_EQ(byCopy.lastAttr, 77u);

  WAYPOINT_ITEM_INFO assigned = FilledPoint();
  assigned.workDistance = 9;
  assigned = src;
  ExpectSameStoredFields(assigned, src);
  ExpectWorkingValuesZero(assigned);
  EXPECT_EQ(assigned.lastAttr, 77u);

  BASE_ITEM_INFO baseSrc(nullptr);
  baseSrc.lastAttr = 5;
  baseSrc.name = L"cell";
  BASE_ITEM_INFO basePtr(&baseSrc);
  EXPECT_EQ(basePtr.name, L"cell");
  EXPECT_EQ(basePtr.lastAttr, 0u);
  BASE_ITEM_INFO baseCopy(baseSrc);
  EXPECT_EQ(baseCopy.lastAttr, 5u);
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
      {"flags", [](WAYPOINT_ITEM_INFO& p) { p.flags[0] = 0; }, true},
      {"attr1", [](WAYPOINT_ITEM_INFO& p) { p.attr1 = 42; }, true},
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
  EXPECT_EQ(hr.time, -1);
  EXPECT_EQ(hr.UsedCount(), 0);
  hr.values[0] = 60;
  hr.values[1] = 61;
  HEARTRATE_ITEM_INFO hrCopy(&hr);
  EXPECT_EQ(hrCopy.UsedCount(), 2);
  EXPECT_EQ(hrCopy.values[1], 61);

  CYCLING_CADENCE_RPM_ITEM_INFO cs(nullptr);
  for (uint8_t v : cs.values) EXPECT_EQ(v, 255);

  WHEEL_SPEED_ITEM_INFO ws(nullptr);
  EXPECT_EQ(ws.UsedCount(), 0);
  for (double v : ws.values) EXPECT_EQ(v, -1.0);
  ws.values[0] = 3.5;
  WHEEL_SPEED_ITEM_INFO wsCopy(&ws);
  EXPECT_EQ(wsCopy.UsedCount(), 1);
}

TEST(PhotoRecord, UrlDefaultsAndNewIds) {
  _PHOTO_ITEM_URL url;
  EXPECT_TRUE(url.dirty);
  EXPECT_TRUE(url.isPublic);
  EXPECT_TRUE(url.dirty2);
  EXPECT_FALSE(url.isPublic2);
  url.url[4] = L"x";
  url = url;  // self-assignment keeps the content
  EXPECT_EQ(url.url[4], L"x");

  PHOTO_ITEM_INFO photo(nullptr, L"a", L"b", L"c");
  const std::regex idForm("PH_[0-9A-F]{16}");
  EXPECT_TRUE(std::regex_match(photo.photoId.ToUtf8(), idForm)) << photo.photoId.ToUtf8();
  EXPECT_TRUE(photo.itemName.IsEmpty());
  PHOTO_ITEM_INFO other(nullptr, L"a", L"b", L"c");
  EXPECT_NE(photo.photoId, other.photoId);
  EXPECT_TRUE(std::regex_match(NewItemId(L"TK_").ToUtf8(), std::regex("TK_[0-9A-F]{16}")));
}

}  // namespace
