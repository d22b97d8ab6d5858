// A user's file read whole and, changed, put back in place: the content is replaced in one step
// (a temporary file in the same folder renamed over it), so the file is never left half written;
// it keeps its permission bits and its access and modification times; and it is not replaced
// when it was deleted or swapped for another file since it was read.
#pragma once

#include <sys/stat.h>

#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

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
  friend class FileReplaceBatch;
  bool Fail(const std::string& what, int err);
  // Why the file may not be replaced now (see Replace); empty when it may.
  std::string CheckReplaceable() const;

  CString path_;
  std::string bytes_;
  struct stat stat_ {};
  std::string error_;
};

// The replacement of many loaded files, made durable together: each new content goes to a
// temporary file beside its file at once; Commit waits for the disk once per file system instead
// of once per file, then puts the files in place one by one, each checked again as Replace checks
// it. Files not yet committed stay as they were; staged temporary files of a batch that is never
// committed are removed.
class FileReplaceBatch {
 public:
  FileReplaceBatch();
  ~FileReplaceBatch();
  FileReplaceBatch(const FileReplaceBatch&) = delete;
  FileReplaceBatch& operator=(const FileReplaceBatch&) = delete;

  // Stages `bytes` as the new content of `file`; false, with `error` set, when `file` may not be
  // replaced or the temporary file cannot be written. `file` may go away afterwards.
  bool Stage(const FileContent& file, std::string_view bytes, std::string& error);
  // Puts every staged file in place. One text per staged file, in the order they were staged:
  // empty when the file was replaced, else why not.
  std::vector<std::string> Commit();

 private:
  struct Staged;
  std::vector<Staged> staged_;
};

}  // namespace navmisc
