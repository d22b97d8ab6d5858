// The clean-up of an application's data folder: sub-folders that no trip of a store names are
// removed. The stores (the trip tree, the activity stores) name their trips in a file; a store
// that lost an entry while it was read would have the clean-up delete a live trip, so the
// clean-up runs only after a complete read (see docs/data-root-safety.md).
#pragma once

#include "navmisc/platform/cstring.h"
#include "navmisc/platform/lists.h"

namespace navmisc {

// Records whether a store was read completely from its file. A read calls Begin, then Missed for
// every entry the file promises that did not read (a trip whose settings file cannot be read, a
// node without a name, a count larger than the entries present), then Finish. Until then, and
// after any miss, the read is not complete.
class CompleteReadGuard {
 public:
  void Begin();
  void Missed(const CString& why);
  void Finish();
  bool IsComplete() const;
  // Why the read is not complete, for the user; empty when it is.
  CString Why() const;

 private:
  enum class State { kNotRead, kReading, kRead };
  State state_ = State::kNotRead;
  int missed_ = 0;
  CString firstMiss_;
};

// Removes every sub-folder of `folder` whose name `used` does not hold, each in two passes 100 ms
// apart (the second catches files that were still locked). Files and symbolic links stay.
// Removes nothing and returns false when `guard` does not report a complete read.
bool RemoveUnusedResourceFolders(const CString& folder, const CStringList& used,
                                 const CompleteReadGuard& guard);

}  // namespace navmisc
