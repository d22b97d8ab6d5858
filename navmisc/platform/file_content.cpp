#include "navmisc/platform/file_content.h"

#include <errno.h>
#include <fcntl.h>
#include <string.h>
#include <unistd.h>

#include <algorithm>
#include <memory>
#include <set>

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

std::string FileContent::CheckReplaceable() const {
  const std::string native = NativePath(path_);
  struct stat now {};
  if (native.empty() || ::stat(native.c_str(), &now) != 0) {
    return errno == ENOENT ? "the file was deleted"
                           : std::string("cannot find the file: ") + ::strerror(errno);
  }
  if (now.st_dev != stat_.st_dev || now.st_ino != stat_.st_ino)
    return "the file was replaced by another";
  // Renaming over a file needs only a writable folder; the file's own protection is what the
  // user set, and it is respected.
  if (!IsWritable()) return "the file is read-only";
  return {};
}

bool FileContent::Replace(std::string_view bytes) {
  FileReplaceBatch batch;
  if (!batch.Stage(*this, bytes, error_)) return false;
  error_ = batch.Commit().front();
  return error_.empty();
}

struct FileReplaceBatch::Staged {
  FileContent file;  // its path and what it was when loaded; no bytes
  std::unique_ptr<AtomicFile> temp;
};

namespace {

// Up to this many files are made durable one by one; more with one sync of their file system
// (which also writes out whatever else is waiting there, so it pays only for many files).
constexpr size_t kSyncOneByOne = 4;

bool SyncFile(const std::string& path, bool wholeFileSystem) {
  detail::UniqueFd fd(::open(path.c_str(), O_RDONLY | O_CLOEXEC));
  if (!fd.ok()) return false;
  for (;;) {
    if ((wholeFileSystem ? ::syncfs(fd.get()) : ::fsync(fd.get())) == 0) return true;
    if (errno != EINTR) return false;
  }
}

}  // namespace

FileReplaceBatch::FileReplaceBatch() = default;
FileReplaceBatch::~FileReplaceBatch() = default;

bool FileReplaceBatch::Stage(const FileContent& file, std::string_view bytes, std::string& error) {
  error = file.CheckReplaceable();
  if (!error.empty()) return false;
  auto temp = std::make_unique<AtomicFile>();
  if (!temp->Open(file.path_)) {
    error = std::string("cannot create a temporary file beside it: ") + ::strerror(errno);
    return false;
  }
  // The times as they were before the file was read (reading moves the access time).
  temp->SetTimes(file.stat_.st_atim, file.stat_.st_mtim);
  if (!temp->Write(bytes) || !temp->Seal(false)) {
    error = std::string("cannot write: ") + ::strerror(errno);
    return false;
  }
  Staged staged{FileContent(), std::move(temp)};
  staged.file.path_ = file.path_;
  staged.file.stat_ = file.stat_;
  staged_.push_back(std::move(staged));
  return true;
}

std::vector<std::string> FileReplaceBatch::Commit() {
  std::vector<std::string> errors(staged_.size());
  const bool together = staged_.size() > kSyncOneByOne;
  std::vector<dev_t> synced;
  for (size_t i = 0; i < staged_.size(); ++i) {
    const dev_t dev = staged_[i].file.stat_.st_dev;
    if (together && std::find(synced.begin(), synced.end(), dev) != synced.end()) continue;
    if (!SyncFile(staged_[i].temp->TempPath(), together)) {
      errors[i] = std::string("cannot write: ") + ::strerror(errno);
      staged_[i].temp->Abandon();
    } else if (together) {
      synced.push_back(dev);
    }
  }
  std::set<std::string> folders;
  for (size_t i = 0; i < staged_.size(); ++i) {
    Staged& s = staged_[i];
    if (!errors[i].empty()) continue;
    errors[i] = s.file.CheckReplaceable();
    if (!errors[i].empty()) {
      s.temp->Abandon();
      continue;
    }
    // The temporary file sits in the folder of the file it replaces (a link's target's folder).
    const CString folder = PathFolder(CString::FromUtf8(s.temp->TempPath()));
    if (!s.temp->Publish(false)) {
      errors[i] = std::string("cannot put the new file in place: ") + ::strerror(errno);
    } else {
      folders.insert(folder.IsEmpty() ? std::string(".") : NativePath(folder));
    }
  }
  // One sync per folder makes the renames durable.
  for (const std::string& folder : folders) SyncFolder(folder);
  staged_.clear();
  return errors;
}

}  // namespace navmisc
