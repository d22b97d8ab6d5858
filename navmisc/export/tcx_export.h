// Training Center Database (TCX v2) export of one activity made of laps of tracks.
#pragma once

#include <cstdint>

#include "navmisc/export/export_control.h"
#include "navmisc/platform/cstring.h"
#include "navmisc/platform/lists.h"

// One lap of an activity. Zero or negative figures mean "unknown" and leave their element out
// (total time and distance are always written).
class TcxLap {
 public:
  int32_t startTime = 0;        // seconds since 1970, UTC; 0 or less = unknown
  double totalTimeSeconds = 0;  // seconds (written truncated to whole seconds)
  double distanceMeters = 0;    // metres
  double maximumSpeed = 0;      // metres per second
  int32_t calories = 0;         // kilocalories
  int32_t averageHeartRate = 0;  // beats per minute
  int32_t maximumHeartRate = 0;  // beats per minute
  // TRACK_ITEM_INFO*, not owned. Their points' working values (cumulative distance, speed,
  // heart rate, cadence) and presence flags are what the Trackpoints show.
  CPtrList tracks;
};

// The activity to export; it owns its laps.
class CTcxActivities {
 public:
  enum SportType : int32_t { kBiking = 0, kRunning = 1, kOther = 2 };  // 2 to 7 are all "Other"

  CTcxActivities() = default;
  ~CTcxActivities();
  CTcxActivities(const CTcxActivities&) = delete;
  CTcxActivities& operator=(const CTcxActivities&) = delete;

  // Appends a new empty lap and returns it.
  TcxLap* AddLap();

  CString Id;             // must not be empty; readers expect a date-time such as the start
  int32_t sportType = 0;  // 0 to 7
  CPtrList laps;          // TcxLap*, owned
};

// Writes `activity` as a TCX v2 document at `path`, replacing any file there (a read-only one
// too). A Trackpoint is written for every point that has a time and at least one presence flag.
// Text is not escaped: an Id holding "&" or "<" is written raw. Lines end in LF, without
// indentation. A document whose UTF-8 form would be longer than twice its length in characters
// (an Id made of many characters outside the Latin scripts) leaves the file empty.
//
// Returns 1 when written; 0 when the activity is rejected (empty Id, sport type outside 0 to 7),
// and then no file is touched, or when the target cannot be opened.
int ExportTcx(CString path, CTcxActivities& activity);

// The same under `control`: progress (one step per track point of the laps), stopping, and the
// reason when the activity is rejected, the target could not be opened or a write failed (a
// write error leaves the result at 1). The points must be loaded: with pointsFromFiles set the
// call returns 0 without touching the target.
int ExportTcx(CString path, CTcxActivities& activity, ExportControl& control);
