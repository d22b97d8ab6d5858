#include "navmisc/platform/msg_queue.h"

#include <errno.h>
#include <linux/futex.h>
#include <sys/syscall.h>
#include <time.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <cstring>
#include <string_view>

#include "navmisc/platform/cstring.h"
#include "navmisc/platform/data_root.h"
#include "navmisc/platform/detail/crc32c.h"
#include "navmisc/platform/detail/msg_ring.h"

namespace navmisc {
namespace detail {

pid_t RobustMutexOwner(const pthread_mutex_t& m) {
  // The kernel's robust-futex protocol keeps the owner's thread id in the low 30 bits of the
  // lock word (the top bits flag waiters and a dead owner).
  const unsigned word = static_cast<unsigned>(__atomic_load_n(&m.__data.__lock, __ATOMIC_RELAXED));
  return static_cast<pid_t>(word & 0x3FFFFFFFu);
}

}  // namespace detail

namespace {

using detail::kMsgFrameMark;
using detail::kMsgRingDataOffset;
using detail::MsgFrameHeader;
using detail::MsgRingHeader;

// "NMQR" in memory. The layout version is part of the object's name.
constexpr SharedBlockType kRingType = {"queue", 0x52514D4E, 2, sizeof(MsgRingHeader)};
constexpr size_t kFrameHeaderSize = sizeof(MsgFrameHeader);
// A message larger than the ring goes in parts of at least this many bytes (or its rest), so a
// nearly full ring does not chop it into crumbs.
constexpr size_t kMinPart = 64 * 1024;
// Waits are cut into slices of this length and the condition looked at again, so that a lock
// whose owner died while this process waited for it is noticed, and so that no wait depends on
// a single wake-up.
constexpr long kWaitSliceMs = 1000;
constexpr int kMinCapacityKiB = 4;
constexpr int kMaxCapacityKiB = 1 << 20;

static_assert(kFrameHeaderSize % 8 == 0);

size_t Align8(size_t n) { return (n + 7) & ~size_t{7}; }

// A point in time on the monotonic clock, or none (wait forever).
class Deadline {
 public:
  explicit Deadline(uint32_t ms) : forever_(ms == kSysMsgWaitForever) {
    ::clock_gettime(CLOCK_MONOTONIC, &at_);
    if (forever_) return;
    at_.tv_sec += ms / 1000;
    at_.tv_nsec += static_cast<long>(ms % 1000) * 1000000L;
    Normalise(at_);
  }
  bool forever() const { return forever_; }
  bool Passed() const {
    if (forever_) return false;
    struct timespec now;
    ::clock_gettime(CLOCK_MONOTONIC, &now);
    return now.tv_sec > at_.tv_sec || (now.tv_sec == at_.tv_sec && now.tv_nsec >= at_.tv_nsec);
  }
  // The end of the next wait: the deadline or one slice from now, whichever comes first.
  struct timespec NextWake() const {
    struct timespec slice;
    ::clock_gettime(CLOCK_MONOTONIC, &slice);
    slice.tv_nsec += kWaitSliceMs * 1000000L;
    Normalise(slice);
    if (forever_) return slice;
    const bool deadlineFirst =
        at_.tv_sec < slice.tv_sec || (at_.tv_sec == slice.tv_sec && at_.tv_nsec < slice.tv_nsec);
    return deadlineFirst ? at_ : slice;
  }

