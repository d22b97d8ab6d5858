#include "navmisc/export/tcx_export.h"

#include <string>

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

using navmisc::exportdetail::DocumentWriter;
using navmisc::exportdetail::Progress;
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

const wchar_t* SportText(int32_t type) {
  switch (type) {
    case CTcxActivities::kBiking: return L"Biking";
    case CTcxActivities::kRunning: return L"Running";
    default: return L"Other";
  }
}

// "%d" of the total time truncated toward zero; a value outside the integers gives the
// processor's "integer indefinite" value, as the conversion instruction does.
int WholeSeconds(double seconds) {
  if (!(seconds > -2147483649.0 && seconds < 2147483648.0)) return INT32_MIN;
  return static_cast<int>(seconds);
}

void AddHeartRate(XmlNode* parent, const wchar_t* name, int bpm) {
  XmlNode* node = parent->AddChild(name);
  node->AddAttribute(L"xsi:type", L"HeartRateInBeatsPerMinute_t");
  node->AddChild(L"Value")->SetText(bpm);
}

// 45/45 is how the store marks a point without a fix, like 0/0.
bool PositionMissing(const WAYPOINT_ITEM_INFO& p) {
  return (p.latitude == 0.0 && p.longitude == 0.0) || (p.latitude == 45.0 && p.longitude == 45.0);
}

bool IsTrackpoint(const WAYPOINT_ITEM_INFO* p) {
  return p && p->time != -1 && (p->flags[WAYPOINT_ITEM_INFO::kFlagPresence] & 0x0F) != 0;
}

void FillTrackpoint(XmlNode* tp, const WAYPOINT_ITEM_INFO& p) {
  const uint8_t flags = p.flags[WAYPOINT_ITEM_INFO::kFlagPresence];
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

// The Lap element with its figures; its Track elements follow the figures.
void FillLap(XmlNode* node, const TcxLap& lap) {
  if (lap.startTime > 0) {
    node->AddAttribute(L"StartTime",
                       navmisc::FromUtf8Lossy(navmisc::exportdetail::StdTimeTextZ(lap.startTime)));
  }
  node->AddChild(L"TotalTimeSeconds")->SetText(WholeSeconds(lap.totalTimeSeconds));
  node->AddChild(L"DistanceMeters")->SetText(lap.distanceMeters);
  if (lap.maximumSpeed > 0) node->AddChild(L"MaximumSpeed")->SetText(lap.maximumSpeed);
  if (lap.calories > 0) node->AddChild(L"Calories")->SetText(lap.calories);
  if (lap.averageHeartRate > 0) AddHeartRate(node, L"AverageHeartRateBpm", lap.averageHeartRate);
  if (lap.maximumHeartRate > 0) AddHeartRate(node, L"MaximumHeartRateBpm", lap.maximumHeartRate);
  node->AddChild(L"Intensity")->SetText(IntensityText(Intensity::kActive));
  node->AddChild(L"TriggerMethod")->SetText(L"Manual");
}

// The document's wide text, converted to UTF-8 piece by piece on its way into the file. The
// result is what converting the whole text at once gives: text that is not valid Unicode, or
// whose UTF-8 form is longer than twice its length in characters (the size of the conversion
// buffer), makes the whole conversion fail and the file end up empty.
class Utf8Document {
 public:
  explicit Utf8Document(DocumentWriter& w) : w_(w) {}
  std::wstring& piece() { return piece_; }
  // Converts and writes what piece() holds.
  void Put() {
    chars_ += piece_.size();
    if (ok_ && navmisc::WideToUtf8(piece_, utf8_)) {
      bytes_ += utf8_.size();
      w_.text() += utf8_;
      w_.MaybeFlush();
    } else {
      ok_ = false;
    }
    piece_.clear();
  }
  bool ok() const { return ok_ && bytes_ <= 2 * chars_; }

 private:
  DocumentWriter& w_;
  std::wstring piece_;
  std::string utf8_;
  size_t chars_ = 0;
  size_t bytes_ = 0;
  bool ok_ = true;
};

}  // namespace

int ExportTcx(CString path, CTcxActivities& activity) {
  ExportControl control;
  return ExportTcx(path, activity, control);
}

int ExportTcx(CString path, CTcxActivities& activity, ExportControl& control) {
  control.error.clear();
  if (activity.Id.IsEmpty() || activity.sportType < 0 || activity.sportType > 7) {
    control.error = "the activity has no Id or a sport type outside 0 to 7";
    return 0;
  }
  if (control.pointsFromFiles) {
    control.error = "a TCX export needs the points loaded";
    return 0;
  }

  // The document's frame; the laps are rendered one by one, and their Trackpoints one at a
  // time, so that a long activity never has to be held as elements in memory.
  XmlDocument doc;
  XmlNode* root = doc.CreateNode(kRootTag);
  XmlNode* folders = root->AddChild(L"Folders");
  XmlNode* activities = root->AddChild(L"Activities");
  XmlNode* act = activities->AddChild(L"Activity");
  act->AddAttribute(L"Sport", SportText(activity.sportType));
  XmlNode* id = act->AddChild(L"Id");
  id->SetText(activity.Id.str());

  DocumentWriter w;
  if (!w.Open(path)) {
    control.error = w.error();
    return 0;
  }
  Progress progress{control.counter, control.keepGoing};
  Utf8Document text(w);
  std::wstring& piece = text.piece();
  piece = kPrologue;
  root->RenderStart(piece);
  folders->Render(piece);
  activities->RenderStart(piece);
  act->RenderStart(piece);
  id->Render(piece);
  text.Put();
  for (const TcxLap* lap : navmisc::Items<TcxLap>(activity.laps)) {
    if (!lap) continue;
    XmlNode lapNode(L"Lap");
    FillLap(&lapNode, *lap);
    lapNode.RenderStart(piece);
    for (const auto& figure : lapNode.children()) figure->Render(piece);
    for (const TRACK_ITEM_INFO* track : navmisc::Items<TRACK_ITEM_INFO>(lap->tracks)) {
      if (!track) continue;
      XmlNode trackNode(L"Track");
      trackNode.RenderStart(piece);
      for (const WAYPOINT_ITEM_INFO* p : navmisc::Items<WAYPOINT_ITEM_INFO>(track->points)) {
        if (IsTrackpoint(p)) {
          XmlNode tp(L"Trackpoint");
          FillTrackpoint(&tp, *p);
          tp.Render(piece);
          text.Put();
        }
        if (!progress.Step()) return navmisc::exportdetail::Stopped(w, control);
      }
      trackNode.RenderEnd(piece);
    }
    lapNode.RenderEnd(piece);
  }
  act->RenderEnd(piece);
  activities->RenderEnd(piece);
  root->RenderEnd(piece);
  text.Put();
  if (!text.ok()) {
    // Nothing of a failed conversion reaches the file.
    w.Remove();
    if (!w.Open(path)) {
      control.error = w.error();
      return 0;
    }
  }
  w.Close();
  control.error = w.error();
  return 1;
}
