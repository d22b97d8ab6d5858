// Opens a trip of a data root and writes it as a GPX document.
//
//   open_and_export DATA_ROOT TRIP_ID OUT.gpx
#include <cstdio>
#include <string>

#include "navmisc/navmisc.h"

int main(int argc, char** argv) {
  if (argc != 4 || !std::string(argv[3]).ends_with(".gpx")) {
    std::fprintf(stderr, "usage: open_and_export DATA_ROOT TRIP_ID OUT.gpx\n");
    return 2;
  }
  // The data root comes first: every file of the library is found under it.
  if (!navmisc::UseDataRoot(CString::FromUtf8(argv[1]))) {
    std::fprintf(stderr, "cannot use %s as the data root\n", argv[1]);
    return 1;
  }
  // The profile's time shift applies to the times of the points as they are read.
  g_TripMapInfo.ReadInfo();

  BLOG_ITEM_INFO trip(GPS_APP_TRIP, CString::FromUtf8(argv[2]), 0);
  if (trip.ReadInfo() != 1) {
    std::fprintf(stderr, "no trip %s under %s\n", argv[2], argv[1]);
    return 1;
  }
  trip.ReadAllWaypoint(0);

  ExportControl control;  // tells whether every byte reached the disk
  if (ExportGpx(CString::FromUtf8(argv[3]), trip.tracks, trip.photos, control) != 1 || !control.error.empty()) {
    std::fprintf(stderr, "cannot write %s: %s\n", argv[3], control.error.c_str());
    return 1;
  }
  long points = 0, kept = 0;
  const long tracks = trip.GetTrackInfo(points, kept);
  std::printf("%s \"%s\": %ld tracks, %ld points, %d photos and markers -> %s\n", argv[2],
              trip.name.ToUtf8().c_str(), tracks, points, trip.photos.GetCount(), argv[3]);
  return 0;
}
