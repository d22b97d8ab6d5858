// Energy expenditure of a workout. Every energy here is in small calories (1/1000 kcal) unless
// a name says otherwise; speeds are km/h, weights kilograms, heights centimetres, times seconds.
//
// Two models live side by side: the exercise model (MovingMet, per pair of points, with the
// heart-rate formula above 65 % of the maximum heart rate and the Harris-Benedict resting
// rate), and the coarser workout model (WorkoutMet, WorkoutEnergy) that sums a whole workout
// from its moving time and average speed. Their tables are kept exactly as the suite's sport
// application has always shown them, steps between bands included.
#pragma once

#include <cstdint>

#include "navmisc/activity/activity_points.h"

class USER_MAP_INFO;
class TRACK_ITEM_INFO;

namespace navmisc::activity {

// Metabolic equivalent of a sport type (0 cycling, 1 running, 2..6 fixed, anything else
// unknown) at `kmh`. Bands run from their lower edge (included) to their upper (excluded).
double MovingMet(int sportType, double kmh);
double WorkoutMet(int sportType, double kmh);

// The owner of an activity on its day.
struct Person {
  bool male = true;
  int age = 0;                 // whole years; 0 when the birth year is unknown
  double fractionalAge = 0.0;  // years by the workout model's day count
  double weight = 60.0;        // kilograms
  double height = 170.0;       // centimetres
  bool weightFromHistory = false;  // the weight and height came from the dated history
};

// The profile's owner on the local date of `localTime` (seconds since 1970, already shifted
// to local time). A time of which no date can be formed (negative, or the 2147483647 of a trip
// without tracks) gives the current date for the ages and the profile's default weight and
// height.
Person PersonOn(USER_MAP_INFO& profile, long localTime);
// The local date of `localTime`; false when none can be formed (see PersonOn).
bool LocalDate(long localTime, int& year, int& month, int& day);

// Harris-Benedict basal metabolic rate, kilocalories a day; never negative.
double BasalRate(const Person& person);
// The resting energy of [start, end]: rounded (end - start) hours of the basal rate. 0 for an
// empty or backwards range.
long RestingEnergy(const Person& person, long start, long end);
double MaxHeartRate(const Person& person);
// Energy of one heart-rate sample (not of a span of time): the per-minute formula over 60.
// Never negative.
double HeartRateEnergy(const Person& person, int heartRate);
// t / 3600 * MET * 1000 * W: moving `seconds` at `kmh`.
double MovingEnergy(int sportType, double weightKg, long seconds, double kmh);

// The exercise energy over the pairs of `points` from range.first to range.last (points with a
// negative state are stepped over, as the summaries do): per pair the
// heart-rate energy when the later point has a heart rate of at least round(0.65 * maximum),
// otherwise the moving energy of the pair's time step at the later point's logger speed.
// Summed, plus 0.5, truncated. 0 for an empty range.
long ExerciseEnergy(const PointVector& points, IndexRange range, int sportType, const Person& person);

// The workout model: truncate((W * MET + B) * moving / 3600 + rest / 3600 * B * 0.5 + 0.5) with
// B = rounded-coefficient BMR * 1000 * 0.05 (kilocalories per hour beside small calories, as
// the model has always mixed them).
long WorkoutEnergy(int sportType, const Person& person, long movingSeconds, double kmh, long restSeconds);

// The energy of one track as a lap: exercise plus resting energy from its first to its last
// timed point, for the owner in the profile of the track's trip's application. Small calories.
long TrackEnergy(TRACK_ITEM_INFO& track, int sportType);

}  // namespace navmisc::activity
