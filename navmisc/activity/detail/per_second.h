// Per-second sensor samples looked up by time. A sample record (heart rate, cadence, wheel
// speed) holds a start time and one value per second up to its end marker; this flattens a list
// of them into (second, value) pairs sorted by second.
#pragma once

#include <algorithm>
#include <cstdint>
#include <type_traits>
#include <utility>
#include <vector>

#include "navmisc/platform/lists.h"

namespace navmisc::activity {

template <class Sample>
class PerSecond {
 public:
  using Value = std::remove_cv_t<std::remove_reference_t<decltype(std::declval<Sample>().values[0])>>;

  PerSecond() = default;
  explicit PerSecond(const CPtrList& samples) { Add(samples); }

  // Adds the samples of `samples` (Sample*); records without a time are ignored.
  void Add(const CPtrList& samples) {
    size_t more = 0;
    for (const Sample* s : navmisc::Items<Sample>(samples)) more += (s && s->time != -1) ? s->UsedCount() : 0;
    values_.reserve(values_.size() + more);
    for (const Sample* s : navmisc::Items<Sample>(samples)) {
      if (!s || s->time == -1) continue;
      const int used = s->UsedCount();
      for (int i = 0; i < used; ++i) values_.emplace_back(static_cast<int64_t>(s->time) + i, s->values[i]);
    }
    sorted_ = false;
  }

  // The sample at `time`, or nullptr. Where records overlap, the first record's sample wins a
  // shared second.
  const Value* At(int64_t time) {
    Sort();
    auto it = std::lower_bound(values_.begin(), values_.end(), time,
                               [](const auto& v, int64_t t) { return v.first < t; });
    return it != values_.end() && it->first == time ? &it->second : nullptr;
  }

  // Walks the samples in time order: for a caller that asks about rising times, each answer
  // costs amortised constant time instead of a search.
  class Cursor {
   public:
    explicit Cursor(PerSecond& owner) : values_((owner.Sort(), owner.values_)) {}
    // REQUIRES: `time` never smaller than in the previous call.
    const Value* At(int64_t time) {
      while (next_ < values_.size() && values_[next_].first < time) ++next_;
      return next_ < values_.size() && values_[next_].first == time ? &values_[next_].second : nullptr;
    }

   private:
    const std::vector<std::pair<int64_t, Value>>& values_;
    size_t next_ = 0;
  };

  bool empty() const { return values_.empty(); }

 private:
  void Sort() {
    if (sorted_) return;
    auto byTime = [](const auto& a, const auto& b) { return a.first < b.first; };
    if (!std::is_sorted(values_.begin(), values_.end(), byTime)) {
      std::stable_sort(values_.begin(), values_.end(), byTime);
    }
    sorted_ = true;
  }

  std::vector<std::pair<int64_t, Value>> values_;
  bool sorted_ = true;
};

}  // namespace navmisc::activity
