#include "navmisc/platform/shared_memory.h"

#include <errno.h>
#include <fcntl.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <unistd.h>

#include <utility>

namespace navmisc {

namespace {

std::error_code LastError() { return std::error_code(errno, std::generic_category()); }

void* MapFd(int fd, size_t size, std::error_code& ec, void* at) {
  void* p = ::mmap(at, size, PROT_READ | PROT_WRITE, MAP_SHARED | (at ? MAP_FIXED : 0), fd, 0);
  if (p == MAP_FAILED) {
    ec = LastError();
    return nullptr;
  }
  return p;
}

// An object that another user made, or that others may read, is not one to trust with the
// user's paths, device settings or messages.
bool Trusted(const struct stat& st, std::error_code& ec) {
  if (st.st_uid == ::geteuid() && (st.st_mode & 077) == 0) return true;
  ec = std::make_error_code(std::errc::permission_denied);
  return false;
}

class FdCloser {
 public:
  explicit FdCloser(int fd) : fd_(fd) {}
  ~FdCloser() {
    if (fd_ >= 0) ::close(fd_);
  }
  FdCloser(const FdCloser&) = delete;
  FdCloser& operator=(const FdCloser&) = delete;

 private:
  int fd_;
};

}  // namespace

SharedMemory::~SharedMemory() {
  if (data_) ::munmap(data_, size_);
}

SharedMemory::SharedMemory(SharedMemory&& other) noexcept
    : data_(std::exchange(other.data_, nullptr)), size_(std::exchange(other.size_, 0)) {}

SharedMemory& SharedMemory::operator=(SharedMemory&& other) noexcept {
  if (this != &other) {
    if (data_) ::munmap(data_, size_);
    data_ = std::exchange(other.data_, nullptr);
    size_ = std::exchange(other.size_, 0);
  }
  return *this;
}

SharedMemory SharedMemory::OpenOrCreate(const std::string& name, size_t size,
                                        std::error_code& ec, void* at) {
  ec.clear();
  if (size == 0) {
    ec = std::make_error_code(std::errc::invalid_argument);
    return {};
  }
  int fd = ::shm_open(name.c_str(), O_RDWR | O_CREAT, 0600);
  if (fd < 0) {
    ec = LastError();
    return {};
  }
  FdCloser closer(fd);
  struct stat st;
  if (::fstat(fd, &st) != 0) {
    ec = LastError();
    return {};
  }
  if (!Trusted(st, ec)) return {};
  if (st.st_size == 0) {
    // Just created (by us or by another process that has not sized it yet): sizing to the same
    // length twice is harmless.
    if (::ftruncate(fd, static_cast<off_t>(size)) != 0) {
      ec = LastError();
      return {};
    }
  } else if (static_cast<size_t>(st.st_size) != size) {
    ec = std::make_error_code(std::errc::invalid_argument);
    return {};
  }
  void* p = MapFd(fd, size, ec, at);
  return p ? SharedMemory(p, size) : SharedMemory();
}

SharedMemory SharedMemory::OpenExisting(const std::string& name, std::error_code& ec) {
  ec.clear();
  int fd = ::shm_open(name.c_str(), O_RDWR, 0);
  if (fd < 0) {
    ec = LastError();
    return {};
  }
  FdCloser closer(fd);
  struct stat st;
  if (::fstat(fd, &st) != 0) {
    ec = LastError();
    return {};
  }
  if (!Trusted(st, ec)) return {};
  if (st.st_size <= 0) {
    ec = std::make_error_code(std::errc::invalid_argument);
    return {};
  }
  const size_t size = static_cast<size_t>(st.st_size);
  void* p = MapFd(fd, size, ec, nullptr);
  return p ? SharedMemory(p, size) : SharedMemory();
}

SharedMemory SharedMemory::Anonymous(size_t size, std::error_code& ec, void* at) {
  ec.clear();
  void* p = ::mmap(at, size, PROT_READ | PROT_WRITE,
                   MAP_SHARED | MAP_ANONYMOUS | (at ? MAP_FIXED : 0), -1, 0);
  if (p == MAP_FAILED) {
    ec = LastError();
    return {};
  }
  return SharedMemory(p, size);
}

bool SharedMemory::Unlink(const std::string& name, std::error_code& ec) {
  ec.clear();
  if (::shm_unlink(name.c_str()) != 0) {
    ec = LastError();
    return false;
  }
  return true;
}

bool SharedMemory::Unmap(std::error_code& ec) {
  ec.clear();
  void* p = std::exchange(data_, nullptr);
  const size_t size = std::exchange(size_, 0);
  if (p && ::munmap(p, size) != 0) {
    ec = LastError();
    return false;
  }
  return true;
}

void* SharedMemory::Release() {
  size_ = 0;
  return std::exchange(data_, nullptr);
}

}  // namespace navmisc
