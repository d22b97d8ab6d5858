#include "navmisc/platform/zip_archive.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>
#include <zip.h>

#include <cerrno>
#include <cstring>

#include "navmisc/platform/detail/error_text.h"
#include "navmisc/platform/detail/temp_files.h"
#include "navmisc/platform/files.h"
#include "navmisc/platform/textconv.h"

namespace navmisc {
namespace {

// libzip reads added files only when the archive is written. Opening the file now turns a
// missing or unreadable file into an error of its own addition rather than of the close.
bool CheckReadable(const std::string& native, std::string& error) {
  ClearFileRefusal();
  const int fd = OpenRegularFile(native);
  if (fd < 0) {
    error = LastFileRefusal().empty() ? detail::ErrorText(errno) : "not a regular file";
    return false;
  }
  ::close(fd);
  return true;
}

}  // namespace

ZipArchiveWriter::~ZipArchiveWriter() { Discard(); }

bool ZipArchiveWriter::Create(const wchar_t* path) {
  Discard();
  error_.clear();
  const std::string native = NativePath(path);
  if (native.empty()) {
    error_ = "no archive path";
    return false;
  }
  int code = 0;
  archive_ = zip_open(native.c_str(), ZIP_CREATE | ZIP_TRUNCATE, &code);
  if (!archive_) {
    zip_error_t err;
    zip_error_init_with_code(&err, code);
    error_ = zip_error_strerror(&err);
    zip_error_fini(&err);
    return false;
  }
  return true;
}

bool ZipArchiveWriter::AddFile(const wchar_t* file, const wchar_t* name) {
  error_.clear();
  if (!archive_) {
    error_ = "the archive is not open";
    return false;
  }
  std::string entry;
  if (!name || !*name || !WideToUtf8(name, entry)) {
    error_ = "no valid entry name";
    return false;
  }
  const std::string native = NativePath(file);
  if (native.empty() || !CheckReadable(native, error_)) {
    if (error_.empty()) error_ = "no file path";
    return false;
  }
  zip_source_t* source = zip_source_file(archive_, native.c_str(), 0, -1);
  if (!source) {
    error_ = zip_strerror(archive_);
    return false;
  }
  // Without ZIP_FL_OVERWRITE a name that is already taken fails rather than replacing an entry.
  if (zip_file_add(archive_, entry.c_str(), source, ZIP_FL_ENC_UTF_8) < 0) {
    error_ = zip_strerror(archive_);
    zip_source_free(source);
    return false;
  }
  return true;
}

bool ZipArchiveWriter::Close() {
  error_.clear();
  if (!archive_) {
    error_ = "the archive is not open";
    return false;
  }
  if (zip_close(archive_) != 0) {
    error_ = zip_strerror(archive_);
    zip_discard(archive_);
    archive_ = nullptr;
    return false;
  }
  archive_ = nullptr;
  return true;
}

void ZipArchiveWriter::Discard() {
  if (archive_) zip_discard(archive_);
  archive_ = nullptr;
}

}  // namespace navmisc
