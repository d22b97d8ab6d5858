#include "navmisc/platform/process.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <errno.h>
#include <signal.h>

#include <string>
#include <vector>

#include <gtest/gtest.h>

namespace {

using navmisc::ChildProcess;
using navmisc::FindProgram;
using navmisc::SplitCommandLine;

bool ProcessExists(pid_t pid) { return ::kill(pid, 0) == 0 || errno != ESRCH; }

TEST(SplitCommandLine, QuotesGroupAndEscapedQuotesStay) {
  const struct {
    const char* line;
    std::vector<std::string> args;
  } cases[] = {
      {"", {}},
      {"  \t ", {}},
      {"a b\tc", {"a", "b", "c"}},
      {R"("/opt/suite/FixTag.exe" -ZE "/data/7F_profile.ini")",
       {"/opt/suite/FixTag.exe", "-ZE", "/data/7F_profile.ini"}},
      {R"(x "a b"c d)", {"x", "a bc", "d"}},
      {R"(say \"hi\")", {"say", "\"hi\""}},
      {R"("C:\photos\a b.jpg")", {"C:\\photos\\a b.jpg"}},
      {R"(empty "" end)", {"empty", "", "end"}},
      {R"(open "never closed)", {"open", "never closed"}},
  };
  for (const auto& c : cases) EXPECT_EQ(SplitCommandLine(c.line), c.args) << c.line;
}

TEST(ChildProcess, ExitCodesSignalsAndStartFailures) {
  ChildProcess p;
  ASSERT_TRUE(p.Start({"/bin/sh", "-c", "exit 7"}));
  EXPECT_EQ(p.Wait(), 7);
  EXPECT_FALSE(p.IsRunning());
  EXPECT_EQ(p.Wait(), -1) << "nothing left to wait for";

  ASSERT_TRUE(p.Start({"/bin/sh", "-c", "kill -9 $$"}));
  EXPECT_EQ(p.Wait(), 128 + SIGKILL);

  EXPECT_FALSE(p.Start({"/nonexistent/FixTag.exe", "-ZE", "x"}));
  EXPECT_FALSE(p.IsRunning());
  EXPECT_EQ(p.error(), "No such file or directory");
  EXPECT_FALSE(p.Start({"/etc/hostname"})) << "not executable";
  EXPECT_FALSE(p.Start({}));
}

TEST(ChildProcess, BoundedWaitThenKill) {
  ChildProcess p;
  ASSERT_TRUE(p.Start({"/bin/sleep", "30"}));
  const pid_t pid = p.pid();
  EXPECT_FALSE(p.WaitFor(50));
  EXPECT_TRUE(p.IsRunning());
  p.Kill();
  EXPECT_FALSE(p.IsRunning());
  EXPECT_EQ(p.exitStatus(), 128 + SIGKILL);
  EXPECT_FALSE(ProcessExists(pid)) << "killed and reaped, not left as a zombie";

  ASSERT_TRUE(p.Start({"/bin/sh", "-c", "exit 3"}));
  EXPECT_TRUE(p.WaitFor(60000));
  EXPECT_EQ(p.exitStatus(), 3);
}

TEST(ChildProcess, DestructionAndReplacementEndTheChild) {
  pid_t first = -1, second = -1;
  {
    ChildProcess p;
    ASSERT_TRUE(p.Start({"/bin/sleep", "30"}));
    first = p.pid();
    ASSERT_TRUE(p.Start({"/bin/sleep", "30"}));  // the first child is ended before
    second = p.pid();
    EXPECT_FALSE(ProcessExists(first));
    ChildProcess moved(std::move(p));
    EXPECT_FALSE(p.IsRunning());
    EXPECT_EQ(moved.pid(), second);
  }
  EXPECT_FALSE(ProcessExists(second));
}

TEST(ChildProcess, ChildGetsNullStreamsAndDefaultSignals) {
  ChildProcess p;
  // With /dev/null as input, read meets the end at once instead of waiting for a terminal.
  ASSERT_TRUE(p.Start({"/bin/sh", "-c", "read x || exit 9"}, {.nullStdin = true}));
  EXPECT_EQ(p.Wait(), 9);

  // A caller that ignores SIGTERM does not pass that on.
  struct sigaction ignore {}, old {};
  ignore.sa_handler = SIG_IGN;
  ASSERT_EQ(::sigaction(SIGTERM, &ignore, &old), 0);
  ASSERT_TRUE(p.Start({"/bin/sleep", "30"}));
  ::sigaction(SIGTERM, &old, nullptr);
  ::kill(p.pid(), SIGTERM);
  EXPECT_EQ(p.Wait(), 128 + SIGTERM);
}

TEST(ChildProcess, CapturedOutputCollectedErrorsAndAGivenInput) {
  char path[] = "/tmp/navmisc-process-XXXXXX";
  const int fd = ::mkstemp(path);
  ASSERT_GE(fd, 0);
  ::unlink(path);
  ASSERT_EQ(::write(fd, "given input\n", 12), 12);
  ASSERT_EQ(::lseek(fd, 0, SEEK_SET), 0);

  ChildProcess p;
  navmisc::SpawnOptions options;
  options.captureOutput = true;
  options.stdinFd = fd;
  // Far more error output than a pipe holds: the reader must keep draining it.
  ASSERT_TRUE(p.Start({"/bin/sh", "-c", "head -c 300000 /dev/zero | tr '\\0' e >&2; cat; exit 3"}, options));
  std::string out;
  char buf[7];
  for (ssize_t n; (n = p.ReadOutput(buf, sizeof buf)) > 0;) out.append(buf, static_cast<size_t>(n));
  ::close(fd);
  EXPECT_EQ(out, "given input\n");
  EXPECT_EQ(p.errorOutput(), std::string(ChildProcess::kErrorOutputLimit, 'e'));
  EXPECT_EQ(p.ReadOutput(buf, sizeof buf), 0) << "the end stays the end";
  EXPECT_EQ(p.Wait(), 3);

  ASSERT_TRUE(p.Start({"/bin/sh", "-c", "sleep 1; echo late"}, {.captureOutput = true}));
  EXPECT_EQ(p.ReadOutput(buf, sizeof buf, 20), ChildProcess::kTimedOut);
  p.Kill();
  EXPECT_EQ(p.ReadOutput(buf, sizeof buf), -1) << "killed: the pipes are closed";

  ChildProcess plain;
  ASSERT_TRUE(plain.Start({"/bin/true"}));
  EXPECT_EQ(plain.ReadOutput(buf, sizeof buf), -1) << "nothing captured";
}

TEST(FindProgram, SearchesPathForExecutableFilesOnly) {
  EXPECT_EQ(FindProgram("/bin/sh"), "/bin/sh");
  EXPECT_FALSE(FindProgram("sh").empty());
  char path[] = "/tmp/navmisc-program-XXXXXX";
  const int fd = ::mkstemp(path);
  ASSERT_GE(fd, 0);
  ::close(fd);
  ::chmod(path, 0644);
  EXPECT_EQ(FindProgram(path), "") << "not executable";
  ::unlink(path);
  EXPECT_EQ(FindProgram("no-such-program-of-navmisc"), "");
  EXPECT_EQ(FindProgram(""), "");
}

}  // namespace
