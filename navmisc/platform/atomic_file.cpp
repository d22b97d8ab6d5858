#include "navmisc/platform/atomic_file.h"

#include <dirent.h>
#include <fcntl.h>
#include <limits.h>
#include <stdlib.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <cerrno>
#include <cstring>
#include <vector>

#include "navmisc/platform/detail/temp_files.h"
#include "navmisc/platform/detail/unique_fd.h"
#include "navmisc/platform/detail/write_fault.h"
#include "navmisc/platform/file_transaction.h"
#include "navmisc/platform/root_confinement.h"
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

// Renames that may still succeed before the injected fault; negative = no fault.
std::atomic<int> g_rename_budget{-1};

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

// The file that actually gets replaced: a symbolic link is followed, so that the link stays a
// link and the file it names receives the new content. (Only links that stay in the data root
// get here.)
std::string ResolveTarget(const std::string& path) {
  struct stat st;
  if (::lstat(path.c_str(), &st) == 0 && S_ISLNK(st.st_mode)) {
    char resolved[PATH_MAX];
    if (::realpath(path.c_str(), resolved)) return resolved;
  }
  return path;
}

// The temporary files of a target are ".<name>.tmp-" and six characters of mkstemp.
constexpr size_t kTempSuffix = 6;
using detail::TempFilePrefix;

// Removes the temporary files that earlier saves of the file `name` in `folder` left behind when
// they were killed. A save in progress holds a lock on its temporary file (the kernel drops it
// when the process dies), so only the files nobody holds go.
void SweepLeftovers(const std::string& folder, const std::string& name) {
  const std::string prefix = TempFilePrefix(name);
  DIR* dir = ::opendir(folder.c_str());
  if (!dir) return;
  const int dirfd = ::dirfd(dir);
  std::vector<std::string> found;
  while (struct dirent* e = ::readdir(dir)) {
    const std::string_view entry = e->d_name;
    if (entry.size() == prefix.size() + kTempSuffix && entry.starts_with(prefix)) found.emplace_back(entry);
  }
  for (const std::string& entry : found) {
    navmisc::detail::UniqueFd fd(::openat(dirfd, entry.c_str(), O_RDONLY | O_NOFOLLOW | O_NONBLOCK | O_CLOEXEC));
    struct stat st;
    if (!fd.ok() || ::fstat(fd.get(), &st) != 0 || !S_ISREG(st.st_mode)) continue;
    if (::flock(fd.get(), LOCK_EX | LOCK_NB) == 0) ::unlinkat(dirfd, entry.c_str(), 0);
  }
  ::closedir(dir);
}

// Creates the locked temporary file for `target`: its descriptor, -1 on failure (errno set).
int CreateLockedTemp(const std::string& target, std::string& temp) {
  const size_t slash = target.rfind('/');
  const size_t name_start = slash == std::string::npos ? 0 : slash + 1;
  for (int attempt = 0; attempt < 3; ++attempt) {
    temp = target.substr(0, name_start) + TempFilePrefix(target.substr(name_start)) + "XXXXXX";
    const int fd = ::mkostemp(temp.data(), O_CLOEXEC);
    if (fd < 0) return -1;
    // Between the creation and the lock another save's sweep may have taken the file away; the
    // name must still lead to this very file.
    struct stat mine, named;
    if (::flock(fd, LOCK_EX | LOCK_NB) == 0 && ::fstat(fd, &mine) == 0 &&
        ::lstat(temp.c_str(), &named) == 0 && mine.st_ino == named.st_ino && mine.st_dev == named.st_dev) {
      return fd;
    }
    RetryClose(fd);
  }
  errno = EAGAIN;
  return -1;
}

}  // namespace

namespace detail {

std::string TempFilePrefix(const std::string& name) { return "." + name.substr(0, 200) + ".tmp-"; }

std::string FolderOf(const std::string& path) {
  const size_t slash = path.rfind('/');
  if (slash == std::string::npos) return ".";
  if (slash == 0) return "/";
  return path.substr(0, slash);
}

void SyncFolder(const std::string& folder) {
  const int dir = ::open(folder.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC);
  if (dir < 0) return;
  FsyncRetry(dir);
  RetryClose(dir);
}

int RenameIntoPlace(const std::string& from, const std::string& to) {
  int budget = g_rename_budget.load(std::memory_order_relaxed);
  while (budget >= 0) {
    if (budget == 0) {
      errno = EIO;
      return -1;
    }
    if (g_rename_budget.compare_exchange_weak(budget, budget - 1, std::memory_order_relaxed)) break;
  }
  return ::rename(from.c_str(), to.c_str());
}

}  // namespace detail

namespace testing {
void FailAtomicWritesAfter(long long bytes) {
  detail::g_write_budget.store(bytes < 0 ? -1 : bytes, std::memory_order_relaxed);
}
void FailAtomicRenamesAfter(int renames) {
  g_rename_budget.store(renames < 0 ? -1 : renames, std::memory_order_relaxed);
}
}  // namespace testing

