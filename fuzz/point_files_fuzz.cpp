// Feeds arbitrary bytes, in memory, to the track point-file readers. The first byte picks the
// file kind, the rest is the file. Besides never crashing, reading must settle: after one round
// of reading and writing (which normalises the text), a further round gives back the very same
// bytes.
//
// Run: point_files_fuzz -max_len=4096 fuzz/corpus/points

#include <cstdint>
#include <cstdlib>
#include <string>
#include <string_view>

#include "navmisc/platform/line_reader.h"
#include "navmisc/records/point_file_format.h"
#include "navmisc/records/point_lists.h"
#include "navmisc/records/track.h"

namespace pf = navmisc::point_file;

namespace {

// Reads `text` as a file of `kind` into the track and gives the file the track would write.
std::string Round(pf::Kind kind, TRACK_ITEM_INFO& track, std::string_view text) {
  navmisc::LineReader lines(pf::kMaxLine);
  lines.OpenMemory(text);
  pf::ReadList(kind, lines, track, 0);
  std::string out;
  pf::EncodeList(kind, track, [&](std::string_view piece) { out.append(piece); }, nullptr, nullptr);
  return out;
}

// Lines the reader cuts into pieces, and names that hold the separator, cannot come back the same.
bool CanSettle(const std::string& text, pf::Kind kind) {
  size_t start = 0;
  while (start < text.size()) {
    size_t end = text.find('\n', start);
    if (end == std::string::npos) end = text.size();
    if (end - start > pf::kMaxLine) return false;
    if (kind == pf::Kind::kCellFixes || kind == pf::Kind::kHelpPoints) {
      size_t commas = 0;
      for (size_t i = start; i < end; ++i) commas += text[i] == ',';
      if (commas != (kind == pf::Kind::kCellFixes ? 3u : 8u)) return false;
    }
    start = end + 1;
  }
  return true;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  if (size < 1) return 0;
  const pf::Kind kind = pf::kAllKinds[data[0] % std::size(pf::kAllKinds)];
  static TRACK_ITEM_INFO track(nullptr);
  const std::string first = Round(kind, track, std::string_view(reinterpret_cast<const char*>(data) + 1, size - 1));
  if (!CanSettle(first, kind)) return 0;
  const std::string second = Round(kind, track, first);
  if (!CanSettle(second, kind)) return 0;
  if (Round(kind, track, second) != second) std::abort();
  return 0;
}
