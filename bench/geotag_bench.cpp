// Geotagging 1000 JPEGs by a 100,000-point trip: `navmisc photos add` + `navmisc geotag` (the
// real programs, FixTag.exe doing the metadata work) against `exiftool -geotag TRACK.gpx
// -overwrite_original DIR` on copies of the same photos with the same track as GPX. One run of
// each on fresh copies; the report ends with the speed-up (target: at least 5x) and the largest
// distance between the positions the two tools gave each photo (they interpolate differently:
// navmisc walks the great circle second by second, exiftool interpolates linearly in time).
//
// Run: cmake --preset release && cmake --build --preset release && build/release/bench/geotag_bench
#include <benchmark/benchmark.h>
#include <stdlib.h>

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <memory>
#include <random>
#include <string>
#include <vector>

#include "navmisc/export/gpx_export.h"
#include "navmisc/geo/gps_helper.h"
#include "navmisc/platform/atomic_file.h"
#include "navmisc/platform/datetime.h"
#include "navmisc/platform/exif.h"
#include "navmisc/platform/files.h"
#include "navmisc/platform/process.h"
#include "navmisc/platform/shared_globals.h"
#include "navmisc/platform/temp_folder.h"
#include "navmisc/records/trip.h"
#include "speedup_reporter.h"
#include "tools/navmisc/tiny_jpeg.h"

namespace {

constexpr int kPoints = 100000;
constexpr int kPhotos = 1000;
constexpr int32_t kStart = 1700000000;  // 2023-11-14T22:13:20Z
constexpr const wchar_t* kTripId = L"GEOTAGBENCH";
// Each photo carries this much picture data besides its metadata, as a small camera JPEG does.
constexpr size_t kPictureBytes = 60000;

std::string Narrow(const CString& s) {
  return navmisc::NativePath(s);
}

// The program `name` on PATH; empty when missing.
std::string OnPath(const char* name) {
  const char* path = getenv("PATH");
  std::string dirs = path ? path : "/usr/bin:/bin";
  for (size_t at = 0; at <= dirs.size();) {
    const size_t colon = std::min(dirs.find(':', at), dirs.size());
    const std::string candidate = dirs.substr(at, colon - at) + "/" + name;
    if (FileExists(CString::FromUtf8(candidate)) && !IsDirectory(CString::FromUtf8(candidate)))
      return candidate;
    at = colon + 1;
  }
  return {};
}

// Drives, walks and pauses: a fix every 1 to 5 seconds, now and then a gap of a few minutes
// (a tunnel, a building), positions rounded to the six decimals that GPX carries so both tools
// start from the same numbers.
void AddTrack(BLOG_ITEM_INFO& trip) {
  auto* track = new TRACK_ITEM_INFO(&trip);
  track->description = L"Bench journey";
  trip.tracks.AddTail(track);
  std::mt19937 rng(20240502);
  std::uniform_int_distribution<int> step(1, 5), gap(60, 900), pick(0, 999);
  std::normal_distribution<double> turn(0.0, 4.0);
  double lat = 46.2, lon = 6.1, heading = 40.0, alt = 380.0, speed = 1.4;  // m/s
  int32_t time = kStart;
  for (int i = 0; i < kPoints; ++i) {
    auto* p = new WAYPOINT_ITEM_INFO(nullptr);
    p->time = time;
    p->latitude = std::round(lat * 1e6) / 1e6;
    p->longitude = std::round(lon * 1e6) / 1e6;
    p->altitude = std::round(alt * 10) / 10;
    p->speed = static_cast<int32_t>(speed * 3600);
    track->points.AddTail(p);
    if (pick(rng) < 5) speed = pick(rng) < 500 ? 1.4 : 22.0;  // switch between walking and driving
    const int dt = pick(rng) < 2 ? gap(rng) : step(rng);
    heading += turn(rng);
    const double metres = speed * dt;
    lat += metres * std::cos(heading * navmisc::geo::kDegToRad) / 111195.0;
    lon += metres * std::sin(heading * navmisc::geo::kDegToRad) /
           (111195.0 * std::cos(lat * navmisc::geo::kDegToRad));
    alt += (pick(rng) - 500) * 0.002 * dt;
    time += dt;
  }
}

// The tiny JPEG with `kPictureBytes` of application data after its header, standing in for
// the picture of a real photo (both tools copy it through unchanged).
std::string CameraJpeg(std::mt19937& rng) {
  std::string jpeg(reinterpret_cast<const char*>(navmisc::kTinyJpeg), sizeof navmisc::kTinyJpeg);
  std::string pad;
  for (size_t left = kPictureBytes; left > 0;) {
    const size_t n = std::min<size_t>(left, 65000);
    pad += "\xFF\xEB";
    pad += static_cast<char>((n + 2) >> 8);
    pad += static_cast<char>((n + 2) & 0xFF);
    for (size_t k = 0; k < n; ++k) pad += static_cast<char>(rng());
    left -= n;
  }
  jpeg.insert(2, pad);
  return jpeg;
}

struct Fixture {
  CString work, root, gpx, camera;
  std::string navmisc, exiftool;
  std::vector<std::string> names;  // the photos' file names
  std::string error;

