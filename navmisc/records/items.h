// The plain value records out of which trips are built: located items, track points, sensor
// samples, map icons, page templates. Times are seconds since 1970 (UTC), coordinates decimal
// degrees (north and east positive).
//
// Every record with a constructor taking a pointer to its own type copies from it (null gives the
// defaults); that is the constructor the readers and track builders use. The copy constructor
// and assignment exist too and differ from it where noted.
#pragma once

#include <cstdint>

#include "navmisc/platform/cstring.h"

// The base of every located item; a cell-tower fix of a track is a bare BASE_ITEM_INFO.
class BASE_ITEM_INFO {
 public:
  explicit BASE_ITEM_INFO(const BASE_ITEM_INFO* from = nullptr);
  // Unlike the pointer constructor, these two also copy `lastAttr`.
  BASE_ITEM_INFO(const BASE_ITEM_INFO& other);
  BASE_ITEM_INFO& operator=(const BASE_ITEM_INFO& other);
  virtual ~BASE_ITEM_INFO();

  int32_t time = -1;       // seconds since 1970; -1 = no time
  double longitude = 0.0;  // degrees east (stored before latitude; files write latitude first)
  double latitude = 0.0;   // degrees north
  CString name;            // cell identity text of a cell fix, label of a help point
  int32_t attr1 = 0;       // carried and copied, not interpreted here
  int32_t attr2 = 0;
  double reserve = 0.0;
  int16_t smallAttr = 0;
  // Copied by the copy constructor and assignment only; the pointer constructor leaves it 0.
  uint32_t lastAttr = 0;
};

// One track point.
class WAYPOINT_ITEM_INFO : public BASE_ITEM_INFO {
 public:
  // Indices into `flags`.
  static constexpr int kFlagKept = 0;      // set by the cleaning passes on points that stay
  static constexpr int kFlagPresence = 1;  // which working values hold a reading (bits below)
  // Bits of flags[kFlagPresence], set by the TCX export; the activity summaries mark their own
  // points with the same bits.
  static constexpr uint8_t kHasPosition = 1;   // latitude and longitude are a real fix
  static constexpr uint8_t kHasHeartRate = 2;  // workHeartRate
  static constexpr uint8_t kHasCadence = 4;    // workCadence
  static constexpr uint8_t kHasSpeed = 8;      // workSpeed

  // Defaults: reserve -2.0, course -1, time -1, everything else 0. A copy takes every field
  // except the working values, which start at zero.
  explicit WAYPOINT_ITEM_INFO(const WAYPOINT_ITEM_INFO* from = nullptr);
  WAYPOINT_ITEM_INFO(const WAYPOINT_ITEM_INFO& other);
  WAYPOINT_ITEM_INFO& operator=(const WAYPOINT_ITEM_INFO& other);
  ~WAYPOINT_ITEM_INFO() override;

  int32_t type = 0;       // optimisation level >= 0; -1 redundant (stop); -2 revised (bad fix)
  double altitude = 0.0;  // metres
  int32_t speed = 0;      // metres per hour
  int32_t course = -1;    // whole degrees; -1 unknown
  int32_t extraA = 0;     // stored in the point files, not interpreted here
  int32_t extraB = 0;     // stored in the main point file only
  uint8_t flags[4] = {0, 0, 0, 0};

  // Working values: scratch for processing, never copied. The TCX export reads them as the
  // cumulative distance (metres), speed (metres per second), heart rate (bpm) and cadence (rpm).
  double workDistance = 0.0;
  double workSpeed = 0.0;
  int32_t workHeartRate = 0;
  int32_t workCadence = 0;

 private:
  void CopyFrom(const WAYPOINT_ITEM_INFO& o);
};

// Equal when type, time, latitude, longitude, altitude, speed, extra value A and course are
// equal (doubles compared exactly). Name, extra value B and the flags do not take part.
bool operator==(const WAYPOINT_ITEM_INFO& a, const WAYPOINT_ITEM_INFO& b);

// Per-second sensor samples: a time and up to 24 byte values; 255 ends the used part.
class HEARTRATE_ITEM_INFO {
 public:
  static constexpr int kValues = 24;
  static constexpr uint8_t kEnd = 255;
  explicit HEARTRATE_ITEM_INFO(const HEARTRATE_ITEM_INFO* from = nullptr);
  HEARTRATE_ITEM_INFO(const HEARTRATE_ITEM_INFO& other) = default;
  HEARTRATE_ITEM_INFO& operator=(const HEARTRATE_ITEM_INFO& other) = default;
  ~HEARTRATE_ITEM_INFO();
  // Number of values before the first 255.
  int UsedCount() const;

  int32_t time = -1;
  uint8_t values[kValues];  // beats per minute
};

