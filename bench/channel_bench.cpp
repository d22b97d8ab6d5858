// The data-control channel:
// - the named queue between two processes against a Unix-domain socket pair (SOCK_SEQPACKET,
//   the kernel's own message channel), for 100-byte and 30 KB messages: messages per second;
// - a request and its reply through the command thread and the real GpsDataControl.exe: median
//   and 99th percentile of the round trip, replies per second one at a time and pipelined;
// - the CPU time that the channel (command thread and process) takes in 10 s of idling;
// - how long the channel takes to close once the exit flag is set.
//
//   cmake --preset release && cmake --build --preset release && build/release/bench/channel_bench
#include <benchmark/benchmark.h>
#include <signal.h>
#include <sys/resource.h>
#include <sys/socket.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <cstdio>
#include <fstream>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include "navmisc/datactrl/device_commands.h"
#include "navmisc/datactrl/request_queue.h"
#include "navmisc/platform/data_root.h"
#include "navmisc/platform/files.h"
#include "navmisc/platform/msg_queue.h"
#include "navmisc/platform/shared_globals.h"
#include "navmisc/platform/temp_folder.h"
#include "speedup_reporter.h"

namespace {

using Clock = std::chrono::steady_clock;

// Messages per benchmark iteration: the consumer acknowledges each batch, so that what sits in
// a buffer at the end of the run is never counted as delivered.
constexpr int kBatch = 1000;

// A consumer process: takes `kBatch` messages with `receive`, then calls `ack`, for ever; killed
// at the end.
class Consumer {
 public:
  template <class Receive, class Ack>
  Consumer(Receive receive, Ack ack) {
    std::fflush(nullptr);
    pid_ = ::fork();
    if (pid_ == 0) {
      for (;;) {
        for (int i = 0; i < kBatch; ++i) receive();
        ack();
      }
    }
  }
  ~Consumer() {
    ::kill(pid_, SIGKILL);
    ::waitpid(pid_, nullptr, 0);
  }

