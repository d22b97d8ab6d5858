#include "cli.h"

#include <algorithm>
#include <atomic>
#include <chrono>
#include <condition_variable>
#include <cmath>
#include <cstdlib>
#include <cstdio>
#include <mutex>
#include <regex>
#include <thread>

#include <CLI/CLI.hpp>

#include "navmisc/platform/console.h"
#include "navmisc/platform/data_root.h"
#include "navmisc/platform/datetime.h"
#include "navmisc/platform/files.h"
#include "navmisc/platform/format.h"
#include "navmisc/platform/shared_globals.h"
#include "navmisc/records/trip.h"
#include "navmisc/records/user_profile.h"

namespace navmisc::cli {

void Fail(const std::string& message, int code) { throw Failure{message, code}; }
void Usage(const std::string& message) { throw Failure{message + " (see --help)", 2}; }

namespace {

// The data root named on the command line, or the default.
std::string& DataRootOption() {
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
  DataRootOption() = DefaultDataRoot();
  app.add_option("--data-root", DataRootOption(),
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
    if (usesDataRoot) SetDataRoot(DataRootOption());
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

namespace {

// True when the fields name a real day and time (no 30th of February).
bool ValidDateTime(int year, int month, int day, int hour, int minute, int second) {
  if (year < 1970 || year > 2037 || month < 1 || month > 12 || day < 1 || day > 31 || hour > 23 || minute > 59 ||
      second > 59) {
    return false;
  }
  int y, mo, d, h, mi, sec;
  GetDateTimeInfo(DateTimeToLong(month, day, year, hour, minute, second), y, mo, d, h, mi, sec);
  return y == year && mo == month && d == day;
}

}  // namespace

Date ParseDate(const std::string& text) {
  static const std::regex iso(R"((\d{4})-(\d{2})-(\d{2}))");
  static const std::regex old(R"((\d{1,2})/(\d{1,2})/(\d{4}))");
  std::smatch m;
  Date d{};
  if (std::regex_match(text, m, iso)) {
    d = {std::stoi(m[1]), std::stoi(m[2]), std::stoi(m[3])};
  } else if (std::regex_match(text, m, old)) {
    d = {std::stoi(m[3]), std::stoi(m[1]), std::stoi(m[2])};
  } else {
    Usage("'" + text + "' is not a date (YYYY-MM-DD)");
  }
  if (!ValidDateTime(d.year, d.month, d.day, 0, 0, 0)) Usage("'" + text + "' is not a date between 1970 and 2037");
  return d;
}

std::string DateText(const Date& d) { return FormatA("%04d-%02d-%02d", d.year, d.month, d.day); }

long ParseTime(const std::string& text) {
  static const std::regex seconds(R"(\d+)");
  static const std::regex iso(
      R"((\d{4})-(\d{2})-(\d{2})(?:[T ](\d{2}):(\d{2})(?::(\d{2}))?(Z|([+-])(\d{2}):?(\d{2}))?)?)");
  std::smatch m;
  if (std::regex_match(text, m, seconds)) {
    if (text.size() > 10 || std::stoll(text) > 2147483647LL) Usage("'" + text + "' is too late a time");
    return std::stol(text);
  }
  if (!std::regex_match(text, m, iso)) {
    Usage("'" + text + "' is not a time (YYYY-MM-DDThh:mm:ss, with Z or an offset such as +02:00 for another zone "
          "than UTC, or seconds since 1970)");
  }
  const auto field = [&m](int i) { return m[i].matched ? std::stoi(m[i]) : 0; };
  if (!ValidDateTime(field(1), field(2), field(3), field(4), field(5), field(6))) {
    Usage("'" + text + "' is not a time between 1970 and 2037");
  }
  long time = DateTimeToLong(field(2), field(3), field(1), field(4), field(5), field(6));
  if (m[8].matched) {
    const long offset = field(9) * 3600L + field(10) * 60L;
    time += m[8] == "+" ? -offset : offset;
  }
  return time;
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

namespace {

// Something the user may name: by its id, the start of its id, or its name.
struct Candidate {
  std::string id;
  std::string name;
};

// The entry of `all` that `text` names: the one whose id it is, else the only one whose id
// starts with it or whose name it is. Fails listing the candidates when none or several match.
size_t PickOne(const std::vector<Candidate>& all, const std::string& text, const std::string& what,
               const std::string& where) {
  for (size_t i = 0; i < all.size(); ++i) {
    if (all[i].id == text) return i;
  }
  std::vector<size_t> hits;
  for (size_t i = 0; i < all.size(); ++i) {
    if (!text.empty() && (all[i].id.rfind(text, 0) == 0 || all[i].name == text)) hits.push_back(i);
  }
  if (hits.size() == 1) return hits.front();
  std::string message;
  if (hits.empty()) {
    message = "no " + what + " '" + text + "' " + where;
    for (size_t i = 0; i < all.size(); ++i) hits.push_back(i);
    message += hits.empty() ? " (there are none)" : "; there are:";
  } else {
    message = FormatA("'%s' names %zu %ss %s; give one's id:", text.c_str(), hits.size(), what.c_str(), where.c_str());
  }
  constexpr size_t kShown = 20;
  for (size_t k = 0; k < hits.size() && k < kShown; ++k) {
    message += FormatA("\n  %-20s %s", all[hits[k]].id.c_str(), all[hits[k]].name.c_str());
  }
  if (hits.size() > kShown) message += FormatA("\n  ... and %zu more", hits.size() - kShown);
  Fail(message);
}

}  // namespace

std::unique_ptr<BLOG_ITEM_INFO> OpenTrip(const std::string& name) {
  std::vector<Candidate> all;
  std::vector<GPS_APP_PROG_TYPE> types;
  for (GPS_APP_PROG_TYPE type : {GPS_APP_TRIP, GPS_APP_SPORT, GPS_APP_TRACKER}) {
    CStringList folders;
    if (GetContent(GetAppDataFolder(type), L"*", folders) < 0) continue;
    for (const CString& id : folders) {
      BLOG_ITEM_INFO trip(type, id, 0);
      if (!FileExists(trip.GetBlogItemProfilePathName()) || trip.ReadInfo() != 1) continue;
      all.push_back({id.ToUtf8(), trip.name.ToUtf8()});
      types.push_back(type);
    }
  }
  const size_t i = PickOne(all, name, "trip", "under " + DataRoot());
  auto trip = std::make_unique<BLOG_ITEM_INFO>(types[i], CString::FromUtf8(all[i].id), 0);
  ClearFileRefusal();
  if (trip->ReadInfo() != 1) {
    const std::string refused = LastFileRefusal();
    Fail("cannot read trip " + all[i].id + (refused.empty() ? "" : ": " + refused));
  }
  return trip;
}

TRACK_ITEM_INFO& FindTrack(BLOG_ITEM_INFO& trip, const std::string& name) {
  std::vector<Candidate> all;
  std::vector<TRACK_ITEM_INFO*> tracks;
  for (auto* t : Items<TRACK_ITEM_INFO>(trip.tracks)) {
    if (!t) continue;
    all.push_back({t->id.ToUtf8(), t->GetName().ToUtf8()});
    tracks.push_back(t);
  }
  return *tracks[PickOne(all, name, "track", "in trip " + trip.tripId.ToUtf8())];
}

void CheckOutputFolder(const std::string& path) {
  const CString target = CString::FromUtf8(path);
  const CString folder = PathFolder(target);
  if (!folder.IsEmpty() && !IsDirectory(folder)) {
    Fail(FileExists(folder) ? folder.ToUtf8() + " is not a folder" : "the folder " + folder.ToUtf8() + " does not exist");
  }
  if (IsDirectory(target)) Fail(path + " is a folder");
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
  std::mutex mutex;
  std::condition_variable finished;
  bool done = false;
  std::thread worker([&] {
    work();
    const std::lock_guard<std::mutex> lock(mutex);
    done = true;
    finished.notify_one();
  });
  ProgressBar bar(label);
  bool interrupted = false;
  for (;;) {
    {
      // The end of the work wakes the wait at once; Ctrl-C and the bar are looked at in between.
      std::unique_lock<std::mutex> lock(mutex);
      if (finished.wait_for(lock, std::chrono::milliseconds(50), [&] { return done; })) break;
    }
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
