#include "navmisc/platform/process.h"

#include <errno.h>
#include <fcntl.h>
#include <poll.h>
#include <signal.h>
#include <spawn.h>
#include <string.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <time.h>
#include <unistd.h>

#include <algorithm>
#include <cstdlib>
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

namespace {
bool IsExecutableFile(const std::string& path) {
  struct stat st;
  return ::stat(path.c_str(), &st) == 0 && S_ISREG(st.st_mode) && ::access(path.c_str(), X_OK) == 0;
}
}  // namespace

std::string FindProgram(const std::string& name) {
  if (name.empty()) return {};
  if (name.find('/') != std::string::npos) return IsExecutableFile(name) ? name : std::string();
  const char* path = std::getenv("PATH");
  std::string_view rest = path && *path ? path : "/usr/local/bin:/usr/bin:/bin";
  for (;;) {
    const size_t colon = rest.find(':');
    std::string dir(rest.substr(0, colon));
    if (dir.empty()) dir = ".";
    std::string candidate = dir + "/" + name;
    if (IsExecutableFile(candidate)) return candidate;
    if (colon == std::string_view::npos) return {};
    rest.remove_prefix(colon + 1);
  }
}

ChildProcess::~ChildProcess() { Kill(); }

ChildProcess::ChildProcess(ChildProcess&& other) noexcept
    : pid_(std::exchange(other.pid_, -1)),
      out_(std::exchange(other.out_, -1)),
      err_(std::exchange(other.err_, -1)),
      errors_(std::move(other.errors_)),
      status_(other.status_),
      error_(std::move(other.error_)) {}

ChildProcess& ChildProcess::operator=(ChildProcess&& other) noexcept {
  if (this != &other) {
    Kill();
    pid_ = std::exchange(other.pid_, -1);
    out_ = std::exchange(other.out_, -1);
    err_ = std::exchange(other.err_, -1);
    errors_ = std::move(other.errors_);
    status_ = other.status_;
    error_ = std::move(other.error_);
  }
  return *this;
}

void ChildProcess::CloseOutput() {
  if (out_ >= 0) ::close(out_);
  if (err_ >= 0) ::close(err_);
  out_ = err_ = -1;
}

bool ChildProcess::DrainErrors() {
  char buf[4096];
  const ssize_t n = ::read(err_, buf, sizeof buf);
  if (n > 0) {
    const size_t room = kErrorOutputLimit - std::min(kErrorOutputLimit, errors_.size());
    errors_.append(buf, std::min(room, static_cast<size_t>(n)));
    return true;
  }
  if (n < 0 && (errno == EINTR || errno == EAGAIN)) return true;
  ::close(err_);
  err_ = -1;
  return false;
}

ssize_t ChildProcess::ReadOutput(char* buffer, size_t capacity, int timeoutMs) {
  if (out_ < 0) return out_ == -2 ? 0 : -1;
  const long long deadline = timeoutMs >= 0 ? NowMs() + timeoutMs : 0;
  for (;;) {
    struct pollfd fds[2] = {{out_, POLLIN, 0}, {err_, POLLIN, 0}};
    int wait = -1;
    if (timeoutMs >= 0) wait = static_cast<int>(std::max<long long>(0, deadline - NowMs()));
    const int r = ::poll(fds, err_ >= 0 ? 2 : 1, wait);
    if (r < 0) {
      if (errno == EINTR) continue;
      return -1;
    }
    if (r == 0) return kTimedOut;
    if (err_ >= 0 && fds[1].revents) DrainErrors();
    if (fds[0].revents) {
      const ssize_t n = ::read(out_, buffer, capacity);
      if (n > 0) return n;
      if (n < 0 && (errno == EINTR || errno == EAGAIN)) continue;
      if (n < 0) return -1;
      // The end of the output: collect what is left of the error stream, then report the end
      // from now on.
      while (err_ >= 0 && DrainErrors()) {
      }
      ::close(out_);
      out_ = -2;
      return 0;
    }
  }
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
    if (n.wanted && !(n.fd == STDIN_FILENO && options.stdinFd >= 0))
      ::posix_spawn_file_actions_addopen(&setup.actions, n.fd, "/dev/null", n.flags, 0);
  }
  if (options.stdinFd >= 0) ::posix_spawn_file_actions_adddup2(&setup.actions, options.stdinFd, STDIN_FILENO);
  // Pipes for the captured streams; the child's ends are closed here once it has them.
  int outPipe[2] = {-1, -1}, errPipe[2] = {-1, -1};
  auto closePipes = [&] {
    for (int fd : {outPipe[0], outPipe[1], errPipe[0], errPipe[1]})
      if (fd >= 0) ::close(fd);
  };
  if (options.captureOutput) {
    if (::pipe2(outPipe, O_CLOEXEC) != 0 || ::pipe2(errPipe, O_CLOEXEC) != 0) {
      error_ = ::strerror(errno);
      closePipes();
      return false;
    }
    ::posix_spawn_file_actions_adddup2(&setup.actions, outPipe[1], STDOUT_FILENO);
    ::posix_spawn_file_actions_adddup2(&setup.actions, errPipe[1], STDERR_FILENO);
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
    closePipes();
    return false;
  }
  pid_ = pid;
  status_ = -1;
  errors_.clear();
  if (options.captureOutput) {
    ::close(outPipe[1]);
    ::close(errPipe[1]);
    out_ = outPipe[0];
    err_ = errPipe[0];
  }
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
  CloseOutput();
  if (pid_ <= 0) return;
  if (!Reap(false)) {
    ::kill(pid_, SIGKILL);
    Reap(true);
  }
}

}  // namespace navmisc
