// Files that a careless tool or an attacker put into the data root: reading them must cost time
// in proportion to the file and end with a clear result.
#include <gtest/gtest.h>
#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include <string>
#include <vector>

#include "navmisc/platform/files.h"
#include "navmisc/records/trip.h"
#include "navmisc/records/trip_tree.h"
#include "navmisc/records/user_profile.h"
#include "record_fixture.h"

using navmisc::Items;
using navmisc::testutil::FinishesWithin;
using navmisc::testutil::ReadFileBytes;
using navmisc::testutil::TempDir;
using navmisc::testutil::WriteFileBytes;

namespace {

class HostileFiles : public navmisc::testutil::RecordTest {
 protected:
  CString Resource() const { return root_ / L"Resource"; }
  // Writes `settings` as the settings file of the trip folder `id`.
  void PutTrip(const wchar_t* id, const std::string& settings) {
    MakeDir(PathJoin(Resource(), id));
    WriteFileBytes(PathJoin(PathJoin(Resource(), id), L"BLOG_ITEM_INFO.INI"), settings);
  }
};

void Link(const CString& target, const CString& link) {
  ::unlink(navmisc::NativePath(link).c_str());
  ASSERT_EQ(symlink(navmisc::NativePath(target).c_str(), navmisc::NativePath(link).c_str()), 0);
}

int Mode(const CString& path) {
  struct stat st;
  return stat(navmisc::NativePath(path).c_str(), &st) == 0 ? static_cast<int>(st.st_mode & 07777) : -1;
}

template <class T, class F>
std::vector<CString> Texts(CPtrList& list, F field) {
  std::vector<CString> out;
  for (T* item : Items<T>(list)) out.push_back(field(*item));
  return out;
}

// A count says how many sections to look for; only the sections that exist become entries, so
// a count of a hundred thousand over a file of a few lines gives those few lines.
TEST_F(HostileFiles, ListsHoldOnlyTheSectionsPresent) {
  PutTrip(L"T1",
          "[SECTION]\ntrip_item_id=T1\nrunner_item_info_count=100000\n"
          "track_item_info_count=100000\nphoto_item_info_count=100000\n"
          "[SECTION_RN(0)]\nrunner_id=R0\n[SECTION_RN(7)]\nrunner_id=R7\n"
          "[SECTION_RN(100000)]\nrunner_id=beyond the count\n"
          "[SECTION_TK(3)]\ntrack_item_id=TK_3\n"
          "[SECTION_PH(0)]\nphoto_item_name=p.jpg\n");
  BLOG_ITEM_INFO trip(GPS_APP_TRIP, L"T1", 0);
  ASSERT_EQ(trip.ReadInfo(), 1);
  EXPECT_EQ(Texts<RUNNER_ITEM_INFO>(trip.runners, [](auto& r) { return r.id; }),
            (std::vector<CString>{L"R0", L"R7"}));
  EXPECT_EQ(Texts<TRACK_ITEM_INFO>(trip.tracks, [](auto& t) { return t.id; }),
            std::vector<CString>{L"TK_3"});
  EXPECT_EQ(Texts<PHOTO_ITEM_INFO>(trip.photos, [](auto& p) { return p.itemName; }),
            std::vector<CString>{L"p.jpg"});

  MakeDir(PathFolder(g_SportMapInfo.GetProfilePathName()));
  WriteFileBytes(g_SportMapInfo.GetProfilePathName(),
                 "[SECTION]\nmarker_item_info_count=100000\nrunner_item_info_count=100000\n"
                 "weightheight_count=100000\n[SECTION_MKR(2)]\nid=M2\n[SECTION_RUN(0)]\nid=R0\n"
                 "[SECTION_WH(5)]\ndate=01/02/2024\nweight=70.5\n");
  g_SportMapInfo.ReadInfo();
  EXPECT_EQ(Texts<MARKER_ITEM_INFO>(g_SportMapInfo.markers, [](auto& m) { return m.id; }),
            std::vector<CString>{L"M2"});
  EXPECT_EQ(Texts<RUNNER_ITEM_INFO>(g_SportMapInfo.runners, [](auto& r) { return r.id; }),
            std::vector<CString>{L"R0"});
  ASSERT_EQ(g_SportMapInfo.weightHeights.GetCount(), 1);
  EXPECT_EQ(static_cast<WEIGHT_HEIGHT_INFO*>(g_SportMapInfo.weightHeights.GetHead())->weight, 70.5);
}

// The largest count there is, in every list of a trip and of the tree at once, with nested
// nodes that claim as much: the read still ends at once.
TEST_F(HostileFiles, LargestCountsCostNothing) {
  const std::string most = "2147483647";
  PutTrip(L"T1", "[SECTION]\ntrip_item_id=T1\nrunner_item_info_count=" + most +
                     "\ntrack_item_info_count=" + most + "\nphoto_item_info_count=" + most +
                     "\n[SECTION_TK(0)]\ntrack_item_id=TK_0\n");
  std::string tree = "[SECTION]\ntree_node_name=All\ntrip_item_info_count=" + most +
                     "\ntrip_item_info_(0)_resource=T1\ntrip_tree_node_count=" + most + "\n";
  for (const char* node : {"SECTION_0", "SECTION_0_0", "SECTION_5"}) {
    tree += std::string("[") + node + "]\ntree_node_name=" + node + "\ntrip_item_info_count=" +
            most + "\ntrip_tree_node_count=" + most + "\n";
  }
  WriteFileBytes(Resource() + L"/RESOURCE_INFO.INI", tree);

  auto read = [] {
    BLOG_TREE_NODE root(nullptr);
    root.ReadInfo(0, nullptr);
  };
  ASSERT_TRUE(FinishesWithin(60, read)) << "reading must not walk the counts";

  BLOG_TREE_NODE root(nullptr);
  ASSERT_EQ(root.ReadInfo(0, nullptr), 1);
  ASSERT_EQ(root.trips.GetCount(), 1);
  EXPECT_EQ(static_cast<BLOG_ITEM_INFO*>(root.trips.GetHead())->tracks.GetCount(), 1);
  ASSERT_EQ(root.children.GetCount(), 2);
  EXPECT_EQ(static_cast<BLOG_TREE_NODE*>(root.children.GetTail())->name, L"SECTION_5");
  EXPECT_EQ(static_cast<BLOG_TREE_NODE*>(root.children.GetHead())->children.GetCount(), 1);
  EXPECT_FALSE(root.completeRead.IsComplete()) << "the counts promise entries that are missing";

  // A chain of nodes deeper than any folder tree stops where the stack is still safe.
  std::string chain;
  std::string section = "SECTION";
  for (int depth = 0; depth < 400; ++depth, section += "_0")
    chain += "[" + section + "]\ntree_node_name=n\ntrip_tree_node_count=1\n";
  WriteFileBytes(Resource() + L"/RESOURCE_INFO.INI", chain);
  BLOG_TREE_NODE deep(nullptr);
  ASSERT_EQ(deep.ReadInfo(0, nullptr), 1);
  int levels = 0;
  for (BLOG_TREE_NODE* n = &deep; !n->children.IsEmpty(); ++levels)
    n = static_cast<BLOG_TREE_NODE*>(n->children.GetHead());
  EXPECT_EQ(levels, 256);
  EXPECT_NE(deep.completeRead.Why().Find(L"too deep"), -1) << deep.completeRead.Why().ToUtf8();
}

// Named pipes and devices in place of settings or point files: a read neither blocks nor runs
// forever, the file counts as missing, and the reason can be told to the user.
TEST_F(HostileFiles, PipesAndDevicesReadAsMissing) {
  PutTrip(L"T1", "[SECTION]\ntrip_item_id=T1\ntrack_item_info_count=3\n"
                 "[SECTION_TK(0)]\ntrack_item_id=TK_FIFO\n[SECTION_TK(1)]\ntrack_item_id=TK_ZERO\n"
                 "[SECTION_TK(2)]\ntrack_item_id=TK_OK\n");
  const CString folder = Resource() + L"/T1";
  WriteFileBytes(folder + L"/TK_OK.BIN", "1000,47.1,8.5,400.0,0,0,-1,0,0\r\n");
  auto fifo = [](const CString& path) { ASSERT_EQ(mkfifo(navmisc::NativePath(path).c_str(), 0600), 0); };
  fifo(folder + L"/TK_FIFO.BIN");
  fifo(folder + L"/TK_OK.HR");
  ASSERT_EQ(symlink("/dev/zero", navmisc::NativePath(folder + L"/TK_ZERO.BIN").c_str()), 0);
  PutTrip(L"T2", "");
  ::unlink(navmisc::NativePath(Resource() + L"/T2/BLOG_ITEM_INFO.INI").c_str());
  fifo(Resource() + L"/T2/BLOG_ITEM_INFO.INI");
  fifo(Resource() + L"/RESOURCE_INFO.INI");
  MakeDir(PathFolder(g_SportMapInfo.GetProfilePathName()));
  fifo(g_SportMapInfo.GetProfilePathName());
  fifo(USER_MAP_INFO::GetSuiteSettingsPathName());

  auto readAll = [] {
    BLOG_ITEM_INFO trip(GPS_APP_TRIP, L"T1", 0);
    trip.ReadInfo();
    trip.ReadAllWaypoint(1);
    BLOG_ITEM_INFO copy(&trip, nullptr, 0);  // copies the point files
    BLOG_ITEM_INFO(GPS_APP_TRIP, L"T2", 0).ReadInfo();
    BLOG_TREE_NODE(nullptr).ReadInfo(0, nullptr);
    g_SportMapInfo.ReadInfo();
  };
  ASSERT_TRUE(FinishesWithin(60, readAll)) << "a read blocked or did not end";

  BLOG_ITEM_INFO trip(GPS_APP_TRIP, L"T1", 0);
  ASSERT_EQ(trip.ReadInfo(), 1);
  trip.ReadAllWaypoint(1);
  ASSERT_EQ(trip.tracks.GetCount(), 1) << "the tracks without a readable point file drop out";
  auto* kept = static_cast<TRACK_ITEM_INFO*>(trip.tracks.GetHead());
  EXPECT_EQ(kept->id, L"TK_OK");
  EXPECT_TRUE(kept->heartRates.IsEmpty());
  EXPECT_NE(navmisc::LastFileRefusal().find("TK_OK.HR is a named pipe"), std::string::npos)
      << navmisc::LastFileRefusal();

  BLOG_ITEM_INFO copy(&trip, nullptr, 0);
  EXPECT_FALSE(FileExists(PathJoin(copy.GetResourcePath(), static_cast<TRACK_ITEM_INFO*>(copy.tracks.GetHead())->id + L".HR")));

  trip.tracks.AddTail(new TRACK_ITEM_INFO(&trip));
  static_cast<TRACK_ITEM_INFO*>(trip.tracks.GetTail())->id = L"TK_ZERO";
  trip.ReadAllWaypoint(1);
  EXPECT_EQ(trip.tracks.GetCount(), 1);
  EXPECT_NE(navmisc::LastFileRefusal().find("TK_ZERO.BIN is a character device"), std::string::npos)
      << navmisc::LastFileRefusal();

  EXPECT_EQ(BLOG_ITEM_INFO(GPS_APP_TRIP, L"T2", 0).ReadInfo(), 0);
  BLOG_TREE_NODE tree(nullptr);
  EXPECT_EQ(tree.ReadInfo(0, nullptr), 0);
  EXPECT_NE(navmisc::LastFileRefusal().find("RESOURCE_INFO.INI is a named pipe"), std::string::npos);
  g_SportMapInfo.ReadInfo();
  EXPECT_EQ(g_SportMapInfo.localize, L"ENG") << "a profile that cannot be read reads as defaults";
}

// Links placed in the data root that lead out of it: no write, copy, rename, delete or change of
// mode goes through them, while links that stay inside keep working.
TEST_F(HostileFiles, LinksOutOfTheDataRootAreNeverFollowed) {
  TempDir outside;
  for (const wchar_t* name : {L"bin", L"ini", L"tree", L"old", L"photo"}) WriteFileBytes(outside / name, "precious");
  ASSERT_EQ(chmod(navmisc::NativePath(outside / L"old").c_str(), 0400), 0);

  // A saved trip whose point file, settings file and photo are links to files outside.
  BLOG_ITEM_INFO trip(GPS_APP_TRIP, nullptr, 0);
  auto* track = new TRACK_ITEM_INFO(&trip);
  track->points.AddTail(navmisc::testutil::NewPoint(1000, 47.1, 8.5));
  trip.tracks.AddTail(track);
  auto* photo = new PHOTO_ITEM_INFO(&trip, L"", L"", L"");
  photo->itemName = L"p.jpg";
  trip.photos.AddTail(photo);
  Link(outside / L"bin", track->GetFilePathName());
  Link(outside / L"ini", trip.GetBlogItemProfilePathName());
  Link(outside / L"photo", photo->GetFilePathName());
  trip.WriteAllWaypoint(1, nullptr, nullptr);
  trip.WriteInfo(1, nullptr, nullptr);
  BLOG_ITEM_INFO copy(&trip, nullptr, 0);  // copies the point file and the photo
  EXPECT_NE(ReadFileBytes(static_cast<TRACK_ITEM_INFO*>(copy.tracks.GetHead())->GetFilePathName()), "precious");
  EXPECT_NE(ReadFileBytes(PathJoin(copy.GetResourcePath(), L"p.jpg")), "precious");
  EXPECT_NE(navmisc::LastFileRefusal().find("leads outside the data root"), std::string::npos)
      << navmisc::LastFileRefusal();

  // The tree file linked outside, with an old-format tree beside it that is a link too: reading
  // the tree (a read-only listing) must neither copy over nor chmod anything outside.
  Link(outside / L"tree", Resource() + L"/RESOURCE_INFO.INI");
  Link(outside / L"old", Resource() + L"/AMBRO_V20.INI");
  BLOG_TREE_NODE tree(nullptr);
  tree.ReadInfo(0, nullptr);
  tree.name = L"All";
  tree.WriteInfo(false, 0, nullptr);

  // A trip folder that is itself a link to a folder outside.
  Link(outside.path(), Resource() + L"/T9");
  BLOG_ITEM_INFO linkedFolder(GPS_APP_TRIP, L"T9", 0);
  linkedFolder.WriteInfo(1, nullptr, nullptr);
  EXPECT_FALSE(FileExists(outside / L"BLOG_ITEM_INFO.INI"));

  for (const wchar_t* name : {L"bin", L"ini", L"tree", L"old", L"photo"}) {
    EXPECT_EQ(ReadFileBytes(outside / name), "precious") << CString(name).ToUtf8();
  }
  EXPECT_EQ(Mode(outside / L"old"), 0400);

  // A link that stays inside the data root is followed as before.
  BLOG_ITEM_INFO other(GPS_APP_TRIP, nullptr, 0);
  const CString otherBin = PathJoin(other.GetResourcePath(), L"TK_OTHER.BIN");
  WriteFileBytes(otherBin, "");
  Link(otherBin, track->GetFilePathName());
  trip.WriteAllWaypoint(1, nullptr, nullptr);
  EXPECT_EQ(ReadFileBytes(otherBin).rfind("1000,", 0), 0u);
}

// A save killed half-way leaves its temporary file beside the target; the next save of that file
// removes it, unless a live save still holds it.
TEST_F(HostileFiles, LeftoverTemporaryFilesGoWithTheNextSave) {
  BLOG_ITEM_INFO trip(GPS_APP_TRIP, nullptr, 0);
  const CString folder = trip.GetResourcePath();
  const CString killed = folder + L"/.BLOG_ITEM_INFO.INI.tmp-AbC123";
  const CString live = folder + L"/.BLOG_ITEM_INFO.INI.tmp-LiVe99";
  const CString otherFile = folder + L"/.MAP_PROFILE.INI.tmp-XyZ789";
  for (const CString& path : {killed, live, otherFile}) WriteFileBytes(path, "half");
  const int held = ::open(navmisc::NativePath(live).c_str(), O_RDONLY | O_CLOEXEC);
  ASSERT_GE(held, 0);
  ASSERT_EQ(flock(held, LOCK_EX), 0);  // as a save in progress holds its file

  trip.WriteInfo(1, nullptr, nullptr);
  EXPECT_FALSE(FileExists(killed));
  EXPECT_TRUE(FileExists(live));
  EXPECT_TRUE(FileExists(otherFile)) << "only the saved file's leftovers go";
  ::close(held);
  trip.WriteInfo(1, nullptr, nullptr);
  EXPECT_FALSE(FileExists(live));
}

}  // namespace
