#include "testutil.h"

#include <signal.h>
#include <stdlib.h>
#include <sys/wait.h>
#include <unistd.h>
#include <time.h>

#include <clocale>
#include <cstdio>

#include <fstream>
#include <sstream>
#include <stdexcept>

#include "navmisc/platform/files.h"
#include "navmisc/platform/shared_globals.h"

namespace navmisc::testutil {

TempDir::TempDir() {
  const char* tmp = getenv("TMPDIR");
  std::string templ = std::string(tmp && *tmp ? tmp : "/tmp") + "/navmisc-test-XXXXXX";
  if (!mkdtemp(templ.data())) throw std::runtime_error("mkdtemp failed");
  path_ = CString::FromUtf8(templ);
}

TempDir::~TempDir() { RemoveDir(path_, L"*.*"); }

CString TempDir::operator/(const wchar_t* name) const { return PathJoin(path_, name); }

std::string ReadFileBytes(const wchar_t* path) {
  std::ifstream in(NativePath(path), std::ios::binary);
  std::ostringstream s;
  s << in.rdbuf();
  return s.str();
}

void WriteFileBytes(const wchar_t* path, const std::string& bytes) {
  std::ofstream out(NativePath(path), std::ios::binary | std::ios::trunc);
  out << bytes;
}

DataRootScope::DataRootScope(const wchar_t* root) : previous_(g_szAppDataPath) {
  SetSharedText(g_szAppDataPath, root);
}

DataRootScope::~DataRootScope() { SetSharedText(g_szAppDataPath, previous_); }

ProgPathScope::ProgPathScope(const wchar_t* folder) : previous_(g_szExecProgPath) {
  SetSharedText(g_szExecProgPath, folder);
}

ProgPathScope::~ProgPathScope() { SetSharedText(g_szExecProgPath, previous_); }

TzScope::TzScope(const char* tz) {
  if (const char* old = getenv("TZ")) old_ = old;
  setenv("TZ", tz, 1);
  tzset();
}

TzScope::~TzScope() {
  if (old_) setenv("TZ", old_->c_str(), 1);
  else unsetenv("TZ");
  tzset();
}

LocaleScope::LocaleScope(const char* name) : old_(std::setlocale(LC_ALL, nullptr)) {
  ok_ = std::setlocale(LC_ALL, name) != nullptr;
}

LocaleScope::~LocaleScope() { std::setlocale(LC_ALL, old_.c_str()); }

CommandResult RunCommand(const std::string& command) {
  CommandResult r;
  std::FILE* pipe = ::popen(command.c_str(), "r");
  if (!pipe) return r;
  char buf[4096];
  for (size_t n; (n = std::fread(buf, 1, sizeof buf, pipe)) > 0;) r.out.append(buf, n);
  const int status = ::pclose(pipe);
  r.status = WIFEXITED(status) ? WEXITSTATUS(status) : -1;
  return r;
}

bool HaveProgram(const char* name) {
  return RunCommand(std::string("command -v ") + name + " >/dev/null 2>&1").status == 0;
}

std::string SchemaDir() {
  const std::string dir = NAVMISC_SCHEMA_DIR;
  return IsDirectory(CString::FromUtf8(dir)) ? dir : std::string();
}

std::string PythonWithModule(const char* module) {
  // Debian's python first: a python of one's own (pyenv, a venv) earlier on PATH may lack the
  // Debian packages.
  for (const char* python : {"/usr/bin/python3", "python3"}) {
    if (RunCommand(std::string(python) + " -c 'import " + module + "' >/dev/null 2>&1").status == 0) return python;
  }
  return {};
}

std::string ShellQuote(const std::string& s) {
  std::string q = "'";
  for (char c : s) {
    if (c == '\'') q += "'\\''";
    else q += c;
  }
  return q + "'";
}

bool FinishesWithin(int seconds, const std::function<void()>& work) {
  const pid_t child = ::fork();
  if (child < 0) return false;
  if (child == 0) {
    work();
    ::_exit(0);
  }
  int status = 0;
  for (int waited_ms = 0; waited_ms < seconds * 1000; waited_ms += 10) {
    if (::waitpid(child, &status, WNOHANG) == child) return WIFEXITED(status) && WEXITSTATUS(status) == 0;
    ::usleep(10 * 1000);
  }
  ::kill(child, SIGKILL);
  ::waitpid(child, &status, 0);
  return false;
}

}  // namespace navmisc::testutil
