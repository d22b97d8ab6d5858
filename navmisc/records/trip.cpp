#include "navmisc/records/trip.h"

#include <climits>
#include <map>

#include "navmisc/platform/datetime.h"
#include "navmisc/platform/file_transaction.h"
#include "navmisc/platform/files.h"
#include "navmisc/platform/resources.h"
#include "navmisc/platform/settings.h"
#include "navmisc/platform/shared_globals.h"
#include "navmisc/platform/unique_id.h"
#include "navmisc/platform/user_locale.h"
#include "navmisc/records/user_profile.h"
#include "navmisc/util/language.h"

using navmisc::DeleteAll;
using navmisc::Items;

BLOG_ITEM_INFO* g_pBlogItem = nullptr;

namespace {

constexpr const wchar_t* kSection = L"SECTION";
constexpr unsigned kTripNameText = 9616;

CString ListSection(const wchar_t* pattern, int n) { return FormatString(pattern, kSection, n); }

// "YYMMDDhhmmss_XNN": local date and time, the index as one hex digit, two digits of
// GetUniqueID(). A folder that already exists is never reused.
CString NewTripId(GPS_APP_PROG_TYPE type, int index) {
  for (;;) {
    int y, mo, d, h, mi, s;
    GetLocalDateTimeInfo(GetCurDateTime(), y, mo, d, h, mi, s);
    const CString id = FormatString(L"%02d%02d%02d%02d%02d%02d_%X%02d", y % 100, mo, d, h, mi, s,
                                    static_cast<unsigned>(index) % 16, GetUniqueID() % 100);
    if (!FileExists(PathJoin(GetAppDataFolder(type), id))) return id;
  }
}

}  // namespace

CString GetAppDataFolder(GPS_APP_PROG_TYPE type) {
  const wchar_t* folder = navmisc::AppDataFolderName(type);
  return PathJoin(g_szAppDataPath, folder ? folder : L"");
}

BLOG_ITEM_INFO::BLOG_ITEM_INFO(GPS_APP_PROG_TYPE type, const wchar_t* folder, int index) : appType(type) {
  if (folder && *folder) {
    tripId = folder;
  } else {
    tripId = NewTripId(type, index);
    MakeDir(GetResourcePath());
    name = LoadResString(kTripNameText) + L"_" + GetCurDateTimeDigitFmt();
    fileName = name;
  }
  SetNewTripDefaults();
}

void BLOG_ITEM_INFO::SetNewTripDefaults() {
  languageId = GetHttpLNGFromLCID(GetUserDefaultLCID());
  if (const USER_MAP_INFO* profile = GetUserMapInfo(appType)) {
    tempMode = static_cast<uint8_t>(profile->tempMode);
    tempStyle = static_cast<uint8_t>(profile->tempStyle);
  }
}

BLOG_ITEM_INFO::BLOG_ITEM_INFO(BLOG_ITEM_INFO* from, const wchar_t* folder, int index)
    : appType(from ? from->appType : GPS_APP_TRIP) {
  tripId = (folder && IsPlainPathComponent(folder) && !FileExists(PathJoin(GetAppDataFolder(appType), folder)))
               ? CString(folder)
               : NewTripId(appType, index);
  MakeDir(GetResourcePath());
  SetNewTripDefaults();
  if (!from) return;
  fileName = from->fileName;
  name = from->name;
  description = from->description;
  languageId = from->languageId;
  createTime = from->createTime;
  optOptimize = from->optOptimize;
  optRevise = from->optRevise;
  optRedundance = from->optRedundance;
  optLevel = from->optLevel;
  timeZone = from->timeZone;
  dayLight = from->dayLight;
  timeZoneShift = from->timeZoneShift;
  displayType = from->displayType;
  playbackSpeed = from->playbackSpeed;
  tempMode = from->tempMode;
  tempStyle = from->tempStyle;
  subSample = from->subSample;
  correction = from->correction;
  zoom = from->zoom;
  netDirty = from->netDirty;
  netPublic = from->netPublic;
  serverId = from->serverId;
  netUrl = from->netUrl;
  tags = from->tags;
  for (auto* r : Items<RUNNER_ITEM_INFO>(from->runners)) runners.AddTail(new RUNNER_ITEM_INFO(*r));
  for (auto* t : Items<TRACK_ITEM_INFO>(from->tracks)) tracks.AddTail(new TRACK_ITEM_INFO(this, t));
  MakeDir(PathJoin(GetResourcePath(), L"Thumbnail"));
  MakeDir(PathJoin(GetResourcePath(), L"MiddleImg"));
  for (auto* p : Items<PHOTO_ITEM_INFO>(from->photos)) {
    auto* copy = new PHOTO_ITEM_INFO(this, p);
    if (p->photoId == from->coverPageId) coverPageId = copy->photoId;
    photos.AddTail(copy);
  }
}

