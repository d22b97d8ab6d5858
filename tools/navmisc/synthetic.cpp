#include "synthetic.h"

#include <algorithm>
#include <cmath>
#include <random>
#include <vector>

#include "navmisc/records/trip.h"

namespace navmisc::synthetic {
namespace {

constexpr double kPi = 3.14159265358979323846;
constexpr double kMetresPerDegree = 111320.0;

// Walks a position forward on a local flat approximation, which is plenty for a few kilometres.
struct Walker {
  double lat;
  double lon;
  double heading;  // degrees, 0 = north
  void Step(double metres) {
    lat += metres * std::cos(heading * kPi / 180) / kMetresPerDegree;
    lon += metres * std::sin(heading * kPi / 180) / (kMetresPerDegree * std::cos(lat * kPi / 180));
  }
};

WAYPOINT_ITEM_INFO* Point(int32_t time, const Walker& w, double alt, double speedMps, std::mt19937& rng,
                          double noiseMetres) {
  std::normal_distribution<double> noise(0.0, noiseMetres / kMetresPerDegree);
  auto* p = new WAYPOINT_ITEM_INFO(nullptr);
  p->time = time;
  p->latitude = w.lat + noise(rng);
  p->longitude = w.lon + noise(rng);
  p->altitude = alt;
  p->speed = static_cast<int32_t>(speedMps * 3600);
  p->course = static_cast<int32_t>(std::fmod(w.heading + 360.0, 360.0));
  return p;
}

TRACK_ITEM_INFO* NewTrack(BLOG_ITEM_INFO& trip, const wchar_t* name, uint32_t color) {
  auto* t = new TRACK_ITEM_INFO(&trip);
  t->description = name;
  t->color = color;
  t->transparency = 10;
  trip.tracks.AddTail(t);
  return t;
}

// Moves along with gentle turns for `seconds`, one point every `interval` seconds. The places
// passed go to `route` when it is given.
void Travel(TRACK_ITEM_INFO& t, Walker& w, int32_t& time, int seconds, int interval, double speed,
            double& alt, std::mt19937& rng, double noise = 2.0, std::vector<Walker>* route = nullptr) {
  std::normal_distribution<double> turn(0.0, 4.0);
  std::normal_distribution<double> climb(0.0, 0.3);
  for (int s = 0; s < seconds; s += interval) {
    w.heading += turn(rng);
    w.Step(speed * interval);
    alt += climb(rng);
    time += interval;
    t.points.AddTail(Point(time, w, alt, speed, rng, noise));
    if (route) route->push_back(w);
  }
}

// Goes back along `route` to where it began, one point every `interval` seconds, and leaves `w`
// there.
void Retrace(TRACK_ITEM_INFO& t, Walker& w, const std::vector<Walker>& route, int32_t& time, int interval,
             double speed, double alt, std::mt19937& rng, double noise) {
  for (auto place = route.rbegin(); place != route.rend(); ++place) {
    w = *place;
    w.heading += 180;
    time += interval;
    t.points.AddTail(Point(time, w, alt, speed, rng, noise));
  }
}

}  // namespace

void AddRun(BLOG_ITEM_INFO& trip, uint32_t seed, int32_t start) {
  std::mt19937 rng(seed);
  TRACK_ITEM_INFO* t = NewTrack(trip, L"Morning run", 0x0000FF);
  Walker w{25.0330, 121.5654, 45};
  double alt = 12;
  int32_t time = start;
  std::normal_distribution<double> pace(3.2, 0.2);
  for (int lap = 0; lap < 6; ++lap) {
    Travel(*t, w, time, 300, 1, pace(rng), alt, rng, 1.5);
    w.heading += 60;
  }
  // Heart rate and cadence: a record per 24 seconds, one value per second.
  std::normal_distribution<double> hrNoise(0, 3);
  for (int32_t at = start; at < time; at += 24) {
    auto* hr = new HEARTRATE_ITEM_INFO(nullptr);
    auto* cs = new CYCLING_CADENCE_RPM_ITEM_INFO(nullptr);
    hr->time = cs->time = at;
    for (int i = 0; i < 24 && at + i < time; ++i) {
      const double warm = std::min(1.0, (at + i - start) / 600.0);
      hr->values[i] = static_cast<uint8_t>(std::clamp(110 + 50 * warm + hrNoise(rng), 60.0, 200.0));
      cs->values[i] = static_cast<uint8_t>(std::clamp(84 + hrNoise(rng), 60.0, 100.0));
    }
    t->heartRates.AddTail(hr);
    t->cadences.AddTail(cs);
  }
}

void AddTrackerDay(BLOG_ITEM_INFO& trip, uint32_t seed, int32_t start) {
  std::mt19937 rng(seed);
  TRACK_ITEM_INFO* t = NewTrack(trip, L"Tracker day", 0x00A000);
  Walker w{51.5072, -0.1276, 90};
  double alt = 20;
  int32_t time = start;
  std::uniform_int_distribution<int> cell(1000, 9999);
  for (int hour = 0; hour < 10; ++hour) {
    const bool moving = hour % 3 != 1;
    Travel(*t, w, time, 3600, 60, moving ? 8.0 : 0.3, alt, rng, moving ? 10.0 : 4.0);
    for (int k = 0; k < 6; ++k) {
      auto* fix = new BASE_ITEM_INFO(nullptr);
      fix->time = time - 3600 + k * 600;
      fix->name = FormatString(L"234-15-%d-%d", cell(rng), cell(rng));
      fix->latitude = w.lat + 0.002 * (k - 3);
      fix->longitude = w.lon - 0.003 * (k - 3);
      t->cellFixes.AddTail(fix);
    }
  }
  for (int k = 0; k < 2; ++k) {
    auto* help = new WAYPOINT_ITEM_INFO(nullptr);
    help->time = start + 7200 + k * 14400;
    help->name = k ? L"SOS 2" : L"SOS 1";
    help->latitude = w.lat;
    help->longitude = w.lon;
    t->helpPoints.AddTail(help);
  }
}

void AddJourney(BLOG_ITEM_INFO& trip, uint32_t seed, int32_t start) {
  std::mt19937 rng(seed);
  Walker w{48.8566, 2.3522, 200};
  double alt = 35;
  int32_t time = start;
  TRACK_ITEM_INFO* out = NewTrack(trip, L"Drive out", 0xFF0000);
  std::vector<Walker> road;
  Travel(*out, w, time, 5400, 5, 25.0, alt, rng, 5.0, &road);
  time += 900;
  // A stroll out and back to the car.
  TRACK_ITEM_INFO* walk = NewTrack(trip, L"Old town walk", 0x00A5FF);
  std::vector<Walker> lanes;
  Travel(*walk, w, time, 1800, 2, 1.4, alt, rng, 3.0, &lanes);
  Retrace(*walk, w, lanes, time, 2, 1.4, alt, rng, 3.0);
  time += 1800;
  // The same road home, ending where the day began.
  TRACK_ITEM_INFO* back = NewTrack(trip, L"Drive back", 0xFF00FF);
  Retrace(*back, w, road, time, 5, 25.0, alt, rng, 5.0);
}

void AddStopSpikeGap(BLOG_ITEM_INFO& trip, uint32_t seed, int32_t start) {
  std::mt19937 rng(seed);
  TRACK_ITEM_INFO* t = NewTrack(trip, L"Walk with a stop", 0x808000);
  Walker w{47.3769, 8.5417, 10};
  double alt = 410;
  int32_t time = start;
  Travel(*t, w, time, 600, 5, 1.3, alt, rng, 2.0);
  // A long stop: the logger keeps fixing around one place at walking pace zero.
  Travel(*t, w, time, 900, 5, 0.0, alt, rng, 3.0);
  Travel(*t, w, time, 300, 5, 1.3, alt, rng, 2.0);
  // One wild fix three kilometres off.
  Walker spike = w;
  spike.heading += 90;
  spike.Step(3000);
  time += 5;
  t->points.AddTail(Point(time, spike, alt, 1.3, rng, 0));
  Travel(*t, w, time, 600, 5, 1.3, alt, rng, 2.0);
  // The logger was off for two hours.
  time += 7200;
  Travel(*t, w, time, 900, 5, 1.3, alt, rng, 2.0);
}

void AddHike(TRACK_ITEM_INFO& track, uint32_t seed, int32_t start) {
  std::mt19937 rng(seed);
  Walker w{46.5580, 7.8350, 60};  // up from the valley
  double alt = 800;
  int32_t time = start;
  Travel(track, w, time, 7200, 5, 1.1, alt, rng, 3.0);
  Travel(track, w, time, 2700, 5, 0.0, alt, rng, 2.0);
  w.heading += 150;
  Travel(track, w, time, 5400, 5, 1.2, alt, rng, 3.0);
}

}  // namespace navmisc::synthetic
