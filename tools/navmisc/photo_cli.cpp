#include "photo_cli.h"

#include <cmath>
#include <exception>
#include <iostream>
#include <map>
#include <memory>
#include <string>

#include "cli.h"
#include "navmisc/geo/gps_mapping.h"
#include "navmisc/geotag/fixtag_format.h"
#include "navmisc/geotag/geotag.h"
#include "navmisc/platform/datetime.h"
#include "navmisc/platform/exif.h"
#include "navmisc/platform/files.h"
#include "navmisc/platform/shared_globals.h"
#include "navmisc/records/trip.h"

namespace navmisc::cli {
namespace {

// A position written by the tool reads back within this many degrees (it keeps 3e-10).
constexpr double kSamePosition = 1e-7;

// A name for the copy of `original` in `folder` that no file has yet: the original's name, or
// "name-2.ext", "name-3.ext", ...
CString FreeName(const CString& folder, const CString& original) {
  const CString name = PathFileName(original);
  const CString title = PathFileTitle(name), extension = PathExtension(name);
  CString candidate = name;
  for (int n = 2; FileExists(PathJoin(folder, candidate)); ++n) {
    candidate = extension.IsEmpty()
                    ? FormatString(L"%s-%d", title.c_str(), n)
                    : FormatString(L"%s-%d.%s", title.c_str(), n, extension.c_str());
  }
  return candidate;
}

// The offset that puts the photo named in "PHOTO=TIME" at TIME.
long OffsetFrom(const std::string& photoAtTime, const std::vector<AddedPhoto>& added,
                const std::vector<std::unique_ptr<_ExifImageInfo>>& read, long shift) {
  const size_t eq = photoAtTime.rfind('=');
  if (eq == std::string::npos || eq == 0) Usage("--offset-from takes PHOTO=TIME");
  const std::string name = photoAtTime.substr(0, eq);
  const long when = ParseTime(photoAtTime.substr(eq + 1));
  const CString wanted = AbsolutePath(CString::FromUtf8(name));
  for (size_t i = 0; i < added.size(); ++i) {
    if (!read[i]) continue;
    if (read[i]->path == wanted || PathFileName(read[i]->path) == CString::FromUtf8(name)) {
      if (read[i]->time == -1) Fail(name + " has no capture time to correct");
      return when - (read[i]->time - shift);
    }
  }
  Usage("--offset-from names " + name + ", which is not among the photos added");
}

bool SamePosition(const PHOTO_ITEM_INFO& photo, const CString& file) {
  CExif2 exif;
  ExifInfo info;
  return exif.GetExif(file, info) && info.hasPosition &&
         std::fabs(info.latitude - photo.latitude) < kSamePosition &&
         std::fabs(info.longitude - photo.longitude) < kSamePosition;
}

// RunWithProgress for work that may fail: a Failure thrown on the worker thread is thrown again
// here.
bool RunFallible(const std::string& label, int total, int& counter, bool& keepGoing,
                 const std::function<void()>& work) {
  std::exception_ptr failure;
  const bool finished = RunWithProgress(label, total, counter, keepGoing, [&] {
    try {
      work();
    } catch (...) {
      failure = std::current_exception();
    }
  });
  if (failure) std::rethrow_exception(failure);
  return finished;
}

// Passes the questions on to another view (if any) and remembers the answers by photo name.
class RecordingView : public COverwriteView {
 public:
  explicit RecordingView(COverwriteView* inner) : inner_(inner) {}
  int AskOverwrite(const wchar_t* photoName, bool& noAsk) override {
    const int answer = inner_ ? inner_->AskOverwrite(photoName, noAsk) : IDNO;
    answers.emplace(photoName, answer);
    return answer;
  }
  bool Confirm(const wchar_t* message) override { return inner_ && inner_->Confirm(message); }

  std::map<std::wstring, int> answers;