BLOG_ITEM_INFO::~BLOG_ITEM_INFO() { ClearAll(); }

void BLOG_ITEM_INFO::ClearAll() {
  DeleteAll<RUNNER_ITEM_INFO>(runners);
  DeleteAll<TRACK_ITEM_INFO>(tracks);
  DeleteAll<PHOTO_ITEM_INFO>(photos);
}

CString BLOG_ITEM_INFO::GetResourcePath() const {
  if (appType == GPS_APP_WHEREAMI) return PathJoin(GetAppDataFolder(appType), L"MAP_HTML");
  // The id comes from files: one that is not a plain folder name locates nothing.
  if (!IsPlainPathComponent(tripId)) return {};
  return PathJoin(GetAppDataFolder(appType), tripId);
}

namespace {
CString InResource(const BLOG_ITEM_INFO& t, const wchar_t* file) {
  const CString folder = t.GetResourcePath();
  return folder.IsEmpty() ? CString() : PathJoin(folder, file);
}
}  // namespace

CString BLOG_ITEM_INFO::GetBlogItemProfilePathName() const { return InResource(*this, L"BLOG_ITEM_INFO.INI"); }
CString BLOG_ITEM_INFO::GetMapProfilePathName() const { return InResource(*this, L"MAP_PROFILE.INI"); }
CString BLOG_ITEM_INFO::GetMapHtmlPathName() const { return InResource(*this, L"MAP_HTMLFILE.HTM"); }

