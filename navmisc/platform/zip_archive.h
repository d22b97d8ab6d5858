// Writing a zip archive (the KMZ container) through libzip: files go in under bare names at the
// archive's root with the default compression (deflate). Nothing appears at the target until
// Close; an archive that is never closed leaves no file behind.
#pragma once

#include <string>

#include "navmisc/platform/cstring.h"

struct zip;

namespace navmisc {

class ZipArchiveWriter {
 public:
  ZipArchiveWriter() = default;
  // Discards an archive that was not closed.
  ~ZipArchiveWriter();
  ZipArchiveWriter(const ZipArchiveWriter&) = delete;
  ZipArchiveWriter& operator=(const ZipArchiveWriter&) = delete;

  // Starts a new, empty archive to be written at `path` (an existing file there is replaced on
  // Close). False when the archive cannot be started.
  bool Create(const wchar_t* path);
  // Adds the regular file `file` as `name` (UTF-8 in the archive). The file's content is read on
  // Close, so it must stay in place until then. False, with nothing added, when the archive is
  // not open, the file cannot be read now, or `name` is empty or already taken.
  bool AddFile(const wchar_t* file, const wchar_t* name);
  // Writes the archive with everything added so far. False when that fails (a file vanished,
  // the disk is full); no archive is left at the target then.
  bool Close();
  // Drops the archive without writing anything.
  void Discard();

  bool IsOpen() const { return archive_ != nullptr; }
  // Why the last operation failed, in libzip's or the system's words; empty when it did not.
  const std::string& error() const { return error_; }

 private:
  zip* archive_ = nullptr;
  std::string error_;
};

}  // namespace navmisc
