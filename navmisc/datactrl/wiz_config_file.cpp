// The wizard's settings file: defaults, reading and writing (docs/device-settings-file.md).
#include "navmisc/datactrl/device_state.h"
#include "navmisc/datactrl/wiz_config_sheet.h"
#include "navmisc/platform/files.h"
#include "navmisc/platform/settings.h"
#include "navmisc/platform/shared_globals.h"
#include "navmisc/util/timezone.h"

namespace {

constexpr const wchar_t* kTzSection = L"TZINFO";
// A stored -1 counts as absent, like a missing key.
constexpr int kAbsent = -1;

CString ModeSection(int mode) { return FormatString(L"MODEL_%d", mode); }

// Reads an integer key that replaces `value` only when it is present.
void ReadIfPresent(unsigned long ini, const wchar_t* section, const wchar_t* key, int32_t& value) {
  const int v = RD_INT(ini, section, key, kAbsent);
  if (v != kAbsent) value = v;
}
void ReadIfPresent(unsigned long ini, const wchar_t* section, const wchar_t* key, bool& value) {
  const int v = RD_INT(ini, section, key, kAbsent);
  if (v != kAbsent) value = v >= 1;
}

}  // namespace

CString CWizConfigSheet::GetSettingFilePath() {
  CString folder = g_szSoftwareCompanyname;
  if (folder.IsEmpty() || folder.GetAt(0) != L'/') {
    const CString config = UserConfigFolder();
    if (config.IsEmpty()) return {};  // no home folder: no settings file rather than one in the current folder
    folder = PathJoin(config, folder);
  }
  const CString name =
      FormatString(L"device_%d_%d.ini", static_cast<int>(g_wDeviceModelID), g_wDeviceSerialID);
  return PathJoin(PathJoin(folder, L"vorla"), name);
}

void CWizConfigSheet::Init_Config_Value() {
  static constexpr int32_t kSmartSpeeds[kModes] = {10, 10, 10, 15, 20, 30};
  for (int i = 0; i < kModes; ++i) {
    WIZ_MODE_INFO& m = modes[i];
    m.nInterval = i == 0 ? 15 : 5;
    m.szName = FormatString(L"Mode %d", i + 1);
    m.bTricklePower = i != 0;
    m.bSmartTracking = i >= 2;
    m.nSmartTrackingInterval = 3;
    m.nSmartTrackingSpeed = kSmartSpeeds[i];
    m.nUnit = 0;
  }
}

int CWizConfigSheet::LoadSettingFile() {
  const unsigned long ini = FileExists(settingFile) ? RD_BEGIN(settingFile) : 0;
  if (!ini) {
    nDayLight = System_DayLight() > 0 ? 1 : 0;
    return 0;
  }
  for (int i = 0; i < kModes; ++i) {
    const CString section = ModeSection(i);
    WIZ_MODE_INFO& m = modes[i];
    ReadIfPresent(ini, section, L"Interval", m.nInterval);
    ReadIfPresent(ini, section, L"Smart_Tracking_Interval", m.nSmartTrackingInterval);
    ReadIfPresent(ini, section, L"SmartTracking_Speed", m.nSmartTrackingSpeed);
    ReadIfPresent(ini, section, L"Unit", m.nUnit);
    if (CString name = RD_STRING(ini, section, L"Name"); !name.IsEmpty()) m.szName = name;
    ReadIfPresent(ini, section, L"TricklePower", m.bTricklePower);
    ReadIfPresent(ini, section, L"SmartTracking", m.bSmartTracking);
  }
  // A file without these keys turns the accelerometer and motion detection off, although a
  // wizard without any file starts with both on.
  nTimeZone = RD_INT(ini, kTzSection, L"TimeZone", -1);
  nDayLight = RD_INT(ini, kTzSection, L"DayLight", -1);
  nBeginTime = RD_INT(ini, kTzSection, L"BeginTime", -1);
  bTricklePower = RD_INT(ini, kTzSection, L"TricklePower", 0) != 0;
  nDualMode = RD_INT(ini, kTzSection, L"DualMode", 0);
  nCycle = RD_INT(ini, kTzSection, L"Cycle", 0);
  bEnableAutoChangeInterval = RD_INT(ini, kTzSection, L"EnableAutoChangeInterval", 0) != 0;
  nUnitSel = RD_INT(ini, kTzSection, L"UnitSel", 0);
  nVScale = RD_INT(ini, kTzSection, L"VScale", -1);
  bAccOn = RD_INT(ini, kTzSection, L"AccOn", 0) != 0;
  bMotionDetect = RD_INT(ini, kTzSection, L"MotionDetect", 0) != 0;
  RD_END(ini);
  return 1;
}

int CWizConfigSheet::WriteSettingFile() {
  MakeDir(PathFolder(settingFile));
  const unsigned long ini = WR_BEGIN(settingFile);
  if (!ini) return 0;
  WR_INT(ini, kTzSection, L"TimeZone", nTimeZone);
  WR_INT(ini, kTzSection, L"DayLight", nDayLight);
  WR_INT(ini, kTzSection, L"BeginTime", nBeginTime);
  WR_INT(ini, kTzSection, L"DualMode", nDualMode);
  WR_INT(ini, kTzSection, L"Cycle", nCycle);
  WR_INT(ini, kTzSection, L"TricklePower", bTricklePower ? 1 : 0);
  WR_INT(ini, kTzSection, L"EnableAutoChangeInterval", bEnableAutoChangeInterval ? 1 : 0);
  WR_INT(ini, kTzSection, L"UnitSel", nUnitSel);
  WR_INT(ini, kTzSection, L"VScale", nVScale);
  WR_INT(ini, kTzSection, L"AccOn", bAccOn ? 1 : 0);
  WR_INT(ini, kTzSection, L"MotionDetect", bMotionDetect ? 1 : 0);
  for (int i = 0; i < kModes; ++i) {
    const CString section = ModeSection(i);
    const WIZ_MODE_INFO& m = modes[i];
    WR_INT(ini, section, L"Interval", m.nInterval);
    WR_STRING(ini, section, L"Name", m.szName);
    WR_INT(ini, section, L"TricklePower", m.bTricklePower ? 1 : 0);
    WR_INT(ini, section, L"Smart_Tracking_Interval", m.nSmartTrackingInterval);
    WR_INT(ini, section, L"SmartTracking_Speed", m.nSmartTrackingSpeed);
    WR_INT(ini, section, L"SmartTracking", m.bSmartTracking ? 1 : 0);
    WR_INT(ini, section, L"Unit", m.nUnit);
  }
  return WR_END(ini);
}
