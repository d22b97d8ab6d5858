#include "cli.h"

#include <algorithm>
#include <atomic>
#include <chrono>
#include <cmath>
#include <cstdlib>
#include <cstdio>
#include <thread>

#include <CLI/CLI.hpp>

#include "navmisc/platform/console.h"
#include "navmisc/platform/data_root.h"
#include "navmisc/platform/datetime.h"
#include "navmisc/platform/files.h"
#include "navmisc/platform/shared_globals.h"
#include "navmisc/records/trip.h"
#include "navmisc/records/user_profile.h"

namespace navmisc::cli {

void Fail(const std::string& message, int code) { throw Failure{message, code}; }
void Usage(const std::string& message) { throw Failure{message + " (see --help)", 2}; }

namespace {

// The data root named on the command line, or the default.
std::string& ChosenDataRoot() {
  static std::string root;
  return root;
}

std::string DefaultDataRoot() {
  if (const char* x = std::getenv("XDG_DATA_HOME"); x && *x) return std::string(x) + "/navmisc";
  const char* home = std::getenv("HOME");
  return std::string(home && *home ? home : "/tmp") + "/.local/share/navmisc";
}

}  // namespace

void AddGlobalOptions(CLI::App& app) {
  ChosenDataRoot() = DefaultDataRoot();
  app.add_option("--data-root", ChosenDataRoot(),
                 "the data folder (default $XDG_DATA_HOME/navmisc, else ~/.local/share/navmisc)")
      ->option_text("DIR");
  // Subcommands made after this pass options they do not know to the program, so that global
  // options may follow the command's name.
  app.fallthrough();
}

CLI::App* AddCommand(CLI::App& app, const std::string& name, const std::string& description,
                     const std::string& details, std::function<void()> run, bool usesDataRoot) {
  CLI::App* sub = app.add_subcommand(name, description);
  sub->footer(details + (details.empty() ? "" : "\n") + "Global options: --data-root DIR (see navmisc --help)");
  sub->callback([run = std::move(run), usesDataRoot] {
    if (usesDataRoot) SetDataRoot(ChosenDataRoot());
    run();
  });
  return sub;
}

void AddHelpCommand(CLI::App& app) {
  auto command = std::make_shared<std::string>();
  CLI::App* sub = app.add_subcommand("help", "this text, or a command's own help");
  sub->add_option("COMMAND", *command, "the command to explain");
  sub->callback([&app, command] {
    if (command->empty()) {
      // App::help would describe the running command, which is this one.
      std::fputs(app.get_formatter()->make_help(&app, app.get_name(), CLI::AppFormatMode::Normal).c_str(), stdout);
      return;
    }
    const CLI::App* target = nullptr;
    for (const CLI::App* s : app.get_subcommands({})) {
      if (s->get_name() == *command) target = s;
    }
    if (!target) Usage("no command '" + *command + "'");
    std::fputs(target->help(app.get_name()).c_str(), stdout);
  });
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
  // Processes on other data roots must never see this run's state, nor it theirs.
  if (!UseDataRoot(CString::FromUtf8(root))) Fail("'" + root + "' cannot be used as a data folder");
  SetSharedText(g_szExecProgPath, GetCurrentExecPath());
  // Loaded times depend on the profiles' time shift: read them before any trip.
  for (auto* p : {&g_TripMapInfo, &g_SportMapInfo, &g_TrackerMapInfo, &g_WhereMapInfo}) p->ReadInfo();
}

std::string DataRoot() { return CString(g_szAppDataPath).ToUtf8(); }

std::unique_ptr<BLOG_ITEM_INFO> OpenTrip(const std::string& id) {
  const CString wid = CString::FromUtf8(id);
  if (!IsPlainPathComponent(wid)) Fail("'" + id + "' is not a trip id");
  for (GPS_APP_PROG_TYPE type : {GPS_APP_TRIP, GPS_APP_SPORT, GPS_APP_TRACKER}) {
    auto trip = std::make_unique<BLOG_ITEM_INFO>(type, wid, 0);
    if (FileExists(trip->GetBlogItemProfilePathName()) && trip->ReadInfo() == 1) return trip;
  }
  Fail("no trip '" + id + "' under " + DataRoot() + " (see navmisc trips)");
}

ProgressBar::ProgressBar(std::string label)
    : label_(std::move(label)),
      started_(std::chrono::steady_clock::now()),
      last_(started_ - std::chrono::seconds(1)),
      draw_(StderrIsTerminal()) {}

void ProgressBar::Show(long long done, long long total, const std::string& note) {
  const auto now = std::chrono::steady_clock::now();
  if (!draw_ || now - started_ < std::chrono::milliseconds(300) || now - last_ < std::chrono::milliseconds(100))
    return;
  last_ = now;
  drawn_ = true;
  const std::string tail = note.empty() ? "" : "  " + note;
  if (total > 0) {
    const double frac = std::min(1.0, static_cast<double>(done) / static_cast<double>(total));
    const int width = 30;
    const int filled = static_cast<int>(frac * width);
    std::fprintf(stderr, "\r%s [%s%s] %3d%%%s\033[K", label_.c_str(), std::string(filled, '#').c_str(),
                 std::string(width - filled, '.').c_str(), static_cast<int>(frac * 100), tail.c_str());
  } else {
    const double secs = std::chrono::duration<double>(now - started_).count();
    std::fprintf(stderr, "\r%s %c %.1fs%s\033[K", label_.c_str(), "|/-\\"[static_cast<int>(secs * 10) % 4], secs,
                 tail.c_str());
  }
  std::fflush(stderr);
}

void ProgressBar::Finish(const std::string& result) {
  if (drawn_) std::fprintf(stderr, "\r%s: %s\033[K\n", label_.c_str(), result.c_str());
  drawn_ = false;
}

bool RunWithProgress(const std::string& label, int total, int& counter, bool& keepGoing,
                     const std::function<void()>& work) {
  InterruptWatch watch;
  std::atomic<bool> done{false};
  std::thread worker([&] {
    work();
    done = true;
  });
  // A bar when the work counts its items, a spinner with the elapsed time otherwise.
  ProgressBar bar(label);
  bool interrupted = false;
  while (!done) {
    std::this_thread::sleep_for(std::chrono::milliseconds(50));
    if (watch.Interrupted() && !interrupted) {
      interrupted = true;
      keepGoing = false;  // the work looks at the flag between items and stops there
    }
    bar.Show(counter, total);
  }
  worker.join();
  bar.Finish(interrupted ? "stopped" : "done");
  return !interrupted;
}

}  // namespace navmisc::cli
