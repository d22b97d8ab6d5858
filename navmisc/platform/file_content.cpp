#include "navmisc/platform/file_content.h"

#include <errno.h>
#include <fcntl.h>
#include <string.h>
#include <unistd.h>

#include <algorithm>

#include "navmisc/platform/atomic_file.h"
#include "navmisc/platform/detail/unique_fd.h"
#include "navmisc/platform/files.h"

namespace navmisc {

bool FileContent::Fail(const std::string& what, int err) {
  error_ = err ? what + ": " + ::strerror(err) : what;
  return false;
}

bool FileContent::Load(const wchar_t* path, size_t maxBytes) {
  path_ = path;
  bytes_.clear();
  error_.clear();
  const std::string native = NativePath(path);
  if (native.empty()) return Fail("no file name", 0);
  // O_NONBLOCK: opening a FIFO must not wait for a writer; it is refused below anyway.
  detail::UniqueFd fd(::open(native.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK));
  if (!fd.ok()) return Fail("cannot open", errno);
  if (::fstat(fd.get(), &stat_) != 0) return Fail("cannot read", errno);
  if (!S_ISREG(stat_.st_mode)) return Fail("not a regular file", 0);
  if (static_cast<unsigned long long>(stat_.st_size) > maxBytes) return Fail("file too large", 0);
  bytes_.resize(static_cast<size_t>(stat_.st_size));
  size_t done = 0;
  // The size may change under us: read what is there now, up to the limit.
  for (;;) {
    if (done == bytes_.size()) {
      if (bytes_.size() >= maxBytes) break;
      bytes_.resize(std::min(maxBytes, bytes_.size() + 65536));
    }
    const ssize_t n = ::read(fd.get(), bytes_.data() + done, bytes_.size() - done);
    if (n < 0 && errno == EINTR) continue;
    if (n < 0) return Fail("cannot read", errno);
    if (n == 0) break;
    done += static_cast<size_t>(n);
  }
  bytes_.resize(done);
  return true;
}

bool FileContent::IsWritable() const {
  return IsFileWritable(path_);
}

bool FileContent::Replace(std::string_view bytes) {
  error_.clear();
  const std::string native = NativePath(path_);
  struct stat now {};
  if (native.empty() || ::stat(native.c_str(), &now) != 0) {
    return Fail(errno == ENOENT ? "the file was deleted" : "cannot find the file",
                errno == ENOENT ? 0 : errno);
  }
  if (now.st_dev != stat_.st_dev || now.st_ino != stat_.st_ino) {
    return Fail("the file was replaced by another", 0);
  }
  // Renaming over a file needs only a writable folder; the file's own protection is what the
  // user set, and it is respected.
  if (!IsWritable()) return Fail("the file is read-only", 0);
  AtomicFile out;
  if (!out.Open(path_)) return Fail("cannot create a temporary file beside it", errno);
  // The times as they were before this object read the file (reading moves the access time).
  out.SetTimes(stat_.st_atim, stat_.st_mtim);
  if (!out.Write(bytes) || !out.Commit()) return Fail("cannot write", errno);
  return true;
}

}  // namespace navmisc
