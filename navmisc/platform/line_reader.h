// Reads a text file line by line through a fixed buffer, so that memory stays constant however
// long the file is. Only regular files are read (see OpenRegularFile).
#pragma once

#include <string>
#include <string_view>

#include "navmisc/platform/cstring.h"

namespace navmisc {

class LineReader {
 public:
  // `maxLine` limits a line the way a fixed line buffer would: a longer line comes back as
  // several pieces of at most `maxLine` characters each. 0 means no limit.
  explicit LineReader(size_t maxLine = 0);
  ~LineReader();
  LineReader(const LineReader&) = delete;
  LineReader& operator=(const LineReader&) = delete;

  bool Open(const wchar_t* path);
  // Reads lines from `bytes` instead of a file, exactly as from a file holding them. The bytes
  // are not copied: they must stay in place while lines are read.
  void OpenMemory(std::string_view bytes);
  bool IsOpen() const { return open_; }
  // The next line without its line end ("\n" or "\r\n"); false at the end of the file or on a
  // read error. The view stays valid until the next call.
  bool Next(std::string_view& line);
  void Close();

 private:
  bool Fill();
  int fd_ = -1;
  bool open_ = false;
  size_t maxLine_;
  std::string buf_;
  const char* data_ = nullptr;  // buf_, or the bytes given to OpenMemory
  size_t begin_ = 0;
  size_t end_ = 0;
  bool eof_ = false;
  std::string long_;  // a line that spans buffer refills
};

}  // namespace navmisc