class CYCLING_CADENCE_RPM_ITEM_INFO {
 public:
  static constexpr int kValues = 24;
  static constexpr uint8_t kEnd = 255;
  explicit CYCLING_CADENCE_RPM_ITEM_INFO(const CYCLING_CADENCE_RPM_ITEM_INFO* from = nullptr);
  CYCLING_CADENCE_RPM_ITEM_INFO(const CYCLING_CADENCE_RPM_ITEM_INFO& other) = default;
  CYCLING_CADENCE_RPM_ITEM_INFO& operator=(const CYCLING_CADENCE_RPM_ITEM_INFO& other) = default;
  ~CYCLING_CADENCE_RPM_ITEM_INFO();
  int UsedCount() const;

  int32_t time = -1;
  uint8_t values[kValues];  // revolutions per minute
};

// A time and up to 12 wheel speeds; -1.0 ends the used part.
class WHEEL_SPEED_ITEM_INFO {
 public:
  static constexpr int kValues = 12;
  explicit WHEEL_SPEED_ITEM_INFO(const WHEEL_SPEED_ITEM_INFO* from = nullptr);
  WHEEL_SPEED_ITEM_INFO(const WHEEL_SPEED_ITEM_INFO& other) = default;
  WHEEL_SPEED_ITEM_INFO& operator=(const WHEEL_SPEED_ITEM_INFO& other) = default;
  ~WHEEL_SPEED_ITEM_INFO();
  int UsedCount() const;

  int32_t time = -1;
  double values[kValues];
};

// One entry of the user's weight and height history. The three date numbers are kept in the
// order USER_MAP_INFO::SetWeightHeight takes them: month, day, year.
class WEIGHT_HEIGHT_INFO {
 public:
  WEIGHT_HEIGHT_INFO& operator=(const WEIGHT_HEIGHT_INFO& other) = default;

  int32_t date1 = 0;
  int32_t date2 = 0;
  int32_t date3 = 0;
  double height = 0.0;  // centimetres
  double weight = 0.0;  // kilograms
};

// A map marker icon.
class MARKER_ITEM_INFO {
 public:
  MARKER_ITEM_INFO() = default;
  MARKER_ITEM_INFO(const MARKER_ITEM_INFO& other) = default;
  MARKER_ITEM_INFO& operator=(const MARKER_ITEM_INFO& other) = default;
  ~MARKER_ITEM_INFO() = default;

  CString id;
  CString url;
};

// An animated runner icon that plays a track back on the map. When `netSource` is clear its
// frame images are files in the trip's resource folder, named by the frame URLs.
class RUNNER_ITEM_INFO {
 public:
  static constexpr int kMaxFrames = 8;
  RUNNER_ITEM_INFO() = default;
  RUNNER_ITEM_INFO(const RUNNER_ITEM_INFO& other) = default;
  RUNNER_ITEM_INFO& operator=(const RUNNER_ITEM_INFO& other) = default;
  ~RUNNER_ITEM_INFO() = default;

  bool userDefined = false;
  bool netSource = false;
  CString id;
  int32_t width = 0;   // pixels
  int32_t height = 0;  // pixels
  uint8_t frameCount = 0;  // at most kMaxFrames
  CString frameUrl[kMaxFrames];
};

// One web-page template of the catalogue.
class TEMPLATE_ITEM_INFO {
 public:
  TEMPLATE_ITEM_INFO() = default;
  TEMPLATE_ITEM_INFO(const TEMPLATE_ITEM_INFO& other) = default;
  TEMPLATE_ITEM_INFO& operator=(const TEMPLATE_ITEM_INFO& other) = default;
  ~TEMPLATE_ITEM_INFO() = default;

  CString name;
  CString description;
  CString thumbnailPath;
  CString landmarkPath;
  int32_t landmarkWidth = 0;
  int32_t landmarkHeight = 0;
  int32_t mode = 0;
  int32_t style = 0;
  bool wideStyle = false;  // style of 100 or more
  int32_t graph = 0;
  int32_t summary = 0;
  bool brandedLabel = false;
};

// The web-publishing state of one photo on the two publishing servers. Index 0..4 of the first
// set and 0..3 of the second are the sizes in which the service stores the picture.
class _PHOTO_ITEM_URL {
 public:
  _PHOTO_ITEM_URL() = default;
  _PHOTO_ITEM_URL(const _PHOTO_ITEM_URL& other) = default;
  _PHOTO_ITEM_URL& operator=(const _PHOTO_ITEM_URL& other);
  ~_PHOTO_ITEM_URL() = default;

  bool dirty = true;
  bool isPublic = true;
  CString serverId;
  CString url[5];
  int32_t width[5] = {0, 0, 0, 0, 0};
  int32_t height[5] = {0, 0, 0, 0, 0};
  bool dirty2 = true;
  bool isPublic2 = false;
  uint8_t server2 = 0;
  CString serverId2;
  CString url2[4];
  int32_t width2[4] = {0, 0, 0, 0};
  int32_t height2[4] = {0, 0, 0, 0};
};
