// Douglas-Peucker on plain (x, y) = (longitude, latitude) pairs, shared by the list-level Smooth
// and by the optimisation levels. Both go through the same range search in one translation unit,
// so the distances they compare are bit for bit the same numbers.
#pragma once

#include <cstdint>
#include <vector>

namespace navmisc::geo {

// Marks (1) the points that Douglas-Peucker keeps at `tolerance` (degrees); a tolerance of 0 or
// less keeps every point. Returns the number kept. `marks` must hold `n` bytes.
int SimplifyMarks(const double* xs, const double* ys, int n, double tolerance, uint8_t* marks);

// For every point, the largest k in 0..maxK such that SimplifyMarks with tolerances[k] keeps it,
// computed in one pass. `tolerances` must be non-decreasing with tolerances[0] <= 0 and
// tolerances[1] > 0.
std::vector<int> SimplifyLevels(const double* xs, const double* ys, int n,
                                const std::vector<double>& tolerances);

}  // namespace navmisc::geo
