// Named message queues between the processes of one user working on one data root: the two
// queues of the data-control channel ("Data_Control_Send", "Data_Control_Recv"). The ring
// layout and the rules for dead peers are in docs/data-control-channel.md.
//
// A queue is a ring of bytes in a POSIX shared-memory object named after the user, the chosen
// data root and the queue's name, mode 0600. Messages are byte strings of any length up to
// kSysMsgMaxMessage; they arrive whole and in order. Any number of processes and threads may
// send and receive on one queue at once.
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <system_error>

#include "navmisc/platform/shared_memory.h"

namespace navmisc {
namespace detail {
struct MsgRingHeader;
}  // namespace detail

// Constructor flags.
inline constexpr int kSysMsgOpenOrCreate = 0;   // the queue's owner: makes the object if missing
inline constexpr int kSysMsgOpenExisting = 1;   // a peer: uses the object its owner made
// The longest message a queue carries (a sender refuses longer ones, a receiver never allocates
// more for one message).
inline constexpr uint32_t kSysMsgMaxMessage = 64u << 20;
// A time-out that never runs out.
inline constexpr uint32_t kSysMsgWaitForever = UINT32_MAX;

}  // namespace navmisc

// What Receive tells about the message it returns.
struct CxSysMsgInfo {
  uint32_t nSize = 0;  // bytes of the message
  uint32_t nSeq = 0;   // its number among the messages sent on the queue (for diagnostics)
};

class CxSysMsgQueue {
 public:
  // Opens the queue `name` (letters, digits, "_", "-", ".") of the chosen data root, with a ring
  // of `capacityKiB` KiB (4 to 1 GiB) when it has to be made; a peer (kSysMsgOpenExisting) takes
  // the ring as its owner made it. Without a chosen data root there is no queue:
  // the object is then invalid, as it is when the shared object cannot be made or is not the
  // user's own (another owner, rights for group or others) — a queue never carries messages
  // between users or data roots.
  CxSysMsgQueue(const wchar_t* name, int capacityKiB, int flags);
  // Unmaps the ring. The name stays for the other processes until Unlink.
  ~CxSysMsgQueue();
  CxSysMsgQueue(const CxSysMsgQueue&) = delete;
  CxSysMsgQueue& operator=(const CxSysMsgQueue&) = delete;

  bool IsValid() const { return ring_ != nullptr; }
  // Why the queue is invalid.
  const std::error_code& error() const { return error_; }
  // The shared object's name, "/navmisc-<uid>-<root hash>-<name>-v<layout>".
  const std::string& objectName() const { return objectName_; }
  // Bytes of the ring.
  uint32_t capacity() const { return capacity_; }

  // Sends `size` bytes as one message. A message that does not fit the free room waits for it
  // (never dropped, never cut); one larger than the whole ring travels in parts that the
  // receiver takes as they come. False when the queue is invalid, the message is longer than
  // kSysMsgMaxMessage, or `timeoutMs` ran out before the message was complete (the receiver
  // then discards what went in).
  bool Send(const void* data, uint32_t size, uint32_t timeoutMs = navmisc::kSysMsgWaitForever);

  // Takes the next message out of the queue, waiting at most `timeoutMs` for one to begin (0:
  // only look); a message whose first part has arrived is awaited to its end as long as its
  // sender lives. Returns the message in a new buffer and its size in `info` (may be null), or
  // null when none came. With `remove` 0 the message stays with this object (not in the ring):
  // its next Receive returns it again.
  std::unique_ptr<uint8_t[]> Receive(uint32_t timeoutMs, CxSysMsgInfo* info, int remove = 1);

  // Bytes in the ring now, frame headers included (for diagnostics and tests).
  uint32_t UsedBytes() const;
  // How often a lock of this ring was taken over from a process that died holding it.
  uint64_t Recoveries() const;

  // Removes the name: processes that open the queue afterwards get a new, empty one; those that
  // have it open keep working on the old one.
  bool Unlink();

  // The ring itself, for tests that play a misbehaving peer.
  navmisc::detail::MsgRingHeader* ring() const { return ring_; }

 private:
  bool Open(int capacityKiB, int flags);
  std::unique_ptr<uint8_t[]> CopyOfKept() const;

  navmisc::SharedMemory memory_;
  navmisc::detail::MsgRingHeader* ring_ = nullptr;
  uint8_t* data_ = nullptr;
  uint32_t capacity_ = 0;
  std::string objectName_;
  std::error_code error_;
  std::unique_ptr<uint8_t[]> kept_;  // a message received with `remove` 0
  CxSysMsgInfo keptInfo_;
};