void BLOG_ITEM_INFO::WriteInfo(int write, int* counter, bool* keepGoing) {
  unsigned long h = 0;
  if (write) {
    MakeDir(GetResourcePath());
    h = WR_BEGIN(GetBlogItemProfilePathName());
  }
  if (counter) *counter += 3;
  const wchar_t* s = kSection;
  if (write) {
    const VORLA_PC_VERSION_INFO& v = g_sVersionInfo;
    WR_STRING(h, s, L"trip_item_id", tripId);
    WR_STRING(h, s, L"name", name);
    WR_STRING(h, s, L"file_name", fileName);
    WR_STRING(h, s, L"description", description);
    WR_STRING(h, s, L"cover_page_id", coverPageId);
    WR_STRING(h, s, L"language_id", languageId);
    WR_INT(h, s, L"create_time", createTime);
    WR_STRING(h, s, L"version", FormatString(L"%-d,%-d,%-d,%-d", v.nMajor, v.nMinor, v.nBuild, v.nRevision));
    WR_INT(h, s, L"opt_optimize", optOptimize ? 1 : 0);
    WR_INT(h, s, L"opt_revise", optRevise ? 1 : 0);
    WR_INT(h, s, L"opt_redundance", optRedundance ? 1 : 0);
    WR_INT(h, s, L"opt_level", optLevel);
    WR_STRING(h, s, L"time_zone", timeZone);
    WR_INT(h, s, L"day_light", dayLight ? 1 : 0);
    WR_INT(h, s, L"time_zone_shift", timeZoneShift);
    WR_INT(h, s, L"display_type", displayType);
    WR_INT(h, s, L"playback_speed", playbackSpeed);
    WR_INT(h, s, L"temp_mode", tempMode);
    WR_INT(h, s, L"temp_style", tempStyle);
    WR_INT(h, s, L"sub_sample", subSample);
    WR_INT(h, s, L"correction", correction);
    WR_INT(h, s, L"zoom", zoom);
    WR_INT(h, s, L"net_dirty", netDirty ? 1 : 0);
    WR_INT(h, s, L"public", netPublic ? 1 : 0);
    WR_STRING(h, s, L"server_id", serverId);
    WR_STRING(h, s, L"net_url", netUrl);
    WR_STRING(h, s, L"tags", tags);
  }
  if (counter) *counter += 1;
  // A stop on request never reaches WR_END: the old settings file stays as it was, and the
  // unfinished document is dropped.
  auto stopped = [&] {
    if (!keepGoing || *keepGoing) return false;
    if (write) WR_ABANDON(h);
    return true;
  };
  if (write) {
    WR_INT(h, s, L"runner_item_info_count", runners.GetCount());
    int n = 0;
    for (auto* r : Items<RUNNER_ITEM_INFO>(runners)) {
      const CString rs = ListSection(L"%s_RN(%d)", n++);
      WR_INT(h, rs, L"userdef", r->userDefined ? 1 : 0);
      WR_INT(h, rs, L"net_src", r->netSource ? 1 : 0);
      WR_STRING(h, rs, L"runner_id", r->id);
      WR_INT(h, rs, L"width", r->width);
      WR_INT(h, rs, L"height", r->height);
      WR_INT(h, rs, L"count", r->frameCount);
      for (int f = 0; f < r->frameCount && f < RUNNER_ITEM_INFO::kMaxFrames; ++f)
        WR_STRING(h, rs, FormatString(L"url(%d)", f), r->frameUrl[f]);
      if (stopped()) return;
    }
    WR_INT(h, s, L"track_item_info_count", tracks.GetCount());
  }
  int n = 0;
  for (auto* t : Items<TRACK_ITEM_INFO>(tracks)) {
    t->WriteInfo(h, ListSection(L"%s_TK(%d)", n++), write, counter, keepGoing);
    if (stopped()) return;
  }
  if (write) WR_INT(h, s, L"photo_item_info_count", photos.GetCount());
  n = 0;
  for (auto* p : Items<PHOTO_ITEM_INFO>(photos)) {
    p->WriteInfo(h, ListSection(L"%s_PH(%d)", n++), write, counter);
    if (stopped()) return;
  }
  if (write) WR_END(h);
}

