#include "navmisc/geotag/geotag.h"

#include <time.h>

#include <cmath>
#include <cstdint>
#include <functional>
#include <limits>
#include <string>
#include <vector>

#include "navmisc/geotag/fixtag_format.h"
#include "navmisc/platform/datetime.h"
#include "navmisc/platform/exif.h"
#include "navmisc/platform/files.h"
#include "navmisc/platform/process.h"
#include "navmisc/platform/resources.h"
#include "navmisc/platform/settings.h"
#include "navmisc/platform/shared_globals.h"
#include "navmisc/records/photo.h"
#include "navmisc/util/timezone.h"

namespace fx = navmisc::fixtag;

bool g_bOverwriteNoAsk = false;

namespace {

// Texts of the question before a protected original is changed ("%s\n%s": why, then the
// question).
constexpr unsigned kReadOnlyText = 9730;
constexpr unsigned kHiddenText = 9731;
constexpr unsigned kWriteAnywayText = 9732;

// Seconds between 1601-01-01 (the start of file times) and 1970-01-01.
constexpr long long kFileTimeEpoch = 11644473600LL;

CString CommandFilePath() {
  return PathJoin(g_szAppDataPath,
                  FormatString(L"%lX_%s", navmisc::GetCurrentThreadId(), fx::kFileName));
}

CString Section(int index) {
  return FormatString(fx::kFileSection, index);
}

// A path as a quoted argument of the command line: a double quote inside it is escaped so that
// splitting the line gives the path back whole.
CString Quoted(const wchar_t* path) {
  CString text(path);
  text.Replace(L"\"", L"\\\"");
  return L"\"" + text + L"\"";
}

// Runs the tool on the command file: hidden, inheriting the environment, waited for without a
// time limit. Its exit code is not used. False when it could not be started.
bool RunTool(const CString& commandFile) {
  const CString program = PathJoin(g_szExecProgPath, fx::kProgram);
  const CString arguments = FormatString(L"%s %s", fx::kSwitch, Quoted(commandFile).c_str());
  const CString line = FormatString(L"%s %s", Quoted(program).c_str(), arguments.c_str());
  navmisc::ChildProcess tool;
  if (!tool.Start(navmisc::SplitCommandLine(line.ToUtf8()),
                  {.nullStdin = true, .nullStdout = true, .nullStderr = true})) {
    return false;
  }
  tool.Wait();
  return true;
}

// Metres per hour from a speed in km/h, truncated; a value that does not fit is no speed.
int32_t MetresPerHour(double kmh) {
  const double mh = kmh * 1000.0;
  if (!std::isfinite(mh) || mh <= std::numeric_limits<int32_t>::min() - 1.0 ||
      mh >= std::numeric_limits<int32_t>::max() + 1.0) {
    return 0;
  }
  return static_cast<int32_t>(mh);
}

// A time that comes from a long into a 32-bit time field.
int32_t Time32(long long t) {
  return static_cast<int32_t>(static_cast<uint32_t>(t));
}

// "2012:05:17 08:30:00" as "05/17/2012 08:30:00": the tokens between " ", ":" and "/" in the
// order month, day, year, hour, minute, second. Missing tokens stay empty (and the text then
// does not read as a date).
CString MetadataDateAsText(const CString& date) {
  std::vector<std::wstring> tokens;
  std::wstring current;
  for (wchar_t c : date.view()) {
    if (c == L' ' || c == L':' || c == L'/') {
      if (!current.empty()) tokens.push_back(std::move(current));
      current.clear();
    } else {
      current.push_back(c);
    }
  }
  if (!current.empty()) tokens.push_back(std::move(current));
  auto token = [&tokens](size_t i) { return i < tokens.size() ? tokens[i].c_str() : L""; };
  return FormatString(L"%s/%s/%s %s:%s:%s", token(1), token(2), token(0), token(3), token(4),
                      token(5));
}

// The answer of the tool for one photo, from the section of the read command file.
void ReadAnswer(unsigned long h, const CString& section, _ExifImageInfo& photo) {
  photo.latitude = RD_FLOAT(h, section, fx::kLatitude, 0.0);
  photo.longitude = RD_FLOAT(h, section, fx::kLongitude, 0.0);
  photo.altitude = RD_FLOAT(h, section, fx::kAltitude, 0.0);
  photo.speed = MetresPerHour(RD_FLOAT(h, section, fx::kSpeed, 0.0));
  photo.comment = RD_STRING(h, section, fx::kComment, L"");
  if (photo.comment.IsEmpty()) photo.comment = RD_STRING(h, section, fx::kXPComment, L"");
  if (photo.comment.IsEmpty()) photo.comment = RD_STRING(h, section, fx::kUserComment, L"");
  CString date = RD_STRING(h, section, fx::kDateTimeOriginal, L"");
  if (date.IsEmpty()) date = RD_STRING(h, section, fx::kDateTime, L"");
  if (!date.IsEmpty()) {
    // The camera's clock as it stands: no time-zone correction.
    photo.time = Time32(DateTimeToLong(MetadataDateAsText(date)));
  } else {
    FILETIME created;
    photo.time = Time32(static_cast<long long>(GetFileCreationTime(photo.path, created)) +
                        GetOSTimeZomeShift());
  }
}

// One exchange with the tool: the command file cleared, the request written ("Count", then what
// `request` adds), the tool run, the answers handed to `answers` (when given), the file cleared
// again. True when the tool could be started.
bool Exchange(int count, const std::function<void(unsigned long)>& request,
              const std::function<void(unsigned long)>& answers = {}) {
  const CString file = CommandFilePath();
  ClearTargetFile(file);
  const unsigned long w = WR_BEGIN(file);
  WR_INT(w, fx::kPropSection, fx::kCount, count);
  request(w);
  WR_END(w);
  const bool started = RunTool(file);
  if (answers) {
    const unsigned long r = RD_BEGIN(file);
    answers(r);
    RD_END(r);
  }
  ClearTargetFile(file);
  return started;
}

// One read exchange. `photos` holds the entries by their index in the caller's list; null
// entries are not read but keep their index.
int ReadPhotos(const std::vector<_ExifImageInfo*>& photos) {
  const auto request = [&photos](unsigned long w) {
    for (size_t i = 0; i < photos.size(); ++i) {
      if (!photos[i]) continue;
      const CString section = Section(static_cast<int>(i));
      WR_STRING(w, section, fx::kOldFile, photos[i]->path);
      WR_STRING(w, section, fx::kReadOnly, fx::kTrue);
    }
  };
  const auto answers = [&photos](unsigned long r) {
    for (size_t i = 0; i < photos.size(); ++i) {
      if (photos[i]) ReadAnswer(r, Section(static_cast<int>(i)), *photos[i]);
    }
  };
  return Exchange(static_cast<int>(photos.size()), request, answers) ? 1 : 0;
}

// The description on one line: CR LF, then CR, then LF each become one blank.
CString OneLine(CString text) {
  text.Replace(L"\r\n", L" ");
  text.Replace(L"\r", L" ");
  text.Replace(L"\n", L" ");
  return text;
}

// One write exchange: the trip's copies of `photos`, all in one command file.
int WriteCopies(const std::vector<PHOTO_ITEM_INFO*>& photos) {
  const auto request = [&photos](unsigned long w) {
    for (size_t i = 0; i < photos.size(); ++i) {
      const PHOTO_ITEM_INFO& photo = *photos[i];
      const CString section = Section(static_cast<int>(i));
      WR_STRING(w, section, fx::kOldFile, photo.GetFilePathName());
      WR_FLOAT(w, section, fx::kLatitude, photo.latitude);
      WR_FLOAT(w, section, fx::kLongitude, photo.longitude);
      WR_FLOAT(w, section, fx::kAltitude, photo.altitude);
      WR_FLOAT(w, section, fx::kSpeed, photo.speed * 0.001);
      WR_STRING(w, section, fx::kComment, OneLine(photo.description));
    }
  };
  return Exchange(static_cast<int>(photos.size()), request) ? 1 : 0;
}

bool HasFile(const PHOTO_ITEM_INFO* photo) {
  return photo && !photo->GetFilePathName().IsEmpty();
}

// The overwrite question for one photo: true when its original is to be written as well.
bool WantsOriginal(const PHOTO_ITEM_INFO& photo, bool& noToAll, bool& yesToAll) {
  int answer = IDYES;
  if (noToAll) {
    answer = IDCANCEL;
  } else if (!yesToAll && !g_bOverwriteNoAsk) {
    COverwriteDlg dlg(photo.originalName.IsEmpty() ? photo.itemName : photo.originalName);
    dlg.m_bNoAsk = g_bOverwriteNoAsk;
    answer = dlg.DoModal();
    g_bOverwriteNoAsk = dlg.m_bNoAsk;
    if (answer == IDCANCEL) {
      noToAll = true;
    } else if (answer == IDYESTOALL) {
      yesToAll = true;
      answer = IDYES;
    }
  }
  return answer == IDYES;
}

}  // namespace

