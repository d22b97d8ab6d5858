#include "navmisc/platform/shared_globals.h"

#include <fcntl.h>
#include <spawn.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdlib>
#include <cstring>
#include <cwchar>
#include <memory>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "navmisc/platform/detail/shared_block.h"
#include "navmisc/platform/shared_memory.h"

extern char** environ;

namespace {

using navmisc::SharedMemory;
using navmisc::detail::SharedBlockData;
using navmisc::detail::SharedBlockOrigin;

// ---- the child side: runs only when started by the tests below -------------------------------

const char* Role() { return std::getenv("NAVMISC_TEST_SHM_ROLE"); }

TEST(SharedGlobalsChild, DISABLED_Role) {
  const std::string role = Role() ? Role() : "";
  if (role.empty()) GTEST_SKIP() << "started by SharedGlobals tests only";
  const SharedBlockOrigin origin = navmisc::detail::SharedBlockSource();
  if (role == "write") {
    ASSERT_EQ(origin, SharedBlockOrigin::kNamedObject);
    // A new object starts zeroed.
    EXPECT_EQ(g_nProductId, 0);
    EXPECT_EQ(g_szAppDataPath[0], L'\0');
    EXPECT_EQ(g_devConfig.nCmdType, 0);
    EXPECT_EQ(g_devConfig.bAccOn, 0);
    g_nProductId = GPS_APP_SPORT;
    navmisc::SetSharedText(g_szAppDataPath, L"/home/user/.local/share/navmisc");
    g_devConfig.nInterval = 5;
    g_devConfig11.NAVI[28799] = 0xAB;
    g_dDeviceVersion = 1.25;
    g_bDeviceConnected = true;
    g_nScanProgress = 77;
  } else if (role == "mark") {
    ASSERT_EQ(origin, SharedBlockOrigin::kNamedObject);
    g_devConfig11.NAVI[std::atoi(std::getenv("NAVMISC_TEST_SHM_INDEX"))] = 1;
  } else if (role == "fallback") {
    EXPECT_EQ(origin, SharedBlockOrigin::kFallback);
    g_nScanProgress = 99;  // must land in the private block
    EXPECT_EQ(g_nScanProgress, 99);
  } else {
    FAIL() << "unknown role " << role;
  }
}

// ---- the parent side ----------------------------------------------------------------------

std::string UniqueName(const char* what) {
  static int counter = 0;
  return "/navmisc-test-" + std::string(what) + "-" + std::to_string(::getpid()) + "-" +
         std::to_string(++counter);
}

// Starts this test program again, running only the child test with the given environment.
pid_t StartChild(const std::string& shm_name, const std::string& role, int index = 0) {
  std::vector<std::string> env;
  for (char** e = environ; *e; ++e) {
    if (std::strncmp(*e, "NAVMISC_SHM_NAME=", 17) != 0 &&
        std::strncmp(*e, "NAVMISC_TEST_SHM_", 17) != 0)
      env.emplace_back(*e);
  }
  env.push_back("NAVMISC_SHM_NAME=" + shm_name);
  env.push_back("NAVMISC_TEST_SHM_ROLE=" + role);
  env.push_back("NAVMISC_TEST_SHM_INDEX=" + std::to_string(index));
  std::vector<char*> envp;
  for (std::string& s : env) envp.push_back(s.data());
  envp.push_back(nullptr);
  std::string exe = "/proc/self/exe";
  std::string filter = "--gtest_filter=SharedGlobalsChild.DISABLED_Role";
  std::string disabled = "--gtest_also_run_disabled_tests";
  char* argv[] = {exe.data(), filter.data(), disabled.data(), nullptr};
  pid_t pid = -1;
  if (::posix_spawn(&pid, exe.c_str(), nullptr, nullptr, argv, envp.data()) != 0) return -1;
  return pid;
}

int WaitChild(pid_t pid) {
  int status = 0;
  if (pid <= 0 || ::waitpid(pid, &status, 0) != pid) return -1;
  return WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status);
}

int RunChild(const std::string& shm_name, const std::string& role) {
  return WaitChild(StartChild(shm_name, role));
}

