#pragma once

#include "navmisc/platform/cstring.h"

// Creates a new, empty folder of its own under $TMPDIR (else /tmp), named after `prefix`, and
// returns its path; empty when that fails.
CString CreateTempFolder(const wchar_t* prefix);

namespace navmisc {

// A folder of its own under $TMPDIR (else /tmp) for the lifetime of the object, removed with
// everything in it afterwards. path() is empty when the folder could not be made.
class ScopedTempFolder {
 public:
  explicit ScopedTempFolder(const wchar_t* prefix) : path_(CreateTempFolder(prefix)) {}
  ~ScopedTempFolder();
  ScopedTempFolder(const ScopedTempFolder&) = delete;
  ScopedTempFolder& operator=(const ScopedTempFolder&) = delete;
  const CString& path() const { return path_; }

 private:
  CString path_;
};

}  // namespace navmisc
