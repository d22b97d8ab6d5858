// Spherical-earth calculations on decimal degrees, and the cleaning passes that run on arrays of
// sWayPoint (see cleaning.h for the list-level wrappers).
//
// Notation: lat/lon are decimal degrees (north and east positive), bearings are degrees clockwise
// from north, times are seconds since 1970, logger speeds metres per hour. Distances are
// kilometres unless a parameter says otherwise. The earth is a sphere (6371 km for kilometres and
// metres). Longitudes are never normalised: results may lie beyond +/-180.
#pragma once

#include <cstdint>

#include "navmisc/geo/waypoint_array.h"
#include "navmisc/platform/datetime.h"
#include "navmisc/platform/types.h"

class CGPSHelper {
 public:
  // Unit of a distance result; the radius used for each is in the implementation.
  enum DIS_UNIT : int {
    DIS_MILE = 0,           // statute miles (radius 3956.0)
    DIS_NAUTICAL_MILE = 1,  // nautical miles (radius 3437.7)
    DIS_KILOMETER = 2,      // kilometres (radius 6371.0)
    DIS_METER = 3           // metres (radius 6371000.0)
  };

  CGPSHelper() = default;
  virtual ~CGPSHelper();

  // ---- geometry ----------------------------------------------------------------------------
  // Great-circle (haversine) distance. 0.0 for identical points, for points less than a
  // centimetre apart and for an unknown unit.
  double GetDistance(double lat1, double lon1, double lat2, double lon2, DIS_UNIT unit);
  // Initial bearing from point 1 to point 2 in whole degrees 0..359 (fraction dropped: -0.4
  // gives 359, 359.7 gives 359); 0.0 for identical points.
  double GetInitialBearing(double lat1, double lon1, double lat2, double lon2);
  // Midpoint of the great-circle arc.
  void GetMidiPoint(double lat1, double lon1, double lat2, double lon2, double& lat, double& lon);
  // The point `distance` kilometres from (lat, lon) along `bearing` degrees.
  void GetDestinationPoint(double lat, double lon, double bearing, double distance,
                           double& lat2, double& lon2);
  // The point `distance` metres from point 1 towards point 2 (along the whole-degree bearing).
  void GetPointBetween2Point(double lat1, double lon1, double lat2, double lon2, double distance,
                             double& lat, double& lon);
  // Distance (km) from (lat, lon) to the polyline `points[0..count)`. `*where` (if given)
  // receives the position of the nearest point on the nearest segment as a fraction 0..1 of that
  // segment. -1.0 when count < 1.
  double GetMinDistance(const sWayPoint* points, int count, double lat, double lon, double* where);
  // Plots `points[0..count)` into a square of `size` pixels, north up, one pixel per metre at
  // scale 1.0 and coarser by steps of 0.2 until the track fits; `screen` receives one point per
  // record. When the track is smaller than `size`, `size` becomes its extent plus two margins.
  // `deviation` (if given) receives the largest distance of a record from the first-to-last
  // segment in pixels (+0.5); `scale` (if given) the metres per pixel used. A `size` of 0 or
  // less is treated like a track smaller than the area (scale 1.0, `size` set).
  void MappingToXY(const sWayPoint* points, int& count, CPoint* screen, long& size, long margin,
                   double* deviation, double* scale = nullptr);

  // ---- cleaning passes (they clear `valid` of dropped records; `count` is never changed) ---
  // Drops bad fixes: points after an unusually long gap, and lone jumps faster than 120 km/h.
  // Returns the number of drops (a point dropped by both rules counts twice). 0 when count <= 4.
  int Revise(sWayPoint* points, int& count);
  // Drops the crowd of fixes recorded while standing still. Returns the number dropped.
  int Reduce(sWayPoint* points, int& count);

 protected:
  // Distance (km) from (lat, lon) to the segment (lat1, lon1)-(lat2, lon2); `*where` receives the
  // fraction 0..1 of the segment at which the nearest point lies.
  double _GetMinDistance(double lat1, double lon1, double lat2, double lon2, double lat,
                         double lon, double* where);
  // b - a seconds, as an unsigned 32-bit number (no check of order).
  uint32_t _GetTimeDurationSec(long a, long b);
  // The span from a to b in whole seconds (rounded).
  long _GetTimeDurationSec(const COleDateTime& a, const COleDateTime& b);

  int _Revise_by_interval(sWayPoint* points, int& count, double factor);
  int _Revise_max_acceleration(sWayPoint* points, int& count, double speedLimit);
  // The stop pass. Speeds in metres per second, radii in metres.
  int _Reduce_Stop_To_Move(sWayPoint* points, int& count, double stopSpeed, double returnRadius,
                           double leaveRadius);
  // An earlier form of the stop pass with its own trace texts; no pass calls it.
  int _Revise_Stop_To_Move(sWayPoint* points, int& count, double stopSpeed, double returnRadius,
                           double leaveRadius);
  // Moves the valid records to the front, in order, resets the rest to the defaults and sets
  // `count` to the number kept. No pass calls it.
  void _Arrange(sWayPoint* points, int& count);

 private:
  // Distances between the records of one array (see gps_helper.cpp).
  class RecordDistances;
  int StopWalk(sWayPoint* points, int count, double stopSpeed, double returnRadius,
               double leaveRadius, bool reviseTexts, const RecordDistances& distances);
};

// The east-west distance in kilometres at latitude `a` between longitudes `b` and `d`: the first
// argument serves as both latitudes and `c` is ignored. Callers outside the library rely on this
// reading; code inside the library measures with CGPSHelper::GetDistance.
double GetGpsDistance(double a, double b, double c, double d);

namespace navmisc::geo {

constexpr double kDegToRad = 0.017453292519943295;
constexpr double kRadToDeg = 57.29577951308232;
constexpr double kEarthRadiusKm = 6371.0;

// A position as a unit vector (x towards 0/0, y towards 0/90E, z towards the north pole).
struct UnitVector {
  double x, y, z;
};
UnitVector ToUnitVector(double lat, double lon);
// Distance (km) from `p` to the great-circle arc a-b (the shorter one); `*where` (if given)
// receives the fraction 0..1 of the arc at which the nearest point lies. Exactly the computation
// of CGPSHelper::_GetMinDistance, for callers that convert their points once.
double SegmentDistanceKm(const UnitVector& a, const UnitVector& b, const UnitVector& p,
                         double* where);
// Angle (radians, 0..pi) between two unit vectors.
double AngleBetween(const UnitVector& a, const UnitVector& b);
// The central angle (radians) of CGPSHelper::GetDistance, with the cosines of both latitudes
// supplied by a caller that measures many legs: the same result to the last bit.
double HaversineAngle(double lat1, double lon1, double cosLat1, double lat2, double lon2, double cosLat2);

}  // namespace navmisc::geo