 private:
  static void Normalise(struct timespec& t) {
    while (t.tv_nsec >= 1000000000L) {
      t.tv_nsec -= 1000000000L;
      ++t.tv_sec;
    }
  }
  bool forever_;
  struct timespec at_;
};

void CountRecovery(MsgRingHeader& r) {
  std::atomic_ref<uint64_t>(r.recoveries).fetch_add(1, std::memory_order_relaxed);
}

// A lock whose owner died is taken over as it is: the ring's indices only ever move after the
// bytes they cover are complete, so a dead owner leaves at worst the parts of an unfinished
// message, which receivers recognise and discard.
int TakeOver(MsgRingHeader& r, pthread_mutex_t& m, int rc) {
  if (rc == EOWNERDEAD) {
    ::pthread_mutex_consistent(&m);
    CountRecovery(r);
    return 0;
  }
  return rc;
}

// Locks `m`, waiting until `deadline` (in slices, so that a lock whose owner dies while we
// wait is taken over like any other).
int Lock(MsgRingHeader& r, pthread_mutex_t& m, const Deadline& deadline) {
  for (;;) {
    const struct timespec wake = deadline.NextWake();
    const int rc = TakeOver(r, m, ::pthread_mutex_clocklock(&m, CLOCK_MONOTONIC, &wake));
    if (rc != ETIMEDOUT || deadline.Passed()) return rc;
  }
}

// Waits on `cond` (ringLock held, and held again on return) until a broadcast, the deadline or
// the end of a slice. The sequence word is read under the lock, and every broadcast changes it
// under the lock, so a broadcast between the unlock and the futex wait makes the wait return at
// once: no wake-up is lost.
void Wait(MsgRingHeader& r, detail::SharedCondition& cond, const Deadline& deadline) {
  std::atomic_ref<uint32_t> seq(cond.seq), waiters(cond.waiters);
  const uint32_t seen = seq.load(std::memory_order_relaxed);
  waiters.fetch_add(1, std::memory_order_relaxed);
  ::pthread_mutex_unlock(&r.ringLock);
  const struct timespec wake = deadline.NextWake();
  // FUTEX_WAIT_BITSET takes an absolute time on CLOCK_MONOTONIC.
  ::syscall(SYS_futex, &cond.seq, FUTEX_WAIT_BITSET, seen, &wake, nullptr, FUTEX_BITSET_MATCH_ANY);
  waiters.fetch_sub(1, std::memory_order_relaxed);
  TakeOver(r, r.ringLock, ::pthread_mutex_lock(&r.ringLock));
}

// Wakes every waiter of `cond` (ringLock held).
void Broadcast(detail::SharedCondition& cond) {
  std::atomic_ref<uint32_t>(cond.seq).fetch_add(1, std::memory_order_release);
  if (std::atomic_ref<uint32_t>(cond.waiters).load(std::memory_order_relaxed) != 0)
    ::syscall(SYS_futex, &cond.seq, FUTEX_WAKE, INT32_MAX, nullptr, nullptr, 0);
}

class Unlocker {
 public:
  explicit Unlocker(pthread_mutex_t& m) : m_(&m) {}
  ~Unlocker() {
    if (m_) ::pthread_mutex_unlock(m_);
  }
  Unlocker(const Unlocker&) = delete;
  Unlocker& operator=(const Unlocker&) = delete;

 private:
  pthread_mutex_t* m_;
};

// The ring lock, released while bytes are copied: the one sender (holding the write lock)
// copies into room that no receiver looks at until the tail moves, and the one receiver
// (holding the read lock) copies out of bytes that no sender touches until the head moves, so
// both copies run outside the lock and at the same time.
class RingLock {
 public:
  explicit RingLock(MsgRingHeader& r) : r_(r) {}
  ~RingLock() {
    if (held_) ::pthread_mutex_unlock(&r_.ringLock);
  }
  RingLock(const RingLock&) = delete;
  RingLock& operator=(const RingLock&) = delete;
  bool Lock(const Deadline& deadline) { return held_ = navmisc::Lock(r_, r_.ringLock, deadline) == 0; }
  void Unlock() {
    ::pthread_mutex_unlock(&r_.ringLock);
    held_ = false;
  }