  Fixture() {
    work = CreateTempFolder(L"navmisc-bench-geotag");
    root = PathJoin(work, L"root");
    gpx = PathJoin(work, L"track.gpx");
    camera = PathJoin(work, L"camera");
    navmisc = NAVMISC_TOOLS_DIR "/navmisc";
    exiftool = OnPath("exiftool");
    if (exiftool.empty()) error = "exiftool is not installed (scripts/setup.sh)";
    MakeDir(camera);
    navmisc::SetSharedText(g_szAppDataPath, root);
    BLOG_ITEM_INFO trip(GPS_APP_TRIP, kTripId, 0);
    MakeDir(trip.GetResourcePath());
    AddTrack(trip);
    trip.WriteAllWaypoint(1, nullptr, nullptr);
    trip.WriteInfo(1, nullptr, nullptr);
    CPtrList none;
    if (!ExportGpx(gpx, trip.tracks, none)) error = "cannot write the GPX track";

    // Photos at random seconds of the track, the camera's clock on UTC (the trip's shift is 0).
    const long first = kStart + 60;
    const long last = static_cast<const WAYPOINT_ITEM_INFO*>(
                          static_cast<TRACK_ITEM_INFO*>(trip.tracks.GetHead())->points.GetTail())
                          ->time -
                      60;
    std::mt19937 rng(7);
    std::uniform_int_distribution<long> when(first, last);
    std::vector<long> times(kPhotos);
    for (long& t : times) t = when(rng);
    std::sort(times.begin(), times.end());
    for (int i = 0; i < kPhotos; ++i) {
      char name[32];
      std::snprintf(name, sizeof name, "IMG_%04d.JPG", i + 1);
      names.push_back(name);
      const CString path = PathJoin(camera, CString::FromUtf8(name));
      navmisc::AtomicFile f;
      if (!f.Open(path) || !f.Write(CameraJpeg(rng)) || !f.Commit())
        error = "cannot write the photos";
      int y, mo, d, h, mi, s;
      GetDateTimeInfo(times[i], y, mo, d, h, mi, s);
      CExif2 exif;
      if (!exif.SetCaptureTime(
              path, FormatString(L"%04d:%02d:%02d %02d:%02d:%02d", y, mo, d, h, mi, s))) {
        error = "cannot set a capture time: " + exif.GetError();
      }
    }
  }
  ~Fixture() { RemoveDir(work, L"*.*"); }

  // A fresh copy of the camera folder in `folder` (any earlier one removed).
  std::vector<std::string> FreshCopies(const CString& folder) {
    RemoveDir(folder, L"*.*");
    MakeDir(folder);
    std::vector<std::string> paths;
    for (const std::string& n : names) {
      const CString name = CString::FromUtf8(n);
      CopyFile(PathJoin(camera, name), PathJoin(folder, name), false);
      paths.push_back(Narrow(PathJoin(folder, name)));
    }
    return paths;
  }

