// Helpers shared by the tests.
#pragma once

#include <string>

#include "navmisc/platform/cstring.h"

namespace navmisc::testutil {

// A fresh folder under $TMPDIR, removed with everything in it when the object goes away.
class TempDir {
 public:
  TempDir();
  ~TempDir();
  TempDir(const TempDir&) = delete;
  TempDir& operator=(const TempDir&) = delete;
  const CString& path() const { return path_; }
  // path()/name
  CString operator/(const wchar_t* name) const;

 private:
  CString path_;
};

std::string ReadFileBytes(const wchar_t* path);
void WriteFileBytes(const wchar_t* path, const std::string& bytes);

// Points the shared data root at `root` for the lifetime of the object, then puts back the
// previous value.
class DataRootScope {
 public:
  explicit DataRootScope(const wchar_t* root);
  ~DataRootScope();

 private:
  CString previous_;
};

// Runs a shell command: its exit status (-1 when it did not end normally) and what it wrote on
// standard output.
struct CommandResult {
  int status = -1;
  std::string out;
};
CommandResult RunCommand(const std::string& command);
// True when `name` is a program on PATH.
bool HaveProgram(const char* name);
// `s` as one single-quoted shell word.
std::string ShellQuote(const std::string& s);

}  // namespace navmisc::testutil
