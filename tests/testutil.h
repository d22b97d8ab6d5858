// Helpers shared by the tests.
#pragma once

#include <gtest/gtest.h>

#include <functional>
#include <optional>
#include <ostream>
#include <string>

#include "navmisc/platform/cstring.h"

// Failure messages show a CString as its text.
inline void PrintTo(const CString& s, std::ostream* os) {
  *os << ::testing::PrintToString(s.str());
}

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

// Points the program folder (where the strings file and the templates are looked for) at
// `folder` for the lifetime of the object.
class ProgPathScope {
 public:
  explicit ProgPathScope(const wchar_t* folder);
  ~ProgPathScope();

 private:
  CString previous_;
};

// Sets TZ (and tzset) for the lifetime of the object, then puts back what was there.
class TzScope {
 public:
  explicit TzScope(const char* tz);
  ~TzScope();

 private:
  std::optional<std::string> old_;
};

// Switches every locale category to `name` for the lifetime of the object; ok() is false when
// that locale is not installed (the locale then stays as it was).
class LocaleScope {
 public:
  explicit LocaleScope(const char* name);
  ~LocaleScope();
  bool ok() const { return ok_; }

 private:
  std::string old_;
  bool ok_ = false;
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
// The folder of the published XML schemas (NAVMISC_SCHEMA_DIR, beside the checkout by default),
// or empty when it is absent: validation against them is then left out, with a note.
std::string SchemaDir();
// A python 3 that can import `module` (Debian's first), or "" when there is none.
std::string PythonWithModule(const char* module);
// `s` as one single-quoted shell word.
std::string ShellQuote(const std::string& s);

// Runs `work` in a forked child and waits up to `seconds` for it. True when it ended normally
// in time; a child still running then is killed. For work that may hang on a broken build (a
// read that blocks or loops); the child's results do not come back, so check them afterwards
// in the test's own process.
bool FinishesWithin(int seconds, const std::function<void()>& work);

}  // namespace navmisc::testutil
