// What the document exporters share: the maker's identity, opening and buffering the target,
// UTF-8 text of the records' wide strings, the standard date-time text and number formatting
// that never depends on the process locale.
#pragma once

#include <charconv>
#include <cstdint>
#include <cstdio>
#include <memory>
#include <string>
#include <string_view>

#include "navmisc/platform/cstring.h"

namespace navmisc::exportdetail {

// The maker's web address, as it appears in the documents' creator texts.
inline constexpr std::string_view kMakerAddress = "https://navmisc.example.org";

struct FileCloser {
  void operator()(std::FILE* f) const {
    if (f) std::fclose(f);
  }
};
using UniqueFile = std::unique_ptr<std::FILE, FileCloser>;

// Opens `path` for writing from scratch ("wb"); null when that is not possible.
UniqueFile OpenForWriting(const wchar_t* path);

// The UTF-8 form of `text` as it fits a C buffer of `bufferSize` bytes, terminator included.
// A longer text is cut after the last whole character that fits (never inside a character);
// text that is not valid Unicode (a lone surrogate) gives an empty result.
std::string Utf8Field(std::wstring_view text, size_t bufferSize);

// The standard date-time text "YYYY-MM-DDThh:mm:ss" (UTC) of `time` (seconds since 1970).
std::string StdTimeText(int32_t time);
// The same with "Z" appended unless the text already ends in "Z".
std::string StdTimeTextZ(int32_t time);

// Appends StdTimeTextZ(time) quickly for long runs of times: the platform text is asked for once
// per UTC day and the clock part of later times of that day is formatted here.
class TimeTextZWriter {
 public:
  void Append(std::string& out, int32_t time);

 private:
  int64_t day_ = INT64_MIN;  // the UTC day whose date part is cached, or none
  char date_[11] = {};       // "YYYY-MM-DDT"
};

// Fixed-point text of `value` with `decimals` digits after the point, as "%.*f" gives it in the
// "C" locale.
inline void AppendFixed(std::string& out, double value, int decimals) {
  char buf[400];
  auto r = std::to_chars(buf, buf + sizeof buf, value, std::chars_format::fixed, decimals);
  if (r.ec == std::errc()) out.append(buf, r.ptr);
}
inline void AppendInt(std::string& out, long long value) {
  char buf[24];
  auto r = std::to_chars(buf, buf + sizeof buf, value);
  out.append(buf, r.ptr);
}

// Collects a document in memory and hands it to the file in large pieces.
class BufferedWriter {
 public:
  explicit BufferedWriter(std::FILE* file) : file_(file) { buf_.reserve(kFlushAt + 4096); }
  ~BufferedWriter() { Flush(); }
  BufferedWriter(const BufferedWriter&) = delete;
  BufferedWriter& operator=(const BufferedWriter&) = delete;

  // The text under construction; call MaybeFlush() after appending an element.
  std::string& text() { return buf_; }
  void Append(std::string_view s) { buf_.append(s); }
  void MaybeFlush() {
    if (buf_.size() >= kFlushAt) Flush();
  }
  // Write errors are not reported: the exporters' callers learn only whether the target opened.
  void Flush() {
    if (!buf_.empty() && file_) std::fwrite(buf_.data(), 1, buf_.size(), file_);
    buf_.clear();
  }

 private:
  static constexpr size_t kFlushAt = 1 << 20;
  std::FILE* file_;
  std::string buf_;
};

}  // namespace navmisc::exportdetail
