#include "navmisc/records/user_profile.h"

#include <cwchar>
#include <variant>
#include <vector>

#include "navmisc/platform/files.h"
#include "navmisc/platform/secret.h"
#include "navmisc/platform/settings.h"
#include "navmisc/platform/shared_globals.h"

USER_MAP_INFO g_TripMapInfo(GPS_APP_TRIP);
USER_MAP_INFO g_SportMapInfo(GPS_APP_SPORT);
USER_MAP_INFO g_TrackerMapInfo(GPS_APP_TRACKER);
USER_MAP_INFO g_WhereMapInfo(GPS_APP_WHEREAMI);

namespace {

constexpr const wchar_t* kSection = L"SECTION";
constexpr const wchar_t* kProfileFile = L"USER_MAP_INFO.INI";
constexpr const wchar_t* kSuiteFile = L"AMBRO_SUITE_INFO.INI";

// One plain key of the profile: its name and the field it holds. Keys with their own rules
// (password, version, lists) are handled beside the table.
using Field = std::variant<CString USER_MAP_INFO::*, int32_t USER_MAP_INFO::*, bool USER_MAP_INFO::*,
                           double USER_MAP_INFO::*>;
struct KeyDef {
  const wchar_t* key;
  Field field;
};

const std::vector<KeyDef> kHeadKeys = {
    {L"name", &USER_MAP_INFO::name},         {L"male", &USER_MAP_INFO::male},
    {L"year", &USER_MAP_INFO::year},         {L"month", &USER_MAP_INFO::month},
    {L"day", &USER_MAP_INFO::day},           {L"height", &USER_MAP_INFO::height},
    {L"weight", &USER_MAP_INFO::weight},     {L"user_account", &USER_MAP_INFO::userAccount},
    {L"keep_password", &USER_MAP_INFO::keepPassword},
};
// "user_password" comes here.
const std::vector<KeyDef> kTutorialKey = {{L"tutorial", &USER_MAP_INFO::tutorial}};
// Kept by the tracker application's profile only.
const std::vector<KeyDef> kTrackerKeys = {
    {L"tracker_trackertype", &USER_MAP_INFO::trackerType},
    {L"tracker_timezone", &USER_MAP_INFO::trackerTimeZone},
    {L"tracker_day_light", &USER_MAP_INFO::trackerDayLight},
    {L"tracker_time_zone_shift", &USER_MAP_INFO::trackerTimeZoneShift},
};
const std::vector<KeyDef> kUnitKeys = {
    {L"metric", &USER_MAP_INFO::metric},
    {L"localize", &USER_MAP_INFO::localize},
};
// "version" comes here.
const std::vector<KeyDef> kTimeKeys = {
    {L"day_light", &USER_MAP_INFO::dayLight},
    {L"time_zone_shift", &USER_MAP_INFO::timeZoneShift},
    {L"google_api_key", &USER_MAP_INFO::googleApiKey},
};
// The version check: in the profile and in the suite settings file.
const std::vector<KeyDef> kVersionCheckKeys = {
    {L"ver_unique_id", &USER_MAP_INFO::verUniqueId},
    {L"ver_enable_check", &USER_MAP_INFO::verEnableCheck},
    {L"ver_check_period_index", &USER_MAP_INFO::verCheckPeriodIndex},
    {L"ver_check_period_time", &USER_MAP_INFO::verCheckPeriodTime},
    {L"ver_last_check_time", &USER_MAP_INFO::verLastCheckTime},
    {L"ver_hide_prompt", &USER_MAP_INFO::verHidePrompt},
};
const std::vector<KeyDef> kTailKeys = {
    {L"dev_model", &USER_MAP_INFO::devModel},
    {L"dev_version", &USER_MAP_INFO::devVersion},
    {L"dev_serial#", &USER_MAP_INFO::devSerial},
    {L"temp_mode", &USER_MAP_INFO::tempMode},
    {L"temp_style", &USER_MAP_INFO::tempStyle},
    {L"auto_launch", &USER_MAP_INFO::autoLaunch},
    {L"clear_Devicedata", &USER_MAP_INFO::clearDeviceData},
    {L"geotag_call_editor", &USER_MAP_INFO::geotagCallEditor},
    {L"import_photo", &USER_MAP_INFO::importPhoto},
    {L"import_photofolder", &USER_MAP_INFO::importPhotoFolder},
    {L"view_photogeotag", &USER_MAP_INFO::viewPhotoGeotag},
    {L"edit_photo", &USER_MAP_INFO::editPhoto},
    {L"import_gpx", &USER_MAP_INFO::importGpx},
    {L"export_gpx", &USER_MAP_INFO::exportGpx},
    {L"export_tcx", &USER_MAP_INFO::exportTcx},
    {L"export_csv", &USER_MAP_INFO::exportCsv},
    {L"photo_def_markerid", &USER_MAP_INFO::photoDefMarkerId},
    {L"landmark_def_markerid", &USER_MAP_INFO::landmarkDefMarkerId},
    {L"track_def_runnerid", &USER_MAP_INFO::trackDefRunnerId},
};

// Reads the keys present in the file; absent ones keep the value the profile holds (its default
// after Reset).
void ReadKeys(unsigned long h, USER_MAP_INFO& p, const std::vector<KeyDef>& keys, bool onlyPresent = false) {
  for (const KeyDef& d : keys) {
    if (onlyPresent && !RD_EXISTS(h, kSection, d.key)) continue;
    std::visit(
        [&](auto member) {
          auto& v = p.*member;
          using T = std::decay_t<decltype(v)>;
          if constexpr (std::is_same_v<T, CString>) v = RD_STRING(h, kSection, d.key, v);
          else if constexpr (std::is_same_v<T, bool>) v = RD_INT(h, kSection, d.key, v ? 1 : 0) != 0;
          else if constexpr (std::is_same_v<T, double>) v = RD_FLOAT(h, kSection, d.key, v);
          else v = RD_INT(h, kSection, d.key, v);
        },
        d.field);
  }
}

void WriteKeys(unsigned long h, const USER_MAP_INFO& p, const std::vector<KeyDef>& keys) {
  for (const KeyDef& d : keys) {
    std::visit(
        [&](auto member) {
          const auto& v = p.*member;
          using T = std::decay_t<decltype(v)>;
          if constexpr (std::is_same_v<T, CString>) WR_STRING(h, kSection, d.key, v);
          else if constexpr (std::is_same_v<T, bool>) WR_INT(h, kSection, d.key, v ? 1 : 0);
          else if constexpr (std::is_same_v<T, double>) WR_FLOAT(h, kSection, d.key, v);
          else WR_INT(h, kSection, d.key, v);
        },
        d.field);
  }
}

// Reads up to `count` integers separated by `sep`, as "%d,%d,..." would: scanning stops at the
// first field that is not a number; fields not reached stay as they are.
void ScanInts(const CString& text, wchar_t sep, int32_t* out, int count) {
  const wchar_t* p = text;
  for (int i = 0; i < count; ++i) {
    while (*p == L' ' || *p == L'\t') ++p;
    wchar_t* end = nullptr;
    const long v = std::wcstol(p, &end, 10);
    if (end == p) return;
    out[i] = static_cast<int32_t>(v);
    p = end;
    if (*p != sep) return;
    ++p;
  }
}

CString SectionOf(const wchar_t* pattern, int n) { return FormatString(pattern, kSection, n); }

}  // namespace

