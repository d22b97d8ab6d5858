// The user profile of each application of the suite ("USER_MAP_INFO.INI" in the application's
// data folder) and the suite-wide version-check settings ("AMBRO_SUITE_INFO.INI" in the data
// root). Keys and defaults are listed in docs/profile-keys.md.
#pragma once

#include <cstdint>

#include "navmisc/platform/lists.h"
#include "navmisc/platform/types.h"
#include "navmisc/records/items.h"

class USER_MAP_INFO {
 public:
  explicit USER_MAP_INFO(GPS_APP_PROG_TYPE type);
  USER_MAP_INFO(const USER_MAP_INFO&) = delete;
  USER_MAP_INFO& operator=(const USER_MAP_INFO&) = delete;
  virtual ~USER_MAP_INFO();

  // Reads the profile and the suite settings; a missing file reads as all defaults.
  void ReadInfo();
  // Writes both files; true when both were written.
  bool WriteInfo();

  // Sets the weight and height of a date (month, day, year). True when an entry of that date
  // existed and was replaced, false when a new entry was appended.
  bool SetWeightHeight(int first, int second, int third, double weight, double height);
  // The weight and height in force on a date: the entry of that date, else the latest earlier
  // one, else the earliest one. False (outputs untouched) when the history is empty.
  bool GetWeightHeight(int first, int second, int third, double& weight, double& height);

  CString GetProfilePathName() const;
  static CString GetSuiteSettingsPathName();
  // Back to the defaults of a profile that was never saved (lists emptied).
  void Reset();

  GPS_APP_PROG_TYPE appType;
  CString name;
  bool male = true;
  int32_t year = 0;   // date of birth
  int32_t month = 0;
  int32_t day = 0;
  double height = 170.0;  // centimetres
  double weight = 60.0;   // kilograms
  CString userAccount;
  bool keepPassword = false;
  CString password;  // in memory only in clear; stored protected (docs/profile-keys.md)
  bool tutorial = true;
  int32_t trackerType = 0;  // the "tracker_" values are kept by the tracker application only
  CString trackerTimeZone;
  bool trackerDayLight = false;
  int32_t trackerTimeZoneShift = 0;
  bool metric = true;
  CString localize = L"ENG";
  int32_t version[4] = {0, 0, 0, 0};  // version of the program that wrote the profile
  bool dayLight = false;
  int32_t timeZoneShift = 0;   // seconds
  bool timeZoneShiftOn = false;  // apply timeZoneShift to loaded data (profiles of old versions)
  CString googleApiKey;
  CString verUniqueId;
  bool verEnableCheck = true;
  int32_t verCheckPeriodIndex = 0;
  int32_t verCheckPeriodTime = 604800;  // seconds
  int32_t verLastCheckTime = 0;         // seconds since 1970
  bool verHidePrompt = false;
  int32_t devModel = 0;
  double devVersion = 0.0;
  int32_t devSerial = 0;
  int32_t tempMode = 1;
  int32_t tempStyle = 2;
  bool autoLaunch = true;
  bool clearDeviceData = false;
  bool geotagCallEditor = true;
  CString importPhoto;
  CString importPhotoFolder;
  CString viewPhotoGeotag;
  CString editPhoto;
  CString importGpx;
  CString exportGpx;
  CString exportTcx;
  CString exportCsv;
  CString photoDefMarkerId;
  CString landmarkDefMarkerId;
  CString trackDefRunnerId;
  CPtrList markers;        // MARKER_ITEM_INFO*, owned
  CPtrList runners;        // RUNNER_ITEM_INFO*, owned
  CPtrList weightHeights;  // WEIGHT_HEIGHT_INFO*, owned, in the order entered
};

extern USER_MAP_INFO g_TripMapInfo;
extern USER_MAP_INFO g_SportMapInfo;
extern USER_MAP_INFO g_TrackerMapInfo;
extern USER_MAP_INFO g_WhereMapInfo;

// The profile of an application type; null for an unknown type.
USER_MAP_INFO* GetUserMapInfo(GPS_APP_PROG_TYPE type);
// The time shift, in seconds, that loaded data of an application type gets: the profile's shift
// plus 7200 with its daylight switch, when its time-shift switch is on; else 0.
long GetProfileTimeShift(GPS_APP_PROG_TYPE type);
