// Reading a file that a user names, front to back, in chunks: only a regular file is read, and
// opening never blocks (a FIFO, a device or a folder is refused rather than waited on).
#pragma once

#include <sys/types.h>

#include <cstdint>
#include <string>

#include "navmisc/platform/cstring.h"

namespace navmisc {

class InputFile {
 public:
  enum class OpenResult {
    kOk,
    kMissing,     // no such file (or a path component is missing)
    kNotRegular,  // a folder, FIFO, socket or device
    kDenied,      // no permission
    kFailed,      // any other reason; see error()
  };

  InputFile() = default;
  ~InputFile();
  InputFile(const InputFile&) = delete;
  InputFile& operator=(const InputFile&) = delete;

  OpenResult Open(const wchar_t* path);
  bool IsOpen() const { return fd_ >= 0; }
  // Size in bytes when the file was opened.
  uint64_t size() const { return size_; }
  // Reads up to `capacity` bytes: the count read, 0 at the end, -1 on a read error (error()).
  ssize_t Read(char* buffer, size_t capacity);
  // Reads up to `capacity` bytes at `offset`, leaving the position of Read alone; safe from
  // several threads at once. The count, 0 at the end, -1 on a read error, its reason in `error`.
  ssize_t ReadAt(uint64_t offset, char* buffer, size_t capacity, std::string& error) const;
  // Back to the first byte.
  bool Rewind();
  // The open descriptor, to hand the same file to a child process (SpawnOptions::stdinFd).
  int descriptor() const { return fd_; }
  void Close();
  // The system's reason for the last failure ("Permission denied").
  const std::string& error() const { return error_; }

 private:
  int fd_ = -1;
  uint64_t size_ = 0;
  std::string error_;
};

}  // namespace navmisc
