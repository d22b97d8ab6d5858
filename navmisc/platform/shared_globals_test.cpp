#include "navmisc/platform/shared_globals.h"

#include <fcntl.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstdlib>
#include <cstring>
#include <cwchar>
#include <filesystem>
#include <memory>
#include <string>
#include <tuple>

#include <gtest/gtest.h>

#include "navmisc/platform/detail/shared_block.h"
#include "navmisc/platform/shared_memory.h"
#include "testutil.h"

namespace {

using navmisc::SharedMemory;
using navmisc::detail::SharedBlockData;
using navmisc::detail::SharedBlockOrigin;
using navmisc::testutil::CommandResult;
using navmisc::testutil::RunCommand;
using navmisc::testutil::ShellQuote;

// ---- the child side: runs only when started by the tests below -------------------------------

const char* Role() { return std::getenv("NAVMISC_TEST_SHM_ROLE"); }

TEST(SharedGlobalsChild, DISABLED_Role) {
  const std::string role = Role() ? Role() : "";
  if (role.empty()) GTEST_SKIP() << "started by SharedGlobals tests only";
  const SharedBlockOrigin origin = navmisc::detail::SharedBlockSource();
  if (role == "write") {
    ASSERT_EQ(origin, SharedBlockOrigin::kNamedObject);
    navmisc::SetSharedText(g_szAppDataPath, L"/home/user/.local/share/navmisc");
    std::tie(g_nProductId, g_devConfig.nInterval, g_devConfig11.NAVI[28799], g_dDeviceVersion,
             g_bDeviceConnected, g_nScanProgress) =
        std::tuple(GPS_APP_SPORT, 5, 0xAB, 1.25, true, 77);
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

// Runs this test program again in `count` processes started together, each running only the
// child test, with `role`, the object's name and its own index in its environment. Status 0 when
// every child passed; the output is theirs.
CommandResult RunChildren(const std::string& shm_name, const std::string& role, int count = 1) {
  const std::string child =
      "NAVMISC_SHM_NAME=" + ShellQuote(shm_name) + " NAVMISC_TEST_SHM_ROLE=" + role +
      " NAVMISC_TEST_SHM_INDEX=$i " + ShellQuote(std::filesystem::read_symlink("/proc/self/exe")) +
      " --gtest_filter=SharedGlobalsChild.DISABLED_Role --gtest_also_run_disabled_tests";
  return RunCommand("i=0; pids=; while [ $i -lt " + std::to_string(count) + " ]; do " + child +
                    " & pids=\"$pids $!\"; i=$((i + 1)); done; failed=0;"
                    " for p in $pids; do wait $p || failed=1; done; exit $failed");
}

// Removes the object when the test ends, however it ends.
struct Unlinker {
  std::string name;
  ~Unlinker() { ::shm_unlink(name.c_str()); }
};

TEST(SharedGlobals, SeenByOtherProcesses) {
  const std::string name = UniqueName("share");
  Unlinker unlink{name};
  const CommandResult child = RunChildren(name, "write");
  ASSERT_EQ(child.status, 0) << child.out;

  // The object outlives the writer, readable only by its owner, and holds what it wrote.
  int fd = ::shm_open(name.c_str(), O_RDONLY, 0);
  ASSERT_GE(fd, 0);
  struct stat st;
  ASSERT_EQ(::fstat(fd, &st), 0);
  ::close(fd);
  EXPECT_EQ(std::tuple(st.st_mode & 0777, st.st_uid, static_cast<size_t>(st.st_size)),
            std::tuple(0600u, ::geteuid(), sizeof(SharedBlockData)));

  std::error_code ec;
  SharedMemory mem = SharedMemory::OpenExisting(name, ec);
  ASSERT_TRUE(mem) << ec.message();
  const auto& block = *static_cast<const SharedBlockData*>(mem.data());
  using namespace navmisc::detail;
  EXPECT_EQ(std::tuple(block.state, block.magic, block.layoutVersion),
            std::tuple(kSharedBlockReady, kSharedBlockMagic, kSharedLayoutVersion));
  EXPECT_EQ(std::tuple(int{block.nProductId}, block.nScanProgress, block.devConfig.nInterval,
                       int{block.devConfig11.NAVI[28799]}, block.dDeviceVersion,
                       block.bDeviceConnected),
            std::tuple(int{GPS_APP_SPORT}, 77, 5, 0xAB, 1.25, true));
  EXPECT_STREQ(block.szAppDataPath, L"/home/user/.local/share/navmisc");
}

TEST(SharedGlobals, ProcessesStartingTogetherInitialiseOnce) {
  // Had a late process initialised the block again, it would wipe the marks made before it.
  const std::string name = UniqueName("race");
  Unlinker unlink{name};
  constexpr int kChildren = 8;
  const CommandResult children = RunChildren(name, "mark", kChildren);
  EXPECT_EQ(children.status, 0) << children.out;
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
  const CommandResult child = RunChildren(name, "fallback");
  EXPECT_EQ(child.status, 0) << child.out;
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
  // A ready block of another layout is refused untouched; an initialiser that died half-way is
  // taken over after the bounded wait.
  const std::tuple<uint32_t, uint32_t, uint32_t, bool> cases[] = {
      {kSharedBlockReady, kSharedBlockMagic, kSharedLayoutVersion + 1, false},
      {kSharedBlockInitialising, 0, 0, true},
  };
  for (const auto& [state, magic, version, usable] : cases) {
    auto block = std::make_unique<SharedBlockData>();
    std::memset(static_cast<void*>(block.get()), 0, sizeof *block);
    std::tie(block->state, block->magic, block->layoutVersion) = std::tuple(state, magic, version);
    block->blockSize = sizeof *block;
    block->nScanProgress = 42;
    EXPECT_EQ(JoinOrInitialiseBlock(*block), usable) << state;
    EXPECT_EQ(block->nScanProgress, usable ? 0 : 42) << state;
    if (usable) {
      EXPECT_EQ(std::tuple(block->state, block->magic),
                std::tuple(kSharedBlockReady, kSharedBlockMagic));
    }
  }
}

TEST(SharedGlobals, SetSharedTextCutsAndTerminates) {
  // Cut to the capacity with room for the terminator; nothing written past it.
  for (const auto& [value, stored] :
       {std::pair{L"12345678", L"1234567"}, {L"1234567", L"1234567"}, {nullptr, L""}}) {
    wchar_t field[9];
    std::wmemset(field, L'#', 9);
    navmisc::SetSharedText(field, 8, value);
    EXPECT_STREQ(field, stored);
    EXPECT_EQ(field[8], L'#');
  }
  wchar_t self[8] = L"abcdef";
  navmisc::SetSharedText(self, self + 2);
  EXPECT_STREQ(self, L"cdef");
}

}  // namespace
