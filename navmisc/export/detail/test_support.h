// Record builders and file helpers shared by the exporter tests.
#pragma once

#include <cerrno>
#include <clocale>
#include <cstdio>
#include <cstdlib>
#include <memory>
#include <string>
#include <vector>

#include <sys/stat.h>
#include <sys/wait.h>

#include "navmisc/platform/files.h"
#include "navmisc/platform/lists.h"
#include "navmisc/records/photo.h"
#include "navmisc/records/track.h"

namespace navmisc::exporttest {

struct Pt {
  double lat;
  double lon;
  double alt;
  int32_t time;
  int32_t speed = 0;  // metres per hour
  int32_t course = -1;
  int32_t type = 0;
};

inline std::unique_ptr<TRACK_ITEM_INFO> MakeTrack(const wchar_t* name, const std::vector<Pt>& pts) {
  auto track = std::make_unique<TRACK_ITEM_INFO>(nullptr);
  track->description = name;
  for (const Pt& p : pts) {
    auto* w = new WAYPOINT_ITEM_INFO;
    w->latitude = p.lat;
    w->longitude = p.lon;
    w->altitude = p.alt;
    w->time = p.time;
    w->speed = p.speed;
    w->course = p.course;
    w->type = p.type;
    track->points.AddTail(w);
  }
  return track;
}

inline std::unique_ptr<PHOTO_ITEM_INFO> MakeItem(int type, const wchar_t* title, const wchar_t* desc,
                                                 double lat, double lon, double alt, int32_t time) {
  auto item = std::make_unique<PHOTO_ITEM_INFO>();
  item->dataType = type;
  item->title = title;
  item->description = desc;
  item->latitude = lat;
  item->longitude = lon;
  item->altitude = alt;
  item->playbackTime = time;
  return item;
}

// Switches the whole process to a locale that writes decimal commas for the object's lifetime;
// ok() is false when the system has none.
class CommaLocale {
 public:
  CommaLocale() {
    for (const char* name : {"de_DE.UTF-8", "de_DE.utf8", "fr_FR.UTF-8", "fr_FR.utf8"}) {
      if (std::setlocale(LC_ALL, name)) {
        char buf[16];
        std::snprintf(buf, sizeof buf, "%.1f", 1.5);
        if (std::string(buf) == "1,5") {
          ok_ = true;
          return;
        }
      }
    }
    std::setlocale(LC_ALL, "C");
  }
  ~CommaLocale() { std::setlocale(LC_ALL, "C"); }
  bool ok() const { return ok_; }

 private:
  bool ok_ = false;
};

// The folder of the published schemas, or empty when it is absent.
inline std::string SchemaDir() {
#ifdef NAVMISC_SCHEMA_DIR
  std::string dir = NAVMISC_SCHEMA_DIR;
  if (IsDirectory(CString::FromUtf8(dir))) return dir;
#endif
  return {};
}

// Runs a shell command; its exit status and what it wrote on standard output.
struct CommandResult {
  int status = -1;
  std::string out;
};
inline CommandResult RunCommand(const std::string& command) {
  CommandResult r;
  std::FILE* pipe = ::popen(command.c_str(), "r");
  if (!pipe) return r;
  char buf[4096];
  size_t n;
  while ((n = std::fread(buf, 1, sizeof buf, pipe)) > 0) r.out.append(buf, n);
  int status = ::pclose(pipe);
  r.status = WIFEXITED(status) ? WEXITSTATUS(status) : -1;
  return r;
}

inline bool HaveProgram(const char* name) {
  return RunCommand(std::string("command -v ") + name + " >/dev/null 2>&1").status == 0;
}

}  // namespace navmisc::exporttest
