// What the exporters' extended calls share: the caller's progress counter and stop flag, where
// the track points come from, and whether the document reached its file whole.
#pragma once

#include <string>

struct ExportControl {
  // Goes up by one per written item and per track point (written or not). May be null.
  int* counter = nullptr;
  // When the caller clears it the export stops and deletes what it wrote (the call returns 0).
  // May be null.
  bool* keepGoing = nullptr;
  // Reads each track's points from its point file while the document is written, one point at
  // a time, instead of from the track's point list (which is neither read nor changed): the
  // document is the one the track gives with its points loaded, without holding them. Not for
  // TCX, whose points carry working values computed from the loaded list.
  bool pointsFromFiles = false;

  // Set by the call: empty when the whole document reached its file(s); otherwise why not, in
  // the system's words ("No space left on device"). A write that fails after the target was
  // opened shows only here: the call's result stays 1.
  std::string error;
};