USER_MAP_INFO::USER_MAP_INFO(GPS_APP_PROG_TYPE type) : appType(type) {}

USER_MAP_INFO::~USER_MAP_INFO() {
  navmisc::DeleteAll<MARKER_ITEM_INFO>(markers);
  navmisc::DeleteAll<RUNNER_ITEM_INFO>(runners);
  navmisc::DeleteAll<WEIGHT_HEIGHT_INFO>(weightHeights);
}

void USER_MAP_INFO::Reset() {
  navmisc::DeleteAll<MARKER_ITEM_INFO>(markers);
  navmisc::DeleteAll<RUNNER_ITEM_INFO>(runners);
  navmisc::DeleteAll<WEIGHT_HEIGHT_INFO>(weightHeights);
  USER_MAP_INFO fresh(appType);
  for (const auto* keys : {&kHeadKeys, &kTutorialKey, &kTrackerKeys, &kUnitKeys, &kTimeKeys,
                           &kVersionCheckKeys, &kTailKeys}) {
    for (const KeyDef& d : *keys) std::visit([&](auto m) { this->*m = fresh.*m; }, d.field);
  }
  password.Empty();
  for (int i = 0; i < 4; ++i) version[i] = 0;
  timeZoneShiftOn = false;
}

CString USER_MAP_INFO::GetProfilePathName() const {
  const wchar_t* folder = navmisc::AppDataFolderName(appType);
  return PathJoin(PathJoin(g_szAppDataPath, folder ? folder : L""), kProfileFile);
}

CString USER_MAP_INFO::GetSuiteSettingsPathName() { return PathJoin(g_szAppDataPath, kSuiteFile); }

