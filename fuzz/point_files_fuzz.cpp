// Feeds arbitrary bytes to the track point-file readers. The first byte picks the file kind, the
// rest is the file. Besides never crashing, reading is checked to settle: after a first pass of
// reading and writing, further passes must give back the very same bytes.
#include <unistd.h>

#include <cstdint>
#include <cstdlib>
#include <string>

#include "navmisc/platform/files.h"
#include "navmisc/platform/shared_globals.h"
#include "navmisc/platform/temp_folder.h"
#include "navmisc/records/trip.h"
#include "navmisc/records/user_profile.h"

namespace {

std::string Slurp(const CString& path) {
  std::string out;
  FILE* f = std::fopen(navmisc::NativePath(path).c_str(), "rb");
  if (!f) return out;
  char buf[4096];
  size_t n;
  while ((n = std::fread(buf, 1, sizeof buf, f)) > 0) out.append(buf, n);
  std::fclose(f);
  return out;
}

void Spit(const CString& path, const uint8_t* data, size_t size) {
  FILE* f = std::fopen(navmisc::NativePath(path).c_str(), "wb");
  if (!f) std::abort();
  if (size) std::fwrite(data, 1, size, f);
  std::fclose(f);
}

CString PathOf(TRACK_ITEM_INFO& t, int kind) {
  switch (kind) {
    case 0: return t.GetFilePathName();
    case 1: return t.GetCellIDFilePathName();
    case 2: return t.GetSOSPointFilePathName();
    case 3: return t.GetHeartRateFilePathName();
    case 4: return t.GetCyclingCadenceFilePathName();
    default: return t.GetWheelSpeedFilePathName();
  }
}

// Lines that the reader would cut, or names that hold the separator, cannot come back the same.
bool Settles(const std::string& text, int kind) {
  size_t start = 0;
  while (start < text.size()) {
    size_t end = text.find('\n', start);
    if (end == std::string::npos) end = text.size();
    if (end - start > 255) return false;
    const std::string line = text.substr(start, end - start);
    if (kind == 1 || kind == 2) {
      size_t commas = 0;
      for (char c : line) commas += c == ',';
      if (commas != (kind == 1 ? 3u : 8u)) return false;
    }
    start = end + 1;
  }
  return true;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  static const CString root = [] {
    CString r = CreateTempFolder(L"navmisc-fuzz-points");
    navmisc::SetSharedText(g_szAppDataPath, r);
    return r;
  }();
  if (size < 1) return 0;
  const int kind = data[0] % 6;
  BLOG_ITEM_INFO trip(GPS_APP_TRACKER, L"FUZZ", 0);
  MakeDir(trip.GetResourcePath());
  TRACK_ITEM_INFO track(&trip);
  track.id = L"TK_FUZZ";
  for (int k = 0; k < 6; ++k) ::unlink(navmisc::NativePath(PathOf(track, k)).c_str());
  Spit(PathOf(track, kind), data + 1, size - 1);

  // One pass normalises the text (a value printed as -1.000000 that is not exactly -1.0 still
  // continues a wheel-speed list; one point loads as two); from then on it must be stable.
  std::string previous;
  for (int pass = 0; pass < 3; ++pass) {
    TRACK_ITEM_INFO t(&trip);
    t.id = L"TK_FUZZ";
    t.ReadAllWaypoint(1);
    t.WriteAllWaypoint(1, nullptr, nullptr);
    const std::string text = Slurp(PathOf(t, kind));
    if (!Settles(text, kind)) return 0;
    if (pass == 2 && text != previous) std::abort();
    previous = text;
  }
  return 0;
}
