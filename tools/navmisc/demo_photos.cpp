// The demo's photo step: three photos "taken" along a trip's second track, added and tagged. The
// KMZ export that follows carries them.
#include <cstdio>
#include <string>

#include "cli.h"
#include "navmisc/platform/atomic_file.h"
#include "navmisc/platform/datetime.h"
#include "navmisc/platform/exif.h"
#include "navmisc/platform/files.h"
#include "navmisc/records/trip.h"
#include "photo_cli.h"
#include "tiny_jpeg.h"

namespace navmisc::cli {

void DemoPhotos(const std::string& tripId) {
  auto trip = OpenTrip(tripId);
  trip->ReadAllWaypoint(0);
  if (trip->tracks.IsEmpty()) Fail("the demo trip has no tracks for its photos");
  POSITION pos = trip->tracks.GetHeadPosition();
  auto* track = static_cast<TRACK_ITEM_INFO*>(trip->tracks.GetNext(pos));
  if (pos) track = static_cast<TRACK_ITEM_INFO*>(trip->tracks.GetAt(pos));
  const long first = static_cast<const WAYPOINT_ITEM_INFO*>(track->points.GetHead())->time;
  const long last = static_cast<const WAYPOINT_ITEM_INFO*>(track->points.GetTail())->time;

  const CString camera = PathJoin(CString::FromUtf8(DataRoot()), L"Camera");
  if (!MakeDir(camera)) Fail("cannot create " + camera.ToUtf8());
  std::vector<std::string> files;
  for (int k = 0; k < 3; ++k) {
    const CString path = PathJoin(camera, FormatString(L"IMG_%04d.JPG", 101 + k));
    AtomicFile file;
    if (!file.Open(path) || !file.Write(kTinyJpeg, sizeof kTinyJpeg) || !file.Commit()) {
      Fail("cannot write " + path.ToUtf8());
    }
    // The camera's clock shows the trip's local time.
    int y, mo, d, h, mi, s;
    GetDateTimeInfo(first + (last - first) * (1 + 4 * k) / 10 + trip->timeZoneShift, y, mo, d, h,
                    mi, s);
    CExif2 exif;
    if (!exif.SetCaptureTime(path,
                             FormatString(L"%04d:%02d:%02d %02d:%02d:%02d", y, mo, d, h, mi, s))) {
      Fail("cannot set the capture time of " + path.ToUtf8() + ": " + exif.GetError());
    }
    files.push_back(path.ToUtf8());
  }
  std::printf("\nPhotos added to \"%s\" (navmisc photos add):\n", trip->name.ToUtf8().c_str());
  PrintAddedPhotos(stdout, AddPhotos(*trip, files, CameraClock(), 50.0));
  const GeotagOutcome tagged = GeotagTrip(*trip, false, IDCANCEL, nullptr);
  std::printf(
      "Tagged %d of %d photos in the trip (navmisc geotag); the KMZ export below carries them.\n",
      tagged.tagged, tagged.placed);
}

}  // namespace navmisc::cli