  CString TripFolder() const { return PathJoin(PathJoin(root, L"Resource"), kTripId); }
  CString ExiftoolFolder() const { return PathJoin(work, L"exiftool"); }
};

Fixture& F() {
  static Fixture f;
  return f;
}

bool Run(const std::vector<std::string>& argv, std::string& error) {
  navmisc::ChildProcess p;
  if (!p.Start(argv, {.nullStdin = true, .nullStdout = true, .nullStderr = false})) {
    error = argv[0] + ": " + p.error();
    return false;
  }
  const int status = p.Wait();
  if (status != 0) error = argv[0] + " exited with " + std::to_string(status);
  return status == 0;
}

void BM_NavmiscPhotosAddAndGeotag(benchmark::State& state) {
  Fixture& f = F();
  if (!f.error.empty()) return state.SkipWithError(f.error.c_str());
  for (auto _ : state) {
    state.PauseTiming();
    // The trip as prepared: its settings file without photos, no photo files.
    CStringList old;
    GetContent(f.TripFolder(), L"*.JPG", old);
    for (POSITION pos = old.GetHeadPosition(); pos;)
      DeleteFile(PathJoin(f.TripFolder(), old.GetNext(pos)));
    BLOG_ITEM_INFO trip(GPS_APP_TRIP, kTripId, 0);
    trip.ReadInfo();
    for (auto* photo : navmisc::Items<PHOTO_ITEM_INFO>(trip.photos)) delete photo;
    trip.photos.RemoveAll();
    trip.WriteInfo(1, nullptr, nullptr);
    std::vector<std::string> add = {f.navmisc, "--data-root", Narrow(f.root),
                                    "photos",  "add",         Narrow(kTripId)};
    for (const std::string& p : f.FreshCopies(PathJoin(f.work, L"originals"))) add.push_back(p);
    std::string error;
    state.ResumeTiming();
    if (!Run(add, error) ||
        !Run({f.navmisc, "--data-root", Narrow(f.root), "geotag", Narrow(kTripId)}, error)) {
      return state.SkipWithError(error.c_str());
    }
  }
}

void BM_ExiftoolGeotag(benchmark::State& state) {
  Fixture& f = F();
  if (!f.error.empty()) return state.SkipWithError(f.error.c_str());
  setenv("TZ", "UTC", 1);  // the camera's clock is on UTC, and exiftool reads it in the local zone
  for (auto _ : state) {
    state.PauseTiming();
    f.FreshCopies(f.ExiftoolFolder());
    std::string error;
    state.ResumeTiming();
    if (!Run({f.exiftool, "-q", "-geotag", Narrow(f.gpx), "-overwrite_original",
              Narrow(f.ExiftoolFolder())},
             error)) {
      return state.SkipWithError(error.c_str());
    }
  }
}

BENCHMARK(BM_NavmiscPhotosAddAndGeotag)
    ->Iterations(1)
    ->Unit(benchmark::kMillisecond)
    ->UseRealTime();
BENCHMARK(BM_ExiftoolGeotag)->Iterations(1)->Unit(benchmark::kMillisecond)->UseRealTime();

// How far apart the two tools put each photo.
void ReportDistances() {
  Fixture& f = F();
  if (!f.error.empty()) return;
  CGPSHelper helper;
  double largest = 0.0, sum = 0.0;
  int both = 0, oursOnly = 0, theirsOnly = 0;
  std::string worst;
  for (const std::string& n : f.names) {
    const CString name = CString::FromUtf8(n);
    navmisc::ExifInfo ours, theirs;
    CExif2 exif;
    const bool a = exif.GetExif(PathJoin(f.TripFolder(), name), ours) && ours.hasPosition;
    const bool b = exif.GetExif(PathJoin(f.ExiftoolFolder(), name), theirs) && theirs.hasPosition;
    if (a && b) {
      ++both;
      const double d = helper.GetDistance(ours.latitude, ours.longitude, theirs.latitude,
                                          theirs.longitude, CGPSHelper::DIS_METER);
      sum += d;
      if (d > largest) {
        largest = d;
        worst = n;
      }
    } else {
      oursOnly += a;
      theirsOnly += b;
    }
  }
  std::printf("photos tagged by both: %d of %d (navmisc only: %d, exiftool only: %d)\n", both,
              kPhotos, oursOnly, theirsOnly);
  if (both) {
    std::printf("distance between the two tools' positions: largest %.3f m (%s), mean %.3f m\n",
                largest, worst.c_str(), sum / both);
  }
  std::printf("%d photos of %zu bytes, a track of %d points\n", kPhotos,
              sizeof navmisc::kTinyJpeg + kPictureBytes + 4 * ((kPictureBytes + 64999) / 65000),
              kPoints);
}

}  // namespace

int main(int argc, char** argv) {
  const int rc =
      navmisc::bench::RunWithSpeedups(argc, argv,
                                      {{"BM_NavmiscPhotosAddAndGeotag/iterations:1/real_time",
                                        "BM_ExiftoolGeotag/iterations:1/real_time", 5.0}});
  ReportDistances();
  return rc;
}