void USER_MAP_INFO::ReadInfo() {
  Reset();
  const unsigned long h = RD_BEGIN(GetProfilePathName());
  if (h) {
    ReadKeys(h, *this, kHeadKeys);
    const CString stored = RD_STRING(h, kSection, L"user_password", L"");
    if (keepPassword) navmisc::UnprotectSecret(stored, password);
    ReadKeys(h, *this, kTutorialKey);
    if (appType == GPS_APP_TRACKER) ReadKeys(h, *this, kTrackerKeys);
    ReadKeys(h, *this, kUnitKeys);
    ScanInts(RD_STRING(h, kSection, L"version", L""), L',', version, 4);
    // Profiles written by that one old release hold times that need the stored shift.
    timeZoneShiftOn = version[2] == 807 && version[3] <= 1599;
    ReadKeys(h, *this, kTimeKeys);
    ReadKeys(h, *this, kVersionCheckKeys);
    ReadKeys(h, *this, kTailKeys);

    const int markerCount = RD_INT(h, kSection, L"marker_item_info_count", 0);
    const int runnerCount = RD_INT(h, kSection, L"runner_item_info_count", 0);
    const int whCount = RD_INT(h, kSection, L"weightheight_count", 0);
    for (int n : navmisc::SectionIndices(h, L"%s_MKR(%d)", kSection, markerCount)) {
      const CString s = SectionOf(L"%s_MKR(%d)", n);
      auto* m = new MARKER_ITEM_INFO;
      m->id = RD_STRING(h, s, L"id", L"");
      m->url = RD_STRING(h, s, L"url", L"");
      markers.AddTail(m);
    }
    for (int n : navmisc::SectionIndices(h, L"%s_RUN(%d)", kSection, runnerCount)) {
      const CString s = SectionOf(L"%s_RUN(%d)", n);
      auto* r = new RUNNER_ITEM_INFO;
      r->userDefined = RD_INT(h, s, L"userdef", 0) != 0;
      r->netSource = RD_INT(h, s, L"net_src", 0) != 0;
      r->id = RD_STRING(h, s, L"id", L"");
      r->width = RD_INT(h, s, L"width", 0);
      r->height = RD_INT(h, s, L"height", 0);
      const int frames = RD_INT(h, s, L"count", 0);
      r->frameCount = static_cast<uint8_t>(frames < 0 ? 0 : frames > RUNNER_ITEM_INFO::kMaxFrames ? RUNNER_ITEM_INFO::kMaxFrames : frames);
      for (int f = 0; f < r->frameCount; ++f) r->frameUrl[f] = RD_STRING(h, s, FormatString(L"url_%d", f), L"");
      runners.AddTail(r);
    }
    for (int n : navmisc::SectionIndices(h, L"%s_WH(%d)", kSection, whCount)) {
      const CString s = SectionOf(L"%s_WH(%d)", n);
      auto* w = new WEIGHT_HEIGHT_INFO;
      int32_t date[3] = {0, 0, 0};
      ScanInts(RD_STRING(h, s, L"date", L""), L'/', date, 3);
      w->date1 = date[0];
      w->date2 = date[1];
      w->date3 = date[2];
      w->weight = RD_FLOAT(h, s, L"weight", 0.0);
      w->height = RD_FLOAT(h, s, L"height", 0.0);
      weightHeights.AddTail(w);
    }
    RD_END(h);
  }
  // The suite-wide file holds the version check for every application; where it has a value,
  // that value wins over the copy in the profile.
  if (const unsigned long s = RD_BEGIN(GetSuiteSettingsPathName())) {
    ReadKeys(s, *this, kVersionCheckKeys, /*onlyPresent=*/true);
    RD_END(s);
  }
}

