#include "navmisc/platform/input_file.h"

#include <errno.h>
#include <fcntl.h>
#include <string.h>
#include <sys/stat.h>
#include <unistd.h>

#include "navmisc/platform/files.h"

namespace navmisc {

InputFile::~InputFile() { Close(); }

void InputFile::Close() {
  if (fd_ >= 0) ::close(fd_);
  fd_ = -1;
  size_ = 0;
}

InputFile::OpenResult InputFile::Open(const wchar_t* path) {
  Close();
  error_.clear();
  // O_NONBLOCK so that opening a FIFO without a writer returns at once; the type is checked
  // on the open descriptor, so nothing can be swapped in between.
  const int fd = ::open(NativePath(path).c_str(), O_RDONLY | O_NONBLOCK | O_CLOEXEC | O_NOCTTY);
  if (fd < 0) {
    const int err = errno;
    error_ = ::strerror(err);
    if (err == ENOENT || err == ENOTDIR) return OpenResult::kMissing;
    if (err == EACCES || err == EPERM) return OpenResult::kDenied;
    if (err == ENXIO || err == EISDIR) return OpenResult::kNotRegular;
    return OpenResult::kFailed;
  }
  struct stat st;
  if (::fstat(fd, &st) != 0) {
    error_ = ::strerror(errno);
    ::close(fd);
    return OpenResult::kFailed;
  }
  if (!S_ISREG(st.st_mode)) {
    error_ = S_ISDIR(st.st_mode)    ? "Is a directory"
             : S_ISFIFO(st.st_mode) ? "Is a FIFO"
             : S_ISSOCK(st.st_mode) ? "Is a socket"
             : S_ISCHR(st.st_mode) || S_ISBLK(st.st_mode) ? "Is a device"
                                    : "Not a regular file";
    ::close(fd);
    return OpenResult::kNotRegular;
  }
  ::fcntl(fd, F_SETFL, ::fcntl(fd, F_GETFL) & ~O_NONBLOCK);
  ::posix_fadvise(fd, 0, 0, POSIX_FADV_SEQUENTIAL);
  fd_ = fd;
  size_ = static_cast<uint64_t>(st.st_size);
  return OpenResult::kOk;
}

ssize_t InputFile::Read(char* buffer, size_t capacity) {
  if (fd_ < 0) return -1;
  for (;;) {
    const ssize_t n = ::read(fd_, buffer, capacity);
    if (n >= 0) return n;
    if (errno == EINTR) continue;
    error_ = ::strerror(errno);
    return -1;
  }
}

ssize_t InputFile::ReadAt(uint64_t offset, char* buffer, size_t capacity, std::string& error) const {
  if (fd_ < 0) return -1;
  for (;;) {
    const ssize_t n = ::pread(fd_, buffer, capacity, static_cast<off_t>(offset));
    if (n >= 0) return n;
    if (errno == EINTR) continue;
    error = ::strerror(errno);
    return -1;
  }
}

bool InputFile::Rewind() { return fd_ >= 0 && ::lseek(fd_, 0, SEEK_SET) == 0; }

}  // namespace navmisc
