// One recorded path of a trip: its attributes live in the trip's settings file, its points and
// sensor samples in up to six text files in the trip's resource folder, named after its id
// (see docs/point-files.md).
#pragma once

#include <cstdint>

#include "navmisc/platform/lists.h"
#include "navmisc/records/items.h"

class BLOG_ITEM_INFO;

class TRACK_ITEM_INFO {
 public:
  // A new track of `trip`: a fresh "TK_" id, has-GPS-data set.
  explicit TRACK_ITEM_INFO(BLOG_ITEM_INFO* trip);
  // A copy of `from` for another trip: a fresh id, the attributes, the six files and the
  // runner's frame files copied; the points are read from the copied files on demand.
  TRACK_ITEM_INFO(BLOG_ITEM_INFO* trip, TRACK_ITEM_INFO* from);
  TRACK_ITEM_INFO(const TRACK_ITEM_INFO&) = delete;
  TRACK_ITEM_INFO& operator=(const TRACK_ITEM_INFO&) = delete;
  virtual ~TRACK_ITEM_INFO();

  // Settings keys of the track, into `section` of an open settings file.
  void WriteInfo(unsigned long handle, const wchar_t* section, int write, int* counter,
                 bool* keepGoing);
  void ReadInfo(unsigned long handle, const wchar_t* section);

  // Writes the point files (the main file always, the side files when their list is not empty).
  // With `write` zero only the counter advances. Stops early when *keepGoing turns false.
  void WriteAllWaypoint(int write, int* counter, bool* keepGoing);
  // Loads the point files; with `force` zero a track that holds points is left alone.
  void ReadAllWaypoint(int force);

  CString GetFilePathName() const;                // ".BIN": points
  CString GetCellIDFilePathName() const;          // ".ID": cell fixes
  CString GetSOSPointFilePathName() const;        // ".SOS": help points
  CString GetHeartRateFilePathName() const;       // ".HR"
  CString GetCyclingCadenceFilePathName() const;  // ".CS"
  CString GetWheelSpeedFilePathName() const;      // ".SPD"

  // Where the track was at `time` (interpolated one point per second between records).
  bool MappingTimeToPoint(long time, double& latitude, double& longitude, long& speed,
                          double& altitude);
  // When the track passed nearest to a position, within `tolerance` metres; -1 when not.
  long MappingPointToTime(double latitude, double longitude, double tolerance);

  // The name shown for the track (exports use it): its description.
  const CString& GetName() const { return description; }
  // False for the thinned copies that share their points with the real track (they never delete
  // or reload them).
  bool OwnsPoints() const { return ownsPoints_; }
  // Empties every list, deleting the records the track owns.
  void ClearAll();

  BLOG_ITEM_INFO* trip = nullptr;  // the owning trip (resource folder, application type)
  CString id;                      // "TK_" + 16 hex digits; names the files
  CString modelId;
  CString description;
  CString runner;                  // id of the runner icon that plays the track back
  uint32_t color = 0;              // RGB of the line, red in the low byte
  int32_t transparency = 0;
  bool hasGpsData = true;          // false for a track of sensor samples only
  CPtrList points;                 // WAYPOINT_ITEM_INFO*, in time order
  CPtrList cellFixes;              // BASE_ITEM_INFO* (tracker application)
  CPtrList helpPoints;             // WAYPOINT_ITEM_INFO* (tracker application, "SOS" button)
  CPtrList heartRates;             // HEARTRATE_ITEM_INFO*
  CPtrList cadences;               // CYCLING_CADENCE_RPM_ITEM_INFO*
  CPtrList wheelSpeeds;            // WHEEL_SPEED_ITEM_INFO*

 protected:
  struct SharedPointsTag {};
  // A thinned track: same trip and id, points shared with (and owned by) another track.
  TRACK_ITEM_INFO(BLOG_ITEM_INFO* trip, const CString& sameId, SharedPointsTag);
  friend void CreateOptimizeTrack(BLOG_ITEM_INFO* trip, CPtrList& oldTracks);

 private:
  CString FilePath(const wchar_t* extension) const;
  bool ownsPoints_ = true;
};
