// A store's settings file for one read or one write: either the file and section a caller has
// open, or (with a null handle) the store's own file and its section "SECTION", which is then
// opened here and closed again at the end.
#pragma once

#include "navmisc/platform/cstring.h"

namespace navmisc::activity {

class StoreFileReader {
 public:
  StoreFileReader(unsigned long handle, const wchar_t* section, const wchar_t* path);
  ~StoreFileReader();
  StoreFileReader(const StoreFileReader&) = delete;
  StoreFileReader& operator=(const StoreFileReader&) = delete;
  // False when the store's own file cannot be opened.
  bool ok() const { return handle_ != 0; }
  unsigned long handle() const { return handle_; }
  const wchar_t* section() const { return section_; }

 private:
  unsigned long handle_;
  const wchar_t* section_;
  bool own_;
};

class StoreFileWriter {
 public:
  // Creates the folder of `path` when the store's own file is to be written.
  StoreFileWriter(unsigned long handle, const wchar_t* section, const wchar_t* path);
  // A writer of its own that was never finished leaves the old file as it was.
  ~StoreFileWriter();
  StoreFileWriter(const StoreFileWriter&) = delete;
  StoreFileWriter& operator=(const StoreFileWriter&) = delete;
  bool ok() const { return handle_ != 0; }
  unsigned long handle() const { return handle_; }
  const wchar_t* section() const { return section_; }
  // Writes the store's own file whole; false when that failed. True for a caller's file.
  bool Finish();

 private:
  unsigned long handle_;
  const wchar_t* section_;
  bool own_;
};

}  // namespace navmisc::activity