 private:
  pid_t pid_;
};

void BM_Queue(benchmark::State& state) {
  const std::string message(static_cast<size_t>(state.range(0)), 'm');
  CxSysMsgQueue data(L"bench_data", 2048, navmisc::kSysMsgOpenOrCreate);
  CxSysMsgQueue acks(L"bench_ack", 4, navmisc::kSysMsgOpenOrCreate);
  if (!data.IsValid() || !acks.IsValid()) return state.SkipWithError("no queue");
  Consumer consumer(
      [&] {
        CxSysMsgInfo info;
        data.Receive(navmisc::kSysMsgWaitForever, &info);
      },
      [&] { acks.Send("a", 1); });
  for (auto _ : state) {
    for (int i = 0; i < kBatch; ++i) data.Send(message.data(), static_cast<uint32_t>(message.size()));
    CxSysMsgInfo info;
    if (!acks.Receive(navmisc::kSysMsgWaitForever, &info)) return state.SkipWithError("no ack");
  }
  state.SetItemsProcessed(state.iterations() * kBatch);
  data.Unlink();
  acks.Unlink();
}

void BM_Socket(benchmark::State& state) {
  const std::string message(static_cast<size_t>(state.range(0)), 'm');
  int fds[2];
  if (::socketpair(AF_UNIX, SOCK_SEQPACKET, 0, fds) != 0) return state.SkipWithError("socketpair");
  std::vector<char> buffer(message.size() + 1);
  Consumer consumer([&] { (void)!::read(fds[1], buffer.data(), buffer.size()); },
                    [&] { (void)!::write(fds[1], "a", 1); });
  for (auto _ : state) {
    for (int i = 0; i < kBatch; ++i) (void)!::write(fds[0], message.data(), message.size());
    char ack;
    if (::read(fds[0], &ack, 1) != 1) return state.SkipWithError("no ack");
  }
  state.SetItemsProcessed(state.iterations() * kBatch);
  ::close(fds[0]);
  ::close(fds[1]);
}

BENCHMARK(BM_Queue)->Arg(100)->Arg(30000)->UseRealTime()->MinTime(2.0);
BENCHMARK(BM_Socket)->Arg(100)->Arg(30000)->UseRealTime()->MinTime(2.0);

// ---- through the real process ----------------------------------------------------------------

class Counter : public CWnd {
 public:
  LRESULT WindowProc(UINT message, WPARAM, LPARAM) override {
    if (message == WM_DATACTRL_RECEIVE) ++replies;
    return 0;
  }
  long replies = 0;
};

// CPU seconds (user and system) of a process from /proc.
double ProcessCpuSeconds(int pid) {
  std::ifstream stat("/proc/" + std::to_string(pid) + "/stat");
  std::string text((std::istreambuf_iterator<char>(stat)), std::istreambuf_iterator<char>());
  const size_t close = text.rfind(')');
  if (close == std::string::npos) return 0;
  std::vector<std::string> fields;
  size_t at = close + 2;
  while (at < text.size()) {
    const size_t blank = text.find(' ', at);
    fields.push_back(text.substr(at, blank - at));
    if (blank == std::string::npos) break;
    at = blank + 1;
  }
  // Fields 14 and 15 of the file (utime, stime) are 11 and 12 after the state letter.
  if (fields.size() < 13) return 0;
  return (std::stod(fields[11]) + std::stod(fields[12])) / static_cast<double>(::sysconf(_SC_CLK_TCK));
}

double OwnCpuSeconds() {
  struct rusage u;
  ::getrusage(RUSAGE_SELF, &u);
  return u.ru_utime.tv_sec + u.ru_utime.tv_usec / 1e6 + u.ru_stime.tv_sec + u.ru_stime.tv_usec / 1e6;
}

void RoundTrips() {
  navmisc::SetSharedText(g_szExecProgPath, CString::FromUtf8(NAVMISC_TOOLS_DIR));
  Counter window;
  const HWND hwnd = window.GetSafeHwnd();
  g_bExit = false;
  std::atomic<bool> finished{false};
  std::thread command([&] {
    ProcessCommand(&window);
    finished = true;
    PostMessageW(hwnd, WM_NULL, 0, 0);
  });
  const auto until = [](auto done, int ms) {
    const auto end = Clock::now() + std::chrono::milliseconds(ms);
    while (!done() && Clock::now() < end) navmisc::PumpMessagesUntil(done, 10);
    return done();
  };
  if (!until([] { return navmisc::datactrl::GetChannelState() == navmisc::datactrl::ChannelState::kRunning; }, 10000)) {
    std::printf("round trip: the channel did not start (%s/GpsDataControl.exe)\n", NAVMISC_TOOLS_DIR);
  } else {
    until([&] { return window.replies >= 2; }, 10000);  // the process's announcement
    constexpr int kRounds = 20000;
    std::vector<double> micros;
    micros.reserve(kRounds);
    for (int i = 0; i < kRounds + 500; ++i) {
      const long before = window.replies;
      const auto t0 = Clock::now();
      DC_KVDEVICE_QueryDeviceStatus();
      navmisc::PumpMessagesUntil([&] { return window.replies > before; }, 5000);
      if (i >= 500) micros.push_back(std::chrono::duration<double, std::micro>(Clock::now() - t0).count());
    }
    std::vector<double> sorted = micros;
    std::sort(sorted.begin(), sorted.end());
    double total = 0;
    for (double m : micros) total += m;
    const auto t0 = Clock::now();
    const long before = window.replies;
    for (int i = 0; i < kRounds; ++i) DC_KVDEVICE_QueryDeviceStatus();
    navmisc::PumpMessagesUntil([&] { return window.replies >= before + kRounds; }, 60000);
    const double pipelined = kRounds / std::chrono::duration<double>(Clock::now() - t0).count();
    std::printf("round trip through GpsDataControl.exe: median %.1f us, p99 %.1f us, "
                "%.0f replies/s one at a time, %.0f replies/s pipelined\n",
                sorted[sorted.size() / 2], sorted[sorted.size() * 99 / 100], kRounds / (total / 1e6),
                pipelined);

    const int pid = navmisc::datactrl::DataControlProcessId();
    const double ownBefore = OwnCpuSeconds(), childBefore = ProcessCpuSeconds(pid);
    const auto idleStart = Clock::now();
    ReleaseCPUTime(10000);  // the owner's thread idles too, handling messages as an application does
    const double seconds = std::chrono::duration<double>(Clock::now() - idleStart).count();
    const double own = OwnCpuSeconds() - ownBefore, child = ProcessCpuSeconds(pid) - childBefore;
    const double percent = 100.0 * (own + child) / seconds;
    std::printf("idle channel for %.1f s: %.3f s CPU in this process, %.3f s in GpsDataControl.exe: "
                "%.3f%% of one core (target < 1%%)%s\n",
                seconds, own, child, percent, percent < 1.0 ? "" : "  ABOVE TARGET");
  }
  // Every command of the command-line tool ends so: how long until the channel has closed.
  const auto exitStart = Clock::now();
  g_bExit = true;
  until([&] { return finished.load(); }, 30000);
  command.join();
  std::printf("channel closed %.1f ms after the exit flag was set (the process ended, the command "
              "thread returned)\n",
              std::chrono::duration<double, std::milli>(Clock::now() - exitStart).count());
}

}  // namespace

int main(int argc, char** argv) {
  const CString root = CreateTempFolder(L"navmisc-bench-channel");
  navmisc::UseDataRoot(root);
  const int code = navmisc::bench::RunWithSpeedups(
      argc, argv,
      {{"BM_Queue/100/min_time:2.000/real_time", "BM_Socket/100/min_time:2.000/real_time", 1.0},
       {"BM_Queue/30000/min_time:2.000/real_time", "BM_Socket/30000/min_time:2.000/real_time", 1.0}});
  RoundTrips();
  navmisc::RemovePerRootObjects(root);
  RemoveDir(root);
  return code;
}
