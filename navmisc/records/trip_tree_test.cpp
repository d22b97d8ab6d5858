#include "navmisc/records/trip_tree.h"

#include <gtest/gtest.h>
#include <unistd.h>

#include <string>
#include <utility>

#include "navmisc/platform/files.h"
#include "record_fixture.h"

using navmisc::testutil::ReadFileBytes;
using navmisc::testutil::TempDir;
using navmisc::testutil::WriteFileBytes;

namespace {

class TripTree : public navmisc::testutil::RecordTest {
 protected:
  CString Resource() const { return root_ / L"Resource"; }
  // A saved trip in the tree's folder.
  static BLOG_ITEM_INFO* NewTrip(const wchar_t* name) {
    auto* t = new BLOG_ITEM_INFO(GPS_APP_TRIP, nullptr, 0);
    t->name = name;
    t->WriteInfo(1, nullptr, nullptr);
    return t;
  }
  // A named child node, owned by `parent`.
  static BLOG_TREE_NODE* AddNode(BLOG_TREE_NODE& parent, const wchar_t* name) {
    auto* node = new BLOG_TREE_NODE(nullptr);
    node->name = name;
    parent.children.AddTail(node);
    return node;
  }
  // Saves the tree "All" {top} / "2024" / "Summer" {deep, server id "srv-9"}; gives the ids of
  // the two trips.
  std::pair<CString, CString> SaveNestedTree() {
    BLOG_TREE_NODE root(nullptr);
    root.name = L"All";
    auto* top = NewTrip(L"top");
    root.trips.AddTail(top);
    auto* deep = NewTrip(L"deep");
    deep->serverId = L"srv-9";
    deep->WriteInfo(1, nullptr, nullptr);
    AddNode(*AddNode(root, L"2024"), L"Summer")->trips.AddTail(deep);
    root.WriteInfo(false, 0, nullptr);
    return {top->tripId, deep->tripId};
  }
};

TEST_F(TripTree, NestedTreeRoundTripsAndSearches) {
  SaveNestedTree();
  const std::string text = ReadFileBytes(Resource() + L"/RESOURCE_INFO.INI");
  EXPECT_NE(text.find("[SECTION_0_0]"), std::string::npos);

  BLOG_TREE_NODE back(nullptr);
  ASSERT_EQ(back.ReadInfo(0, nullptr), 1);
  EXPECT_EQ(back.name, L"All");
  ASSERT_EQ(back.children.GetCount(), 1);
  auto* c = static_cast<BLOG_TREE_NODE*>(back.children.GetHead());
  ASSERT_EQ(c->children.GetCount(), 1);
  auto* g = static_cast<BLOG_TREE_NODE*>(c->children.GetHead());
  ASSERT_EQ(g->trips.GetCount(), 1);
  auto* found = back.FindBlogItemFmServerID(L"srv-9");
  ASSERT_NE(found, nullptr);
  EXPECT_EQ(found->name, L"deep");
  EXPECT_EQ(back.FindBlogItemFmServerID(L"SRV-9"), nullptr) << "server ids match exactly";
  EXPECT_EQ(back._FindNodeFmBlogItem(found), g);
  BLOG_ITEM_INFO stranger(GPS_APP_TRIP, L"X", 0);
  EXPECT_EQ(back._FindNodeFmBlogItem(&stranger), nullptr);
}

TEST_F(TripTree, InvalidOrMissingTreesReadAsNothing) {
  BLOG_TREE_NODE none(nullptr);
  EXPECT_EQ(none.ReadInfo(0, nullptr), 0);
  MakeDir(Resource());
  WriteFileBytes(Resource() + L"/RESOURCE_INFO.INI", "[SECTION]\ntrip_item_info_count=0\n");
  EXPECT_EQ(none.ReadInfo(0, nullptr), 0);

  // Trips whose folder is gone or whose id would leave the folder drop out.
  auto* kept = NewTrip(L"kept");
  WriteFileBytes(Resource() + L"/RESOURCE_INFO.INI",
                 "[SECTION]\ntree_node_name=Root\ntrip_item_info_count=3\n"
                 "trip_item_info_(0)_resource=../../outside\n"
                 "trip_item_info_(1)_resource=gone\n"
                 "trip_item_info_(2)_resource=" + kept->tripId.ToUtf8() + "\n"
                 "trip_tree_node_count=1\n[SECTION_0]\n");
  BLOG_TREE_NODE tree(nullptr);
  ASSERT_EQ(tree.ReadInfo(0, nullptr), 1);
  ASSERT_EQ(tree.trips.GetCount(), 1);
  EXPECT_EQ(static_cast<BLOG_ITEM_INFO*>(tree.trips.GetHead())->name, L"kept");
  EXPECT_TRUE(tree.children.IsEmpty()) << "a child without a name is not valid";
  delete kept;
}

TEST_F(TripTree, ReplaceMovesTheReplacementToTheEnd) {
  BLOG_TREE_NODE root(nullptr);
  auto* x = new BLOG_ITEM_INFO(GPS_APP_TRIP, L"x", 0);
  auto* y = new BLOG_ITEM_INFO(GPS_APP_TRIP, L"y", 0);
  auto* z = new BLOG_ITEM_INFO(GPS_APP_TRIP, L"z", 0);
  root.trips.AddTail(x);
  root.trips.AddTail(y);
  EXPECT_TRUE(root.ReplaceBlogItem(x, z));
  ASSERT_EQ(root.trips.GetCount(), 2);
  EXPECT_EQ(root.trips.GetHead(), y);
  EXPECT_EQ(root.trips.GetTail(), z);
  EXPECT_FALSE(root.ReplaceBlogItem(x, z));
  delete x;  // the caller owns the old trip
}

TEST_F(TripTree, OldTreeFileReplacesTheCurrentOne) {
  MakeDir(Resource());
  WriteFileBytes(Resource() + L"/RESOURCE_INFO.INI", "[SECTION]\ntree_node_name=New\n");
  WriteFileBytes(Resource() + L"/AMBRO_V20.INI", "[SECTION]\ntree_node_name=Old\n");
  BLOG_TREE_NODE tree(nullptr);
  ASSERT_EQ(tree.ReadInfo(0, nullptr), 1);
  EXPECT_EQ(tree.name, L"Old");
  EXPECT_FALSE(FileExists(Resource() + L"/AMBRO_V20.INI"));
}

TEST_F(TripTree, CleanUpRemovesOnlyUnnamedFoldersOfACompleteTree) {
  const auto [topId, deepId] = SaveNestedTree();

  MakeDir(Resource() + L"/orphan/sub");
  WriteFileBytes(Resource() + L"/orphan/sub/file", "x");
  // A link to a folder outside must not lead the clean-up there.
  TempDir outside;
  WriteFileBytes(outside / L"precious", "keep");
  ASSERT_EQ(symlink(outside.path().ToUtf8().c_str(), (Resource() + L"/link").ToUtf8().c_str()), 0);

  // A tree that was not read from its file never cleans up.
  BLOG_TREE_NODE unread(nullptr);
  unread.RemoveAllUnusedResource();
  EXPECT_TRUE(IsDirectory(Resource() + L"/orphan"));

  BLOG_TREE_NODE tree(nullptr);
  ASSERT_EQ(tree.ReadInfo(0, nullptr), 1);
  tree.RemoveAllUnusedResource();
  EXPECT_FALSE(FileExists(Resource() + L"/orphan"));
  EXPECT_TRUE(IsDirectory(PathJoin(Resource(), topId)));
  EXPECT_TRUE(IsDirectory(PathJoin(Resource(), deepId)));
  EXPECT_TRUE(FileExists(Resource() + L"/RESOURCE_INFO.INI"));
  EXPECT_EQ(ReadFileBytes(outside / L"precious"), "keep");
}

// A tree from which a trip or a node dropped out while it was read is not complete: the clean-up
// must leave every folder alone, the dropped trip's above all.
TEST_F(TripTree, CleanUpRemovesNothingAfterATripOrNodeDroppedOut) {
  struct Case {
    const char* what;
    // The settings file of the second trip, given its id; null keeps the saved one.
    std::string (*settings)(const std::string& id);
    // Lines added to the root section of the tree file.
    const char* treeExtra;
    // The damage is one the reader copes with: the tree is complete after all.
    bool readable = false;
  };
  const Case cases[] = {
      {"empty settings file", [](const std::string&) { return std::string(); }, ""},
      {"no trip id", [](const std::string&) { return std::string("[SECTION]\nname=x\n"); }, ""},
      {"another trip's id",
       [](const std::string&) { return std::string("[SECTION]\ntrip_item_id=990101000000_001\n"); }, ""},
      {"UTF-16 without byte-order mark",
       [](const std::string& id) {
         std::string out;
         for (char c : "[SECTION]\r\nname=x\r\ntrip_item_id=" + id + "\r\n") out += {c, '\0'};
         return out;
       },
       "", true},
      {"more trips counted than named", nullptr, "trip_item_info_count=3\n"},
      {"a node without a name", nullptr, "trip_tree_node_count=2\n"},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(c.what);
    TempDir root;
    navmisc::testutil::DataRootScope scope(root.path());
    BLOG_TREE_NODE saved(nullptr);
    saved.name = L"All";
    saved.trips.AddTail(NewTrip(L"kept"));
    BLOG_ITEM_INFO* victim = NewTrip(L"victim");
    saved.trips.AddTail(victim);
    AddNode(saved, L"child");
    saved.WriteInfo(false, 0, nullptr);
    const CString folder = victim->GetResourcePath();
    const CString tree = root / L"Resource/RESOURCE_INFO.INI";
    if (c.settings) WriteFileBytes(victim->GetBlogItemProfilePathName(), c.settings(victim->tripId.ToUtf8()));
    // A later key of the same name would be ignored, so the extra lines go first.
    std::string text = ReadFileBytes(tree);
    text.insert(text.find('\n') + 1, c.treeExtra);
    WriteFileBytes(tree, text);
    MakeDir(root / L"Resource/orphan");

    BLOG_TREE_NODE read(nullptr);
    ASSERT_EQ(read.ReadInfo(0, nullptr), 1);
    read.RemoveAllUnusedResource();
    EXPECT_TRUE(IsDirectory(folder));
    EXPECT_EQ(IsDirectory(root / L"Resource/orphan"), !c.readable);
    EXPECT_EQ(read.completeRead.IsComplete(), c.readable);
    // The caller can tell the user what kept the clean-up back.
    EXPECT_EQ(read.completeRead.Why().IsEmpty(), c.readable) << read.completeRead.Why().ToUtf8();

    // Written again and read back, the tree still names the trip that did not read, so a later
    // clean-up does not take its folder for unused either.
    read.WriteInfo(false, 0, nullptr);
    BLOG_TREE_NODE again(nullptr);
    ASSERT_EQ(again.ReadInfo(0, nullptr), 1);
    again.RemoveAllUnusedResource();
    EXPECT_TRUE(IsDirectory(folder));
  }

  // A trip whose folder is gone has nothing a clean-up could delete: it drops out, and the read
  // is still complete.
  {
    TempDir root;
    navmisc::testutil::DataRootScope scope(root.path());
    BLOG_TREE_NODE saved(nullptr);
    saved.name = L"All";
    saved.trips.AddTail(NewTrip(L"gone"));
    saved.WriteInfo(false, 0, nullptr);
    ASSERT_TRUE(RemoveDir(static_cast<BLOG_ITEM_INFO*>(saved.trips.GetHead())->GetResourcePath()));
    BLOG_TREE_NODE read(nullptr);
    ASSERT_EQ(read.ReadInfo(0, nullptr), 1);
    EXPECT_TRUE(read.trips.IsEmpty());
    EXPECT_TRUE(read.completeRead.IsComplete()) << read.completeRead.Why().ToUtf8();
  }
}

}  // namespace
