// One round through real files, to hold the file readers and writers to the in-memory ones that
// the other targets fuzz at speed: the first byte picks a point-file kind (0-5) or a settings
// file (6); the rest is the file. Read from disk, the file must give what the same bytes give in
// memory, and written back to disk it must hold the bytes the writer gives in memory. Slow (every
// write is synced), so it runs for a short while only.
//
// Run: files_fuzz -max_len=2048 fuzz/corpus/points fuzz/corpus/settings

#include <algorithm>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <string>
#include <string_view>
#include <tuple>
#include <utility>
#include <vector>

#include "navmisc/platform/files.h"
#include "navmisc/platform/line_reader.h"
#include "navmisc/platform/settings.h"
#include "navmisc/platform/shared_globals.h"
#include "navmisc/platform/temp_folder.h"
#include "navmisc/records/point_file_format.h"
#include "navmisc/records/point_lists.h"
#include "navmisc/records/trip.h"

namespace pf = navmisc::point_file;

namespace {

std::string Slurp(const CString& path) {
  std::string out;
  FILE* f = std::fopen(navmisc::NativePath(path).c_str(), "rb");
  if (!f) return out;
  char buf[4096];
  for (size_t n; (n = std::fread(buf, 1, sizeof buf, f)) > 0;) out.append(buf, n);
  std::fclose(f);
  return out;
}

void Spit(const CString& path, std::string_view bytes) {
  FILE* f = std::fopen(navmisc::NativePath(path).c_str(), "wb");
  if (!f) std::abort();
  std::fwrite(bytes.data(), 1, bytes.size(), f);
  std::fclose(f);
}

CString PathOf(const TRACK_ITEM_INFO& t, pf::Kind kind) {
  switch (kind) {
    case pf::Kind::kPoints: return t.GetFilePathName();
    case pf::Kind::kCellFixes: return t.GetCellIDFilePathName();
    case pf::Kind::kHelpPoints: return t.GetSOSPointFilePathName();
    case pf::Kind::kHeartRate: return t.GetHeartRateFilePathName();
    case pf::Kind::kCadence: return t.GetCyclingCadenceFilePathName();
    case pf::Kind::kWheelSpeed: return t.GetWheelSpeedFilePathName();
  }
  return {};
}

void PointFile(pf::Kind kind, std::string_view bytes, BLOG_ITEM_INFO& trip) {
  TRACK_ITEM_INFO onDisk(&trip);
  onDisk.id = L"TK_FUZZ";
  for (pf::Kind k : pf::kAllKinds) DeleteFile(PathOf(onDisk, k));
  Spit(PathOf(onDisk, kind), bytes);
  onDisk.ReadAllWaypoint(1);

  TRACK_ITEM_INFO inMemory(nullptr);
  navmisc::LineReader lines(pf::kMaxLine);
  lines.OpenMemory(bytes);
  pf::ReadList(kind, lines, inMemory, 0);
  // A file of one point loads as two, and an empty side list leaves its file alone: both are
  // rules of the track, not of the file.
  if (pf::ListIsEmpty(kind, inMemory) || (kind == pf::Kind::kPoints && inMemory.points.GetCount() == 1)) return;
  std::string expected;
  pf::EncodeList(kind, inMemory, [&](std::string_view piece) { expected.append(piece); }, nullptr, nullptr);
  onDisk.WriteAllWaypoint(1, nullptr, nullptr);
  if (Slurp(PathOf(onDisk, kind)) != expected) std::abort();
}

std::vector<navmisc::SettingsEntry> Values(unsigned long r) {
  std::vector<navmisc::SettingsEntry> out = navmisc::SettingsEntries(r);
  RD_END(r);
  std::sort(out.begin(), out.end(), [](const auto& a, const auto& b) {
    return std::tie(a.section.str(), a.key.str()) < std::tie(b.section.str(), b.key.str());
  });
  return out;
}

void SettingsFile(std::string_view bytes, const CString& folder) {
  const CString in = PathJoin(folder, L"in.ini"), out = PathJoin(folder, L"out.ini");
  Spit(in, bytes);
  const unsigned long r = RD_BEGIN(in);
  if (!r) std::abort();  // a regular file always opens
  const auto values = Values(r);
  if (values != Values(navmisc::ReadSettingsFromMemory(bytes))) std::abort();

  const unsigned long toDisk = WR_BEGIN(out), toMemory = WR_BEGIN(L"memory");
  for (const auto& e : values) {
    WR_STRING(toDisk, e.section, e.key, e.value);
    WR_STRING(toMemory, e.section, e.key, e.value);
  }
  std::string expected;
  if (WR_END(toDisk) != 1 || !navmisc::EndSettingsToMemory(toMemory, expected)) std::abort();
  if (Slurp(out) != expected) std::abort();
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  static const CString root = [] {
    const CString r = CreateTempFolder(L"navmisc-fuzz-files");
    navmisc::SetSharedText(g_szAppDataPath, r);
    return r;
  }();
  if (size < 1) return 0;
  static BLOG_ITEM_INFO trip(GPS_APP_TRACKER, L"FUZZ", 0);
  MakeDir(trip.GetResourcePath());
  const std::string_view bytes(reinterpret_cast<const char*>(data) + 1, size - 1);
  if (data[0] % 7 == 6) SettingsFile(bytes, trip.GetResourcePath());
  else PointFile(pf::kAllKinds[data[0] % 7], bytes, trip);
  return 0;
}
