#include "navmisc/records/resource_cleanup.h"

#include <string>
#include <unordered_set>

#include "navmisc/platform/files.h"

namespace navmisc {

void CompleteReadGuard::Begin() {
  state_ = State::kReading;
  missed_ = 0;
  firstMiss_.Empty();
}

void CompleteReadGuard::Missed(const CString& why) {
  if (missed_++ == 0) firstMiss_ = why;
}

void CompleteReadGuard::Finish() {
  if (state_ == State::kReading) state_ = State::kRead;
}

bool CompleteReadGuard::IsComplete() const { return state_ == State::kRead && missed_ == 0; }

CString CompleteReadGuard::Why() const {
  if (missed_ > 1) return FormatString(L"%s (and %d more entries that did not read)", firstMiss_.c_str(), missed_ - 1);
  if (missed_ == 1) return firstMiss_;
  switch (state_) {
    case State::kNotRead: return L"it was not read from its file";
    case State::kReading: return L"its file could not be read to the end";
    case State::kRead: break;
  }
  return {};
}

bool RemoveUnusedResourceFolders(const CString& folder, const CStringList& used,
                                 const CompleteReadGuard& guard) {
  if (!guard.IsComplete()) return false;
  std::unordered_set<std::wstring> keep;
  for (const CString& id : used) keep.insert(id.str());
  CStringList entries;
  if (GetContent(folder, L"*.*", entries) < 0) return false;
  for (const CString& entry : entries) {
    if (keep.count(entry.str())) continue;
    const CString path = PathJoin(folder, entry);
    // Only folders are trip resources: the store's own file and other files stay. RemoveDir
    // leaves a symbolic link to a folder alone.
    if (!IsDirectory(path)) continue;
    RemoveDir(path, L"*.*");
    SleepMs(100);
    RemoveDir(path, L"*.*");
  }
  return true;
}

}  // namespace navmisc
