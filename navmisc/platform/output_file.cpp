#include "navmisc/platform/output_file.h"

#include <cerrno>
#include <cstring>

#include "navmisc/platform/detail/error_text.h"
#include "navmisc/platform/detail/write_fault.h"
#include "navmisc/platform/files.h"

namespace navmisc {
namespace {

thread_local std::string t_last_open_error;

}  // namespace

OutputFile::~OutputFile() {
  if (file_) std::fclose(file_);
}

bool OutputFile::Open(const wchar_t* path) {
  Close();
  failed_ = false;
  error_.clear();
  const std::string native = NativePath(path);
  if (native.empty()) {
    Failed(ENOENT);
  } else {
    // "e": the descriptor does not leak into programs the library starts.
    file_ = std::fopen(native.c_str(), "wbe");
    if (!file_) Failed(errno);
  }
  t_last_open_error = error_;
  return file_ != nullptr;
}

bool OutputFile::Write(std::string_view bytes) {
  if (!file_ || failed_) return false;
  // An injected fault writes what its budget allows and then fails like a full disk.
  const size_t allowed = detail::TakeWriteBudget(bytes.size());
  errno = 0;
  if (allowed > 0 && std::fwrite(bytes.data(), 1, allowed, file_) != allowed) {
    Failed(errno ? errno : EIO);
  } else if (allowed < bytes.size()) {
    Failed(ENOSPC);
  }
  return !failed_;
}

bool OutputFile::Close() {
  if (!file_) return !failed_;
  std::FILE* f = file_;
  file_ = nullptr;
  errno = 0;
  if (std::fclose(f) != 0) Failed(errno ? errno : EIO);
  return !failed_;
}

void OutputFile::Failed(int err) {
  if (!failed_) error_ = detail::ErrorText(err);
  failed_ = true;
}

std::string LastOpenError() { return t_last_open_error; }

}  // namespace navmisc
