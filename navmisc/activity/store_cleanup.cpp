#include "navmisc/activity/store_cleanup.h"

#include "navmisc/platform/files.h"
#include "navmisc/records/trip.h"

namespace navmisc::activity {

const char* CompleteRead::Reason() const {
  switch (state_) {
    case State::kNotRead: return "the store was not read from its file";
    case State::kReading: return "the store is being read";
    case State::kRead: break;
  }
  return dropped_ ? "activities named by the store file could not be read" : "";
}

int RemoveUnusedFolders(const CompleteRead& guard, GPS_APP_PROG_TYPE app, const CStringList& used,
                        RemovalPasses passes) {
  if (!guard.IsComplete()) return -1;
  // The folder is listed through a file name in it, which is never created.
  const CString folder = PathFolder(PathJoin(GetAppDataFolder(app), L"dumy.file"));
  if (!IsRealDirectory(folder)) return 0;
  CStringList entries;
  if (GetContent(folder, L"*.*", entries) < 0) return 0;
  int removed = 0;
  for (const CString& entry : entries) {
    if (used.Find(entry)) continue;
    const CString path = PathJoin(folder, entry);
    if (!IsRealDirectory(path)) continue;
    RemoveDir(path, L"*.*");
    SleepMs(100);
    if (passes == RemovalPasses::kTwiceWithPause) RemoveDir(path, L"*.*");
    if (PathStatus(path) == 2) ++removed;
  }
  return removed;
}

}  // namespace navmisc::activity