 private:
  MsgRingHeader& r_;
  bool held_ = false;
};

void InitialiseRing(SharedBlockHeader& header) {
  auto& r = reinterpret_cast<MsgRingHeader&>(header);
  pthread_mutexattr_t ma;
  ::pthread_mutexattr_init(&ma);
  ::pthread_mutexattr_setpshared(&ma, PTHREAD_PROCESS_SHARED);
  ::pthread_mutexattr_setrobust(&ma, PTHREAD_MUTEX_ROBUST);
  for (pthread_mutex_t* m : {&r.ringLock, &r.writeLock, &r.readLock}) ::pthread_mutex_init(m, &ma);
  ::pthread_mutexattr_destroy(&ma);
  // The conditions start as zeros, as the block was filled.
}

bool ValidQueueName(std::string_view name) {
  if (name.empty() || name.size() > 64) return false;
  return std::all_of(name.begin(), name.end(), [](char c) {
    return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || (c >= '0' && c <= '9') ||
           c == '_' || c == '-' || c == '.';
  });
}

uint32_t FrameCrc(const MsgFrameHeader& f, const void* part) {
  uint8_t fields[12];
  const uint32_t values[3] = {f.total, f.offset, f.length};
  for (int i = 0; i < 3; ++i)
    for (int b = 0; b < 4; ++b) fields[4 * i + b] = static_cast<uint8_t>(values[i] >> (8 * b));
  return detail::Crc32c(part, f.length, detail::Crc32c(fields, sizeof fields));
}

// The bytes of the ring, seen through the shared header.
struct RingView {
  MsgRingHeader& r;
  uint8_t* data;
  uint32_t capacity;

  uint64_t Used() const { return r.tail - r.head; }
  uint64_t Free() const { return capacity - Used(); }
  void CopyIn(uint64_t pos, const void* src, size_t n) {
    const size_t at = pos % capacity, first = std::min<size_t>(n, capacity - at);
    std::memcpy(data + at, src, first);
    std::memcpy(data, static_cast<const uint8_t*>(src) + first, n - first);
  }
  void CopyOut(uint64_t pos, void* dst, size_t n) const {
    const size_t at = pos % capacity, first = std::min<size_t>(n, capacity - at);
    std::memcpy(dst, data + at, first);
    std::memcpy(static_cast<uint8_t*>(dst) + first, data, n - first);
  }
};

// A message being put together from its parts by a receiver.
struct Assembly {
  std::unique_ptr<uint8_t[]> bytes;
  uint32_t seq = 0, total = 0, got = 0;
  bool active = false;

  void Start(const MsgFrameHeader& f) {
    bytes.reset(new uint8_t[std::max<uint32_t>(f.total, 1)]);
    seq = f.seq;
    total = f.total;
    got = 0;
    active = true;
  }
  bool Continues(const MsgFrameHeader& f) const {
    return active && f.seq == seq && f.total == total && f.offset == got;
  }
  void Drop() {
    bytes.reset();
    active = false;
  }
};

}  // namespace
}  // namespace navmisc

using navmisc::detail::MsgFrameHeader;
using navmisc::detail::MsgRingHeader;

CxSysMsgQueue::CxSysMsgQueue(const wchar_t* name, int capacityKiB, int flags) {
  const std::string& root = navmisc::ChosenDataRoot();
  const std::string kind = name ? CString(name).ToUtf8() : std::string();
  if (root.empty()) {
    error_ = std::make_error_code(std::errc::no_such_device_or_address);
    return;
  }
  const bool capacityUsed = flags == navmisc::kSysMsgOpenOrCreate;
  if (!navmisc::ValidQueueName(kind) ||
      (capacityUsed && (capacityKiB < navmisc::kMinCapacityKiB ||
                        capacityKiB > navmisc::kMaxCapacityKiB))) {
    error_ = std::make_error_code(std::errc::invalid_argument);
    return;
  }
  objectName_ = navmisc::PerRootObjectName(kind, root) + "-v" +
                std::to_string(navmisc::kRingType.layoutVersion);
  // An owner finding an object it cannot use (left by a crashed build of another ring size, say)
  // replaces it; a peer never does.
  if (!Open(capacityKiB, flags) && flags == navmisc::kSysMsgOpenOrCreate &&
      error_ != std::errc::permission_denied) {
    std::error_code ignored;
    navmisc::SharedMemory::Unlink(objectName_, ignored);
    Open(capacityKiB, flags);
  }
}

