#include "navmisc/export/gpx_export.h"

#include <algorithm>
#include <string_view>

#include "navmisc/export/detail/export_common.h"
#include "navmisc/platform/format.h"
#include "navmisc/records/photo.h"
#include "navmisc/records/track.h"

namespace {

using navmisc::AppendFixed;
using navmisc::WriteFixed;
using navmisc::exportdetail::DocumentWriter;
using navmisc::exportdetail::Progress;
using navmisc::exportdetail::TimeTextZWriter;
using navmisc::exportdetail::Utf8Field;

// Texts go through fixed buffers of this many bytes, terminator included.
constexpr size_t kTextBuffer = 2048;
// Stored speeds are metres per hour; GPX wants metres per second.
constexpr double kMetresPerHourToMetresPerSecond = 0.0002777777777777778;

void WriteWaypoint(std::string& out, const PHOTO_ITEM_INFO& item, TimeTextZWriter& times) {
  CString flattened = item.description;
  // Keeps every description on one line; lone CR or LF stay as they are.
  flattened.Replace(L"\r\n", L"&#13;");
  out += "\r\n<wpt lat=\"";
  AppendFixed(out, item.latitude, 6);
  out += "\" lon=\"";
  AppendFixed(out, item.longitude, 6);
  out += "\">\r\n<ele>";
  AppendFixed(out, item.altitude, 6);
  out += "</ele>";
  // 0 and -1 both mean the item has no time of its own.
  if (item.playbackTime != 0 && item.playbackTime != -1) {
    out += "\r\n<time>";
    times.Append(out, item.playbackTime);
    out += "</time>";
  }
  out += "\r\n<name>";
  out += Utf8Field(item.title.view(), kTextBuffer);
  out += "</name>\r\n<desc>";
  out += Utf8Field(flattened.view(), kTextBuffer);
  out += "</desc>\r\n<sym>Waypoint</sym>\r\n</wpt>";
}

// False when the caller stopped the export.
bool WriteTrack(DocumentWriter& w, const TRACK_ITEM_INFO& track, bool fromFile, TimeTextZWriter& times,
                Progress& progress) {
  std::string& out = w.text();
  out += "\r\n<trk>\r\n<name>";
  out += Utf8Field(track.GetName().view(), kTextBuffer);
  // The document's colour is the same for every track, whatever its colour in the trip.
  out += "</name>\r\n<desc>Color:004000ff</desc>\r\n<trkseg>";
  const bool finished = navmisc::exportdetail::ForEachPoint(track, fromFile, [&](const WAYPOINT_ITEM_INFO* p) {
    if (p && p->time != -1) {
      // The hot path of a long track: the element is built in place, then appended once.
      char element[128 + 4 * 340];
      char* at = element;
      const auto put = [&at](std::string_view text) { at = std::copy(text.begin(), text.end(), at); };
      put("\r\n<trkpt lat=\"");
      at = WriteFixed(at, p->latitude, 6);
      put("\" lon=\"");
      at = WriteFixed(at, p->longitude, 6);
      put("\">\r\n<ele>");
      at = WriteFixed(at, p->altitude, 6);
      put("</ele>\r\n<time>");
      at = times.Write(at, p->time);
      put("</time>\r\n<speed>");
      at = WriteFixed(at, p->speed * kMetresPerHourToMetresPerSecond, 2);
      put("</speed>\r\n</trkpt>");
      out.append(element, static_cast<size_t>(at - element));
      w.MaybeFlush();
    }
    return progress.Step();
  });
  if (!finished) return false;
  out += "\r\n</trkseg>\r\n</trk>";
  return true;
}

}  // namespace

int ExportGpx(CString path, CPtrList& tracks, CPtrList& items) {
  ExportControl control;
  return ExportGpx(path, tracks, items, control);
}

int ExportGpx(CString path, CPtrList& tracks, CPtrList& items, ExportControl& control) {
  control.error.clear();
  DocumentWriter w;
  if (!w.Open(path)) {
    control.error = w.error();
    return 0;
  }
  Progress progress{control.counter, control.keepGoing};
  TimeTextZWriter times;
  std::string& out = w.text();
  out += "<?xml version=\"1.0\" encoding=\"UTF-8\" standalone=\"yes\" ?>\r\n<gpx creator=\"Corvane ";
  out += navmisc::exportdetail::kMakerAddress;
  out += "/1.1\" version=\"1.0\" xmlns=\"http://www.topografix.com/GPX/1/0\""
         " xmlns:xsi=\"http://www.w3.org/2001/XMLSchema-instance\""
         " xsi:schemaLocation=\"http://www.topografix.com/GPX/1/0"
         " http://www.topografix.com/GPX/1/0/gpx.xsd\">";
  // Waypoints always precede tracks, whichever list the caller filled first.
  for (const PHOTO_ITEM_INFO* item : navmisc::Items<PHOTO_ITEM_INFO>(items)) {
    if (item) WriteWaypoint(out, *item, times);
    w.MaybeFlush();
    if (!progress.Step()) return navmisc::exportdetail::Stopped(w, control);
  }
  for (const TRACK_ITEM_INFO* track : navmisc::Items<TRACK_ITEM_INFO>(tracks)) {
    if (track && !WriteTrack(w, *track, control.pointsFromFiles, times, progress)) {
      return navmisc::exportdetail::Stopped(w, control);
    }
  }
  out += "\r\n</gpx>";
  w.Close();
  control.error = w.error();
  return 1;
}
