// Places a photo on a trip's tracks by the time it was taken: where was the camera then?
//
//   place_photo DATA_ROOT TRIP_ID YYYY-MM-DDThh:mm:ss
#include <cstdio>

#include "navmisc/navmisc.h"

int main(int argc, char** argv) {
  if (argc != 4) {
    std::fprintf(stderr, "usage: place_photo DATA_ROOT TRIP_ID YYYY-MM-DDThh:mm:ss (UTC)\n");
    return 2;
  }
  if (!navmisc::UseDataRoot(CString::FromUtf8(argv[1]))) {
    std::fprintf(stderr, "cannot use %s as the data root\n", argv[1]);
    return 1;
  }
  g_TripMapInfo.ReadInfo();
  BLOG_ITEM_INFO trip(GPS_APP_TRIP, CString::FromUtf8(argv[2]), 0);
  if (trip.ReadInfo() != 1) {
    std::fprintf(stderr, "no trip %s under %s\n", argv[2], argv[1]);
    return 1;
  }
  trip.ReadAllWaypoint(0);

  const long taken = ConvertStdStringTimeT(CString::FromUtf8(argv[3]));
  if (taken == -1) {
    std::fprintf(stderr, "%s is not a time\n", argv[3]);
    return 2;
  }
  PHOTO_ITEM_INFO photo(&trip, nullptr, nullptr, nullptr);
  photo.playbackTime = static_cast<int32_t>(taken);
  // By the photo's time on the tracks, or (with a position instead) by where it was taken.
  if (!MappingGPSAndTrack(trip.tracks, 50.0, &photo)) {
    std::printf("the trip was not recorded at %s\n", argv[3]);
    return 1;
  }
  std::printf("%s: %.6f, %.6f, %.1f m, on track %s\n", argv[3], photo.latitude, photo.longitude, photo.altitude,
              photo.trackItemId.ToUtf8().c_str());
  return 0;
}