// Removes the object when the test ends, however it ends.
struct Unlinker {
  std::string name;
  ~Unlinker() { ::shm_unlink(name.c_str()); }
};

TEST(SharedGlobals, SeenByOtherProcesses) {
  const std::string name = UniqueName("share");
  Unlinker unlink{name};
  ASSERT_EQ(RunChild(name, "write"), 0);

  // The object outlives the writer, readable only by its owner, and holds what it wrote.
  int fd = ::shm_open(name.c_str(), O_RDONLY, 0);
  ASSERT_GE(fd, 0);
  struct stat st;
  ASSERT_EQ(::fstat(fd, &st), 0);
  ::close(fd);
  EXPECT_EQ(st.st_mode & 0777, 0600u);
  EXPECT_EQ(st.st_uid, ::geteuid());
  EXPECT_EQ(static_cast<size_t>(st.st_size), sizeof(SharedBlockData));

  std::error_code ec;
  SharedMemory mem = SharedMemory::OpenExisting(name, ec);
  ASSERT_TRUE(mem) << ec.message();
  const auto& block = *static_cast<const SharedBlockData*>(mem.data());
  EXPECT_EQ(block.state, navmisc::detail::kSharedBlockReady);
  EXPECT_EQ(block.magic, navmisc::detail::kSharedBlockMagic);
  EXPECT_EQ(block.layoutVersion, navmisc::detail::kSharedLayoutVersion);
  EXPECT_EQ(block.nProductId, GPS_APP_SPORT);
  EXPECT_EQ(block.nScanProgress, 77);
  EXPECT_STREQ(block.szAppDataPath, L"/home/user/.local/share/navmisc");
  EXPECT_EQ(block.devConfig.nInterval, 5);
  EXPECT_EQ(block.devConfig11.NAVI[28799], 0xAB);
  EXPECT_EQ(block.dDeviceVersion, 1.25);
  EXPECT_TRUE(block.bDeviceConnected);
}

TEST(SharedGlobals, ProcessesStartingTogetherInitialiseOnce) {
  // Had a late process initialised the block again, it would wipe the marks made before it.
  const std::string name = UniqueName("race");
  Unlinker unlink{name};
  constexpr int kChildren = 8;
  pid_t pids[kChildren];
  for (int i = 0; i < kChildren; ++i) pids[i] = StartChild(name, "mark", i);
  for (int i = 0; i < kChildren; ++i) EXPECT_EQ(WaitChild(pids[i]), 0) << "child " << i;
  std::error_code ec;
  SharedMemory mem = SharedMemory::OpenExisting(name, ec);
  ASSERT_TRUE(mem) << ec.message();
  const auto& block = *static_cast<const SharedBlockData*>(mem.data());
  for (int i = 0; i < kChildren; ++i) EXPECT_EQ(block.devConfig11.NAVI[i], 1) << "mark " << i;
}

TEST(SharedGlobals, ForeignObjectIsLeftAlone) {
  const std::string name = UniqueName("foreign");
  Unlinker unlink{name};
  int fd = ::shm_open(name.c_str(), O_RDWR | O_CREAT | O_EXCL, 0600);
  ASSERT_GE(fd, 0);
  ASSERT_EQ(::ftruncate(fd, 100), 0);
  ASSERT_EQ(::write(fd, "foreign data", 12), 12);

  std::error_code ec;
  EXPECT_FALSE(SharedMemory::OpenOrCreate(name, sizeof(SharedBlockData), ec));
  EXPECT_EQ(ec, std::errc::invalid_argument);
  EXPECT_EQ(RunChild(name, "fallback"), 0);
  char bytes[13] = {};
  ASSERT_EQ(::pread(fd, bytes, 12, 0), 12);
  EXPECT_STREQ(bytes, "foreign data");
  struct stat st;
  ASSERT_EQ(::fstat(fd, &st), 0);
  EXPECT_EQ(st.st_size, 100);

  // Others may read it: not trusted.
  ASSERT_EQ(::fchmod(fd, 0644), 0);
  EXPECT_FALSE(SharedMemory::OpenOrCreate(name, 100, ec));
  EXPECT_EQ(ec, std::errc::permission_denied);
  ::close(fd);
}

