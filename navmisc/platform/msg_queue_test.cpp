#include "navmisc/platform/msg_queue.h"

#include <fcntl.h>
#include <signal.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <cstdio>
#include <cstring>
#include <string>
#include <thread>
#include <tuple>
#include <vector>

#include "navmisc/platform/data_root.h"
#include "navmisc/platform/detail/crc32c.h"
#include "navmisc/platform/detail/msg_ring.h"
#include "testutil.h"

namespace {

using navmisc::detail::MsgFrameHeader;
using navmisc::testutil::TempDir;

constexpr int kSmallRingKiB = 4;

std::string Pattern(size_t n, unsigned seed) {
  std::string s(n, '\0');
  for (size_t i = 0; i < n; ++i) s[i] = static_cast<char>((i * 131 + seed * 7) >> 3);
  return s;
}

std::string Take(CxSysMsgQueue& q, uint32_t timeoutMs = 5000) {
  CxSysMsgInfo info;
  auto m = q.Receive(timeoutMs, &info);
  return m ? std::string(reinterpret_cast<const char*>(m.get()), info.nSize) : "<none>";
}

bool Put(CxSysMsgQueue& q, const std::string& s, uint32_t timeoutMs = navmisc::kSysMsgWaitForever) {
  return q.Send(s.data(), static_cast<uint32_t>(s.size()), timeoutMs);
}

// Waits (bounded) until `done` holds.
template <class F>
bool Eventually(F done, int ms = 10000) {
  for (int waited = 0; waited < ms; waited += 5) {
    if (done()) return true;
    std::this_thread::sleep_for(std::chrono::milliseconds(5));
  }
  return done();
}

// A process forked from the test that runs `work` and then waits to be killed. `ready` is
// written by the child once it is in position.
struct ForkedPeer {
  pid_t pid = -1;
  ~ForkedPeer() { KillNow(); }
  template <class F>
  bool Start(F work) {
    int fds[2];
    if (::pipe(fds) != 0) return false;
    std::fflush(nullptr);  // the child must not write the test's buffered output again
    pid = ::fork();
    if (pid == 0) {
      ::close(fds[0]);
      work(fds[1]);
      for (;;) ::pause();
    }
    ::close(fds[1]);
    char c;
    const bool ok = ::read(fds[0], &c, 1) == 1;
    ::close(fds[0]);
    return ok;
  }
  void KillNow() {
    if (pid <= 0) return;
    ::kill(pid, SIGKILL);
    ::waitpid(pid, nullptr, 0);
    pid = -1;
  }
};

TEST(Crc32c, StandardCheckValueAndEveryBlockBoundary) {
  EXPECT_EQ(navmisc::detail::Crc32c("123456789", 9), 0xE3069283u);
  EXPECT_EQ(navmisc::detail::Crc32cPortable("123456789", 9), 0xE3069283u);
  const std::string data = Pattern(3 * 8192 * 2 + 3 * 256 * 3 + 13, 5);
  for (size_t n : {0ul, 1ul, 7ul, 8ul, 767ul, 768ul, 769ul, 24575ul, 24576ul, 24577ul, data.size()}) {
    EXPECT_EQ(navmisc::detail::Crc32c(data.data(), n), navmisc::detail::Crc32cPortable(data.data(), n)) << n;
    // Continuing from a previous value is the same as one pass.
    const uint32_t first = navmisc::detail::Crc32c(data.data(), n / 3);
    EXPECT_EQ(navmisc::detail::Crc32c(data.data() + n / 3, n - n / 3, first),
              navmisc::detail::Crc32c(data.data(), n)) << n;
  }
}

class MsgQueue : public ::testing::Test {
 protected:
  void SetUp() override { ASSERT_TRUE(navmisc::UseDataRoot(root_.path())); }
  void TearDown() override { navmisc::RemovePerRootObjects(root_.path()); }
  TempDir root_;
};

TEST_F(MsgQueue, MessagesOfEverySizeArriveWholeAndInOrder) {
  CxSysMsgQueue sender(L"Data_Control_Send", kSmallRingKiB, navmisc::kSysMsgOpenOrCreate);
  ASSERT_TRUE(sender.IsValid()) << sender.error().message();
  CxSysMsgQueue receiver(L"Data_Control_Send", 0, navmisc::kSysMsgOpenExisting);
  ASSERT_TRUE(receiver.IsValid()) << receiver.error().message();
  const uint32_t cap = sender.capacity();
  ASSERT_EQ(cap, kSmallRingKiB * 1024u);
  const size_t oneFrame = cap - sizeof(MsgFrameHeader);
  // Around the largest message that goes in one frame, and far beyond the ring.
  const std::vector<size_t> sizes = {0, 1, 7, 100, oneFrame - 1, oneFrame, oneFrame + 1,
                                     3 * cap + 5, 5u << 20};
  std::thread producer([&] {
    for (size_t i = 0; i < sizes.size(); ++i) EXPECT_TRUE(Put(sender, Pattern(sizes[i], i)));
  });
  for (size_t i = 0; i < sizes.size(); ++i) {
    CxSysMsgInfo info;
    auto m = receiver.Receive(10000, &info);
    ASSERT_TRUE(m) << "message " << i;
    EXPECT_EQ(info.nSize, sizes[i]);
    EXPECT_EQ(std::string(reinterpret_cast<const char*>(m.get()), info.nSize), Pattern(sizes[i], i))
        << "message of " << sizes[i] << " bytes";
  }
  producer.join();
  EXPECT_EQ(receiver.UsedBytes(), 0u);
  EXPECT_EQ(receiver.ring()->discarded, 0u);

  // A message kept with `remove` 0 comes again, then is gone.
  ASSERT_TRUE(Put(sender, "kept"));
  CxSysMsgInfo info;
  auto peeked = receiver.Receive(1000, &info, 0);
  ASSERT_TRUE(peeked);
  EXPECT_EQ(std::string(reinterpret_cast<char*>(peeked.get()), info.nSize), "kept");
  EXPECT_EQ(Take(receiver, 0), "kept");
  EXPECT_EQ(Take(receiver, 0), "<none>");
  EXPECT_FALSE(sender.Send("x", navmisc::kSysMsgMaxMessage + 1u));
}

TEST_F(MsgQueue, FullRingMakesTheSenderWaitAndLosesNothing) {
  CxSysMsgQueue q(L"full", kSmallRingKiB, navmisc::kSysMsgOpenOrCreate);
  ASSERT_TRUE(q.IsValid());
  const std::string block = Pattern(1000, 1);
  int queued = 0;
  while (Put(q, Pattern(1000, queued), 0)) ++queued;
  ASSERT_GT(queued, 0);
  const uint32_t used = q.UsedBytes();
  EXPECT_GT(used + 1024 + sizeof(MsgFrameHeader), q.capacity());
  EXPECT_FALSE(Put(q, block, 50));  // a bounded send gives up and leaves the ring as it was
  EXPECT_EQ(q.UsedBytes(), used);

  std::atomic<bool> sent{false};
  std::thread late([&] {
    EXPECT_TRUE(Put(q, "last"));
    sent = true;
  });
  std::this_thread::sleep_for(std::chrono::milliseconds(200));
  EXPECT_FALSE(sent);  // nobody has read: still waiting for room
  EXPECT_EQ(Take(q), Pattern(1000, 0));
  late.join();
  for (int i = 1; i < queued; ++i) EXPECT_EQ(Take(q, 0), Pattern(1000, i)) << i;
  EXPECT_EQ(Take(q, 0), "last");
}

TEST_F(MsgQueue, PeerKilledHoldingTheRingLockBlocksNobody) {
  CxSysMsgQueue q(L"Data_Control_Recv", kSmallRingKiB, navmisc::kSysMsgOpenOrCreate);
  ASSERT_TRUE(q.IsValid());
  ASSERT_TRUE(Put(q, "before"));
  ForkedPeer peer;
  ASSERT_TRUE(peer.Start([&](int ready) {
    // Kept mapped until the kill, as in a process that dies inside the lock: the kernel can
    // mark a dead owner only in a lock it can still reach.
    auto* mine = new CxSysMsgQueue(L"Data_Control_Recv", 0, navmisc::kSysMsgOpenExisting);
    if (!mine->IsValid() || ::pthread_mutex_lock(&mine->ring()->ringLock) != 0) ::_exit(1);
    (void)!::write(ready, "x", 1);
  }));
  EXPECT_EQ(navmisc::detail::RobustMutexOwner(q.ring()->ringLock), peer.pid);
  peer.KillNow();

  // Both directions go on; the lock is taken over once.
  EXPECT_EQ(Take(q), "before");
  EXPECT_TRUE(Put(q, "after"));
  EXPECT_EQ(Take(q), "after");
  EXPECT_EQ(q.Recoveries(), 1u);
  EXPECT_EQ(navmisc::detail::RobustMutexOwner(q.ring()->ringLock), 0);
}

TEST_F(MsgQueue, PeersKilledWhileWaitingBlockNobody) {
  // One peer waits for a message, another for room in the full ring; both are killed there.
  CxSysMsgQueue q(L"waiting", kSmallRingKiB, navmisc::kSysMsgOpenOrCreate);
  ASSERT_TRUE(q.IsValid());
  ForkedPeer receiver, sender;
  ASSERT_TRUE(receiver.Start([&](int ready) {
    CxSysMsgQueue mine(L"waiting", 0, navmisc::kSysMsgOpenExisting);
    (void)!::write(ready, "x", 1);
    mine.Receive(navmisc::kSysMsgWaitForever, nullptr);
  }));
  ASSERT_TRUE(Eventually([&] { return q.ring()->notEmpty.waiters == 1; }));
  receiver.KillNow();
  int queued = 0;
  while (Put(q, Pattern(1000, queued), 0)) ++queued;
  ASSERT_TRUE(sender.Start([&](int ready) {
    CxSysMsgQueue mine(L"waiting", 0, navmisc::kSysMsgOpenExisting);
    (void)!::write(ready, "x", 1);
    Put(mine, "never");
  }));
  ASSERT_TRUE(Eventually([&] { return q.ring()->notFull.waiters == 1; }));
  sender.KillNow();

  // Waking the dead costs nothing; the living go on.
  for (int i = 0; i < queued; ++i) EXPECT_EQ(Take(q), Pattern(1000, i));
  std::thread late([&] {
    std::this_thread::sleep_for(std::chrono::milliseconds(50));
    EXPECT_TRUE(Put(q, "late"));
  });
  EXPECT_EQ(Take(q), "late");
  late.join();
}

TEST_F(MsgQueue, SenderKilledHalfWayThroughALargeMessage) {
  CxSysMsgQueue q(L"half", kSmallRingKiB, navmisc::kSysMsgOpenOrCreate);
  ASSERT_TRUE(q.IsValid());
  ForkedPeer peer;
  // The peer starts a message three rings long; with nobody reading it fills the ring and waits
  // for room, holding the write lock.
  ASSERT_TRUE(peer.Start([&](int ready) {
    CxSysMsgQueue mine(L"half", 0, navmisc::kSysMsgOpenExisting);
    (void)!::write(ready, "x", 1);
    Put(mine, Pattern(3 * mine.capacity(), 9));
  }));
  ASSERT_TRUE(Eventually([&] { return q.UsedBytes() > q.capacity() / 2; }));
  ASSERT_TRUE(Eventually(
      [&] { return navmisc::detail::RobustMutexOwner(q.ring()->writeLock) == peer.pid; }));
  peer.KillNow();

  // The receiver takes the first part, finds the sender gone and drops the message; the next
  // sender is not held up.
  EXPECT_EQ(Take(q, 200), "<none>");
  EXPECT_GE(q.ring()->discarded, 1u);
  EXPECT_TRUE(Put(q, "next"));
  EXPECT_EQ(Take(q), "next");
}

TEST_F(MsgQueue, FramesThatCannotBeTrustedAreDropped) {
  // What a receiver that died half-way, a stray write or a torn copy leaves in the ring. A frame
  // that is wrong in itself is skipped; bytes that are not a frame at all leave nothing in the
  // ring that could be found again, so everything waiting goes.
  struct Case {
    const char* what;
    void (*spoil)(MsgFrameHeader& frame);
    const char* next;  // what the receiver gets instead of the spoilt message
  };
  const Case cases[] = {
      {"a changed byte", [](MsgFrameHeader& f) { reinterpret_cast<uint8_t*>(&f + 1)[2] ^= 1; }, "fine"},
      {"a changed length", [](MsgFrameHeader& f) { f.total += 1; }, "fine"},
      {"a part without its beginning",
       [](MsgFrameHeader& f) { std::tie(f.offset, f.length) = std::tuple(2u, 4u); }, "fine"},
      {"not a frame", [](MsgFrameHeader& f) { f.mark = 0; }, "<none>"},
  };
  for (const Case& c : cases) {
    CxSysMsgQueue q(L"spoilt", kSmallRingKiB, navmisc::kSysMsgOpenOrCreate);
    ASSERT_TRUE(q.IsValid());
    ASSERT_TRUE(Put(q, "spoilt"));
    c.spoil(*reinterpret_cast<MsgFrameHeader*>(reinterpret_cast<uint8_t*>(q.ring()) +
                                               navmisc::detail::kMsgRingDataOffset));
    ASSERT_TRUE(Put(q, "fine"));
    EXPECT_EQ(Take(q, 0), c.next) << c.what;
    EXPECT_EQ(q.ring()->discarded, 1u) << c.what;
    EXPECT_TRUE(Put(q, "again"));
    EXPECT_EQ(Take(q, 0), "again") << c.what;
    q.Unlink();
  }
}

TEST_F(MsgQueue, EachUserAndDataRootHasItsOwnQueues) {
  CxSysMsgQueue a(L"Data_Control_Recv", kSmallRingKiB, navmisc::kSysMsgOpenOrCreate);
  ASSERT_TRUE(a.IsValid());
  ASSERT_TRUE(Put(a, "for root A"));
  struct stat st;
  int fd = ::shm_open(a.objectName().c_str(), O_RDONLY, 0);
  ASSERT_GE(fd, 0);
  ASSERT_EQ(::fstat(fd, &st), 0);
  ::close(fd);
  EXPECT_EQ(st.st_mode & 0777, 0600u);
  EXPECT_NE(a.objectName().find("-" + std::to_string(::geteuid()) + "-"), std::string::npos);

  TempDir other;
  ASSERT_TRUE(navmisc::UseDataRoot(other.path()));
  {
    CxSysMsgQueue b(L"Data_Control_Recv", kSmallRingKiB, navmisc::kSysMsgOpenOrCreate);
    ASSERT_TRUE(b.IsValid());
    EXPECT_NE(b.objectName(), a.objectName());
    EXPECT_EQ(Take(b, 0), "<none>");
    CxSysMsgQueue peer(L"Data_Control_Send", 0, navmisc::kSysMsgOpenExisting);
    EXPECT_FALSE(peer.IsValid());  // nobody made it on this root
  }
  navmisc::RemovePerRootObjects(other.path());
  ASSERT_TRUE(navmisc::UseDataRoot(root_.path()));
  EXPECT_EQ(Take(a, 0), "for root A");

  // An object under the queue's name that is not the user's own alone is never used, by the
  // owner or a peer: one readable by others, or (where the test may give it away) one of
  // another user.
  const std::string name =
      CxSysMsgQueue(L"planted", kSmallRingKiB, navmisc::kSysMsgOpenOrCreate).objectName();
  for (bool otherUser : {false, true}) {
    if (otherUser && ::geteuid() != 0) continue;
    ::shm_unlink(name.c_str());
    fd = ::shm_open(name.c_str(), O_RDWR | O_CREAT | O_EXCL, 0644);
    ASSERT_GE(fd, 0);
    ASSERT_EQ(::ftruncate(fd, navmisc::detail::kMsgRingDataOffset + 4096), 0);
    if (otherUser) {
      ASSERT_EQ(::fchown(fd, 12345, 12345), 0);
      ASSERT_EQ(::fchmod(fd, 0600), 0);
    }
    ::close(fd);
    for (int flags : {navmisc::kSysMsgOpenOrCreate, navmisc::kSysMsgOpenExisting}) {
      CxSysMsgQueue planted(L"planted", kSmallRingKiB, flags);
      EXPECT_FALSE(planted.IsValid()) << otherUser << flags;
      EXPECT_EQ(planted.error(), std::errc::permission_denied);
    }
  }
  ::shm_unlink(name.c_str());
}

}  // namespace
