#include "navmisc/activity/summary.h"

#include <algorithm>
#include <climits>

namespace navmisc::activity {
namespace {

// Ascent and descent of the sport store ignore altitude changes smaller than this (metres):
// barometric and GPS altitudes wobble by about as much while the ground is flat.
constexpr double kClimbHysteresis = 2.0;
// An altitude at or above this is no altitude at all.
constexpr double kNoAltitude = 99999999.0;

int32_t ClampToInt32(double v) {
  if (v >= static_cast<double>(INT32_MAX)) return INT32_MAX;
  if (v <= static_cast<double>(INT32_MIN)) return INT32_MIN;
  return static_cast<int32_t>(v);
}

}  // namespace

void Summarize(PointVector& points, const std::vector<double>& legKm, long start, long end, long timeShift,
               SummaryRules rules, MovingTotals moving, TrackerFigures& out) {
  static_cast<TrackerFigures&>(out) = TrackerFigures{};
  const bool sport = rules == SummaryRules::kSport;
  const IndexRange range = FindRange(points, start, end, true);

  if (!range.empty) {
    const ActivityPoint& head = points[range.first];
    points[range.first].distance = 0.0;
    double distance = 0.0;
    double maxSpeed = 0.0;
    double minAlt = head.altitude < kNoAltitude ? head.altitude : kNoAltitude;
    double maxAlt = head.altitude <= 0 ? head.altitude : 0.0;
    double reference = head.altitude;
    double ascent = 0.0, descent = 0.0;
    long previousStep = 0;  // the time step of the pair before the current one
    // Pairs join consecutive points that take part: a point left out of the statistics is
    // stepped over, so that a wild fix or the wander of a stop adds nothing.
    size_t prevIndex = range.first;
    for (size_t i = range.first + 1; i <= range.last; ++i) {
      ActivityPoint& cur = points[i];
      if (cur.type < 0) {
        cur.distance = distance;
        continue;
      }
      const ActivityPoint& prev = points[prevIndex];
      const double leg = prevIndex + 1 == i ? legKm[i] : LegKm(prev, cur);
      prevIndex = i;
      const long step = static_cast<long>(cur.time) - prev.time;

      double km;
      if (!sport || cur.Has(WAYPOINT_ITEM_INFO::kHasPosition)) {
        km = leg;
      } else if (cur.Has(WAYPOINT_ITEM_INFO::kHasSpeed) && cur.speedReading >= 0) {
        // The step of the previous pair, not of this one: the sport application has always
        // measured sensor-only legs so, and its stored figures depend on it.
        km = static_cast<double>(previousStep) * cur.speedReading * 0.001;
      } else if (prev.Has(WAYPOINT_ITEM_INFO::kHasSpeed)) {
        km = 0.0;
      } else {
        km = leg;
      }
      distance += km * 1000.0;
      cur.distance = distance;
      previousStep = step;

      if (sport) {
        double speed = cur.speed;
        if (!(cur.Has(WAYPOINT_ITEM_INFO::kHasPosition) && cur.speed != 0) &&
            cur.Has(WAYPOINT_ITEM_INFO::kHasSpeed) && cur.speedReading >= 0) {
          speed = static_cast<double>(static_cast<long long>(cur.speedReading * 3600.0));
        }
        maxSpeed = std::max(maxSpeed, speed);
      }

      const double alt = cur.altitude;
      if (alt <= minAlt) minAlt = alt;
      if (alt >= maxAlt) maxAlt = alt;
      if (sport) {
        if (alt < reference && reference - alt >= kClimbHysteresis) {
          descent += reference - alt;
          reference = alt;
        } else if (alt > reference && alt - reference >= kClimbHysteresis) {
          ascent += alt - reference;
          reference = alt;
        }
      } else {
        if (alt > prev.altitude) ascent += alt - prev.altitude;
        else descent += prev.altitude - alt;
      }
    }
    if (!sport) {
      // The tracker takes the largest logger speed of every point in range, the first too.
      maxSpeed = head.speed;
      for (size_t i = range.first; i <= range.last; ++i)
        if (points[i].type >= 0) maxSpeed = std::max<double>(maxSpeed, points[i].speed);
    }
    out.distance = distance;
    out.maxSpeed = maxSpeed;
    out.minAltitude = minAlt;
    out.maxAltitude = maxAlt;
    out.ascent = ascent;
    out.descent = descent;
  }

  out.startTime = ClampToInt32(static_cast<double>(start + timeShift));
  out.endTime = ClampToInt32(static_cast<double>(end + timeShift));
  // A backwards range lasts nothing rather than a negative time.
  out.duration = std::max(0, ClampToInt32(static_cast<double>(out.endTime) - out.startTime));
  out.avgSpeed = out.duration != 0 ? out.distance / out.duration * 3600.0 : 0.0;
  out.movingTime = std::min(moving.time, std::max(out.duration, 0));
  out.movingDistance = moving.distance;
  out.pace = out.movingDistance != 0.0 ? ClampToInt32(out.movingTime / (out.movingDistance * 0.001)) : 0;
}

void SummarizeSensors(const PointVector& points, long start, long end, SportFigures& out) {
  out.movingAvgSpeed = out.movingTime != 0 ? out.movingDistance / out.movingTime * 3600.0 : 0.0;
  out.maxHeartRate = out.avgHeartRate = out.maxCadence = out.avgCadence = 0;
  const IndexRange range = FindRange(points, start, end, false);
  if (range.empty) return;
  long long hrSum = 0, hrCount = 0, cadSum = 0, cadCount = 0;
  for (size_t i = range.first; i <= range.last; ++i) {
    const ActivityPoint& p = points[i];
    if (p.Has(WAYPOINT_ITEM_INFO::kHasHeartRate)) {
      hrSum += p.heartRate;
      ++hrCount;
      out.maxHeartRate = std::max<int32_t>(out.maxHeartRate, p.heartRate);
    }
    if (p.Has(WAYPOINT_ITEM_INFO::kHasCadence)) {
      cadSum += p.cadence;
      ++cadCount;
      out.maxCadence = std::max<int32_t>(out.maxCadence, p.cadence);
    }
  }
  out.avgHeartRate = hrCount ? static_cast<int32_t>(hrSum / hrCount) : 0;
  out.avgCadence = cadCount ? static_cast<int32_t>(cadSum / cadCount) : 0;
}

}  // namespace navmisc::activity
