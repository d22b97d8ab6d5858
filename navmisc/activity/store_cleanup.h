// The clean-up of an activity store's data folder, and the guard that lets it run only after a
// complete read.
//
// A store deletes every folder of its data folder that none of its activities names. That is
// safe only when the store holds every activity its file names: after a read from which one
// dropped out (its trip could not be read, its section was missing or named no usable folder),
// the folder of that activity would look unused and be deleted with the user's data.
#pragma once

#include "navmisc/platform/lists.h"
#include "navmisc/platform/types.h"

namespace navmisc::activity {

// Tracks whether the last read of a store took in every item its file names.
class CompleteRead {
 public:
  // A read starts; until it ends the store counts as not read.
  void Begin() {
    state_ = State::kReading;
    dropped_ = 0;
  }
  // An item that the file names was left out.
  void Dropped(long long count = 1) { dropped_ += count; }
  // The read ends: `ok` when it reached the end of the file (not when it gave up early).
  void End(bool ok) { state_ = ok ? State::kRead : State::kNotRead; }
  // True after a read that ended well with nothing dropped.
  bool IsComplete() const { return state_ == State::kRead && dropped_ == 0; }
  // Why a clean-up may not run now ("" when it may).
  const char* Reason() const;
  long long dropped() const { return dropped_; }

 private:
  enum class State { kNotRead, kReading, kRead };
  State state_ = State::kNotRead;
  long long dropped_ = 0;
};

// How unused folders are removed: once and then a pause before the next folder, or twice with
// the pause between the two passes (the second catches files that were still held open).
enum class RemovalPasses { kOnceThenPause, kTwiceWithPause };

// Removes every sub-folder of the application's data folder (data root + "SportRes",
// "TrackerRes" or "WhereRes") whose name is not in `used`, waiting 100 ms as `passes` says.
// Only real folders directly inside it are touched: files stay, a symbolic link is never
// followed, and nothing happens when the data folder itself is a link. Returns the number of
// folders removed, or -1 when `guard` says the last read was not complete (nothing removed).
int RemoveUnusedFolders(const CompleteRead& guard, GPS_APP_PROG_TYPE app, const CStringList& used,
                        RemovalPasses passes);

}  // namespace navmisc::activity
