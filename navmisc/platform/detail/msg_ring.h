// The layout of a queue's shared object (see docs/data-control-channel.md, "Queue rings").
// Private to the library; tests use it to play a peer that dies at the worst moment.
#pragma once

#include <pthread.h>
#include <sys/types.h>

#include <cstddef>
#include <cstdint>

#include "navmisc/platform/per_root_block.h"

namespace navmisc::detail {

// A condition variable that a process dying while it waits cannot break. glibc's
// process-shared pthread_cond_t keeps per-waiter bookkeeping inside the shared object; a waiter
// killed in pthread_cond_wait leaves it behind, and a later pthread_cond_broadcast can wait for
// that waiter for ever. Here the only shared state is a sequence word that the kernel's futex
// waits on: a dead waiter leaves nothing behind but a too high `waiters` count, which costs a
// needless wake-up call and nothing else.
struct SharedCondition {
  uint32_t seq;      // changed by every broadcast
  uint32_t waiters;  // processes that may be waiting (an upper bound)
};

// Why a mutex and condition variables rather than a lock-free ring: any number of senders and
// receivers share one queue (several threads of an application send requests), both sides need
// to sleep while there is nothing to do, and a process-shared robust mutex tells the next
// locker when its owner died, which is exactly the case a crashing data-control process brings.
struct MsgRingHeader {
  SharedBlockHeader block;
  uint32_t nextSeq;      // number of the next message sent
  uint32_t reserved;
  uint64_t head;         // bytes taken out since the ring was made
  uint64_t tail;         // bytes put in since the ring was made; tail - head are waiting
  uint64_t recoveries;   // locks taken over from a dead owner (changed atomically)
  uint64_t discarded;    // frames thrown away: orphaned parts, bad checksums (under ringLock)
  pthread_mutex_t ringLock;   // guards head, tail, nextSeq and the bytes between them
  pthread_mutex_t writeLock;  // held by a sender for the whole of one message
  pthread_mutex_t readLock;   // held by a receiver for the whole of one message
  SharedCondition notEmpty;   // bytes were put in
  SharedCondition notFull;    // bytes were taken out
};

// The data area (the ring's bytes) starts here.
inline constexpr size_t kMsgRingDataOffset = (sizeof(MsgRingHeader) + 63) & ~size_t{63};

// Each part of a message in the ring starts with this header; the part's bytes follow and the
// whole frame is padded to a multiple of 8 bytes. A message that fits the ring is one frame.
struct MsgFrameHeader {
  uint32_t mark;    // kMsgFrameMark
  uint32_t seq;     // the message's number
  uint32_t total;   // bytes of the whole message
  uint32_t offset;  // where this part begins in the message
  uint32_t length;  // bytes of this part
  uint32_t crc;     // CRC-32C of total, offset, length (12 bytes, little-endian) and the part
};
inline constexpr uint32_t kMsgFrameMark = 0x46514D4E;  // "NMQF" in memory

// The thread id of the process that holds `m` (a robust mutex keeps it in its lock word), 0
// when it is free.
pid_t RobustMutexOwner(const pthread_mutex_t& m);

}  // namespace navmisc::detail
