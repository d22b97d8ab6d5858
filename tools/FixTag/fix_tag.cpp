#include "fix_tag.h"

#include <algorithm>
#include <string>
#include <vector>

#include "navmisc/geotag/fixtag_format.h"
#include "navmisc/platform/exif.h"
#include "navmisc/platform/settings.h"

namespace navmisc::fixtag {
namespace {

// N of a section named "File.N" (any case, N written plainly: no sign, no leading zero); -1 for
// any other name.
long long FileSectionIndex(const CString& name) {
  static const CString prefix = CString(kFileSection).Left(CString(kFileSection).Find(L'%'));
  if (name.GetLength() <= prefix.GetLength() ||
      name.Left(prefix.GetLength()).CompareNoCase(prefix) != 0) {
    return -1;
  }
  const CString digits = name.Mid(prefix.GetLength());
  if (digits.GetLength() > 10 || (digits.GetLength() > 1 && digits.GetAt(0) == L'0')) return -1;
  long long n = 0;
  for (wchar_t c : digits.view()) {
    if (c < L'0' || c > L'9') return -1;
    n = n * 10 + (c - L'0');
  }
  return n;
}

class Request {
 public:
  // `exif` collects the photos that write and copy requests change, to be put in place together.
  Request(unsigned long in, unsigned long out, const CString& section, CExif2& exif)
      : in_(in), out_(out), section_(section), exif_(exif) {}

  // Carries a read request out, or stages a write or copy request (true: `staged` set). False
  // with `error` set when it fails.
  bool Run(bool& staged, std::string& error) {
    staged = false;
    const CString photo = RD_STRING(in_, section_, kOldFile, L"");
    WR_STRING(out_, section_, kOldFile, photo);
    if (photo.IsEmpty()) {
      error = "no \"Old File\" given";
      return false;
    }
    bool ok = false;
    if (RD_EXISTS(in_, section_, kNewFile)) {
      const CString target = RD_STRING(in_, section_, kNewFile, L"");
      WR_STRING(out_, section_, kNewFile, target);
      ok = staged = exif_.StageCopyGps(photo, target);
    } else if (RD_STRING(in_, section_, kReadOnly, L"").CompareNoCase(kTrue) == 0) {
      WR_STRING(out_, section_, kReadOnly, kTrue);
      ok = Read(photo);
    } else {
      ok = staged = Write(photo, error);
      if (!error.empty()) return false;
    }
    if (!ok) error = exif_.GetError();
    return ok;
  }

 private:
  bool Read(const CString& photo) {
    ExifInfo info;
    if (!exif_.GetExif(photo, info)) return false;
    if (info.hasPosition) {
      WR_FLOAT(out_, section_, kLatitude, info.latitude);
      WR_FLOAT(out_, section_, kLongitude, info.longitude);
    }
    if (info.hasAltitude) WR_FLOAT(out_, section_, kAltitude, info.altitude);
    if (info.hasSpeed) WR_FLOAT(out_, section_, kSpeed, info.speed);
    const struct {
      const wchar_t* key;
      const CString& value;
    } texts[] = {{kComment, info.comment},
                 {kXPComment, info.xpComment},
                 {kUserComment, info.userComment},
                 {kDateTimeOriginal, info.dateTimeOriginal},
                 {kDateTime, info.dateTime}};
    for (const auto& t : texts) {
      if (!t.value.IsEmpty()) WR_STRING(out_, section_, t.key, t.value);
    }
    return true;
  }

  bool Write(const CString& photo, std::string& error) {
    if (!RD_EXISTS(in_, section_, kLatitude) || !RD_EXISTS(in_, section_, kLongitude)) {
      error = "no position given";
      return false;
    }
    ExifGeoTag tag;
    tag.latitude = RD_FLOAT(in_, section_, kLatitude, 0.0);
    tag.longitude = RD_FLOAT(in_, section_, kLongitude, 0.0);
    tag.altitude = RD_FLOAT(in_, section_, kAltitude, 0.0);
    tag.speed = RD_FLOAT(in_, section_, kSpeed, 0.0);
    tag.comment = RD_STRING(in_, section_, kComment, L"");
    WR_FLOAT(out_, section_, kLatitude, tag.latitude);
    WR_FLOAT(out_, section_, kLongitude, tag.longitude);
    WR_FLOAT(out_, section_, kAltitude, tag.altitude);
    WR_FLOAT(out_, section_, kSpeed, tag.speed);
    WR_STRING(out_, section_, kComment, tag.comment);
    return exif_.StageExif(photo, tag);
  }

  unsigned long in_, out_;
  CString section_;
  CExif2& exif_;
};

}  // namespace

bool RunCommandFile(const wchar_t* path, Outcome& outcome, std::FILE* errors) {
  outcome = Outcome();
  const unsigned long in = RD_BEGIN(path);
  if (!in) return false;
  const int count = RD_INT(in, kPropSection, kCount, 0);
  CStringList names;
  RD_SECTIONS(in, names);
  std::vector<long long> indices;
  for (POSITION pos = names.GetHeadPosition(); pos;) {
    const long long n = FileSectionIndex(names.GetNext(pos));
    if (n >= 0 && n < count) indices.push_back(n);
  }
  std::sort(indices.begin(), indices.end());

  const unsigned long out = WR_BEGIN(path);
  WR_INT(out, kPropSection, kCount, count);
  CExif2 exif;
  std::vector<CString> stagedSections;
  auto failed = [&](const CString& section, const std::string& error) {
    ++outcome.failed;
    WR_STRING(out, section, kError, CString::FromUtf8(error));
    if (errors) {
      std::fprintf(errors, "FixTag.exe: %s: %s\n",
                   RD_STRING(in, section, kOldFile, L"").ToUtf8().c_str(), error.c_str());
    }
  };
  for (const long long n : indices) {
    const CString section = FormatString(kFileSection, static_cast<int>(n));
    std::string error;
    bool staged = false;
    if (!Request(in, out, section, exif).Run(staged, error)) {
      failed(section, error);
    } else if (staged) {
      stagedSections.push_back(section);
    } else {
      ++outcome.done;
    }
  }
  // The changed photos go in place together: one wait for the disk for all of them.
  const std::vector<std::string> results = exif.CommitStaged();
  for (size_t i = 0; i < results.size(); ++i) {
    if (results[i].empty()) {
      ++outcome.done;
    } else {
      failed(stagedSections[i], results[i]);
    }
  }
  RD_END(in);
  return WR_END(out) == 1;
}

}  // namespace navmisc::fixtag
