#include "navmisc/geo/detail/douglas_peucker.h"

#include <algorithm>
#include <cmath>
#include <limits>

namespace navmisc::geo {
namespace {

struct RangeMax {
  double distance = 0.0;  // 0 when no point lies strictly between the ends
  int index = -1;         // first point of that distance
};

// Farthest point strictly between a and b, measured to the segment a-b (to the nearer end when
// the point projects outside it). A tie goes to the lowest index.
inline RangeMax FindRangeMax(const double* xs, const double* ys, int a, int b) {
  RangeMax best;
  best.index = a;
  const double ax = xs[a], ay = ys[a], bx = xs[b], by = ys[b];
  const double dx = bx - ax, dy = by - ay;
  const double len = std::sqrt(dx * dx + dy * dy);
  const bool hasDirection = len > 0.0;
  const double ux = hasDirection ? dx / len : 0.0, uy = hasDirection ? dy / len : 0.0;
  for (int k = a + 1; k < b; ++k) {
    const double px = xs[k] - ax, py = ys[k] - ay;
    double d;
    if (!hasDirection || px * ux + py * uy < 0.0) {
      d = std::sqrt(px * px + py * py);
    } else {
      const double qx = bx - xs[k], qy = by - ys[k];
      const double along = qx * ux + qy * uy;
      const double q2 = qx * qx + qy * qy;
      d = along < 0.0 ? std::sqrt(q2) : std::sqrt(std::fabs(q2 - along * along));
    }
    if (d > best.distance) {
      best.distance = d;
      best.index = k;
    }
  }
  return best;
}

struct Range {
  int a, b;
  double inherited;  // smallest split distance among the ancestors (+inf for the root)
};

}  // namespace

int SimplifyMarks(const double* xs, const double* ys, int n, double tolerance, uint8_t* marks) {
  if (n <= 0) return 0;
  std::fill(marks, marks + n, uint8_t{0});
  if (tolerance <= 0.0) {
    std::fill(marks, marks + n, uint8_t{1});
    return n;
  }
  // An explicit stack: a long track would exhaust the call stack with recursion.
  std::vector<Range> stack;
  stack.push_back({0, n - 1, 0.0});
  while (!stack.empty()) {
    const Range r = stack.back();
    stack.pop_back();
    const RangeMax m = FindRangeMax(xs, ys, r.a, r.b);
    if (!(m.distance > tolerance)) {
      marks[r.a] = 1;
      marks[r.b] = 1;
    } else {
      stack.push_back({r.a, m.index, 0.0});
      stack.push_back({m.index, r.b, 0.0});
    }
  }
  return static_cast<int>(std::count(marks, marks + n, uint8_t{1}));
}

// Where a range splits does not depend on the tolerance, only whether it splits. A range is
// examined at tolerance t exactly when every ancestor split, i.e. t < the smallest split distance
// among its ancestors (`inherited`), and it keeps its two ends when it does not split itself,
// i.e. its own distance <= t. So the range keeps its ends for the tolerances in
// [distance, inherited), and a point's level is the largest k whose tolerance falls into such an
// interval of one of the ranges it ends. Ranges whose tolerances all lie below tolerances[1] are
// never examined at a positive step and are not visited.
std::vector<int> SimplifyLevels(const double* xs, const double* ys, int n,
                                const std::vector<double>& tolerances) {
  std::vector<int> level(static_cast<size_t>(std::max(n, 0)), 0);  // tolerance 0 keeps all
  const int maxK = static_cast<int>(tolerances.size()) - 1;
  if (n <= 0 || maxK < 1) return level;
  const double finest = tolerances[1];
  // Largest k >= 1 with tolerances[k] < bound (bound > finest, so one exists).
  auto largestBelow = [&](double bound) {
    int lo = 1, hi = maxK;
    while (lo < hi) {
      const int mid = (lo + hi + 1) / 2;
      if (tolerances[mid] < bound) lo = mid;
      else hi = mid - 1;
    }
    return lo;
  };
  std::vector<Range> stack;
  stack.push_back({0, n - 1, std::numeric_limits<double>::infinity()});
  while (!stack.empty()) {
    const Range r = stack.back();
    stack.pop_back();
    const RangeMax m = FindRangeMax(xs, ys, r.a, r.b);
    const int k = largestBelow(r.inherited);
    if (!(m.distance > tolerances[k])) {
      level[r.a] = std::max(level[r.a], k);
      level[r.b] = std::max(level[r.b], k);
    }
    if (m.distance > finest) {
      const double inherited = std::min(r.inherited, m.distance);
      stack.push_back({r.a, m.index, inherited});
      stack.push_back({m.index, r.b, inherited});
    }
  }
  return level;
}

}  // namespace navmisc::geo