int GetPhotoInfor(CPtrList& photos) {
  std::vector<_ExifImageInfo*> entries;
  entries.reserve(static_cast<size_t>(photos.GetCount()));
  for (POSITION pos = photos.GetHeadPosition(); pos;) {
    auto* photo = static_cast<_ExifImageInfo*>(photos.GetNext(pos));
    entries.push_back(photo && photo->time == -1 ? photo : nullptr);
  }
  return ReadPhotos(entries);
}

int GetPhotoInfor(_ExifImageInfo* photo, bool force) {
  if (!photo || (!force && photo->time != -1)) return 0;
  return ReadPhotos({photo});
}

int WriteGeoTagInfo(PHOTO_ITEM_INFO* photo, bool writeOriginal) {
  if (!HasFile(photo)) return 0;
  if (writeOriginal) WriteGeoTagInfoToOriginal(photo);
  return WriteCopies({photo});
}

int CopyExifGeoTagInfo(const wchar_t* from, const wchar_t* to) {
  const auto request = [from, to](unsigned long w) {
    WR_STRING(w, Section(0), fx::kOldFile, from);
    WR_STRING(w, Section(0), fx::kNewFile, to);
  };
  return Exchange(1, request) ? 1 : 0;
}

int CheckAndWriteGeoTagInfo(PHOTO_ITEM_INFO* photo, bool& noToAll, bool& yesToAll) {
  if (!HasFile(photo)) return 0;
  return WriteGeoTagInfo(photo, WantsOriginal(*photo, noToAll, yesToAll));
}

