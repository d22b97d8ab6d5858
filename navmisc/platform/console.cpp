#include "navmisc/platform/console.h"

#include <signal.h>
#include <unistd.h>

namespace navmisc {
namespace {

volatile sig_atomic_t g_interrupted = 0;
struct sigaction g_previous;

void OnInterrupt(int) { g_interrupted = 1; }

}  // namespace

bool StderrIsTerminal() { return ::isatty(STDERR_FILENO) == 1; }

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
