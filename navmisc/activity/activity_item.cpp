#include "navmisc/activity/activity_item.h"

#include <climits>
#include <type_traits>

#include "navmisc/platform/datetime.h"
#include "navmisc/platform/settings.h"
#include "navmisc/records/trip.h"
#include "navmisc/records/user_profile.h"

namespace navmisc::activity {
namespace {

// A trip without tracks starts at this time (and ends at 0).
constexpr long kNoStart = 2147483647L;

int32_t ToInt32(long v) { return static_cast<int32_t>(v < INT32_MIN ? INT32_MIN : (v > INT32_MAX ? INT32_MAX : v)); }

}  // namespace

template <class Figures>
ActivityItem<Figures>::ActivityItem(int32_t type, BLOG_ITEM_INFO* trip, USER_MAP_INFO* profile)
    : type(type), trip(trip), createTime(static_cast<int32_t>(GetCurDateTime())), profile(profile) {
  utcStart_ = trip ? trip->GetUTCStartTime() : kNoStart;
  utcEnd_ = trip ? trip->GetUTCEndTime() : 0;
  selStartTime = ToInt32(utcStart_ + TimeShift());
  selEndTime = ToInt32(utcEnd_ + TimeShift());
}

template <class Figures>
ActivityItem<Figures>::~ActivityItem() {
  delete trip;
}

template <class Figures>
long ActivityItem<Figures>::TimeShift() const {
  return trip ? trip->timeZoneShift : 0;
}

template <class Figures>
Person ActivityItem<Figures>::Owner() const {
  return PersonOn(*profile, utcStart_ == kNoStart ? -1 : utcStart_ + TimeShift());
}

template <class Figures>
void ActivityItem<Figures>::Update(long start, long end, MovingTotals moving, Figures& out) {
  constexpr bool kSport = std::is_same_v<Figures, SportFigures>;
  out = Figures{};
  if (points.empty()) return;
  Summarize(points, legKm_, start, end, TimeShift(), kSport ? SummaryRules::kSport : SummaryRules::kTracker,
            moving, out);
  if constexpr (kSport) SummarizeSensors(points, start, end, out);
}

template <class Figures>
void ActivityItem<Figures>::PrepareSummaryData(CPtrList* heartRates, CPtrList* cadences) {
  if (!trip) return;
  utcStart_ = trip->GetUTCStartTime();  // loads the points when they are not loaded yet
  utcEnd_ = trip->GetUTCEndTime();
  MergePoints(trip->tracks, heartRates, cadences, points);
  legKm_ = LegLengthsKm(points);
  segments = BuildMovingSegments(points, legKm_);
  Update(utcStart_, utcEnd_, SumMovingSegments(segments), whole);
  const long start = selStartTime - TimeShift();
  const long end = selEndTime - TimeShift();
  // Most selections are the whole activity; its figures need no second walk.
  if (start == utcStart_ && end == utcEnd_) selected = whole;
  else Update(start, end, SumMovingSegments(segments, start, end), selected);
}

template <class Figures>
void ActivityItem<Figures>::UpdateSelSummaryData(long start, long end, CPtrList* given) {
  selStartTime = ToInt32(start + TimeShift());
  selEndTime = ToInt32(end + TimeShift());
  if (!given) {
    Update(start, end, SumMovingSegments(segments, start, end), selected);
    return;
  }
  std::vector<MovingSegment> other;
  for (const MovingSegment* s : Items<MovingSegment>(*given))
    if (s) other.push_back(*s);
  Update(start, end, SumMovingSegments(other, start, end), selected);
}

template <class Figures>
bool ActivityItem<Figures>::GetWeightHeight(double& weight, double& height) {
  const Person owner = Owner();
  weight = owner.weight;
  height = owner.height;
  return owner.weightFromHistory;
}

template <class Figures>
bool ActivityItem<Figures>::SetWeightHeight(double weight, double height) {
  int year, month, day;
  if (utcStart_ == kNoStart || !LocalDate(utcStart_ + TimeShift(), year, month, day)) return false;
  double w, h;
  GetWeightHeight(w, h);
  if (w == weight && h == height) return false;
  profile->SetWeightHeight(month, day, year, weight, height);
  return true;
}

template <class Figures>
void ActivityItem<Figures>::WriteStoreKeys(unsigned long handle, const wchar_t* section) const {
  WR_INT(handle, section, L"type", type);
  WR_STRING(handle, section, L"res_info", trip ? trip->tripId.c_str() : L"");
  WR_INT(handle, section, L"sel_starttime", selStartTime);
  WR_INT(handle, section, L"sel_endtime", selEndTime);
  WR_INT(handle, section, L"duration_time", whole.duration);
  WR_FLOAT(handle, section, L"avg_speed", whole.avgSpeed);
  WR_INT(handle, section, L"moving_time", whole.movingTime);
  WR_INT(handle, section, L"avg_pace", whole.pace);
  WR_INT(handle, section, L"makertime(UTC)", createTime);
  WR_INT(handle, section, L"curseltab", curSelTab);
}

template <class Figures>
void ActivityItem<Figures>::ReadStoreKeys(unsigned long handle, const wchar_t* section) {
  // The selection defaults to the whole trip, as the constructor set it.
  selStartTime = RD_INT(handle, section, L"sel_starttime", selStartTime);
  selEndTime = RD_INT(handle, section, L"sel_endtime", selEndTime);
  whole.duration = RD_INT(handle, section, L"duration_time", 0);
  whole.avgSpeed = RD_FLOAT(handle, section, L"avg_speed", 0.0);
  whole.movingTime = RD_INT(handle, section, L"moving_time", 0);
  whole.pace = RD_INT(handle, section, L"avg_pace", -1);
  createTime = RD_INT(handle, section, L"makertime(UTC)", -1);
  curSelTab = RD_INT(handle, section, L"curseltab", 0);
}

template class ActivityItem<SportFigures>;
template class ActivityItem<TrackerFigures>;

}  // namespace navmisc::activity
