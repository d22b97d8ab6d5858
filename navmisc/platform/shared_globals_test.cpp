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

#include "navmisc/platform/data_root.h"
#include "navmisc/platform/detail/shared_globals_block.h"
#include "navmisc/platform/shared_memory.h"
#include "testutil.h"

namespace {

using navmisc::SharedBlockOrigin;
using navmisc::SharedMemory;
using navmisc::detail::SharedGlobals;
using navmisc::detail::SharedGlobalsBlock;
using navmisc::testutil::CommandResult;
using navmisc::testutil::RunCommand;
using navmisc::testutil::ShellQuote;
using navmisc::testutil::TempDir;

// ---- the child side: runs only when started by the tests below -------------------------------

const char* Role() { return std::getenv("NAVMISC_TEST_SHM_ROLE"); }

// The child's data root comes from NAVMISC_DATA_ROOT, read when the library is loaded.
TEST(SharedGlobalsChild, DISABLED_Role) {
  const std::string role = Role() ? Role() : "";
  if (role.empty()) GTEST_SKIP() << "started by SharedGlobals tests only";
  const int value = std::atoi(std::getenv("NAVMISC_TEST_SHM_VALUE"));
  if (role == "write") {
    ASSERT_EQ(SharedGlobals().origin(), SharedBlockOrigin::kNamedObject);
    std::tie(g_nProductId, g_sVersionInfo.nBuild) = std::tuple(GPS_APP_PROG_TYPE(value), value);
    navmisc::SetSharedText(g_szGapiInfo, std::to_wstring(value).c_str());
  } else if (role == "read") {
    ASSERT_EQ(SharedGlobals().origin(), SharedBlockOrigin::kNamedObject);
    EXPECT_EQ(std::tuple(int{g_nProductId}, g_sVersionInfo.nBuild), std::tuple(value, value));
    EXPECT_EQ(CString(g_szGapiInfo), CString(std::to_wstring(value).c_str()));
    EXPECT_EQ(CString(g_szAppDataPath), CString::FromUtf8(navmisc::ChosenDataRoot()));
  } else if (role == "mark") {
    ASSERT_EQ(SharedGlobals().origin(), SharedBlockOrigin::kNamedObject);
    g_szGapiInfo[value] = L'x';
  } else if (role == "fallback") {
    EXPECT_EQ(SharedGlobals().origin(), SharedBlockOrigin::kFallback);
    g_sVersionInfo.nBuild = value;  // must land in the private block
    EXPECT_EQ(g_sVersionInfo.nBuild, value);
  } else {
    FAIL() << "unknown role " << role;
  }
}

// ---- the parent side ----------------------------------------------------------------------

// Runs this test program again in `count` processes started together, each running only the
// child test with `role`, the data root `root` inherited through the environment and `value`
// (plus its own index, when `indexed`). Status 0 when every child passed; the output is theirs.
CommandResult RunChildren(const CString& root, const std::string& role, int value, int count = 1,
                          bool indexed = false) {
  const std::string child =
      "NAVMISC_DATA_ROOT=" + ShellQuote(root.ToUtf8()) + " NAVMISC_TEST_SHM_ROLE=" + role +
      " NAVMISC_TEST_SHM_VALUE=$((" + std::to_string(value) + (indexed ? " + i" : "") + ")) " +
      ShellQuote(std::filesystem::read_symlink("/proc/self/exe")) +
      " --gtest_filter=SharedGlobalsChild.DISABLED_Role --gtest_also_run_disabled_tests 2>&1";
  return RunCommand("i=0; pids=; while [ $i -lt " + std::to_string(count) + " ]; do " + child +
                    " & pids=\"$pids $!\"; i=$((i + 1)); done; failed=0;"
                    " for p in $pids; do wait $p || failed=1; done; exit $failed");
}

// A data root whose shared objects are removed when the test ends, however it ends.
struct RootWithObjects {
  TempDir dir;
  ~RootWithObjects() { navmisc::RemovePerRootObjects(dir.path()); }
  std::string ObjectName() const {
    return navmisc::PerRootObjectName("globals", navmisc::CanonicalDataRoot(dir.path())) + "-v" +
           std::to_string(navmisc::detail::kSharedGlobalsType.layoutVersion);
  }
};

TEST(SharedGlobals, EachDataRootItsOwn) {
  RootWithObjects a, b;
  // What one process writes on root A, a later process on A sees, and one on B never does:
  // a run on B must not redirect a run on A.
  ASSERT_EQ(RunChildren(a.dir.path(), "write", 22).status, 0);
  ASSERT_EQ(RunChildren(b.dir.path(), "write", 55).status, 0);
  const CommandResult readA = RunChildren(a.dir.path(), "read", 22);
  EXPECT_EQ(readA.status, 0) << readA.out;
  const CommandResult readB = RunChildren(b.dir.path(), "read", 55);
  EXPECT_EQ(readB.status, 0) << readB.out;

  // The objects outlive their writers, readable only by their owner.
  int fd = ::shm_open(a.ObjectName().c_str(), O_RDONLY, 0);
  ASSERT_GE(fd, 0) << a.ObjectName();
  struct stat st;
  ASSERT_EQ(::fstat(fd, &st), 0);
  ::close(fd);
  EXPECT_EQ(std::tuple(st.st_mode & 0777, st.st_uid, static_cast<size_t>(st.st_size)),
            std::tuple(0600u, ::geteuid(), sizeof(SharedGlobalsBlock)));

  // This process moves between the roots through the same references; another spelling of a
  // root (through a link, with "..") is the same root.
  const CString link = b.dir / L"link-to-a";
  ASSERT_EQ(::symlink(a.dir.path().ToUtf8().c_str(), link.ToUtf8().c_str()), 0);
  const GPS_APP_PROG_TYPE& product = g_nProductId;
  for (const auto& [root, expected] :
       {std::pair{b.dir.path(), 55}, {link, 22}, {b.dir / L"x/..", 55}}) {
    ASSERT_TRUE(navmisc::UseDataRoot(root)) << root.ToUtf8();
    EXPECT_EQ(std::tuple(int{product}, g_sVersionInfo.nBuild), std::tuple(expected, expected));
    EXPECT_EQ(std::getenv(navmisc::kDataRootVariable), navmisc::ChosenDataRoot());
  }
  EXPECT_EQ(CString(g_szAppDataPath), b.dir.path());
  EXPECT_FALSE(navmisc::UseDataRoot(L""));
}

TEST(SharedGlobals, ProcessesStartingTogetherInitialiseOnce) {
  // Had a late process initialised the block again, it would wipe the marks made before it.
  RootWithObjects root;
  constexpr int kChildren = 8;
  const CommandResult children = RunChildren(root.dir.path(), "mark", 0, kChildren, true);
  EXPECT_EQ(children.status, 0) << children.out;
  std::error_code ec;
  SharedMemory mem = SharedMemory::OpenExisting(root.ObjectName(), ec);
  ASSERT_TRUE(mem) << ec.message();
  const auto& block = *static_cast<const SharedGlobalsBlock*>(mem.data());
  for (int i = 0; i < kChildren; ++i) EXPECT_EQ(block.szGapiInfo[i], L'x') << "mark " << i;
}

TEST(SharedGlobals, ForeignObjectIsLeftAlone) {
  RootWithObjects root;
  const std::string name = root.ObjectName();
  int fd = ::shm_open(name.c_str(), O_RDWR | O_CREAT | O_EXCL, 0600);
  ASSERT_GE(fd, 0);
  ASSERT_EQ(::ftruncate(fd, 100), 0);
  ASSERT_EQ(::write(fd, "foreign data", 12), 12);

  std::error_code ec;
  EXPECT_FALSE(SharedMemory::OpenOrCreate(name, sizeof(SharedGlobalsBlock), ec));
  EXPECT_EQ(ec, std::errc::invalid_argument);
  const CommandResult child = RunChildren(root.dir.path(), "fallback", 9);
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
  using namespace navmisc;
  constexpr SharedBlockType type = detail::kSharedGlobalsType;
  // A ready block of another layout is refused untouched; an initialiser that died half-way is
  // taken over after the bounded wait.
  const std::tuple<uint32_t, uint32_t, uint32_t, bool> cases[] = {
      {kSharedBlockReady, type.magic, type.layoutVersion + 1, false},
      {kSharedBlockInitialising, 0, 0, true},
  };
  for (const auto& [state, magic, version, usable] : cases) {
    auto block = std::make_unique<SharedGlobalsBlock>();
    std::memset(static_cast<void*>(block.get()), 0, sizeof *block);
    std::tie(block->header.state, block->header.magic, block->header.layoutVersion) =
        std::tuple(state, magic, version);
    block->header.blockSize = sizeof *block;
    block->sVersionInfo.nBuild = 42;
    bool fresh = false;
    EXPECT_EQ(JoinOrInitialiseBlock(block->header, type, fresh), usable) << state;
    EXPECT_EQ(std::tuple(fresh, block->sVersionInfo.nBuild), std::tuple(usable, usable ? 0 : 42));
    if (usable) {
      EXPECT_EQ(std::tuple(block->header.state, block->header.magic),
                std::tuple(kSharedBlockReady, type.magic));
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