 private:
  COverwriteView* inner_;
};

[[noreturn]] void FailToolStart() {
  Fail("cannot start the tagging tool " + PathJoin(g_szExecProgPath, fixtag::kProgram).ToUtf8());
}

bool Placed(const PHOTO_ITEM_INFO& photo) {
  return photo.latitude != 0.0 || photo.longitude != 0.0;
}

// One answer line from stdin, trimmed and in lower case; nullopt at the end of the input.
std::optional<std::string> ReadAnswer() {
  std::string line;
  if (!std::getline(std::cin, line)) return std::nullopt;
  std::string out;
  for (char c : line) {
    if (c != ' ' && c != '\t' && c != '\r')
      out.push_back(static_cast<char>(std::tolower(static_cast<unsigned char>(c))));
  }
  return out;
}

}  // namespace

std::vector<AddedPhoto> AddPhotos(BLOG_ITEM_INFO& trip, const std::vector<std::string>& files,
                                  const CameraClock& clock, double tolerance) {
  const int n = static_cast<int>(files.size());
  std::vector<AddedPhoto> added(files.size());
  std::vector<std::unique_ptr<_ExifImageInfo>> read(files.size());
  std::vector<ExifInfo> sizes(files.size());
  const CString folder = trip.GetResourcePath();
  int counter = 0;
  bool keepGoing = true;
  const bool finished = RunFallible("Adding photos", 3 * n, counter, keepGoing, [&] {
    // Only photos go in; what exiv2 cannot read is reported and left out.
    CPtrList list;
    for (int i = 0; i < n && keepGoing; ++i, ++counter) {
      added[i].file = files[i];
      const CString path = AbsolutePath(CString::FromUtf8(files[i]));
      CExif2 exif;
      if (!exif.GetExif(path, sizes[i])) {
        added[i].problem = exif.GetError();
        continue;
      }
      read[i] = std::make_unique<_ExifImageInfo>();
      read[i]->path = path;
      list.AddTail(read[i].get());
    }
    if (!keepGoing) return;
    if (!list.IsEmpty() && !GetPhotoInfor(list)) {
      FailToolStart();
    }
    counter += n;
    const long offset = clock.offsetFrom.empty()
                            ? clock.offset
                            : OffsetFrom(clock.offsetFrom, added, read, trip.timeZoneShift);
    navmisc::TrackMappingScope scope;
    for (int i = 0; i < n && keepGoing; ++i, ++counter) {
      if (!read[i]) continue;
      const _ExifImageInfo& info = *read[i];
      const CString name = FreeName(folder, info.path);
      if (!CopyFile(info.path, PathJoin(folder, name), true)) {
        added[i].problem = "cannot copy it into " + folder.ToUtf8();
        continue;
      }
      SetFileNormal(PathJoin(folder, name));  // the trip's copy is tagged later
      auto* photo = new PHOTO_ITEM_INFO(&trip, nullptr, nullptr, nullptr);
      photo->itemName = name;
      photo->originalName = info.path;
      photo->title = PathFileTitle(info.path);
      photo->description = info.comment;
      photo->width = photo->originalWidth = sizes[i].width;
      photo->height = photo->originalHeight = sizes[i].height;
      photo->originalTime = info.time;
      photo->playbackTime =
          info.time == -1 ? -1 : static_cast<int32_t>(info.time - trip.timeZoneShift + offset);
      photo->latitude = info.latitude;
      photo->longitude = info.longitude;
      photo->altitude = info.altitude;
      photo->speed = info.speed;
      const long wanted = photo->playbackTime;
      added[i].trackTime = wanted;
      if (MappingGPSAndTrack(trip.tracks, tolerance, photo)) {
        added[i].place = photo->playbackTime == wanted && wanted > 0
                             ? AddedPhoto::Place::kByTime
                             : AddedPhoto::Place::kByPosition;
      } else if (info.latitude != 0.0 || info.longitude != 0.0) {
        // Not on a track, but the camera knew where it was: that position stays.
        photo->latitude = info.latitude;
        photo->longitude = info.longitude;
        photo->altitude = info.altitude;
        photo->speed = info.speed;
        added[i].place = AddedPhoto::Place::kOwnPosition;
      }
      InsertItemToPhotoList(trip.photos, photo);
      added[i].photo = photo;
    }
  });
  if (!finished) {
    for (AddedPhoto& a : added) {
      if (!a.photo) continue;
      DeleteFile(a.photo->GetFilePathName());
      trip.photos.RemoveAt(trip.photos.Find(a.photo));
      delete a.photo;
    }
    Fail("stopped by Ctrl-C; no photo was added", 130);
  }
  trip.WriteInfo(1, nullptr, nullptr);
  BLOG_ITEM_INFO check(trip.appType, trip.tripId, 0);
  if (check.ReadInfo() != 1 || check.photos.GetCount() != trip.photos.GetCount()) {
    Fail("cannot save the trip under " + folder.ToUtf8() + " (is it writable?)");
  }
  return added;
}

void PrintAddedPhotos(std::FILE* out, const std::vector<AddedPhoto>& added) {
  for (const AddedPhoto& a : added) {
    if (!a.photo) {
      std::fprintf(out, "%-24s not added: %s\n", a.file.c_str(), a.problem.c_str());
      continue;
    }
    const PHOTO_ITEM_INFO& p = *a.photo;
    std::fprintf(out, "%-24s %-20s  ", p.itemName.ToUtf8().c_str(), TimeText(a.trackTime).c_str());
    switch (a.place) {
      case AddedPhoto::Place::kByTime:
      case AddedPhoto::Place::kByPosition:
        std::fprintf(out, "placed by %s on %s at %.6f, %.6f\n",
                     a.place == AddedPhoto::Place::kByTime ? "time" : "position",
                     p.trackItemId.ToUtf8().c_str(), p.latitude, p.longitude);
        break;
      case AddedPhoto::Place::kOwnPosition:
        std::fprintf(out, "not on a track; keeps its own position %.6f, %.6f\n", p.latitude,
                     p.longitude);
        break;
      case AddedPhoto::Place::kNone:
        std::fprintf(out, "not placed: %s\n",
                     a.trackTime == -1 ? "no capture time" : "outside the tracks' times");
        break;
    }
  }
}

void PrintPhotoList(std::FILE* out, BLOG_ITEM_INFO& trip) {
  // The camera's clock is local time of no stated zone: it is shown without the "Z" of UTC.
  auto camera = [](long t) {
    return t == -1 ? std::string("-") : TimeTToStdStringTime(t).ToUtf8();
  };
  std::fprintf(out, "%-24s %-21s %-21s %-12s %-12s %s\n", "photo", "camera time", "track time",
               "latitude", "longitude", "track");
  for (const auto* p : Items<PHOTO_ITEM_INFO>(trip.photos)) {
    if (!p) continue;
    std::fprintf(out, "%-24s %-21s %-21s ", p->itemName.ToUtf8().c_str(),
                 camera(p->originalTime).c_str(), TimeText(p->playbackTime).c_str());
    if (Placed(*p)) {
      std::fprintf(out, "%-12.6f %-12.6f %s\n", p->latitude, p->longitude,
                   p->trackItemId.IsEmpty() ? "-" : p->trackItemId.ToUtf8().c_str());
    } else {
      std::fprintf(out, "%-12s %-12s -\n", "-", "-");
    }
  }
}

GeotagOutcome GeotagTrip(BLOG_ITEM_INFO& trip, bool originals, std::optional<int> answer,
                         COverwriteView* view) {
  GeotagOutcome outcome;
  CPtrList placed;  // not owning: the trip owns its photos
  for (auto* p : Items<PHOTO_ITEM_INFO>(trip.photos)) {
    if (!p || p->GetFilePathName().IsEmpty()) continue;
    if (Placed(*p)) {
      placed.AddTail(p);
    } else {
      ++outcome.unplaced;
    }
  }
  outcome.placed = placed.GetCount();
  if (placed.IsEmpty()) return outcome;
  bool noToAll = !originals || answer == IDCANCEL;
  bool yesToAll = originals && answer == IDYESTOALL;
  const bool presetYes = yesToAll;
  int started = 0, counter = 0;
  bool keepGoing = true;
  const bool asking = !noToAll && !yesToAll;
  RecordingView recorder(view);
  struct ViewScope {
    explicit ViewScope(COverwriteView* v) : previous(GetOverwriteView()) { SetOverwriteView(v); }
    ~ViewScope() { SetOverwriteView(previous); }
    COverwriteView* previous;
  } scope(&recorder);
  if (asking) {
    // The questions are the progress; a progress bar would write over them.
    started = CheckAndWriteGeoTagInfo(placed, noToAll, yesToAll, &counter, &keepGoing);
  } else if (!RunFallible("Tagging", outcome.placed, counter, keepGoing, [&] {
               started = CheckAndWriteGeoTagInfo(placed, noToAll, yesToAll, &counter, &keepGoing);
             })) {
    Fail("stopped by Ctrl-C; the trip's photos were not tagged", 130);
  }
  if (!started) {
    FailToolStart();
  }
  // The originals the user agreed to, in the order they were asked about: after "yes to all"
  // the rest are not asked.
  bool all = presetYes;
  for (const auto* p : Items<PHOTO_ITEM_INFO>(placed)) {
    if (SamePosition(*p, p->GetFilePathName())) {
      ++outcome.tagged;
    } else {
      outcome.failed.push_back(p->itemName.ToUtf8());
    }
    const auto said = recorder.answers.find(p->originalName.str());
    const bool agreed = all || (said != recorder.answers.end() &&
                                (said->second == IDYES || said->second == IDYESTOALL));
    if (said != recorder.answers.end() && said->second == IDYESTOALL) all = true;
    if (agreed && !p->originalName.IsEmpty() && SamePosition(*p, p->originalName))
      ++outcome.originals;
  }
  return outcome;
}

int TerminalOverwriteView::AskOverwrite(const wchar_t* photoName, bool&) {
  for (;;) {
    std::fprintf(stderr,
                 "Write the position into the original %s too? [y]es, [n]o, [a]ll, [q] none: ",
                 CString(photoName).ToUtf8().c_str());
    std::fflush(stderr);
    const std::optional<std::string> line = ReadAnswer();
    if (!line) {
      std::fputc('\n', stderr);
      return IDCANCEL;
    }
    if (*line == "y" || *line == "yes") return IDYES;
    if (*line == "n" || *line == "no") return IDNO;
    if (*line == "a" || *line == "all") return IDYESTOALL;
    if (*line == "q" || *line == "none") return IDCANCEL;
  }
}

bool TerminalOverwriteView::Confirm(const wchar_t* message) {
  std::fprintf(stderr, "%s [y/N]: ", CString(message).ToUtf8().c_str());
  std::fflush(stderr);
  const std::optional<std::string> line = ReadAnswer();
  if (!line) std::fputc('\n', stderr);
  return line && (*line == "y" || *line == "yes");
}

}  // namespace navmisc::cli