TEST(SharedGlobals, JoinOrInitialiseByState) {
  using namespace navmisc::detail;
  struct Case {
    const char* what;
    uint32_t state;
    uint32_t magic;
    uint32_t version;
    bool usable;
    bool keeps_data;
  } cases[] = {
      {"new", kSharedBlockNew, 0, 0, true, false},
      {"ready", kSharedBlockReady, kSharedBlockMagic, kSharedLayoutVersion, true, true},
      {"other magic", kSharedBlockReady, 0x1234, kSharedLayoutVersion, false, true},
      {"other layout", kSharedBlockReady, kSharedBlockMagic, kSharedLayoutVersion + 1, false,
       true},
      {"unknown state", 7, kSharedBlockMagic, kSharedLayoutVersion, false, true},
      // The initialiser died half-way: after the bounded wait the block is taken over.
      {"stuck initialising", kSharedBlockInitialising, 0, 0, true, false},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(c.what);
    auto block = std::make_unique<SharedBlockData>();
    std::memset(static_cast<void*>(block.get()), 0, sizeof *block);
    block->state = c.state;
    block->magic = c.magic;
    block->layoutVersion = c.version;
    block->blockSize = sizeof *block;
    block->nScanProgress = 42;
    EXPECT_EQ(JoinOrInitialiseBlock(*block), c.usable);
    EXPECT_EQ(block->nScanProgress, c.keeps_data ? 42 : 0);
    if (c.usable) {
      EXPECT_EQ(block->state, kSharedBlockReady);
      EXPECT_EQ(block->magic, kSharedBlockMagic);
    }
  }
}

TEST(SharedGlobals, PrivateBlockIsSharedWithForkedChildren) {
  const char* env = std::getenv("NAVMISC_SHM_NAME");
  if (!env || std::string(env) != "private")
    GTEST_SKIP() << "the test programs run with NAVMISC_SHM_NAME=private";
  EXPECT_STREQ(navmisc::SharedBlockName(), "private");
  EXPECT_EQ(navmisc::detail::SharedBlockSource(), SharedBlockOrigin::kPrivate);
  g_nCountOfProgress = 1;
  pid_t pid = ::fork();
  ASSERT_GE(pid, 0);
  if (pid == 0) {
    g_nCountOfProgress = 4242;
    ::_exit(0);
  }
  EXPECT_EQ(WaitChild(pid), 0);
  EXPECT_EQ(g_nCountOfProgress, 4242);
  g_nCountOfProgress = 0;
}

TEST(SharedGlobals, SetSharedTextCutsAndTerminates) {
  struct Case {
    const wchar_t* value;
    const wchar_t* stored;
  } cases[] = {
      {L"", L""}, {L"abc", L"abc"}, {L"1234567", L"1234567"}, {L"12345678", L"1234567"},
      {L"123456789012", L"1234567"}, {nullptr, L""},
  };
  for (const Case& c : cases) {
    wchar_t field[9];
    std::wmemset(field, L'#', 9);
    navmisc::SetSharedText(field, 8, c.value);
    EXPECT_STREQ(field, c.stored);
    EXPECT_EQ(field[8], L'#');  // nothing written past the capacity
  }
  wchar_t self[8] = L"abcdef";
  navmisc::SetSharedText(self, self + 2);
  EXPECT_STREQ(self, L"cdef");
}

TEST(CommandBlocks, DeviceDefaults) {
  auto block = std::make_unique<CDataControlCmdBlkKVDevice>();
  std::memset(static_cast<void*>(block.get()), 0xFF, sizeof *block);
  InitDeviceBlockDefaults(*block);
  EXPECT_EQ(block->nCmdType, 1);
  EXPECT_EQ(block->bMotionDetect, 1);
  EXPECT_EQ(block->bAccOn, 1);
  block->nCmdType = 0;
  block->bMotionDetect = 0;
  block->bAccOn = 0;
  const auto* bytes = reinterpret_cast<const unsigned char*>(block.get());
  for (size_t i = 0; i < sizeof *block; ++i) ASSERT_EQ(bytes[i], 0) << "byte " << i;

}

}  // namespace
