#include "navmisc/export/tcx_export.h"

#include <vector>

#include "navmisc/export/detail/export_common.h"
#include "navmisc/export/detail/xml_tree.h"
#include "navmisc/platform/datetime.h"
#include "navmisc/platform/textconv.h"
#include "navmisc/records/track.h"

CTcxActivities::~CTcxActivities() { navmisc::DeleteAll<TcxLap>(laps); }

TcxLap* CTcxActivities::AddLap() {
  auto* lap = new TcxLap;
  laps.AddTail(lap);
  return lap;
}

namespace {

using navmisc::exportdetail::XmlDocument;
using navmisc::exportdetail::XmlNode;

constexpr wchar_t kRootTag[] =
    L"TrainingCenterDatabase xmlns=\"http://www.garmin.com/xmlschemas/TrainingCenterDatabase/v2\""
    L" xmlns:xsi=\"http://www.w3.org/2001/XMLSchema-instance\""
    L" xsi:schemaLocation=\"http://www.garmin.com/xmlschemas/TrainingCenterDatabase/v2"
    L" http://www.garmin.com/xmlschemas/TrainingCenterDatabasev2.xsd\"";
// The comment keeps its three dashes and its spelling: readers of older exports match it.
constexpr wchar_t kPrologue[] =
    L"<?xml version=\"1.0\" encoding=\"UTF-8\" standalone=\"no\" ?>\n<!--- Corvane verion:2.0 -->\n";

constexpr uint8_t kHasPosition = 1;
constexpr uint8_t kHasHeartRate = 2;
constexpr uint8_t kHasCadence = 4;
constexpr uint8_t kHasSpeed = 8;

enum class Intensity { kActive, kResting };

const wchar_t* IntensityText(Intensity i) { return i == Intensity::kActive ? L"Active" : L"Resting"; }

void AddHeartRate(XmlNode* parent, const wchar_t* name, int bpm) {
  XmlNode* node = parent->AddChild(name);
  node->AddAttribute(L"xsi:type", L"HeartRateInBeatsPerMinute_t");
  node->AddChild(L"Value")->SetText(bpm);
}

// 45/45 is how the store marks a point without a fix, like 0/0.
bool PositionMissing(const WAYPOINT_ITEM_INFO& p) {
  return (p.latitude == 0.0 && p.longitude == 0.0) || (p.latitude == 45.0 && p.longitude == 45.0);
}

void AddTrackpoint(XmlNode* track, const WAYPOINT_ITEM_INFO& p) {
  const uint8_t flags = p.flags[WAYPOINT_ITEM_INFO::kFlagPresence];
  XmlNode* tp = track->AddChild(L"Trackpoint");
  // Unlike the lap's start, the point's time gets no "Z"; readers take it as UTC either way.
  tp->AddChild(L"Time")->SetText(TimeTToStdStringTime(p.time).str());
  if ((flags & kHasPosition) && !PositionMissing(p)) {
    XmlNode* pos = tp->AddChild(L"Position");
    pos->AddChild(L"LatitudeDegrees")->SetText(p.latitude);
    pos->AddChild(L"LongitudeDegrees")->SetText(p.longitude);
    tp->AddChild(L"AltitudeMeters")->SetText(p.altitude);
  }
  tp->AddChild(L"DistanceMeters")->SetText(p.workDistance);
  if (flags & kHasHeartRate) AddHeartRate(tp, L"HeartRateBpm", p.workHeartRate);
  if (flags & kHasCadence) tp->AddChild(L"Cadence")->SetText(p.workCadence);
  if (flags & kHasSpeed) {
    XmlNode* tpx = tp->AddChild(L"Extensions")->AddChild(L"TPX");
    tpx->AddAttribute(L"xmlns", L"http://www.garmin.com/xmlschemas/ActivityExtension/v2");
    tpx->AddAttribute(L"CadenceSensor", L"Bike");
    tpx->AddChild(L"Speed")->SetText(p.workSpeed);
  }
}

void AddLap(XmlNode* activity, const TcxLap& lap) {
  XmlNode* node = activity->AddChild(L"Lap");
  if (lap.startTime > 0) {
    node->AddAttribute(L"StartTime",
                       navmisc::FromUtf8Lossy(navmisc::exportdetail::StdTimeTextZ(lap.startTime)));
  }
  node->AddChild(L"TotalTimeSeconds")->SetText(static_cast<int>(lap.totalTimeSeconds));
  node->AddChild(L"DistanceMeters")->SetText(lap.distanceMeters);
  if (lap.maximumSpeed > 0) node->AddChild(L"MaximumSpeed")->SetText(lap.maximumSpeed);
  if (lap.calories > 0) node->AddChild(L"Calories")->SetText(lap.calories);
  if (lap.averageHeartRate > 0) AddHeartRate(node, L"AverageHeartRateBpm", lap.averageHeartRate);
  if (lap.maximumHeartRate > 0) AddHeartRate(node, L"MaximumHeartRateBpm", lap.maximumHeartRate);
  node->AddChild(L"Intensity")->SetText(IntensityText(Intensity::kActive));
  node->AddChild(L"TriggerMethod")->SetText(L"Manual");
  for (const TRACK_ITEM_INFO* track : navmisc::Items<TRACK_ITEM_INFO>(lap.tracks)) {
    if (!track) continue;
    XmlNode* trackNode = node->AddChild(L"Track");
    for (const WAYPOINT_ITEM_INFO* p : navmisc::Items<WAYPOINT_ITEM_INFO>(track->points)) {
      if (!p || p->time == -1) continue;
      if ((p->flags[WAYPOINT_ITEM_INFO::kFlagPresence] & 0x0F) == 0) continue;
      AddTrackpoint(trackNode, *p);
    }
  }
}

const wchar_t* SportText(int32_t type) {
  switch (type) {
    case CTcxActivities::kBiking: return L"Biking";
    case CTcxActivities::kRunning: return L"Running";
    default: return L"Other";
  }
}

}  // namespace

int ExportTcx(CString path, CTcxActivities& activity) {
  if (activity.Id.IsEmpty() || activity.sportType < 0 || activity.sportType > 7) return 0;

  XmlDocument doc;
  XmlNode* root = doc.CreateNode(kRootTag);
  root->AddChild(L"Folders");
  XmlNode* act = root->AddChild(L"Activities")->AddChild(L"Activity");
  act->AddAttribute(L"Sport", SportText(activity.sportType));
  act->AddChild(L"Id")->SetText(activity.Id.str());
  for (const TcxLap* lap : navmisc::Items<TcxLap>(activity.laps)) {
    if (lap) AddLap(act, *lap);
  }

  std::wstring text = doc.Render(kPrologue);
  // The document is converted into a buffer of twice its length in characters: text that needs
  // more than that (long runs of characters outside the Latin scripts) leaves the file empty.
  std::vector<char> utf8(text.size() * 2 + 1);
  int length = WCSToMBS(text.c_str(), utf8.data(), static_cast<int>(utf8.size()), true);

  navmisc::exportdetail::UniqueFile file = navmisc::exportdetail::OpenForWriting(path);
  if (!file) return 0;
  if (length > 0) std::fwrite(utf8.data(), 1, static_cast<size_t>(length), file.get());
  return 1;
}
