// Writing a file so that readers see either the old content or the whole new one: the bytes go
// to a temporary file in the same folder, which is flushed and renamed over the target on
// Commit. Destroying an uncommitted AtomicFile removes the temporary file and leaves the target
// as it was. Inside a FileTransaction, Commit only stages the complete file and the transaction
// puts it into place with the others. A target under the data root that a symbolic link leads out of it is refused.
// Temporary files that a killed save of the same target left behind are removed on Open (see
// docs/data-root-safety.md).
#pragma once

#include <sys/types.h>
#include <time.h>

#include <cstddef>
#include <string>
#include <string_view>

#include "navmisc/platform/cstring.h"

namespace navmisc {

class AtomicFile {
 public:
  AtomicFile() = default;
  ~AtomicFile();
  AtomicFile(const AtomicFile&) = delete;
  AtomicFile& operator=(const AtomicFile&) = delete;

  // Creates the temporary file beside `path`. False when that is impossible.
  bool Open(const wchar_t* path);
  bool IsOpen() const { return fd_ >= 0; }
  // Buffers and writes bytes; false once any write has failed (later writes are ignored).
  bool Write(std::string_view bytes);
  bool Write(const void* data, size_t size) {
    return Write(std::string_view(static_cast<const char*>(data), size));
  }
  // Gives the new file these access and modification times instead of the time of the write
  // (for a file whose content changes in a way its user should not see as an edit).
  void SetTimes(const struct timespec& accessed, const struct timespec& modified);
  // Flushes, syncs and renames over the target. False (target untouched) on any failure.
  bool Commit();
  // The same in two steps, for many files made durable together (one sync of the file system
  // instead of one per file): Seal writes out and closes the temporary file, waiting for the
  // disk only when `durable`; Publish renames it over the target and, with `syncFolder`, makes
  // the rename durable. Between the two, the caller makes the data durable (SyncFileSystem) and
  // may still Abandon. Both false (target untouched, temporary file removed) on failure.
  bool Seal(bool durable);
  bool Publish(bool syncFolder);
  // The temporary file while the object holds one (for syncing its file system).
  const std::string& TempPath() const;
  // Removes the temporary file; the target stays as it was.
  void Abandon();
  // Why the last Open, Write or Commit failed, in words ("cannot write /d/x.BIN: No space left
  // on device"); empty when none did.
  const std::string& error() const { return error_; }

 private:
  bool Flush();
  bool Failed(const std::string& what, int err);  // records the first failure; false
  bool Report(const std::string& why);            // the same with the words given
  void WriteFailed();
  void StartWriteback();
  int fd_ = -1;
  off_t written_ = 0;      // bytes in the temporary file
  off_t writtenBack_ = 0;  // bytes whose writing out has been started
  bool failed_ = false;
  bool keepTimes_ = false;
  struct timespec times_[2] = {};
  std::string target_;
  std::string temp_;
  std::string buffer_;
  std::string error_;
};

// Makes the entries of a folder durable (fsync of the folder), after files were renamed into it.
void SyncFolder(const std::string& folder);

namespace testing {
// Fault injection for tests: after `bytes` more bytes have been written through AtomicFile or
// OutputFile in this process, every further write fails as a full disk would. A negative value
// switches the fault off.
void FailAtomicWritesAfter(long long bytes);
// After `renames` more renames into place, every further one fails (EIO). Negative: off.
void FailAtomicRenamesAfter(int renames);
}  // namespace testing

}  // namespace navmisc