bool CxSysMsgQueue::Open(int capacityKiB, int flags) {
  error_.clear();
  const size_t wanted = navmisc::detail::kMsgRingDataOffset + size_t(capacityKiB) * 1024;
  memory_ = flags == navmisc::kSysMsgOpenExisting
                ? navmisc::SharedMemory::OpenExisting(objectName_, error_)
                : navmisc::SharedMemory::OpenOrCreate(objectName_, wanted, error_);
  if (!memory_) return false;
  const size_t size = memory_.size();
  if (size < navmisc::detail::kMsgRingDataOffset + size_t(navmisc::kMinCapacityKiB) * 1024 ||
      (size - navmisc::detail::kMsgRingDataOffset) % 8 != 0 ||
      size - navmisc::detail::kMsgRingDataOffset > size_t(navmisc::kMaxCapacityKiB) * 1024) {
    error_ = std::make_error_code(std::errc::invalid_argument);
    memory_ = {};
    return false;
  }
  auto* header = static_cast<navmisc::SharedBlockHeader*>(memory_.data());
  bool fresh = false;
  if (!navmisc::JoinOrInitialiseBlock(*header, navmisc::kRingType, fresh,
                                      navmisc::InitialiseRing)) {
    error_ = std::make_error_code(std::errc::invalid_argument);
    memory_ = {};
    return false;
  }
  ring_ = static_cast<MsgRingHeader*>(memory_.data());
  data_ = static_cast<uint8_t*>(memory_.data()) + navmisc::detail::kMsgRingDataOffset;
  capacity_ = static_cast<uint32_t>(size - navmisc::detail::kMsgRingDataOffset);
  return true;
}

CxSysMsgQueue::~CxSysMsgQueue() = default;

bool CxSysMsgQueue::Unlink() {
  if (objectName_.empty()) return false;
  std::error_code ec;
  return navmisc::SharedMemory::Unlink(objectName_, ec);
}

uint32_t CxSysMsgQueue::UsedBytes() const {
  if (!ring_) return 0;
  if (navmisc::Lock(*ring_, ring_->ringLock, navmisc::Deadline(navmisc::kSysMsgWaitForever)) != 0)
    return 0;
  const uint32_t used = static_cast<uint32_t>(ring_->tail - ring_->head);
  ::pthread_mutex_unlock(&ring_->ringLock);
  return used;
}

std::unique_ptr<uint8_t[]> CxSysMsgQueue::CopyOfKept() const {
  std::unique_ptr<uint8_t[]> copy(new uint8_t[std::max<uint32_t>(keptInfo_.nSize, 1)]);
  std::memcpy(copy.get(), kept_.get(), keptInfo_.nSize);
  return copy;
}

uint64_t CxSysMsgQueue::Recoveries() const {
  return ring_ ? std::atomic_ref<uint64_t>(ring_->recoveries).load() : 0;
}

bool CxSysMsgQueue::Send(const void* data, uint32_t size, uint32_t timeoutMs) {
  using namespace navmisc;
  if (!ring_ || size > kSysMsgMaxMessage || (size && !data)) return false;
  MsgRingHeader& r = *ring_;
  RingView ring{r, data_, capacity_};
  const Deadline deadline(timeoutMs);
  const auto* bytes = static_cast<const uint8_t*>(data);
  const size_t maxPart = capacity_ - kFrameHeaderSize;
  // The checksum of a message sent whole is made before the lock is taken.
  MsgFrameHeader whole{kMsgFrameMark, 0, size, 0, size, 0};
  if (size <= maxPart) whole.crc = FrameCrc(whole, bytes);

  if (Lock(r, r.writeLock, deadline) != 0) return false;
  Unlocker writer(r.writeLock);
  RingLock locked(r);
  if (!locked.Lock(deadline)) return false;
  const uint32_t seq = r.nextSeq++;
  uint32_t offset = 0;
  do {
    const size_t rest = size - offset;
    // A message that fits the ring waits for room for all of it; only one larger than the ring
    // is split, into parts as large as the room allows.
    const size_t want = std::min(rest, maxPart);
    const size_t least = rest <= maxPart ? want : std::min(want, kMinPart);
    while (ring.Free() < Align8(kFrameHeaderSize + least)) {
      if (deadline.Passed()) return false;  // the receiver drops the parts already in
      Wait(r, r.notFull, deadline);
    }
    MsgFrameHeader f{kMsgFrameMark, seq, size, offset, 0, 0};
    f.length = static_cast<uint32_t>(std::min<uint64_t>(want, ring.Free() - kFrameHeaderSize));
    const uint64_t at = r.tail;
    locked.Unlock();
    f.crc = f.length == size ? whole.crc : FrameCrc(f, bytes + offset);
    ring.CopyIn(at, &f, kFrameHeaderSize);
    ring.CopyIn(at + kFrameHeaderSize, bytes + offset, f.length);
    if (!locked.Lock(Deadline(kSysMsgWaitForever))) return false;
    r.tail = at + Align8(kFrameHeaderSize + f.length);
    offset += f.length;
    Broadcast(r.notEmpty);
  } while (offset < size);
  return true;
}

