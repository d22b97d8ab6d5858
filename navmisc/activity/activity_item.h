// What a sport and a tracker activity share: the trip (owned), the calendar fields, the merged
// point list with its moving segments, the two sets of summary figures (the whole activity and
// the selected time range) and the owner's weight and height on the activity's date.
#pragma once

#include <cstdint>
#include <vector>

#include "navmisc/activity/activity_points.h"
#include "navmisc/activity/calories.h"
#include "navmisc/activity/moving_segments.h"
#include "navmisc/activity/summary.h"
#include "navmisc/platform/lists.h"
#include "navmisc/platform/types.h"

class BLOG_ITEM_INFO;
class USER_MAP_INFO;

namespace navmisc::activity {

// `Figures` is SportFigures (sport rules, sensors) or TrackerFigures (tracker rules).
template <class Figures>
class ActivityItem {
 public:
  // Takes `trip`. The selection starts as the whole trip; the creation time is now.
  ActivityItem(int32_t type, BLOG_ITEM_INFO* trip, USER_MAP_INFO* profile);
  ActivityItem(const ActivityItem&) = delete;
  ActivityItem& operator=(const ActivityItem&) = delete;
  // Deletes the trip.
  virtual ~ActivityItem();

  // Rebuilds the merged points (loading the trip's points when needed) and the moving
  // segments, then computes the whole set over the trip's UTC start to end and the selected set
  // over the stored selection. Heart rate and cadence come from the given lists
  // (HEARTRATE_ITEM_INFO*, CYCLING_CADENCE_RPM_ITEM_INFO*), or from the tracks when null.
  void PrepareSummaryData(CPtrList* heartRates, CPtrList* cadences);
  // Selects the UTC range [start, end] and recomputes the selected set only. `segments`
  // (MovingSegment*) replaces the activity's own moving segments when given.
  void UpdateSelSummaryData(long start, long end, CPtrList* segments);

  // The owner's weight (kg) and height (cm) on the activity's date. False, with the profile's
  // defaults, when the date cannot be formed or the history has no entry.
  bool GetWeightHeight(double& weight, double& height);
  // Records a new weight and height for the activity's date; false when both equal the current
  // ones or there is no date.
  bool SetWeightHeight(double weight, double height);

  // The trip's time shift, seconds (local = UTC + shift).
  long TimeShift() const;
  // The trip's UTC start as it was when the activity was made (or last prepared).
  long UtcStartTime() const { return utcStart_; }

  // The activity's keys of the store file, in `section` of an open settings file.
  void WriteStoreKeys(unsigned long handle, const wchar_t* section) const;
  void ReadStoreKeys(unsigned long handle, const wchar_t* section);

  int32_t type;
  BLOG_ITEM_INFO* trip;  // owned
  CRect rect;            // set by the calendar view
  int32_t createTime;    // seconds since 1970 (UTC); -1 unknown
  int32_t curSelTab = 0;  // the tab the user last had open
  int32_t selStartTime;   // the selected range, local seconds
  int32_t selEndTime;
  PointVector points;                  // merged, time-ordered copies of the trip's points
  std::vector<MovingSegment> segments;
  Figures whole;     // the whole activity
  Figures selected;  // the selected range
  USER_MAP_INFO* profile;  // whose weight, height and age count; not owned

 protected:
  // The owner on the activity's local start date.
  Person Owner() const;
  // Computes `out` over the UTC range with the moving totals given.
  void Update(long start, long end, MovingTotals moving, Figures& out);

  std::vector<double> legKm_;
  long utcStart_;
  long utcEnd_;
};

}  // namespace navmisc::activity