bool USER_MAP_INFO::WriteInfo() {
  MakeDir(PathFolder(GetProfilePathName()));
  const unsigned long h = WR_BEGIN(GetProfilePathName());
  if (!h) return false;
  WriteKeys(h, *this, kHeadKeys);
  WR_STRING(h, kSection, L"user_password", keepPassword ? navmisc::ProtectSecret(password) : CString());
  WriteKeys(h, *this, kTutorialKey);
  if (appType == GPS_APP_TRACKER) WriteKeys(h, *this, kTrackerKeys);
  WriteKeys(h, *this, kUnitKeys);
  const VORLA_PC_VERSION_INFO& v = g_sVersionInfo;
  WR_STRING(h, kSection, L"version", FormatString(L"%-d,%-d,%-d,%-d", v.nMajor, v.nMinor, v.nBuild, v.nRevision));
  WriteKeys(h, *this, kTimeKeys);
  WriteKeys(h, *this, kVersionCheckKeys);
  WriteKeys(h, *this, kTailKeys);
  WR_INT(h, kSection, L"marker_item_info_count", markers.GetCount());
  WR_INT(h, kSection, L"runner_item_info_count", runners.GetCount());
  WR_INT(h, kSection, L"weightheight_count", weightHeights.GetCount());
  int n = 0;
  for (auto* m : navmisc::Items<MARKER_ITEM_INFO>(markers)) {
    const CString s = SectionOf(L"%s_MKR(%d)", n++);
    WR_STRING(h, s, L"id", m->id);
    WR_STRING(h, s, L"url", m->url);
  }
  n = 0;
  for (auto* r : navmisc::Items<RUNNER_ITEM_INFO>(runners)) {
    const CString s = SectionOf(L"%s_RUN(%d)", n++);
    WR_INT(h, s, L"userdef", r->userDefined ? 1 : 0);
    WR_INT(h, s, L"net_src", r->netSource ? 1 : 0);
    WR_STRING(h, s, L"id", r->id);
    WR_INT(h, s, L"width", r->width);
    WR_INT(h, s, L"height", r->height);
    WR_INT(h, s, L"count", r->frameCount);
    for (int f = 0; f < r->frameCount && f < RUNNER_ITEM_INFO::kMaxFrames; ++f) {
      WR_STRING(h, s, FormatString(L"url_%d", f), r->frameUrl[f]);
    }
  }
  n = 0;
  for (auto* w : navmisc::Items<WEIGHT_HEIGHT_INFO>(weightHeights)) {
    const CString s = SectionOf(L"%s_WH(%d)", n++);
    WR_STRING(h, s, L"date", FormatString(L"%02d/%02d/%04d", w->date1, w->date2, w->date3));
    WR_FLOAT(h, s, L"weight", w->weight);
    WR_FLOAT(h, s, L"height", w->height);
  }
  const bool profileOk = WR_END(h) == 1;

  MakeDir(g_szAppDataPath);
  const unsigned long s = WR_BEGIN(GetSuiteSettingsPathName());
  if (!s) return false;
  WriteKeys(s, *this, kVersionCheckKeys);
  const bool suiteOk = WR_END(s) == 1;
  return profileOk && suiteOk;
}

bool USER_MAP_INFO::SetWeightHeight(int first, int second, int third, double w, double hgt) {
  for (auto* e : navmisc::Items<WEIGHT_HEIGHT_INFO>(weightHeights)) {
    if (e->date1 == first && e->date2 == second && e->date3 == third) {
      e->weight = w;
      e->height = hgt;
      return true;
    }
  }
  auto* e = new WEIGHT_HEIGHT_INFO;
  e->date1 = first;
  e->date2 = second;
  e->date3 = third;
  e->weight = w;
  e->height = hgt;
  weightHeights.AddTail(e);
  return false;
}

bool USER_MAP_INFO::GetWeightHeight(int first, int second, int third, double& w, double& hgt) {
  // Dates compare as year, month, day.
  auto key = [](int month, int d, int y) { return (static_cast<long long>(y) * 13 + month) * 32 + d; };
  const long long want = key(first, second, third);
  const WEIGHT_HEIGHT_INFO* before = nullptr;  // latest entry on or before the date
  const WEIGHT_HEIGHT_INFO* earliest = nullptr;
  for (auto* e : navmisc::Items<WEIGHT_HEIGHT_INFO>(weightHeights)) {
    const long long k = key(e->date1, e->date2, e->date3);
    if (k <= want && (!before || k >= key(before->date1, before->date2, before->date3))) before = e;
    if (!earliest || k < key(earliest->date1, earliest->date2, earliest->date3)) earliest = e;
  }
  const WEIGHT_HEIGHT_INFO* found = before ? before : earliest;
  if (!found) return false;
  w = found->weight;
  hgt = found->height;
  return true;
}

USER_MAP_INFO* GetUserMapInfo(GPS_APP_PROG_TYPE type) {
  switch (type) {
    case GPS_APP_TRIP: return &g_TripMapInfo;
    case GPS_APP_SPORT: return &g_SportMapInfo;
    case GPS_APP_TRACKER: return &g_TrackerMapInfo;
    case GPS_APP_WHEREAMI: return &g_WhereMapInfo;
  }
  return nullptr;
}

long GetProfileTimeShift(GPS_APP_PROG_TYPE type) {
  const USER_MAP_INFO* p = GetUserMapInfo(type);
  if (!p || !p->timeZoneShiftOn) return 0;
  return static_cast<long>(p->timeZoneShift) + (p->dayLight ? 7200 : 0);
}
