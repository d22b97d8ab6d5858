#include "navmisc/platform/process.h"

#include <errno.h>
#include <fcntl.h>
#include <poll.h>
#include <signal.h>
#include <spawn.h>
#include <string.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <time.h>
#include <unistd.h>

#include <algorithm>
#include <utility>

#include "navmisc/platform/detail/unique_fd.h"

extern char** environ;

namespace navmisc {
namespace {

// Signals whose handling the child gets back at their defaults: a caller that ignores SIGPIPE or
// SIGINT must not hand that on to the program it starts.
constexpr int kDefaultSignals[] = {SIGPIPE, SIGINT, SIGQUIT, SIGTERM, SIGHUP, SIGCHLD,
                                   SIGUSR1, SIGUSR2, SIGALRM};

int StatusOf(int raw) {
  if (WIFEXITED(raw)) return WEXITSTATUS(raw);
  if (WIFSIGNALED(raw)) return 128 + WTERMSIG(raw);
  return -1;
}

long long NowMs() {
  struct timespec ts;
  ::clock_gettime(CLOCK_MONOTONIC, &ts);
  return static_cast<long long>(ts.tv_sec) * 1000 + ts.tv_nsec / 1000000;
}

// posix_spawn's attribute and file-action objects, destroyed however Start leaves.
struct SpawnSetup {
  posix_spawnattr_t attr;
  posix_spawn_file_actions_t actions;
  bool ok = false;

  SpawnSetup() {
    if (::posix_spawnattr_init(&attr) != 0) return;
    if (::posix_spawn_file_actions_init(&actions) != 0) {
      ::posix_spawnattr_destroy(&attr);
      return;
    }
    ok = true;
  }
  ~SpawnSetup() {
    if (!ok) return;
    ::posix_spawn_file_actions_destroy(&actions);
    ::posix_spawnattr_destroy(&attr);
  }
  SpawnSetup(const SpawnSetup&) = delete;
  SpawnSetup& operator=(const SpawnSetup&) = delete;
};

}  // namespace

std::vector<std::string> SplitCommandLine(std::string_view line) {
  std::vector<std::string> args;
  std::string current;
  bool inArg = false, quoted = false;
  for (size_t i = 0; i < line.size(); ++i) {
    const char c = line[i];
    if (c == '\\' && i + 1 < line.size() && line[i + 1] == '"') {
      current.push_back('"');
      inArg = true;
      ++i;
    } else if (c == '"') {
      quoted = !quoted;
      inArg = true;  // "" is an empty argument
    } else if ((c == ' ' || c == '\t') && !quoted) {
      if (inArg) args.push_back(std::move(current));
      current.clear();
      inArg = false;
    } else {
      current.push_back(c);
      inArg = true;
    }
  }
  if (inArg) args.push_back(std::move(current));
  return args;
}

unsigned long GetCurrentThreadId() { return static_cast<unsigned long>(::gettid()); }

ChildProcess::~ChildProcess() { Kill(); }

ChildProcess::ChildProcess(ChildProcess&& other) noexcept
    : pid_(std::exchange(other.pid_, -1)), status_(other.status_), error_(std::move(other.error_)) {}

ChildProcess& ChildProcess::operator=(ChildProcess&& other) noexcept {
  if (this != &other) {
    Kill();
    pid_ = std::exchange(other.pid_, -1);
    status_ = other.status_;
    error_ = std::move(other.error_);
  }
  return *this;
}

bool ChildProcess::Start(const std::vector<std::string>& argv, const SpawnOptions& options) {
  Kill();
  error_.clear();
  if (argv.empty() || argv[0].empty()) {
    error_ = "no program given";
    return false;
  }
  SpawnSetup setup;
  if (!setup.ok) {
    error_ = "cannot prepare the start of a process";
    return false;
  }
  sigset_t mask;
  sigemptyset(&mask);
  sigset_t defaults;
  sigemptyset(&defaults);
  for (int sig : kDefaultSignals) sigaddset(&defaults, sig);
  ::posix_spawnattr_setsigmask(&setup.attr, &mask);
  ::posix_spawnattr_setsigdefault(&setup.attr, &defaults);
  ::posix_spawnattr_setflags(&setup.attr, POSIX_SPAWN_SETSIGMASK | POSIX_SPAWN_SETSIGDEF);
  const struct {
    bool wanted;
    int fd;
    int flags;
  } nulls[] = {{options.nullStdin, STDIN_FILENO, O_RDONLY},
               {options.nullStdout, STDOUT_FILENO, O_WRONLY},
               {options.nullStderr, STDERR_FILENO, O_WRONLY}};
  for (const auto& n : nulls) {
    if (n.wanted) ::posix_spawn_file_actions_addopen(&setup.actions, n.fd, "/dev/null", n.flags, 0);
  }

  std::vector<char*> args;
  args.reserve(argv.size() + 1);
  for (const std::string& a : argv) args.push_back(const_cast<char*>(a.c_str()));
  args.push_back(nullptr);
  pid_t pid = -1;
  // glibc's posix_spawn reports a failed exec (a missing program, say) as its own result.
  const int rc = ::posix_spawn(&pid, argv[0].c_str(), &setup.actions, &setup.attr, args.data(),
                               environ);
  if (rc != 0) {
    error_ = ::strerror(rc);
    return false;
  }
  pid_ = pid;
  status_ = -1;
  return true;
}

bool ChildProcess::Reap(bool block) {
  if (pid_ <= 0) return true;
  int raw = 0;
  for (;;) {
    const pid_t r = ::waitpid(pid_, &raw, block ? 0 : WNOHANG);
    if (r == pid_) {
      status_ = StatusOf(raw);
      break;
    }
    if (r == 0) return false;  // still running
    if (errno == EINTR) continue;
    // ECHILD: the child was reaped elsewhere (a caller that ignores SIGCHLD); its status is lost.
    status_ = -1;
    break;
  }
  pid_ = -1;
  return true;
}

int ChildProcess::Wait() {
  if (pid_ <= 0) return -1;
  Reap(true);
  return status_;
}

bool ChildProcess::WaitFor(unsigned ms) {
  if (pid_ <= 0) return true;
  if (Reap(false)) return true;
  const long long deadline = NowMs() + ms;
  // A pidfd becomes readable when the child ends, so the wait needs no polling.
  detail::UniqueFd pidfd(static_cast<int>(::syscall(SYS_pidfd_open, pid_, 0)));
  for (;;) {
    const long long left = deadline - NowMs();
    if (left <= 0) return Reap(false);
    if (pidfd.ok()) {
      struct pollfd p = {pidfd.get(), POLLIN, 0};
      const int r = ::poll(&p, 1, static_cast<int>(std::min<long long>(left, 1 << 30)));
      if (r < 0 && errno != EINTR) return Reap(false);
    } else {
      // Kernels before 5.3: look again every few milliseconds.
      struct timespec nap = {0, static_cast<long>(std::min<long long>(left, 5)) * 1000000L};
      ::nanosleep(&nap, nullptr);
    }
    if (Reap(false)) return true;
  }
}

void ChildProcess::Kill() {
  if (pid_ <= 0) return;
  if (!Reap(false)) {
    ::kill(pid_, SIGKILL);
    Reap(true);
  }
}

}  // namespace navmisc