AtomicFile::~AtomicFile() { Abandon(); }

bool AtomicFile::Open(const wchar_t* path) {
  Abandon();
  error_.clear();
  const std::string native = NativePath(path);
  if (native.empty() || native.back() == '/') return Failed("no file name", ENOENT);
  if (!StaysInDataRoot(native, true)) return Report(LastFileRefusal());
  target_ = ResolveTarget(native);

  // The temporary file sits in the target's folder so that the final rename never crosses a
  // file system; the leading dot keeps it out of ordinary listings, and the name part is
  // shortened so that the temporary name stays within NAME_MAX.
  SweepLeftovers(detail::FolderOf(target_), target_.substr(target_.rfind('/') + 1));
  std::string temp;
  const int fd = CreateLockedTemp(target_, temp);
  if (fd < 0) return Failed("cannot create a temporary file beside " + target_, errno);

  // mkostemp creates 0600; a replaced file keeps its permission bits, a new one gets the usual
  // 0644.
  struct stat st;
  const mode_t mode = (::stat(target_.c_str(), &st) == 0 && S_ISREG(st.st_mode)) ? (st.st_mode & 07777)
                                                                                 : kNewFileMode;
  if (::fchmod(fd, mode) != 0) {
    const int err = errno;
    RetryClose(fd);
    ::unlink(temp.c_str());
    return Failed("cannot set the mode of " + temp, err);
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

bool AtomicFile::Failed(const std::string& what, int err) { return Report(what + ": " + detail::ErrorText(err)); }

bool AtomicFile::Report(const std::string& why) {
  if (error_.empty()) error_ = why;
  // A file that fails inside a transaction fails the whole save.
  if (FileTransaction* tx = FileTransaction::Current()) tx->Fail(error_);
  return false;
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
    if (!WriteAll(fd_, bytes.data(), bytes.size())) WriteFailed();
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
    if (!WriteAll(fd_, buffer_.data(), buffer_.size())) WriteFailed();
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

void AtomicFile::WriteFailed() {
  Failed("cannot write " + target_, errno);
  failed_ = true;
}

void AtomicFile::SetTimes(const struct timespec& accessed, const struct timespec& modified) {
  times_[0] = accessed;
  times_[1] = modified;
  keepTimes_ = true;
}

bool AtomicFile::Commit() {
  if (!Seal(true)) return false;
  if (FileTransaction* tx = FileTransaction::Current()) {
    // Complete and on disk: the transaction puts it into place together with the others.
    tx->Stage(std::move(temp_), target_);
    temp_.clear();
    return true;
  }
  return Publish(true);
}

bool AtomicFile::Seal(bool durable) {
  if (fd_ < 0) return Failed("nothing to commit", EBADF);
  // The data must be on disk before the rename makes it visible, or a crash could leave the
  // target name pointing at an empty or partial file: here, or by the caller before Publish. The
  // times are set after the last write, which would otherwise move the modification time again.
  bool ok = Flush();
  if (ok && keepTimes_ && ::futimens(fd_, times_) != 0) ok = Failed("cannot set the times of " + target_, errno);
  if (ok && durable && !FsyncRetry(fd_)) ok = Failed("cannot write " + target_, errno);
  const int fd = fd_;
  fd_ = -1;
  if (RetryClose(fd) != 0 && ok) ok = Failed("cannot write " + target_, errno);
  // Many sealed files may wait for their Publish: none keeps its buffer meanwhile.
  std::string().swap(buffer_);
  if (!ok) Abandon();
  return ok;
}

bool AtomicFile::Publish(bool syncFolder) {
  if (fd_ >= 0 || temp_.empty()) return false;
  if (detail::RenameIntoPlace(temp_, target_) != 0) {
    Failed("cannot replace " + target_, errno);
    Abandon();
    return false;
  }
  temp_.clear();
  // Make the rename itself durable. The new content is in place either way, so a folder that
  // cannot be synced does not fail the commit.
  if (syncFolder) detail::SyncFolder(detail::FolderOf(target_));
  return true;
}

const std::string& AtomicFile::TempPath() const { return temp_; }

void SyncFolder(const std::string& folder) { detail::SyncFolder(folder); }

void AtomicFile::Abandon() {
  if (fd_ >= 0) {
    RetryClose(fd_);
    fd_ = -1;
    // Given up before it was complete: a save that counted on it is not complete either.
    if (FileTransaction* tx = FileTransaction::Current()) tx->Fail(error_.empty() ? "gave up writing " + target_ : error_);
  }
  if (!temp_.empty()) {
    ::unlink(temp_.c_str());
    temp_.clear();
  }
  buffer_.clear();
  failed_ = false;
}

}  // namespace navmisc
