// Child processes: starting a program of the suite, waiting for it with or without a limit, and
// ending it. A ChildProcess owns its child: one that is still running when the object goes away
// is killed and reaped, so no caller (and no failing test) can leave a process behind.
#pragma once

#include <sys/types.h>

#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

namespace navmisc {

// Splits a command line into arguments the way the suite's programs read theirs: blanks and
// tabs separate arguments, double quotes group text with blanks into one argument and are
// removed, and \" stands for a double quote inside or outside quotes. Any other backslash is an
// ordinary character, so "C:\photos\a b.jpg" in quotes stays one argument as written.
std::vector<std::string> SplitCommandLine(std::string_view line);

// The kernel's identifier of the calling thread (unique among the live threads of the system).
unsigned long GetCurrentThreadId();

// The full path of the program `name` found on PATH (an executable regular file), empty when
// there is none. A name with a "/" is taken as a path and returned when it is executable.
std::string FindProgram(const std::string& name);

struct SpawnOptions {
  // Standard input, output and error of the child go to /dev/null: the child runs hidden, as a
  // program without a window. Unset streams are inherited.
  bool nullStdin = false;
  bool nullStdout = false;
  bool nullStderr = false;
  // Standard output goes into a pipe that ReadOutput reads. Standard error is then collected too
  // (the first kErrorOutputLimit bytes are kept for errorOutput()), so that a child that writes
  // much to it can never block on a full pipe.
  bool captureOutput = false;
  // When not negative, the child's standard input is a copy of this descriptor (nullStdin is
  // then ignored).
  int stdinFd = -1;
};

class ChildProcess {
 public:
  ChildProcess() = default;
  // A child still running is killed and reaped.
  ~ChildProcess();
  ChildProcess(ChildProcess&& other) noexcept;
  ChildProcess& operator=(ChildProcess&& other) noexcept;
  ChildProcess(const ChildProcess&) = delete;
  ChildProcess& operator=(const ChildProcess&) = delete;

  // Starts the program at the path argv[0] (it is not searched on PATH) with the arguments
  // argv[1..] and this process's environment. False, with error() telling why, when it could not
  // be started: a missing or non-executable file fails here, not later. A running child of this
  // object is killed and reaped first.
  bool Start(const std::vector<std::string>& argv, const SpawnOptions& options = {});

  // True from a successful Start until the child has been reaped.
  bool IsRunning() const { return pid_ > 0; }
  pid_t pid() const { return pid_; }

  // Waits until the child ends, without a limit, and reaps it. Returns its exit status:
  // the exit code, or 128 + the number of the signal that ended it; -1 when no child runs.
  int Wait();
  // Waits at most `ms` milliseconds. True when the child has ended (and is reaped); its exit
  // status is then exitStatus(). False while it is still running.
  bool WaitFor(unsigned ms);
  // Sends SIGKILL and reaps the child; nothing when none runs.
  void Kill();

  // With captureOutput: reads up to `capacity` bytes of the child's standard output, waiting
  // for them. Returns the count, 0 when the child has closed its output, -1 on an error or when
  // output is not captured. Read the output to its end before Wait: a child blocked on a full
  // pipe never ends. Kill and the destructor close the pipes. With `timeoutMs` not negative,
  // returns kTimedOut when no output came within that time.
  ssize_t ReadOutput(char* buffer, size_t capacity, int timeoutMs = -1);
  static constexpr ssize_t kTimedOut = -2;
  // The start of what the child wrote on standard error while ReadOutput ran (captureOutput).
  const std::string& errorOutput() const { return errors_; }
  static constexpr size_t kErrorOutputLimit = 4096;

  // The exit status of the last child that was reaped (see Wait), -1 before.
  int exitStatus() const { return status_; }
  // Why the last Start failed ("No such file or directory"), empty after a successful one.
  const std::string& error() const { return error_; }

 private:
  bool Reap(bool block);
  void CloseOutput();
  bool DrainErrors();

  pid_t pid_ = -1;
  int out_ = -1;  // read ends of the captured standard output and error
  int err_ = -1;
  std::string errors_;
  int status_ = -1;
  std::string error_;
};

}  // namespace navmisc
