#include "navmisc/platform/staging_folder.h"

#include <stdio.h>
#include <stdlib.h>

#include <cerrno>

#include "navmisc/platform/detail/error_text.h"
#include "navmisc/platform/files.h"

namespace navmisc {

StagingFolder::StagingFolder(const wchar_t* folder, const wchar_t* name)
    : folder_(folder && *folder ? folder : L".") {
  // The name part is shortened so that the folder's name stays within NAME_MAX.
  std::string templ = NativePath(PathJoin(folder_, (L"." + CString(name).str().substr(0, 200)).c_str())) +
                      ".tmp-XXXXXX";
  if (::mkdtemp(templ.data())) {
    path_ = CString::FromUtf8(templ);
  } else {
    error_ = detail::ErrorText(errno);
  }
}

StagingFolder::~StagingFolder() {
  if (!path_.IsEmpty()) RemoveDir(path_);
}

bool StagingFolder::Publish() {
  CStringList names;
  if (path_.IsEmpty() || GetContent(path_, L"*", names) < 0) {
    error_ = path_.IsEmpty() ? error_ : detail::ErrorText(errno);
    return false;
  }
  for (const CString& name : names) {
    // rename() replaces a symbolic link at the target by the file, never what the link names.
    if (::rename(NativePath(PathJoin(path_, name)).c_str(), NativePath(PathJoin(folder_, name)).c_str()) != 0) {
      error_ = detail::ErrorText(errno);
      return false;
    }
    published_.AddTail(name);
  }
  return true;
}

}  // namespace navmisc
