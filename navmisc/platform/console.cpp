#include "navmisc/platform/console.h"

#include <fcntl.h>
#include <signal.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>

#include "navmisc/platform/detail/error_text.h"
#include "navmisc/platform/detail/unique_fd.h"
#include "navmisc/platform/files.h"

namespace navmisc {
namespace {

volatile sig_atomic_t g_interrupted = 0;
struct sigaction g_previous;

void OnInterrupt(int) { g_interrupted = 1; }

}  // namespace

bool StderrIsTerminal() { return ::isatty(STDERR_FILENO) == 1; }

bool CopyFileToStdout(const wchar_t* path, std::string& error) {
  const detail::UniqueFd in(::open(NativePath(path).c_str(), O_RDONLY | O_CLOEXEC));
  if (in.get() < 0) {
    error = detail::ErrorText(errno);
    return false;
  }
  std::fflush(stdout);
  char buf[1 << 16];
  for (;;) {
    const ssize_t n = ::read(in.get(), buf, sizeof buf);
    if (n < 0 && errno == EINTR) continue;
    if (n < 0) {
      error = detail::ErrorText(errno);
      return false;
    }
    if (n == 0) return true;
    for (ssize_t done = 0; done < n;) {
      const ssize_t w = ::write(STDOUT_FILENO, buf + done, static_cast<size_t>(n - done));
      if (w < 0 && errno == EINTR) continue;
      if (w < 0) {
        error = detail::ErrorText(errno);
        return false;
      }
      done += w;
    }
  }
}

InterruptWatch::InterruptWatch() {
  g_interrupted = 0;
  struct sigaction sa {};
  sa.sa_handler = OnInterrupt;
  sigemptyset(&sa.sa_mask);
  ::sigaction(SIGINT, &sa, &g_previous);
}

InterruptWatch::~InterruptWatch() { ::sigaction(SIGINT, &g_previous, nullptr); }

bool InterruptWatch::Interrupted() const { return g_interrupted != 0; }

}  // namespace navmisc
