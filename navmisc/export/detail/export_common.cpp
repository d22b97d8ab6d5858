#include "navmisc/export/detail/export_common.h"

#include <cstring>

#include "navmisc/platform/datetime.h"
#include "navmisc/platform/files.h"
#include "navmisc/platform/textconv.h"

namespace navmisc::exportdetail {

bool DocumentWriter::Open(const CString& path) {
  Close();
  text_.clear();
  path_ = path;
  ClearTargetFile(path);
  return file_.Open(path);
}

void DocumentWriter::Flush() {
  file_.Write(text_);
  text_.clear();
}

void DocumentWriter::Close() {
  if (!file_.IsOpen()) return;
  Flush();
  file_.Close();
}

void DocumentWriter::Remove() {
  text_.clear();
  if (!file_.IsOpen()) return;
  file_.Close();
  DeleteFileRetry(path_);
}

int Stopped(DocumentWriter& w, ExportControl& control) {
  w.Remove();
  control.error = "stopped";
  return 0;
}

long long PointCount(const TRACK_ITEM_INFO& track, bool fromFile) {
  return fromFile ? TrackPointReader::Count(track) : track.points.GetCount();
}

std::string Utf8Field(std::wstring_view text, size_t bufferSize) {
  std::string out;
  if (bufferSize == 0 || !WideToUtf8(text, out)) return {};
  const size_t limit = bufferSize - 1;
  if (out.size() > limit) {
    size_t cut = limit;
    // Step back over continuation bytes so that the cut falls before a lead byte.
    while (cut > 0 && (static_cast<unsigned char>(out[cut]) & 0xC0) == 0x80) --cut;
    out.resize(cut);
  }
  return out;
}

std::string StdTimeText(int32_t time) { return ToUtf8Lossy(TimeTToStdStringTime(time).view()); }

std::string StdTimeTextZ(int32_t time) {
  std::string s = StdTimeText(time);
  if (s.empty() || s.back() != 'Z') s += 'Z';
  return s;
}

namespace {

int64_t FloorDiv(int64_t a, int64_t b) { return a / b - ((a % b != 0) && ((a < 0) != (b < 0))); }

void PutTwo(char* p, int v) {
  p[0] = static_cast<char>('0' + v / 10);
  p[1] = static_cast<char>('0' + v % 10);
}

}  // namespace

void TimeTextZWriter::Append(std::string& out, int32_t time) {
  char text[64];
  out.append(text, static_cast<size_t>(Write(text, time) - text));
}

char* TimeTextZWriter::Write(char* at, int32_t time) {
  const int64_t day = FloorDiv(time, 86400);
  const int sod = static_cast<int>(time - day * 86400);
  char clock[9];
  PutTwo(clock, sod / 3600);
  clock[2] = ':';
  PutTwo(clock + 3, sod / 60 % 60);
  clock[5] = ':';
  PutTwo(clock + 6, sod % 60);
  clock[8] = 'Z';
  if (day == day_) {
    std::memcpy(at, date_, sizeof date_);
    std::memcpy(at + sizeof date_, clock, sizeof clock);
    return at + sizeof date_ + sizeof clock;
  }
  const std::string text = StdTimeTextZ(time).substr(0, 63);
  // Reuse the date part only when the platform text has exactly the expected shape and clock,
  // so that the fast path can never disagree with it.
  if (text.size() == 20 && text[10] == 'T' && text.compare(11, 9, clock, 9) == 0) {
    text.copy(date_, sizeof date_);
    day_ = day;
  } else {
    day_ = INT64_MIN;
  }
  return at + text.copy(at, text.size());
}

}  // namespace navmisc::exportdetail
