#include "navmisc/platform/temp_folder.h"

#include <stdlib.h>

#include <string>

#include "navmisc/platform/files.h"

CString CreateTempFolder(const wchar_t* prefix) {
  const char* tmp = getenv("TMPDIR");
  std::string templ = std::string(tmp && *tmp ? tmp : "/tmp") + "/" + CString(prefix).ToUtf8() + "-XXXXXX";
  if (!mkdtemp(templ.data())) return {};
  return CString::FromUtf8(templ);
}

navmisc::ScopedTempFolder::~ScopedTempFolder() {
  if (!path_.IsEmpty()) RemoveDir(path_);
}