int BLOG_ITEM_INFO::ReadInfo() {
  const CString path = GetBlogItemProfilePathName();
  const unsigned long h = path.IsEmpty() ? 0 : RD_BEGIN(path);
  if (!h) return 0;
  const wchar_t* s = kSection;
  const CString id = RD_STRING(h, s, L"trip_item_id", L"");
  if (id.IsEmpty() || !IsPlainPathComponent(id)) {
    RD_END(h);
    return 0;
  }
  ClearAll();
  tripId = id;
  name = RD_STRING(h, s, L"name", L"");
  fileName = RD_STRING(h, s, L"file_name", L"");
  if (fileName.IsEmpty()) fileName = name;
  description = RD_STRING(h, s, L"description", L"");
  coverPageId = RD_STRING(h, s, L"cover_page_id", L"");
  languageId = RD_STRING(h, s, L"language_id", L"");
  createTime = RD_INT(h, s, L"create_time", 0);
  RD_STRING(h, s, L"version", L"");  // the writer's version; nothing depends on it yet
  optOptimize = RD_INT(h, s, L"opt_optimize", 0) != 0;
  optRevise = RD_INT(h, s, L"opt_revise", 0) != 0;
  optRedundance = RD_INT(h, s, L"opt_redundance", 0) != 0;
  optLevel = RD_INT(h, s, L"opt_level", 0);
  timeZone = RD_STRING(h, s, L"time_zone", L"");
  dayLight = RD_INT(h, s, L"day_light", 0) != 0;
  timeZoneShift = RD_INT(h, s, L"time_zone_shift", 0);
  if (const USER_MAP_INFO* profile = GetUserMapInfo(appType); profile && profile->timeZoneShiftOn) {
    // Trips of the old release get the profile's daylight hours, and their map profile is made
    // again with the new times.
    timeZoneShift += profile->dayLight ? 7200 : 0;
    const CString mapProfile = GetMapProfilePathName();
    const int status = PathStatus(mapProfile);
    if (status != 2 && status != 3) DeleteFileRetry(mapProfile);
  }
  displayType = RD_INT(h, s, L"display_type", 0);
  playbackSpeed = RD_INT(h, s, L"playback_speed", 60);
  tempMode = static_cast<uint8_t>(RD_INT(h, s, L"temp_mode", tempMode));
  tempStyle = static_cast<uint8_t>(RD_INT(h, s, L"temp_style", tempStyle));
  subSample = static_cast<uint8_t>(RD_INT(h, s, L"sub_sample", subSample));
  correction = static_cast<uint8_t>(RD_INT(h, s, L"correction", correction));
  zoom = static_cast<uint8_t>(RD_INT(h, s, L"zoom", zoom));
  netDirty = RD_INT(h, s, L"net_dirty", 0) != 0;
  netPublic = RD_INT(h, s, L"public", 0) != 0;
  serverId = RD_STRING(h, s, L"server_id", L"");
  netUrl = RD_STRING(h, s, L"net_url", L"");
  tags = RD_STRING(h, s, L"tags", L"");

  // Only the sections present are visited: the count alone could ask for billions.
  const int runnerCount = RD_INT(h, s, L"runner_item_info_count", 0);
  for (int n : navmisc::SectionIndices(h, L"%s_RN(%d)", kSection, runnerCount)) {
    const CString rs = ListSection(L"%s_RN(%d)", n);
    auto* r = new RUNNER_ITEM_INFO;
    r->userDefined = RD_INT(h, rs, L"userdef", 0) != 0;
    r->netSource = RD_INT(h, rs, L"net_src", 0) != 0;
    r->id = RD_STRING(h, rs, L"runner_id", L"");
    r->width = RD_INT(h, rs, L"width", 0);
    r->height = RD_INT(h, rs, L"height", 0);
    const int frames = RD_INT(h, rs, L"count", 0);
    r->frameCount = static_cast<uint8_t>(frames < 0 ? 0 : (frames > RUNNER_ITEM_INFO::kMaxFrames ? RUNNER_ITEM_INFO::kMaxFrames : frames));
    for (int f = 0; f < r->frameCount; ++f) r->frameUrl[f] = RD_STRING(h, rs, FormatString(L"url(%d)", f), L"");
    runners.AddTail(r);
  }
  const int trackCount = RD_INT(h, s, L"track_item_info_count", 0);
  for (int n : navmisc::SectionIndices(h, L"%s_TK(%d)", kSection, trackCount)) {
    auto* t = new TRACK_ITEM_INFO(this);
    t->ReadInfo(h, ListSection(L"%s_TK(%d)", n));
    // A track id names files in this folder; one that could point elsewhere is dropped.
    if (IsPlainPathComponent(t->id)) tracks.AddTail(t);
    else delete t;
  }
  const int photoCount = RD_INT(h, s, L"photo_item_info_count", 0);
  for (int n : navmisc::SectionIndices(h, L"%s_PH(%d)", kSection, photoCount)) {
    auto* p = new PHOTO_ITEM_INFO;
    p->trip = this;
    p->ReadInfo(h, ListSection(L"%s_PH(%d)", n));
    photos.AddTail(p);
  }
  RD_END(h);
  return 1;
}

void BLOG_ITEM_INFO::WriteAllWaypoint(int write, int* counter, bool* keepGoing) {
  for (auto* t : Items<TRACK_ITEM_INFO>(tracks)) t->WriteAllWaypoint(write, counter, keepGoing);
}

bool BLOG_ITEM_INFO::SaveAll(int* counter, bool* keepGoing, CString* why) {
  navmisc::FileTransaction save;
  auto stopped = [&] {
    if (keepGoing && !*keepGoing) save.Fail("stopped before the trip was saved");
    return keepGoing && !*keepGoing;
  };
  // The settings file comes last, so that even the order of the renames never shows settings
  // that name tracks whose files are not in place yet.
  if (!stopped()) WriteAllWaypoint(1, counter, keepGoing);
  if (!stopped()) WriteInfo(1, counter, keepGoing);
  stopped();
  const bool saved = save.Commit();
  if (!saved && why) *why = CString::FromUtf8(save.error());
  return saved;
}

