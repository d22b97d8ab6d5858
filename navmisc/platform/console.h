// The terminal side of command-line programs: whether output goes to a terminal, and Ctrl-C.
#pragma once

namespace navmisc {

bool StderrIsTerminal();

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
