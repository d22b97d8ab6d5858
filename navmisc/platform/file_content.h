// A user's file read whole and, changed, put back in place: the content is replaced in one step
// (a temporary file in the same folder renamed over it), so the file is never left half written;
// it keeps its permission bits and its access and modification times; and it is not replaced
// when it was deleted or swapped for another file since it was read.
#pragma once

#include <sys/stat.h>

#include <cstddef>
#include <string>
#include <string_view>

#include "navmisc/platform/cstring.h"

namespace navmisc {

class FileContent {
 public:
  // Reads the whole of `path` (a symbolic link is followed). Only regular files are read, and at
  // most `maxBytes`: a larger file fails rather than costing unbounded memory. False, with
  // error() telling why, on failure.
  bool Load(const wchar_t* path, size_t maxBytes);

  const std::string& bytes() const { return bytes_; }
  const CString& path() const { return path_; }
  // True when the calling user may write the file (IsFileWritable).
  bool IsWritable() const;

  // Replaces the loaded file's content with `bytes`. False, with error() telling why and the
  // file as it was, when the file is not writable, when its name no longer leads to the file
  // that was loaded (deleted, or replaced by another), or when the write fails.
  bool Replace(std::string_view bytes);

  const std::string& error() const { return error_; }

 private:
  bool Fail(const std::string& what, int err);

  CString path_;
  std::string bytes_;
  struct stat stat_ {};
  std::string error_;
};

}  // namespace navmisc