void BLOG_ITEM_INFO::ReadAllWaypoint(int force) {
  CPtrList all;
  while (!tracks.IsEmpty()) all.AddTail(tracks.RemoveHead());
  for (auto* t : Items<TRACK_ITEM_INFO>(all)) {
    t->ReadAllWaypoint(force);
    if (t->points.IsEmpty()) delete t;
    else tracks.AddTail(t);
  }
}

long BLOG_ITEM_INFO::GetUTCStartTime() {
  ReadAllWaypoint(0);
  if (tracks.IsEmpty()) return 2147483647L;
  long best = LONG_MAX;
  auto take = [&](const CPtrList& list, auto* sample) {
    using T = std::remove_pointer_t<decltype(sample)>;
    if (!list.IsEmpty()) best = std::min<long>(best, static_cast<const T*>(list.GetHead())->time);
  };
  for (auto* t : Items<TRACK_ITEM_INFO>(tracks)) {
    take(t->points, static_cast<WAYPOINT_ITEM_INFO*>(nullptr));
    take(t->cellFixes, static_cast<BASE_ITEM_INFO*>(nullptr));
    take(t->heartRates, static_cast<HEARTRATE_ITEM_INFO*>(nullptr));
    take(t->cadences, static_cast<CYCLING_CADENCE_RPM_ITEM_INFO*>(nullptr));
    take(t->wheelSpeeds, static_cast<WHEEL_SPEED_ITEM_INFO*>(nullptr));
  }
  return best;
}

long BLOG_ITEM_INFO::GetUTCEndTime() {
  ReadAllWaypoint(0);
  if (tracks.IsEmpty()) return 0;
  long best = LONG_MIN;
  auto take = [&](const CPtrList& list, auto* sample) {
    using T = std::remove_pointer_t<decltype(sample)>;
    if (!list.IsEmpty()) best = std::max<long>(best, static_cast<const T*>(list.GetTail())->time);
  };
  for (auto* t : Items<TRACK_ITEM_INFO>(tracks)) {
    take(t->points, static_cast<WAYPOINT_ITEM_INFO*>(nullptr));
    take(t->cellFixes, static_cast<BASE_ITEM_INFO*>(nullptr));
    take(t->heartRates, static_cast<HEARTRATE_ITEM_INFO*>(nullptr));
    take(t->cadences, static_cast<CYCLING_CADENCE_RPM_ITEM_INFO*>(nullptr));
    take(t->wheelSpeeds, static_cast<WHEEL_SPEED_ITEM_INFO*>(nullptr));
  }
  return best;
}

long BLOG_ITEM_INFO::GetTrackInfo(long& total, long& kept) {
  ReadAllWaypoint(0);
  total = kept = 0;
  long revised = 0, redundant = 0;
  for (auto* t : Items<TRACK_ITEM_INFO>(tracks)) {
    for (auto* p : Items<WAYPOINT_ITEM_INFO>(t->points)) {
      if (p->latitude == 0.0 && p->longitude == 0.0) continue;
      ++total;
      if (p->type >= optLevel) ++kept;
      else if (p->type == -2) ++revised;
      else if (p->type == -1) ++redundant;
    }
  }
  if (!optRevise) kept += revised;
  if (!optRedundance) kept += redundant;
  if (!optOptimize) kept = total;
  return tracks.GetCount();
}

const wchar_t* BLOG_ITEM_INFO::_GetAssociateTrackID(PHOTO_ITEM_INFO* photo) {
  if (!photo || !photo->trip) return nullptr;
  POSITION theirs = photo->trip->tracks.GetHeadPosition();
  POSITION mine = tracks.GetHeadPosition();
  while (theirs && mine) {
    auto* other = static_cast<TRACK_ITEM_INFO*>(photo->trip->tracks.GetNext(theirs));
    auto* own = static_cast<TRACK_ITEM_INFO*>(tracks.GetNext(mine));
    if (other->id == photo->trackItemId) return own->id;
  }
  return nullptr;
}
