#include "navmisc/platform/atomic_file.h"

#include <fcntl.h>
#include <limits.h>
#include <stdlib.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <cerrno>

#include "navmisc/platform/detail/write_fault.h"
#include "navmisc/platform/files.h"

namespace navmisc {
namespace {

// Large enough that a point file of a million lines costs a few hundred write calls, small
// enough to be harmless per open file.
constexpr size_t kBufferSize = 256 * 1024;
// Permission bits of a file that did not exist before.
constexpr mode_t kNewFileMode = 0644;
// Every this many bytes the kernel is asked to start writing the file out, so that the disk works
// while the rest is still being produced and the final fsync has little left to wait for.
constexpr off_t kWritebackChunk = 8 << 20;

// Writes everything or fails; retries interrupted and partial writes. A shortened grant from
// the fault injection writes what it allows and then fails with ENOSPC, like a full disk.
bool WriteAll(int fd, const char* data, size_t size) {
  const size_t allowed = detail::TakeWriteBudget(size);
  size_t done = 0;
  while (done < allowed) {
    const ssize_t n = ::write(fd, data + done, allowed - done);
    if (n < 0) {
      if (errno == EINTR) continue;
      return false;
    }
    done += static_cast<size_t>(n);
  }
  if (allowed < size) {
    errno = ENOSPC;
    return false;
  }
  return true;
}

int RetryClose(int fd) {
  // Linux releases the descriptor even when close reports EINTR; retrying could close a
  // descriptor another thread just opened, so there is no retry here.
  return ::close(fd);
}

bool FsyncRetry(int fd) {
  for (;;) {
    if (::fsync(fd) == 0) return true;
    if (errno != EINTR) return false;
  }
}

std::string FolderOf(const std::string& path) {
  const size_t slash = path.rfind('/');
  if (slash == std::string::npos) return ".";
  if (slash == 0) return "/";
  return path.substr(0, slash);
}

// The file that actually gets replaced: a symbolic link is followed, so that the link stays a
// link and the file it names receives the new content.
std::string ResolveTarget(const std::string& path) {
  struct stat st;
  if (::lstat(path.c_str(), &st) == 0 && S_ISLNK(st.st_mode)) {
    char resolved[PATH_MAX];
    if (::realpath(path.c_str(), resolved)) return resolved;
  }
  return path;
}

}  // namespace

namespace testing {
void FailAtomicWritesAfter(long long bytes) {
  detail::g_write_budget.store(bytes < 0 ? -1 : bytes, std::memory_order_relaxed);
}
}  // namespace testing

AtomicFile::~AtomicFile() { Abandon(); }

bool AtomicFile::Open(const wchar_t* path) {
  Abandon();
  if (!path || !*path) return false;
  target_ = ResolveTarget(NativePath(path));
  if (target_.empty() || target_.back() == '/') return false;

  // The temporary file sits in the target's folder so that the final rename never crosses a
  // file system; the leading dot keeps it out of ordinary listings.
  // The name part is shortened so that the temporary name stays within NAME_MAX.
  const size_t slash = target_.rfind('/');
  const size_t name_start = slash == std::string::npos ? 0 : slash + 1;
  std::string temp = target_.substr(0, name_start) + "." +
                     target_.substr(name_start, 200) + ".tmp-XXXXXX";
  const int fd = ::mkostemp(temp.data(), O_CLOEXEC);
  if (fd < 0) return false;

  // mkostemp creates 0600; a replaced file keeps its permission bits, a new one gets the usual
  // 0644.
  struct stat st;
  const mode_t mode = (::stat(target_.c_str(), &st) == 0 && S_ISREG(st.st_mode)) ? (st.st_mode & 07777)
                                                                                 : kNewFileMode;
  if (::fchmod(fd, mode) != 0) {
    RetryClose(fd);
    ::unlink(temp.c_str());
    return false;
  }
  fd_ = fd;
  temp_ = std::move(temp);
  failed_ = false;
  keepTimes_ = false;
  written_ = writtenBack_ = 0;
  buffer_.clear();
  buffer_.reserve(kBufferSize);
  return true;
}

bool AtomicFile::Write(std::string_view bytes) {
  if (fd_ < 0 || failed_) return false;
  if (buffer_.size() + bytes.size() <= kBufferSize) {
    buffer_.append(bytes);
    if (buffer_.size() == kBufferSize) return Flush();
    return true;
  }
  if (!Flush()) return false;
  if (bytes.size() >= kBufferSize) {
    // A large block goes straight to the file rather than through the buffer.
    if (!WriteAll(fd_, bytes.data(), bytes.size())) failed_ = true;
    written_ += static_cast<off_t>(bytes.size());
    StartWriteback();
    return !failed_;
  }
  buffer_.append(bytes);
  return true;
}

bool AtomicFile::Flush() {
  if (fd_ < 0 || failed_) return false;
  if (!buffer_.empty()) {
    if (!WriteAll(fd_, buffer_.data(), buffer_.size())) failed_ = true;
    written_ += static_cast<off_t>(buffer_.size());
    buffer_.clear();
    StartWriteback();
  }
  return !failed_;
}

void AtomicFile::StartWriteback() {
  if (failed_ || written_ - writtenBack_ < kWritebackChunk) return;
  // Only a hint: where the call is not supported, fsync at Commit does all the work.
  ::sync_file_range(fd_, writtenBack_, written_ - writtenBack_, SYNC_FILE_RANGE_WRITE);
  writtenBack_ = written_;
}

void AtomicFile::SetTimes(const struct timespec& accessed, const struct timespec& modified) {
  times_[0] = accessed;
  times_[1] = modified;
  keepTimes_ = true;
}

bool AtomicFile::Commit() { return Seal(true) && Publish(true); }

bool AtomicFile::Seal(bool durable) {
  if (fd_ < 0) return false;
  // The data must be on disk before the rename makes it visible, or a crash could leave the
  // target name pointing at an empty or partial file: here, or by the caller before Publish. The
  // times are set after the last write, which would otherwise move the modification time again.
  bool ok = Flush() && (!keepTimes_ || ::futimens(fd_, times_) == 0) && (!durable || FsyncRetry(fd_));
  const int fd = fd_;
  fd_ = -1;
  if (RetryClose(fd) != 0) ok = false;
  // Many sealed files may wait for their Publish: none keeps its buffer meanwhile.
  std::string().swap(buffer_);
  if (!ok) Abandon();
  return ok;
}

bool AtomicFile::Publish(bool syncFolder) {
  if (fd_ >= 0 || temp_.empty()) return false;
  if (::rename(temp_.c_str(), target_.c_str()) != 0) {
    Abandon();
    return false;
  }
  temp_.clear();
  // Make the rename itself durable. The new content is in place either way, so a folder that
  // cannot be synced does not fail the commit.
  if (syncFolder) SyncFolder(FolderOf(target_));
  return true;
}

const std::string& AtomicFile::TempPath() const { return temp_; }

void SyncFolder(const std::string& folder) {
  const int dir = ::open(folder.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC);
  if (dir >= 0) {
    FsyncRetry(dir);
    RetryClose(dir);
  }
}

void AtomicFile::Abandon() {
  if (fd_ >= 0) {
    RetryClose(fd_);
    fd_ = -1;
  }
  if (!temp_.empty()) {
    ::unlink(temp_.c_str());
    temp_.clear();
  }
  buffer_.clear();
  failed_ = false;
}

}  // namespace navmisc
