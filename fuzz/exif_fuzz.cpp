// The tagging tool's metadata reading on arbitrary bytes: exiv2 through ReadExif. Besides never
// crashing or leaking, whatever is reported must be sane, since the tool hands it on: positions
// within range, finite altitudes and speeds within bounds, dates in their one form, comments of
// bounded length.
//
// Run: exif_fuzz -max_len=16384 -timeout=10 fuzz/corpus/exif
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <string>
#include <string_view>

#include "navmisc/platform/exif.h"

namespace {

void Require(bool ok, const char* what) {
  if (ok) return;
  std::fprintf(stderr, "exif_fuzz: %s\n", what);
  std::abort();
}

bool IsDateTime(const CString& text) {
  if (text.IsEmpty()) return true;
  const std::wstring_view s = text.view();
  if (s.size() != 19) return false;
  for (size_t i = 0; i < s.size(); ++i) {
    const wchar_t expected = i == 4 || i == 7 || i == 13 || i == 16 ? L':' : i == 10 ? L' ' : 0;
    if (expected ? s[i] != expected : (s[i] < L'0' || s[i] > L'9')) return false;
  }
  return true;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  navmisc::ExifInfo info;
  std::string error;
  if (!navmisc::ReadExif(std::string_view(reinterpret_cast<const char*>(data), size), info,
                         error)) {
    Require(!error.empty(), "a failure without a reason");
    return 0;
  }
  if (info.hasPosition) {
    Require(std::isfinite(info.latitude) && std::fabs(info.latitude) <= 90.0, "latitude");
    Require(std::isfinite(info.longitude) && std::fabs(info.longitude) <= 180.0, "longitude");
  }
  Require(!info.hasAltitude || (std::isfinite(info.altitude) && std::fabs(info.altitude) < 1e6),
          "altitude");
  Require(!info.hasSpeed || (std::isfinite(info.speed) && info.speed >= 0.0 && info.speed < 1e6),
          "speed");
  Require(IsDateTime(info.dateTimeOriginal) && IsDateTime(info.dateTime), "date form");
  for (const CString* text : {&info.comment, &info.xpComment, &info.userComment}) {
    Require(text->GetLength() <= 65536, "comment length");
  }
  return 0;
}
