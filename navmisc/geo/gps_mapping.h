// Mapping between a time and a position on a track, and the placement of photos on a trip's
// tracks. Between two recorded points a track is filled in as a great-circle line with one
// point per second (legs longer than 999 seconds get 1000 evenly timed points).
//
// Times are seconds since 1970 (a time below 1 means none), positions decimal degrees (exactly
// 0.0/0.0 means none), tolerances metres, speeds metres per hour, altitudes metres.
#pragma once

#include <memory>

#include "navmisc/geo/gps_helper.h"
#include "navmisc/platform/cstring.h"
#include "navmisc/platform/lists.h"

class PHOTO_ITEM_INFO;
class TRACK_ITEM_INFO;

class CGPSMapping : public CGPSHelper {
 public:
  // Copies `count` records of `points`; the caller keeps (and frees) its own array.
  CGPSMapping(const sWayPoint* points, int count);
  CGPSMapping(const CGPSMapping&) = delete;
  CGPSMapping& operator=(const CGPSMapping&) = delete;
  ~CGPSMapping() override;

  // Where the track was at `time`: a recorded point when the time matches one, otherwise the
  // interpolated record nearest in time (a tie goes to the earlier one); `point` then carries
  // that record's own time. 0 when the time lies outside the track or there are fewer than two
  // points.
  int MappingTimeToPoint(long time, sWayPoint& point);
  // When the track passed nearest to `point` (latitude and longitude are read): the time of the
  // nearest interpolated record of the nearest leg, when it lies within `tolerance` metres. A
  // track of one point answers with that point's time whatever the position. 0 when not found.
  int MappingPointToTime(sWayPoint point, long& time, double tolerance);

  int GetCount() const { return m_nCount; }

 protected:
  // The leg from p1 to p2 with one record per second, at most `limit` records (then evenly timed);
  // both ends are copies of p1 and p2. Returns a new array (delete[]) and sets `count`; null
  // with `count` 0 when p2 is earlier than p1.
  sWayPoint* _Expand2(const sWayPoint* p1, const sWayPoint* p2, int& count, int limit);
  // _Expand2 without a limit.
  sWayPoint* _Expand(const sWayPoint* p1, const sWayPoint* p2, int& count);

  // The answer for a time within the leg (i - 1, i), its ends included.
  int _MapTimeOnLeg(int i, long time, sWayPoint& point);
  // The answer for a time strictly inside the leg (i - 1, i).
  int _MapTimeWithinLeg(int i, long time, sWayPoint& point);
  // The answer for a position whose nearest leg is (i, i + 1).
  int _MapPointNearLeg(int i, double latitude, double longitude, long& time, double tolerance);

  sWayPoint* m_pPoints = nullptr;
  int m_nCount = 0;
};

// The first track of `tracks` (TRACK_ITEM_INFO*) that was at `time`, tried in order; with a
// non-empty `trackId` only the track of that id (case-sensitive). Sets the position, altitude and
// speed; null (outputs untouched) when no track was there.
TRACK_ITEM_INFO* GetTrackGPSFromTime(const CPtrList& tracks, long time, double& latitude,
                                     double& longitude, double& altitude, long& speed,
                                     const wchar_t* trackId);
// The first track that passed within `tolerance` metres of the position. Sets `time`, and snaps
// the position onto the track (with altitude and speed from it). Null when none did.
TRACK_ITEM_INFO* GetTrackTimeFromGPS(const CPtrList& tracks, double tolerance, double& latitude,
                                     double& longitude, double& altitude, long& speed, long& time,
                                     const wchar_t* trackId);
// Places one item: by its time when it has one that falls on a track (the given track first,
// then any), otherwise by its position; an item that matches neither is cleared of its place
// (empty track id, time -1, position 0/0, altitude 0, speed 0) and false is returned.
bool MappingGPSAndTrack(const CPtrList& tracks, double tolerance, CString& trackId,
                        double& latitude, double& longitude, double& altitude, long& speed,
                        long& time);
// The same for a photo's own fields (track id, position, altitude, speed, playback time).
bool MappingGPSAndTrack(const CPtrList& tracks, double tolerance, PHOTO_ITEM_INFO* photo);

// Inserts `photo` into a trip's photo list (PHOTO_ITEM_INFO*) in display order: placed photos by
// playback time, then placed photos without one by original time, then unplaced photos by
// original time; before existing entries with equal keys.
void InsertItemToPhotoList(CPtrList& photos, PHOTO_ITEM_INFO* photo);
// Inserts `track` before the first track that starts strictly later (start = time of its first
// point; a track without points counts as starting at the end of time).
void InsertItemToTrackList(CPtrList& tracks, TRACK_ITEM_INFO* track);

namespace navmisc {

// While an object of this class lives, the track-level mappings on the same thread
// (TRACK_ITEM_INFO::MappingTimeToPoint and MappingPointToTime, and so GetTrackGPSFromTime,
// GetTrackTimeFromGPS and MappingGPSAndTrack) reuse one indexed working copy per track instead of
// rebuilding the working array for every call: use it around a batch of placements. The answers
// are exactly those without the scope.
//
// REQUIRES: the point records of the tracks are not edited in place while the scope lives.
// Adding or removing points is detected (the copy is rebuilt when the list's count or its first
// or last entry changes), editing a point's time or position is not. Scopes nest; the innermost
// one serves. Not shared between threads.
class TrackMappingScope {
 public:
  TrackMappingScope();
  ~TrackMappingScope();
  TrackMappingScope(const TrackMappingScope&) = delete;
  TrackMappingScope& operator=(const TrackMappingScope&) = delete;

  // The scope's indexed copies (internal).
  struct Impl;
  Impl& impl() { return *impl_; }

 private:
  std::unique_ptr<Impl> impl_;
  TrackMappingScope* previous_;
};

}  // namespace navmisc
