#include "navmisc/activity/where_store.h"

#include <gtest/gtest.h>

#include "navmisc/platform/files.h"
#include "navmisc/records/trip.h"
#include "navmisc/records/user_profile.h"
#include "record_fixture.h"

namespace {

using navmisc::testutil::ProgPathScope;
using navmisc::testutil::ReadFileBytes;
using navmisc::testutil::TempDir;
using navmisc::testutil::WriteFileBytes;

class WhereStore : public navmisc::testutil::RecordTest {};

// A where-am-I trip that counts its own destruction.
struct CountedTrip : BLOG_ITEM_INFO {
  explicit CountedTrip(int& deaths) : BLOG_ITEM_INFO(GPS_APP_WHEREAMI, nullptr, 0), deaths_(deaths) {}
  ~CountedTrip() override { ++deaths_; }
  int& deaths_;
};

TEST_F(WhereStore, PositionScriptAndMapTemplate) {
  TempDir programs;
  ProgPathScope prog(programs.path());
  g_WhereMapInfo.tempStyle = 2;
  g_WhereMapInfo.tempMode = 1;
  MakeDir(programs / L"Templates/0002_0001/js");
  WriteFileBytes(programs / L"Templates/0002_0001/js/gmap.js", "// map page\n");

  WHEREIAM_DATA_NODE store;
  EXPECT_FALSE(store.AddWhereItem(WHERE_ITEM_TYPE(3), 1000000000, 121.5, 25.1, 12.0, 36000));  // no trip held
  store.AddWhereItem(WHERE_ITEM_DEFAULT, new BLOG_ITEM_INFO(GPS_APP_WHEREAMI, nullptr, 0));
  const CString folder = store.item->GetResourcePath();
  EXPECT_EQ(PathFileName(folder), L"MAP_HTML");
  WriteFileBytes(PathJoin(folder, L"js/gmap.js"), "old");  // replaced
  ASSERT_TRUE(store.AddWhereItem(WHERE_ITEM_TYPE(3), 1000000000, 121.5, 25.1, 12.0, 36000));
  EXPECT_EQ(store.itemType, 3);
  EXPECT_EQ(ReadFileBytes(PathJoin(folder, L"track_data.js")),
            "track0 = [\n[1000000000, 25.100000, 121.500000, 12.000, 36.0, 0, 0, 0]\n];");
  EXPECT_EQ(ReadFileBytes(PathJoin(folder, L"js/gmap.js")), "// map page\n");
  // Another template style has no script: the position is still written.
  g_WhereMapInfo.tempStyle = 3;
  ASSERT_TRUE(store.AddWhereItem(WHERE_ITEM_DEFAULT, -5, -0.5, -33.85, -2.0, 1949));
  EXPECT_EQ(ReadFileBytes(store.GetTrackDataPathName()), "track0 = [\n[-5, -33.850000, -0.500000, -2.000, 1.9, 0, 0, 0]\n];");
}

TEST_F(WhereStore, HoldsOneTripPersistsItAndCleansAroundIt) {
  int deaths = 0;
  {
    WHEREIAM_DATA_NODE store;
    ASSERT_TRUE(store.WriteInfo(true, 0, nullptr));  // nothing held: an empty file
    EXPECT_EQ(ReadFileBytes(WHEREIAM_DATA_NODE::GetStorePathName()), "");
    store.AddWhereItem(WHERE_ITEM_DEFAULT, new CountedTrip(deaths));
    auto* second = new CountedTrip(deaths);
    store.AddWhereItem(WHERE_ITEM_TYPE(7), second);
    EXPECT_EQ(deaths, 1);  // the first went when the second came
    store.AddWhereItem(WHERE_ITEM_TYPE(7), second);
    EXPECT_EQ(deaths, 1);  // the same trip again stays
    second->name = L"Here";
    ASSERT_TRUE(store.WriteInfo(true, 0, nullptr));
    EXPECT_EQ(ReadFileBytes(WHEREIAM_DATA_NODE::GetStorePathName()),
              "[SECTION]\nwhereiam_item_type=7\nwhereiam_item_info=" + second->tripId.ToUtf8() + "\n");
  }
  EXPECT_EQ(deaths, 2);

  const CString where = GetAppDataFolder(GPS_APP_WHEREAMI);
  MakeDir(PathJoin(where, L"stale"));
  WHEREIAM_DATA_NODE back;
  ASSERT_EQ(back.ReadInfo(0, nullptr), 1);
  ASSERT_NE(back.item, nullptr);
  EXPECT_EQ(std::tuple(back.itemType, back.item->name, back.item->appType), std::tuple(7, CString(L"Here"), GPS_APP_WHEREAMI));
  WHEREIAM_DATA_NODE copy;
  copy = back;
  ASSERT_NE(copy.item, nullptr);
  EXPECT_NE(copy.item, back.item);  // a record of its own
  EXPECT_EQ(std::tuple(copy.itemType, copy.item->tripId), std::tuple(7, back.item->tripId));

  // The held trip's folder stays (its id names no folder); everything else goes.
  EXPECT_EQ(back.RemoveAllUnusedResource(), 1);
  EXPECT_FALSE(FileExists(PathJoin(where, L"stale")));
  EXPECT_TRUE(FileExists(back.item->GetBlogItemProfilePathName()));

  // A trip that cannot be read: no item, still 1, and no clean-up.
  DeleteFile(back.item->GetBlogItemProfilePathName());
  MakeDir(PathJoin(where, L"stale"));
  WHEREIAM_DATA_NODE lost;
  EXPECT_EQ(lost.ReadInfo(0, nullptr), 1);
  EXPECT_EQ(lost.item, nullptr);
  EXPECT_EQ(lost.RemoveAllUnusedResource(), -1);
  EXPECT_TRUE(FileExists(PathJoin(where, L"MAP_HTML")));
  EXPECT_TRUE(FileExists(PathJoin(where, L"stale")));

  // Opening for a position keeps such a store as it is rather than give it a new trip.
  const std::string named = ReadFileBytes(WHEREIAM_DATA_NODE::GetStorePathName());
  WHEREIAM_DATA_NODE opened;
  EXPECT_EQ(navmisc::activity::OpenWhereStore(opened), navmisc::activity::WhereStoreOpen::kUnreadable);
  EXPECT_EQ(ReadFileBytes(WHEREIAM_DATA_NODE::GetStorePathName()), named);

  DeleteFile(WHEREIAM_DATA_NODE::GetStorePathName());
  EXPECT_EQ(lost.ReadInfo(0, nullptr), 0);

  // With no store yet, opening makes and saves the trip, of the kind asked for; a second opening
  // finds that same trip.
  WHEREIAM_DATA_NODE first;
  ASSERT_EQ(navmisc::activity::OpenWhereStore(first, WHERE_ITEM_TYPE(4)), navmisc::activity::WhereStoreOpen::kReady);
  ASSERT_NE(first.item, nullptr);
  EXPECT_EQ(std::tuple(first.itemType, first.item->name), std::tuple(4, CString(L"Where am I")));
  WHEREIAM_DATA_NODE again;
  ASSERT_EQ(navmisc::activity::OpenWhereStore(again), navmisc::activity::WhereStoreOpen::kReady);
  ASSERT_NE(again.item, nullptr);
  EXPECT_EQ(std::tuple(again.itemType, again.item->tripId), std::tuple(4, first.item->tripId));
}

}  // namespace
