// Documents written beside their final place and moved there only when they are complete, so
// that a failed or stopped write leaves the previous files as they were.
#pragma once

#include <string>

#include "navmisc/platform/cstring.h"
#include "navmisc/platform/lists.h"

namespace navmisc {

// A hidden folder of its own (".NAME.tmp-XXXXXX") inside the folder of the files it will
// replace: the same file system, so that moving a finished file into place is one rename.
// Destroying it removes the folder with whatever is still in it.
class StagingFolder {
 public:
  // Creates the folder in `folder` ("" = the current folder), named after `name`. path() is
  // empty when that fails; error() says why.
  StagingFolder(const wchar_t* folder, const wchar_t* name);
  ~StagingFolder();
  StagingFolder(const StagingFolder&) = delete;
  StagingFolder& operator=(const StagingFolder&) = delete;

  const CString& path() const { return path_; }
  // Renames every file of the staging folder (in name order) to the same name in the target
  // folder, replacing what is there. A symbolic link of that name is replaced itself; the file
  // it points to is left alone. False at the first file that cannot be moved; error() says
  // why, and the files moved before it stay moved.
  bool Publish();
  // The names Publish moved, in order.
  const CStringList& published() const { return published_; }
  // The system's reason for the last failure, empty when none.
  const std::string& error() const { return error_; }

 private:
  CString folder_;
  CString path_;
  CStringList published_;
  std::string error_;
};

}  // namespace navmisc
