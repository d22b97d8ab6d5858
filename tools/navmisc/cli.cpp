#include "cli.h"

#include <atomic>
#include <chrono>
#include <cmath>
#include <cstdio>
#include <thread>

#include "navmisc/platform/console.h"
#include "navmisc/platform/datetime.h"
#include "navmisc/platform/files.h"
#include "navmisc/platform/shared_globals.h"
#include "navmisc/records/trip.h"
#include "navmisc/records/user_profile.h"

namespace navmisc::cli {

void Fail(const std::string& message, int code) { throw Failure{message, code}; }
void Usage(const std::string& message) { throw Failure{message + " (see --help)", 2}; }

std::optional<std::string> Args::Option(const std::string& name) {
  // One-letter options take one dash ("-o FILE"), longer ones two.
  const std::string flag = (name.size() == 1 ? "-" : "--") + name;
  for (size_t i = 0; i < args_.size(); ++i) {
    if (args_[i] == flag) {
      if (i + 1 >= args_.size()) Usage(flag + " needs a value");
      std::string v = args_[i + 1];
      args_.erase(args_.begin() + static_cast<long>(i), args_.begin() + static_cast<long>(i) + 2);
      return v;
    }
    if (args_[i].rfind(flag + "=", 0) == 0) {
      std::string v = args_[i].substr(flag.size() + 1);
      args_.erase(args_.begin() + static_cast<long>(i));
      return v;
    }
  }
  return std::nullopt;
}

bool Args::Flag(const std::string& name) {
  for (size_t i = 0; i < args_.size(); ++i) {
    if (args_[i] == "--" + name) {
      args_.erase(args_.begin() + static_cast<long>(i));
      return true;
    }
  }
  return false;
}

std::vector<std::string> Args::Positionals() {
  for (const auto& a : args_)
    if (a.size() > 1 && a[0] == '-' && !(std::isdigit(static_cast<unsigned char>(a[1])) || a[1] == '.'))
      Usage("unknown option " + a);
  return args_;
}

double ParseDouble(const std::string& text, const std::string& what) {
  char* end = nullptr;
  const double v = std::strtod(text.c_str(), &end);
  if (text.empty() || *end || !std::isfinite(v)) Usage(what + " must be a number, not '" + text + "'");
  return v;
}

long ParseTime(const std::string& text) {
  char* end = nullptr;
  const long v = std::strtol(text.c_str(), &end, 10);
  if (!text.empty() && !*end) return v;
  const long t = ConvertStdStringTimeT(CString::FromUtf8(text));
  if (t == -1) Usage("'" + text + "' is not a time (seconds since 1970 or YYYY-MM-DDThh:mm:ss)");
  return t;
}

std::string TimeText(long time) {
  if (time == -1 || time == 2147483647L) return "-";
  return TimeTToStdStringTime(time).ToUtf8() + "Z";
}

void SetDataRoot(const std::string& root) {
  SetSharedText(g_szAppDataPath, CString::FromUtf8(root));
  SetSharedText(g_szExecProgPath, GetCurrentExecPath());
  // Loaded times depend on the profiles' time shift: read them before any trip.
  for (auto* p : {&g_TripMapInfo, &g_SportMapInfo, &g_TrackerMapInfo, &g_WhereMapInfo}) p->ReadInfo();
}

std::string DataRoot() { return CString(g_szAppDataPath).ToUtf8(); }

std::unique_ptr<BLOG_ITEM_INFO> OpenTrip(const std::string& id) {
  const CString wid = CString::FromUtf8(id);
  if (!IsPlainPathComponent(wid)) Fail("'" + id + "' is not a trip id");
  ClearFileRefusal();
  for (GPS_APP_PROG_TYPE type : {GPS_APP_TRIP, GPS_APP_SPORT, GPS_APP_TRACKER}) {
    auto trip = std::make_unique<BLOG_ITEM_INFO>(type, wid, 0);
    if (FileExists(trip->GetBlogItemProfilePathName()) && trip->ReadInfo() == 1) return trip;
  }
  const std::string refused = LastFileRefusal();
  Fail("no trip '" + id + "' under " + DataRoot() + (refused.empty() ? " (see navmisc trips)" : ": " + refused));
}

bool RunWithProgress(const std::string& label, int total, int& counter, bool& keepGoing,
                     const std::function<void()>& work) {
  InterruptWatch watch;
  std::atomic<bool> done{false};
  std::thread worker([&] {
    work();
    done = true;
  });
  // A bar when the work counts its items, a spinner with the elapsed time otherwise; either only
  // once the work has taken more than a moment.
  const bool draw = StderrIsTerminal();
  const auto started = std::chrono::steady_clock::now();
  bool drawn = false;
  bool interrupted = false;
  auto last = std::chrono::steady_clock::now() - std::chrono::seconds(1);
  while (!done) {
    std::this_thread::sleep_for(std::chrono::milliseconds(50));
    if (watch.Interrupted() && !interrupted) {
      interrupted = true;
      keepGoing = false;  // the work looks at the flag between items and stops there
    }
    const auto now = std::chrono::steady_clock::now();
    if (draw && now - started >= std::chrono::milliseconds(300) && now - last >= std::chrono::milliseconds(100)) {
      last = now;
      drawn = true;
      if (total > 0) {
        const double frac = std::min(1.0, static_cast<double>(counter) / total);
        const int width = 30;
        const int filled = static_cast<int>(frac * width);
        std::fprintf(stderr, "\r%s [%s%s] %3d%%", label.c_str(), std::string(filled, '#').c_str(),
                     std::string(width - filled, '.').c_str(), static_cast<int>(frac * 100));
      } else {
        const double secs = std::chrono::duration<double>(now - started).count();
        std::fprintf(stderr, "\r%s %c %.1fs", label.c_str(), "|/-\\"[static_cast<int>(secs * 10) % 4], secs);
      }
      std::fflush(stderr);
    }
  }
  worker.join();
  if (drawn) std::fprintf(stderr, "\r%s: %s\033[K\n", label.c_str(), interrupted ? "stopped" : "done");
  return !interrupted;
}

}  // namespace navmisc::cli