int CheckAndWriteGeoTagInfo(CPtrList& photos, bool& noToAll, bool& yesToAll, int* counter,
                            bool* keepGoing) {
  std::vector<PHOTO_ITEM_INFO*> copies;
  for (POSITION pos = photos.GetHeadPosition(); pos;) {
    auto* photo = static_cast<PHOTO_ITEM_INFO*>(photos.GetNext(pos));
    if (keepGoing && !*keepGoing) return 0;
    if (HasFile(photo)) {
      if (WantsOriginal(*photo, noToAll, yesToAll)) WriteGeoTagInfoToOriginal(photo);
      copies.push_back(photo);
    }
    if (counter) ++*counter;
  }
  return copies.empty() ? 0 : WriteCopies(copies);
}

int WriteGeoTagInfoToOriginal(PHOTO_ITEM_INFO* photo) {
  if (!photo || photo->originalName.IsEmpty() || !FileExists(photo->originalName)) return 0;
  const CString& path = photo->originalName;
  const bool protectedFile = !IsFileWritable(path);
  const bool hidden = PathFileName(path).Left(1) == L".";
  if (protectedFile || hidden) {
    const CString why = LoadResString(protectedFile ? kReadOnlyText : kHiddenText) + L" " + path;
    if (!COverwriteDlg::Confirm(
            FormatString(L"%s\n%s", why.c_str(), LoadResString(kWriteAnywayText).c_str()))) {
      return 0;
    }
  }
  const int mode = GetFileMode(path);
  if (protectedFile && !SetFileNormal(path)) return 0;
  navmisc::ExifGeoTag tag;
  tag.latitude = photo->latitude;
  tag.longitude = photo->longitude;
  tag.altitude = photo->altitude;
  tag.speed = photo->speed * 0.001;
  tag.comment = OneLine(photo->description);
  CExif2 exif;
  const bool written = exif.SetExif(path, tag);
  if (protectedFile) SetFileMode(path, mode);
  return written ? 1 : 0;
}

int WriteGeoTagInfoToOriginal(CPtrList& photos) {
  int written = 0;
  for (POSITION pos = photos.GetHeadPosition(); pos;) {
    written += WriteGeoTagInfoToOriginal(static_cast<PHOTO_ITEM_INFO*>(photos.GetNext(pos)));
  }
  return written;
}

long GetFileCreationTime(const wchar_t* path, FILETIME& created) {
  long long seconds = 0;
  long nanos = 0;
  if (!GetFileBirthTime(path, seconds, nanos) || seconds < -kFileTimeEpoch) return 0;
  const uint64_t ticks = static_cast<uint64_t>(seconds + kFileTimeEpoch) * 10000000ULL +
                         static_cast<uint64_t>(nanos) / 100;
  created.dwLowDateTime = static_cast<uint32_t>(ticks);
  created.dwHighDateTime = static_cast<uint32_t>(ticks >> 32);
  // The creation time in local calendar fields and back: the same second, except in the hour
  // that a change from daylight saving repeats, where mktime picks one of the two.
  const time_t t = static_cast<time_t>(seconds);
  struct tm local {};
  if (!::localtime_r(&t, &local)) return 0;
  local.tm_isdst = -1;
  return static_cast<long>(::mktime(&local));
}
