#include "navmisc/geo/cleaning.h"

#include <cstdint>
#include <memory>
#include <vector>

#include "navmisc/geo/detail/douglas_peucker.h"
#include "navmisc/geo/gps_helper.h"
#include "navmisc/records/items.h"

namespace {

constexpr int kKept = WAYPOINT_ITEM_INFO::kFlagKept;

void ClearMarks(CPtrList& points) {
  for (WAYPOINT_ITEM_INFO* p : navmisc::Items<WAYPOINT_ITEM_INFO>(points)) {
    if (p) p->flags[kKept] = 0;
  }
}

template <class Pass>
int RunArrayPass(CPtrList& points, Pass pass) {
  ClearMarks(points);
  int count = points.GetCount();
  if (count < 4) return 0;
  navmisc::WayPointArray array = navmisc::MakeWayPointArray(points);
  CGPSHelper helper;
  const int result = pass(helper, array.get(), count);
  // Record k answers for the k-th list entry.
  int k = 0;
  for (WAYPOINT_ITEM_INFO* p : navmisc::Items<WAYPOINT_ITEM_INFO>(points)) {
    if (p && array[k].valid == 1) p->flags[kKept] = 1;
    ++k;
  }
  return result;
}

}  // namespace

int Revise(CPtrList& points) {
  return RunArrayPass(points, [](CGPSHelper& h, sWayPoint* a, int& n) { return h.Revise(a, n); });
}

int Reduction(CPtrList& points) {
  return RunArrayPass(points, [](CGPSHelper& h, sWayPoint* a, int& n) { return h.Reduce(a, n); });
}

int Smooth(CPtrList& points, double tolerance) {
  ClearMarks(points);
  std::vector<WAYPOINT_ITEM_INFO*> entries;
  entries.reserve(static_cast<size_t>(points.GetCount()));
  for (WAYPOINT_ITEM_INFO* p : navmisc::Items<WAYPOINT_ITEM_INFO>(points)) {
    if (p) entries.push_back(p);
  }
  const int n = static_cast<int>(entries.size());
  if (n == 0) return 0;
  std::vector<double> xs(entries.size()), ys(entries.size());
  for (int i = 0; i < n; ++i) {
    xs[i] = entries[i]->longitude;
    ys[i] = entries[i]->latitude;
  }
  // SimplifyMarks writes every byte.
  std::unique_ptr<uint8_t[]> marks(new uint8_t[entries.size()]);
  const int kept = navmisc::geo::SimplifyMarks(xs.data(), ys.data(), n, tolerance, marks.get());
  for (int i = 0; i < n; ++i) {
    if (marks[i]) entries[i]->flags[kKept] = 1;
  }
  return kept;
}
