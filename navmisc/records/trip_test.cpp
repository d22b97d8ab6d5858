#include "navmisc/records/trip.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <map>
#include <memory>
#include <regex>
#include <string>
#include <tuple>

#include "navmisc/platform/files.h"
#include "navmisc/platform/resources.h"
#include "record_fixture.h"

using navmisc::Items;
using navmisc::testutil::NewPoint;
using navmisc::testutil::ReadFileBytes;
using navmisc::testutil::WriteFileBytes;

namespace {

class TripRecord : public navmisc::testutil::RecordTest {
 protected:
  TripRecord() {
    WriteFileBytes(root_ / L"strings.ini", "[STRINGS]\n9616=Journey\n");
    navmisc::SetResourceFile(root_ / L"strings.ini");
  }
  ~TripRecord() override { navmisc::SetResourceFile(L""); }
  // A trip with two tracks, a runner and a photo on the second track, saved.
  std::unique_ptr<BLOG_ITEM_INFO> SavedTrip() {
    auto trip = std::make_unique<BLOG_ITEM_INFO>(GPS_APP_TRIP, nullptr, 3);
    for (int t = 0; t < 2; ++t) {
      auto* track = new TRACK_ITEM_INFO(trip.get());
      track->description = t ? L"Back" : L"Out";
      track->runner = L"R1";
      for (int i = 0; i < 3; ++i)
        track->points.AddTail(NewPoint(1000 + 100 * t + i, 25 + i * 0.001, 121));
      trip->tracks.AddTail(track);
    }
    auto* runner = new RUNNER_ITEM_INFO;
    std::tie(runner->id, runner->frameCount, runner->frameUrl[0], runner->frameUrl[1]) =
        std::tuple(L"R1", 2, L"f0.png", L"f1.png");
    trip->runners.AddTail(runner);
    WriteFileBytes(PathJoin(trip->GetResourcePath(), L"f0.png"), "frame0");
    auto* photo = new PHOTO_ITEM_INFO(trip.get(), L"", L"", L"");
    std::tie(photo->itemName, photo->title, photo->latitude, photo->longitude) =
        std::tuple(L"p.jpg", L"Line one\nline \"two\"", 25.001, 121.0);
    photo->url.height[0] = 480;  // written as "dimension_h0", read as "dimension_H0"
    photo->trackItemId = static_cast<TRACK_ITEM_INFO*>(trip->tracks.GetTail())->id;
    trip->photos.AddTail(photo);
    trip->coverPageId = photo->photoId;
    WriteFileBytes(photo->GetFilePathName(), "jpeg bytes");
    trip->WriteInfo(1, nullptr, nullptr);
    trip->WriteAllWaypoint(1, nullptr, nullptr);
    return trip;
  }
};

TEST_F(TripRecord, NewTripGetsAnIdFolderNameAndDefaults) {
  g_TripMapInfo.tempMode = 4;
  g_TripMapInfo.tempStyle = 7;
  BLOG_ITEM_INFO trip(GPS_APP_TRIP, nullptr, 0x1B);
  EXPECT_TRUE(std::regex_match(trip.tripId.ToUtf8(), std::regex("[0-9]{12}_B[0-9]{2}"))) << trip.tripId.ToUtf8();
  EXPECT_TRUE(IsDirectory(trip.GetResourcePath()));
  EXPECT_EQ(trip.GetResourcePath(), PathJoin(PathJoin(root_.path(), L"Resource"), trip.tripId));
  EXPECT_TRUE(std::regex_match(trip.name.ToUtf8(), std::regex("Journey_[0-9]{14}"))) << trip.name.ToUtf8();
  EXPECT_EQ(trip.fileName, trip.name);
  // Mode and style come from the application's profile.
  EXPECT_EQ(std::tuple(trip.optOptimize, trip.optRevise, trip.optRedundance, trip.displayType,
                       trip.playbackSpeed, int{trip.tempMode}, int{trip.tempStyle}, int{trip.zoom}),
            std::tuple(true, true, true, 2, 60, 4, 7, 10));
  EXPECT_FALSE(trip.languageId.IsEmpty());

  BLOG_ITEM_INFO where(GPS_APP_WHEREAMI, nullptr, 0);
  EXPECT_EQ(where.GetResourcePath(), PathJoin(PathJoin(root_.path(), L"WhereRes"), L"MAP_HTML"));

  // Trips made in the same second never share a folder.
  BLOG_ITEM_INFO again(GPS_APP_TRIP, nullptr, 0x1B);
  EXPECT_NE(again.tripId, trip.tripId);
}

TEST_F(TripRecord, SettingsFileRoundTripAndCounters) {
  auto trip = SavedTrip();
  int counter = 0;
  trip->WriteInfo(0, &counter, nullptr);
  EXPECT_EQ(counter, 3 + 1 + 2 + 1) << "3, 1, one per track, one per photo";

  // What was read, written again, gives the same file: every key of the trip, its runner,
  // tracks and photo came back.
  const std::string text = ReadFileBytes(trip->GetBlogItemProfilePathName());
  BLOG_ITEM_INFO back(GPS_APP_TRIP, trip->tripId, 0);
  ASSERT_EQ(back.ReadInfo(), 1);
  ASSERT_EQ(back.photos.GetCount(), 1);
  EXPECT_EQ(static_cast<PHOTO_ITEM_INFO*>(back.photos.GetHead())->trip, &back);
  EXPECT_TRUE(static_cast<TRACK_ITEM_INFO*>(back.tracks.GetHead())->points.IsEmpty())
      << "points come on demand";
  back.WriteInfo(1, nullptr, nullptr);
  EXPECT_EQ(ReadFileBytes(back.GetBlogItemProfilePathName()), text);
  EXPECT_EQ(back.GetUTCStartTime(), 1000);
  EXPECT_EQ(back.GetUTCEndTime(), 1102);

  // The photo's first height key is written in lower case; it came back all the same above.
  for (const char* part :
       {"\ndimension_h0=480\n", "[SECTION_PH(0)]", "[SECTION_TK(1)]", "[SECTION_RN(0)]"})
    EXPECT_NE(text.find(part), std::string::npos) << part;
  // The trip's own keys, in the order written.
  const std::string head = text.substr(0, text.find("\n\n"));
  std::string keys;
  for (size_t at = head.find('\n'); at != std::string::npos; at = head.find('\n', at + 1))
    keys += head.substr(at + 1, head.find('=', at) - at - 1) + " ";
  EXPECT_EQ(keys,
            "trip_item_id name file_name description cover_page_id language_id create_time version "
            "opt_optimize opt_revise opt_redundance opt_level time_zone day_light time_zone_shift "
            "display_type playback_speed temp_mode temp_style sub_sample correction zoom net_dirty "
            "public server_id net_url tags runner_item_info_count track_item_info_count "
            "photo_item_info_count ");
}

TEST_F(TripRecord, ReaderDefaultsDifferFromANewTrip) {
  BLOG_ITEM_INFO trip(GPS_APP_TRIP, L"OLD1", 0);
  MakeDir(trip.GetResourcePath());
  WriteFileBytes(trip.GetBlogItemProfilePathName(),
                 "[SECTION]\ntrip_item_id=OLD1\nname=Walk\ntrack_item_info_count=1\n"
                 "[SECTION_TK(0)]\ntrack_item_id=TK_1\n");
  WriteFileBytes(PathJoin(trip.GetResourcePath(), L"TK_1.BIN"),
                 "1,0.0,0.0,0,0,0,-1,0,0\r\n2,1.0,1.0,0,0,-2,-1,0,0\r\n3,1.0,1.1,0,0,-1,-1,0,0\r\n"
                 "4,1.0,1.2,0,0,5,-1,0,0\r\n");
  ASSERT_EQ(trip.ReadInfo(), 1);
  auto* track = static_cast<TRACK_ITEM_INFO*>(trip.tracks.GetHead());
  EXPECT_EQ(std::tuple(trip.fileName.str(), trip.optOptimize, trip.optRevise, trip.displayType,
                       trip.netDirty, trip.netPublic, track->color, track->transparency),
            std::tuple(L"Walk", false, false, 0, false, false, 16711935u, 10));

  // The point at 0/0 is never counted; levels -2 and -1 and 5 make the rest.
  const struct {
    bool optimise, revise, redundance;
    long kept;
  } cases[] = {{false, true, true, 3}, {true, true, true, 1}, {true, false, true, 2},
               {true, false, false, 3}, {true, true, false, 2}};
  for (const auto& c : cases) {
    std::tie(trip.optOptimize, trip.optRevise, trip.optRedundance, trip.optLevel) =
        std::tuple(c.optimise, c.revise, c.redundance, 1);
    long total = 0, kept = 0;
    EXPECT_EQ(trip.GetTrackInfo(total, kept), 1);
    EXPECT_EQ(total, 3);
    EXPECT_EQ(kept, c.kept) << c.optimise << c.revise << c.redundance;
  }

  // Without tracks: the extreme times.
  BLOG_ITEM_INFO empty(GPS_APP_TRIP, L"EMPTY", 0);
  EXPECT_EQ(empty.GetUTCStartTime(), 2147483647L);
  EXPECT_EQ(empty.GetUTCEndTime(), 0);
}

TEST_F(TripRecord, BadSettingsFilesFailToRead) {
  const std::pair<const char*, const char*> cases[] = {
      {"NOID", "[SECTION]\nname=x\n"},
      {"ESCAPE", "[SECTION]\ntrip_item_id=../../etc\n"},
  };
  for (const auto& [folder, text] : cases) {
    BLOG_ITEM_INFO trip(GPS_APP_TRIP, CString::FromUtf8(folder), 0);
    MakeDir(trip.GetResourcePath());
    WriteFileBytes(trip.GetBlogItemProfilePathName(), text);
    EXPECT_EQ(trip.ReadInfo(), 0) << folder;
  }
  BLOG_ITEM_INFO missing(GPS_APP_TRIP, L"MISSING", 0);
  EXPECT_EQ(missing.ReadInfo(), 0);
  BLOG_ITEM_INFO escaping(GPS_APP_TRIP, L"..", 0);
  EXPECT_TRUE(escaping.GetResourcePath().IsEmpty());
  EXPECT_EQ(escaping.ReadInfo(), 0);

  // A track id that could leave the folder drops that track only.
  BLOG_ITEM_INFO trip(GPS_APP_TRIP, L"TRACKS", 0);
  MakeDir(trip.GetResourcePath());
  WriteFileBytes(trip.GetBlogItemProfilePathName(),
                 "[SECTION]\ntrip_item_id=TRACKS\ntrack_item_info_count=2\n"
                 "[SECTION_TK(0)]\ntrack_item_id=../x\n[SECTION_TK(1)]\ntrack_item_id=TK_2\n");
  ASSERT_EQ(trip.ReadInfo(), 1);
  ASSERT_EQ(trip.tracks.GetCount(), 1);
  EXPECT_EQ(static_cast<TRACK_ITEM_INFO*>(trip.tracks.GetHead())->id, L"TK_2");
}

TEST_F(TripRecord, ProfileTimeShiftAndMapProfileRegeneration) {
  g_SportMapInfo.timeZoneShiftOn = true;
  g_SportMapInfo.dayLight = true;
  BLOG_ITEM_INFO trip(GPS_APP_SPORT, L"SPORT1", 0);
  MakeDir(trip.GetResourcePath());
  WriteFileBytes(trip.GetBlogItemProfilePathName(), "[SECTION]\ntrip_item_id=SPORT1\ntime_zone_shift=-3600\n");
  WriteFileBytes(trip.GetMapProfilePathName(), "old map");
  ASSERT_EQ(trip.ReadInfo(), 1);
  EXPECT_EQ(trip.timeZoneShift, 3600);
  EXPECT_FALSE(FileExists(trip.GetMapProfilePathName()));

  g_SportMapInfo.timeZoneShiftOn = false;
  WriteFileBytes(trip.GetMapProfilePathName(), "old map");
  ASSERT_EQ(trip.ReadInfo(), 1);
  EXPECT_EQ(trip.timeZoneShift, -3600);
  EXPECT_TRUE(FileExists(trip.GetMapProfilePathName()));
}

TEST_F(TripRecord, StoppedWriteKeepsTheOldSettingsFile) {
  auto trip = SavedTrip();
  const std::string before = ReadFileBytes(trip->GetBlogItemProfilePathName());
  trip->name = L"Renamed";
  bool keepGoing = false;
  trip->WriteInfo(1, nullptr, &keepGoing);
  EXPECT_EQ(ReadFileBytes(trip->GetBlogItemProfilePathName()), before);
  trip->WriteInfo(1, nullptr, nullptr);
  EXPECT_NE(ReadFileBytes(trip->GetBlogItemProfilePathName()), before);
}

TEST_F(TripRecord, DuplicateCopiesFilesAndCarriesAssociations) {
  auto trip = SavedTrip();
  BLOG_ITEM_INFO copy(trip.get(), nullptr, 1);
  EXPECT_NE(copy.tripId, trip->tripId);
  ASSERT_EQ(copy.tracks.GetCount(), 2);
  ASSERT_EQ(copy.photos.GetCount(), 1);
  auto* firstCopy = static_cast<TRACK_ITEM_INFO*>(copy.tracks.GetHead());
  auto* secondCopy = static_cast<TRACK_ITEM_INFO*>(copy.tracks.GetTail());
  auto* secondOrig = static_cast<TRACK_ITEM_INFO*>(trip->tracks.GetTail());
  EXPECT_NE(secondCopy->id, secondOrig->id);
  EXPECT_EQ(ReadFileBytes(secondCopy->GetFilePathName()), ReadFileBytes(secondOrig->GetFilePathName()));
  EXPECT_EQ(firstCopy->description, L"Out");
  EXPECT_EQ(ReadFileBytes(PathJoin(copy.GetResourcePath(), L"f0.png")), "frame0");
  EXPECT_FALSE(FileExists(PathJoin(copy.GetResourcePath(), L"f1.png"))) << "a missing frame is skipped";
  EXPECT_TRUE(IsDirectory(PathJoin(copy.GetResourcePath(), L"Thumbnail")));

  auto* photo = static_cast<PHOTO_ITEM_INFO*>(copy.photos.GetHead());
  auto* orig = static_cast<PHOTO_ITEM_INFO*>(trip->photos.GetHead());
  EXPECT_NE(photo->photoId, orig->photoId);
  EXPECT_EQ(copy.coverPageId, photo->photoId);
  EXPECT_EQ(photo->trackItemId, secondCopy->id) << "the photo stays on the matching track";
  EXPECT_EQ(ReadFileBytes(photo->GetFilePathName()), "jpeg bytes");
}

TEST_F(TripRecord, ReadAllWaypointDropsTracksWithoutPoints) {
  auto trip = SavedTrip();
  auto* ghost = new TRACK_ITEM_INFO(trip.get());  // no file at all
  trip->tracks.AddTail(ghost);
  auto* emptyFile = new TRACK_ITEM_INFO(trip.get());
  WriteFileBytes(emptyFile->GetFilePathName(), "");
  trip->tracks.AddTail(emptyFile);
  trip->ReadAllWaypoint(1);
  EXPECT_EQ(trip->tracks.GetCount(), 2);
}

// Every file of a folder (hidden ones too) with its bytes.
std::map<std::string, std::string> FolderFiles(const CString& folder) {
  std::map<std::string, std::string> out;
  for (const auto& e : std::filesystem::directory_iterator(navmisc::NativePath(folder))) {
    if (e.is_regular_file()) out[e.path().filename()] = ReadFileBytes(CString::FromUtf8(e.path().string()));
  }
  return out;
}

// A save that fails anywhere (a full disk while any of the files is written, a rename that
// fails after others went through) leaves the trip's files exactly as they were and says so.
TEST_F(TripRecord, SaveReplacesAllFilesOrNone) {
  auto trip = SavedTrip();
  const std::map<std::string, std::string> before = FolderFiles(trip->GetResourcePath());
  trip->name = L"Renamed";
  auto* first = static_cast<TRACK_ITEM_INFO*>(trip->tracks.GetHead());
  for (auto* track : Items<TRACK_ITEM_INFO>(trip->tracks)) {
    for (int i = 0; i < 40; ++i) track->points.AddTail(NewPoint(5000 + i, 26, 122));
  }
  auto* hr = new HEARTRATE_ITEM_INFO(nullptr);
  hr->time = 5000;
  first->heartRates.AddTail(hr);  // a file that did not exist before

  // Budgets from nothing to just short of the whole save, so that every file fails in turn.
  long long budget = 0;
  for (;; budget += 97) {
    navmisc::testing::FailAtomicWritesAfter(budget);
    CString why;
    const bool saved = trip->SaveAll(nullptr, nullptr, &why);
    navmisc::testing::FailAtomicWritesAfter(-1);
    if (saved) break;
    ASSERT_EQ(FolderFiles(trip->GetResourcePath()), before) << budget;
    EXPECT_NE(why.Find(L"No space left on device"), -1) << why.ToUtf8();
  }
  EXPECT_GT(budget, 4000) << "the settings file failed too, as the last one written";

  WriteFileBytes(trip->GetBlogItemProfilePathName(), before.at("BLOG_ITEM_INFO.INI"));
  for (auto* track : Items<TRACK_ITEM_INFO>(trip->tracks)) {
    const CString bin = track->GetFilePathName();
    WriteFileBytes(bin, before.at(PathFileName(bin).ToUtf8()));
  }
  DeleteFile(first->GetHeartRateFilePathName());
  for (int renames : {0, 1, 3}) {
    navmisc::testing::FailAtomicRenamesAfter(renames);
    EXPECT_FALSE(trip->SaveAll(nullptr, nullptr, nullptr)) << renames;
    navmisc::testing::FailAtomicRenamesAfter(-1);
    EXPECT_EQ(FolderFiles(trip->GetResourcePath()), before) << renames;
  }

  bool keepGoing = false;  // stopped before it began: nothing changes
  EXPECT_FALSE(trip->SaveAll(nullptr, &keepGoing, nullptr));
  EXPECT_EQ(FolderFiles(trip->GetResourcePath()), before);

  ASSERT_TRUE(trip->SaveAll(nullptr, nullptr, nullptr));
  BLOG_ITEM_INFO back(GPS_APP_TRIP, trip->tripId, 0);
  ASSERT_EQ(back.ReadInfo(), 1);
  back.ReadAllWaypoint(0);
  EXPECT_EQ(back.name, L"Renamed");
  EXPECT_EQ(static_cast<TRACK_ITEM_INFO*>(back.tracks.GetHead())->points.GetCount(), 43);
  EXPECT_EQ(static_cast<TRACK_ITEM_INFO*>(back.tracks.GetHead())->heartRates.GetCount(), 1);
}

}  // namespace
