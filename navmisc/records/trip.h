// A trip: a set of tracks, photos and runner icons with the attributes that govern how it is
// shown and published. Each trip lives in its own folder (its id) under the data folder of the
// application that owns it; the folder holds "BLOG_ITEM_INFO.INI" (see docs/trip-files.md),
// the track point files and the photo folders.
#pragma once

#include <cstdint>

#include "navmisc/platform/lists.h"
#include "navmisc/platform/types.h"
#include "navmisc/records/items.h"
#include "navmisc/records/photo.h"
#include "navmisc/records/track.h"

class BLOG_ITEM_INFO {
 public:
  // With a folder name: the trip of that id, about to be read. Without one: a new trip with a
  // new id whose folder is created. `index` enters the new id as one hexadecimal digit.
  BLOG_ITEM_INFO(GPS_APP_PROG_TYPE type, const wchar_t* folder = nullptr, int index = 0);
  // Duplicates `from` into a new folder: settings, runners, tracks with their files, photos.
  BLOG_ITEM_INFO(BLOG_ITEM_INFO* from, const wchar_t* folder, int index);
  BLOG_ITEM_INFO(const BLOG_ITEM_INFO&) = delete;
  BLOG_ITEM_INFO& operator=(const BLOG_ITEM_INFO&) = delete;
  virtual ~BLOG_ITEM_INFO();

  // The settings file. WriteInfo writes only when `write` is non-zero and advances `*counter`
  // either way; a cleared *keepGoing stops it and leaves the old file in place.
  void WriteInfo(int write, int* counter, bool* keepGoing);
  // 1 when the settings file was read, 0 when it cannot be opened or names no trip id.
  int ReadInfo();

  void WriteAllWaypoint(int write, int* counter, bool* keepGoing);
  // Saves the trip as one unit: every point file and the settings file are written, and only
  // when all of them succeeded do they replace the old ones, together. False, with every file
  // of the trip as it was, when any write failed or *keepGoing turned false; `why` (may be
  // null) then says what failed.
  bool SaveAll(int* counter, bool* keepGoing, CString* why);
  // Loads every track's points; tracks left without points drop out of the trip.
  void ReadAllWaypoint(int force);

  // Number of tracks; `total` points (0/0 positions excluded) and the `kept` ones under the
  // trip's optimisation settings.
  long GetTrackInfo(long& total, long& kept);
  // Earliest time over all tracks and their side lists; 2147483647 without tracks.
  long GetUTCStartTime();
  // Latest time; 0 without tracks.
  long GetUTCEndTime();

  // Sets every point's optimisation level and the trip's display level (`optLevel`).
  void OptimizeWaypoint(GPS_APP_PROG_TYPE product, int optimise, int* progress, bool* keepGoing);

  CString GetResourcePath() const;
  CString GetBlogItemProfilePathName() const;  // "BLOG_ITEM_INFO.INI"
  CString GetMapProfilePathName() const;       // "MAP_PROFILE.INI"
  CString GetMapHtmlPathName() const;          // "MAP_HTMLFILE.HTM"

  // Deletes every runner, track and photo.
  void ClearAll();

  GPS_APP_PROG_TYPE appType;
  CString tripId;       // also the trip's folder name
  CString fileName;
  CString name;
  CString description;
  CString coverPageId;  // photo id of the cover picture
  CString languageId;   // web language code
  int32_t createTime = 0;
  bool optOptimize = true;    // optimisation levels in use
  bool optRevise = true;      // hide level -2 points (bad fixes)
  bool optRedundance = true;  // hide level -1 points (stops)
  int32_t optLevel = 0;       // hide points whose level is below this
  CString timeZone;
  bool dayLight = false;
  int32_t timeZoneShift = 0;  // seconds
  int32_t displayType = 2;
  int32_t playbackSpeed = 60;
  uint8_t tempMode = 0;
  uint8_t tempStyle = 0;
  uint8_t subSample = 1;
  uint8_t correction = 1;
  uint8_t zoom = 10;
  bool netDirty = true;
  bool netPublic = true;
  CString serverId;
  CString netUrl;
  CString tags;
  CPtrList runners;  // RUNNER_ITEM_INFO*, owned
  CPtrList tracks;   // TRACK_ITEM_INFO*, owned
  CPtrList photos;   // PHOTO_ITEM_INFO*, owned

 protected:
  // The id of this trip's track that stands where `photo`'s track stands in the photo's own
  // trip; null when none matches.
  const wchar_t* _GetAssociateTrackID(PHOTO_ITEM_INFO* photo);
  friend class PHOTO_ITEM_INFO;

 private:
  void SetNewTripDefaults();
};

// The trip the calling application currently works on.
extern BLOG_ITEM_INFO* g_pBlogItem;

// Keeps thinned copies of the trip's tracks (points filtered by the trip's optimisation
// settings, shared with the real tracks, not owned) in the trip, and the real tracks in
// `oldTracks`. Always undo with RestoreOldTrack before the trip is saved or freed.
void CreateOptimizeTrack(BLOG_ITEM_INFO* trip, CPtrList& oldTracks);
// Destroys the thinned tracks (never their points) and puts the real ones back. Does nothing
// when `oldTracks` is empty; the caller empties `oldTracks` afterwards.
void RestoreOldTrack(BLOG_ITEM_INFO* trip, CPtrList& oldTracks);

// The folder of an application type's data under the data root ("Resource", ...).
CString GetAppDataFolder(GPS_APP_PROG_TYPE type);
