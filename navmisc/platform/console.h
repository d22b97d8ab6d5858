// The terminal side of command-line programs: whether output goes to a terminal, and Ctrl-C.
#pragma once

#include <string>

namespace navmisc {

bool StderrIsTerminal();
// Copies the file at `path` to standard output (flushing what stdio holds first). False, with the
// system's reason in `error`, when the file cannot be read or the output cannot be written.
bool CopyFileToStdout(const wchar_t* path, std::string& error);

// While it lives, Ctrl-C (SIGINT) does not end the process but is recorded; Interrupted() tells
// whether it came. The previous handling comes back on destruction.
class InterruptWatch {
 public:
  InterruptWatch();
  ~InterruptWatch();
  InterruptWatch(const InterruptWatch&) = delete;
  InterruptWatch& operator=(const InterruptWatch&) = delete;
  bool Interrupted() const;
};

}  // namespace navmisc
