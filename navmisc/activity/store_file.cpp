#include "navmisc/activity/store_file.h"

#include "navmisc/platform/files.h"
#include "navmisc/platform/settings.h"

namespace navmisc::activity {

constexpr const wchar_t* kOwnSection = L"SECTION";

StoreFileReader::StoreFileReader(unsigned long handle, const wchar_t* section, const wchar_t* path)
    : handle_(handle ? handle : RD_BEGIN(path)), section_(handle ? section : kOwnSection), own_(handle == 0) {}

StoreFileReader::~StoreFileReader() {
  if (own_ && handle_) RD_END(handle_);
}

StoreFileWriter::StoreFileWriter(unsigned long handle, const wchar_t* section, const wchar_t* path)
    : handle_(handle), section_(handle ? section : kOwnSection), own_(handle == 0) {
  if (own_) {
    MakeDir(PathFolder(path));
    handle_ = WR_BEGIN(path);
  }
}

StoreFileWriter::~StoreFileWriter() {
  if (own_ && handle_) WR_ABANDON(handle_);
}

bool StoreFileWriter::Finish() {
  if (!own_) return true;
  const bool written = handle_ && WR_END(handle_) == 1;
  handle_ = 0;
  return written;
}

}  // namespace navmisc::activity
