// Record builders and file helpers shared by the exporter tests.
#pragma once

#include <memory>
#include <string>
#include <tuple>
#include <vector>

#include "navmisc/platform/files.h"
#include "navmisc/platform/lists.h"
#include "navmisc/records/photo.h"
#include "navmisc/records/track.h"
#include "testutil.h"

namespace navmisc::exporttest {

struct Pt {
  double lat;
  double lon;
  double alt;
  int32_t time;
  int32_t speed = 0;  // metres per hour
  int32_t course = -1;
  int32_t type = 0;
};

inline std::unique_ptr<TRACK_ITEM_INFO> MakeTrack(const wchar_t* name, const std::vector<Pt>& pts) {
  auto track = std::make_unique<TRACK_ITEM_INFO>(nullptr);
  track->description = name;
  for (const Pt& p : pts) {
    auto* w = new WAYPOINT_ITEM_INFO;
    std::tie(w->latitude, w->longitude, w->altitude, w->time) = std::tie(p.lat, p.lon, p.alt, p.time);
    std::tie(w->speed, w->course, w->type) = std::tie(p.speed, p.course, p.type);
    track->points.AddTail(w);
  }
  return track;
}

inline std::unique_ptr<PHOTO_ITEM_INFO> MakeItem(int type, const wchar_t* title, const wchar_t* desc,
                                                 double lat, double lon, double alt, int32_t time) {
  auto item = std::make_unique<PHOTO_ITEM_INFO>();
  std::tie(item->dataType, item->title, item->description) = std::tie(type, title, desc);
  std::tie(item->latitude, item->longitude, item->altitude, item->playbackTime) = std::tie(lat, lon, alt, time);
  return item;
}

// Pulls the Folder name (the local date and time of the export) out of a KML document and puts
// "@DATE@" in its place, so that the rest can be compared byte for byte.
inline std::string MaskKmlDate(const std::string& doc, std::string* name = nullptr) {
  const std::string open = "<Folder><name>";
  const size_t start = doc.find(open);
  if (start == std::string::npos) return doc;
  const size_t from = start + open.size();
  const size_t end = doc.find("</name>", from);
  if (end == std::string::npos) return doc;
  if (name) *name = doc.substr(from, end - from);
  return doc.substr(0, from) + "@DATE@" + doc.substr(end);
}

using navmisc::testutil::CommandResult;
using navmisc::testutil::HaveProgram;
using navmisc::testutil::RunCommand;
using navmisc::testutil::SchemaDir;
using navmisc::testutil::ShellQuote;

}  // namespace navmisc::exporttest