std::unique_ptr<uint8_t[]> CxSysMsgQueue::Receive(uint32_t timeoutMs, CxSysMsgInfo* info,
                                                  int remove) {
  using namespace navmisc;
  if (info) *info = {};
  if (kept_) {
    if (info) *info = keptInfo_;
    return remove ? std::move(kept_) : CopyOfKept();
  }
  if (!ring_) return nullptr;
  MsgRingHeader& r = *ring_;
  RingView ring{r, data_, capacity_};
  const Deadline deadline(timeoutMs);
  if (Lock(r, r.readLock, deadline) != 0) return nullptr;
  Unlocker reader(r.readLock);
  RingLock locked(r);
  if (!locked.Lock(Deadline(kSysMsgWaitForever))) return nullptr;

  Assembly message;
  for (;;) {
    if (ring.Used() >= kFrameHeaderSize) {
      MsgFrameHeader f;
      ring.CopyOut(r.head, &f, kFrameHeaderSize);
      const uint64_t frameBytes = Align8(kFrameHeaderSize + f.length);
      if (f.mark != kMsgFrameMark || f.total > kSysMsgMaxMessage || f.length > f.total ||
          f.offset > f.total - f.length || frameBytes > ring.Used()) {
        // Not a frame where one must begin: the ring was written by something else. Nothing in
        // it can be trusted to be found again, so all of it goes.
        r.head = r.tail;
        ++r.discarded;
        message.Drop();
        Broadcast(r.notFull);
        continue;
      }
      // A first part starts a message (dropping one left unfinished by a dead sender); other
      // parts belong to the message being put together, or to one whose receiver died half-way.
      if (f.offset == 0) message.Start(f);
      const bool take = message.Continues(f);
      bool intact = true;
      if (take) {
        const uint64_t at = r.head;
        locked.Unlock();
        ring.CopyOut(at + kFrameHeaderSize, message.bytes.get() + f.offset, f.length);
        intact = FrameCrc(f, message.bytes.get() + f.offset) == f.crc;
        if (!locked.Lock(Deadline(kSysMsgWaitForever))) return nullptr;
      }
      r.head += frameBytes;
      Broadcast(r.notFull);
      if (!take || !intact) {
        ++r.discarded;
        if (!intact) message.Drop();
        continue;
      }
      message.got += f.length;
      if (message.got < message.total) continue;
      CxSysMsgInfo got{message.total, message.seq};
      if (info) *info = got;
      if (!remove) {
        keptInfo_ = got;
        kept_ = std::move(message.bytes);
        return CopyOfKept();
      }
      return std::move(message.bytes);
    }
    if (message.active) {
      // The rest of a message in parts is still to come from a sender holding the write lock.
      // If nobody alive holds it, the sender died or gave up half-way.
      const int rc = TakeOver(r, r.writeLock, ::pthread_mutex_trylock(&r.writeLock));
      if (rc == 0) {
        ::pthread_mutex_unlock(&r.writeLock);
        ++r.discarded;
        message.Drop();
        continue;
      }
      Wait(r, r.notEmpty, Deadline(kSysMsgWaitForever));
      continue;
    }
    if (deadline.Passed()) return nullptr;
    Wait(r, r.notEmpty, deadline);
  }
}
