#include "navmisc/platform/line_reader.h"

#include <fcntl.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>

#include "navmisc/platform/files.h"

namespace navmisc {
namespace {
constexpr size_t kBufferSize = 1 << 18;
}

LineReader::LineReader(size_t maxLine) : maxLine_(maxLine) {}
LineReader::~LineReader() { Close(); }

bool LineReader::Open(const wchar_t* path) {
  Close();
  // Only a regular file: a pipe would block, a device such as /dev/zero would never end.
  fd_ = OpenRegularFile(NativePath(path));
  if (fd_ < 0) return false;
  buf_.resize(kBufferSize);
  data_ = buf_.data();
  begin_ = end_ = 0;
  eof_ = false;
  open_ = true;
  return true;
}

void LineReader::OpenMemory(std::string_view bytes) {
  Close();
  data_ = bytes.data();
  begin_ = 0;
  end_ = bytes.size();
  eof_ = true;
  open_ = true;
}

void LineReader::Close() {
  if (fd_ >= 0) ::close(fd_);
  fd_ = -1;
  open_ = false;
}

bool LineReader::Fill() {
  if (eof_ || fd_ < 0) return false;
  if (begin_ > 0) {
    std::memmove(buf_.data(), buf_.data() + begin_, end_ - begin_);
    end_ -= begin_;
    begin_ = 0;
  }
  for (;;) {
    const ssize_t n = ::read(fd_, buf_.data() + end_, buf_.size() - end_);
    if (n < 0 && errno == EINTR) continue;
    if (n <= 0) {
      eof_ = true;
      return false;
    }
    end_ += static_cast<size_t>(n);
    return true;
  }
}

bool LineReader::Next(std::string_view& line) {
  if (!open_) return false;
  long_.clear();
  for (;;) {
    const char* start = data_ + begin_;
    const size_t avail = end_ - begin_;
    const char* nl = static_cast<const char*>(std::memchr(start, '\n', avail));
    const size_t take = nl ? static_cast<size_t>(nl - start) : avail;
    // The line's own characters: a CR before the LF is part of the line end, not the line.
    const size_t own = (nl && take > 0 && start[take - 1] == '\r') ? take - 1 : take;
    const size_t room = maxLine_ ? maxLine_ - long_.size() : std::string::npos;
    if (own > room || (!nl && take >= room)) {
      // A limited line buffer hands out a long line in pieces.
      long_.append(start, room);
      begin_ += room;
      line = long_;
      return true;
    }
    if (nl) {
      begin_ += take + 1;
      if (long_.empty()) {
        line = std::string_view(start, own);
      } else {
        long_.append(start, take);
        if (!long_.empty() && long_.back() == '\r') long_.pop_back();
        line = long_;
      }
      return true;
    }
    // No line end in the buffer yet: keep the piece and read on.
    long_.append(start, avail);
    begin_ = end_;
    if (!Fill()) {
      if (long_.empty()) return false;
      if (long_.back() == '\r') long_.pop_back();
      line = long_;
      return true;
    }
  }
}

}  // namespace navmisc
