#include "navmisc/platform/per_root_block.h"

#include <time.h>

#include <atomic>
#include <cstring>
#include <new>
#include <system_error>
#include <utility>

#include "navmisc/platform/data_root.h"
#include "navmisc/platform/detail/per_root_registry.h"
#include "navmisc/platform/shared_memory.h"

namespace navmisc {
namespace {

static_assert(std::atomic_ref<uint32_t>::is_always_lock_free,
              "the state word must be usable between processes without a lock");

// How long a process waits for another one to finish initialising a block before it decides
// that the other one died half-way and does the work itself.
constexpr int kInitWaitMs = 2000;

void SleepOneMs() {
  struct timespec ts = {0, 1000000};
  ::nanosleep(&ts, nullptr);
}

// Everything but the state word becomes zero, then the identification is written and the
// block's own initialisation runs.
void FillNewBlock(SharedBlockHeader& header, const SharedBlockType& type,
                  void (*initialise)(SharedBlockHeader&)) {
  constexpr size_t kStateSize = sizeof header.state;
  std::memset(reinterpret_cast<unsigned char*>(&header) + kStateSize, 0, type.size - kStateSize);
  header.magic = type.magic;
  header.layoutVersion = type.layoutVersion;
  header.blockSize = static_cast<uint32_t>(type.size);
  if (initialise) initialise(header);
}

bool HasLayout(const SharedBlockHeader& header, const SharedBlockType& type) {
  return header.magic == type.magic && header.layoutVersion == type.layoutVersion &&
         header.blockSize == type.size;
}

}  // namespace

bool JoinOrInitialiseBlock(SharedBlockHeader& header, const SharedBlockType& type, bool& fresh,
                           void (*initialise)(SharedBlockHeader&)) {
  fresh = false;
  std::atomic_ref<uint32_t> state(header.state);
  uint32_t seen = kSharedBlockNew;
  if (state.compare_exchange_strong(seen, kSharedBlockInitialising, std::memory_order_acq_rel)) {
    FillNewBlock(header, type, initialise);
    state.store(kSharedBlockReady, std::memory_order_release);
    fresh = true;
    return true;
  }
  for (int waited = 0; seen == kSharedBlockInitialising && waited < kInitWaitMs; ++waited) {
    SleepOneMs();
    seen = state.load(std::memory_order_acquire);
  }
  if (seen == kSharedBlockInitialising) {
    // The initialising process has died between claiming and publishing: finish its work.
    // Should it only be slow, both write the same zeros and the same identification.
    FillNewBlock(header, type, initialise);
    state.store(kSharedBlockReady, std::memory_order_release);
    fresh = true;
    return true;
  }
  return seen == kSharedBlockReady && HasLayout(header, type);
}

PerRootBlock::PerRootBlock(const SharedBlockType& type,
                           std::function<void(void*, const std::string&, bool)> onAttach)
    : type_(type), onAttach_(std::move(onAttach)) {
  Attach(ChosenDataRoot());
  detail::RegisterPerRootBlock(this);
}

void PerRootBlock::Attach(const std::string& root) {
  std::error_code ec;
  bool fresh = false;
  bool zeroed = false;  // data_ is memory nobody has used yet
  if (!data_) {
    // The block's address for the life of the process.
    if (SharedMemory mem = SharedMemory::Anonymous(type_.size, ec)) {
      data_ = mem.Release();
      mapped_ = zeroed = true;
    }
  }
  if (mapped_ && !root.empty()) {
    const std::string name =
        PerRootObjectName(type_.kind, root) + "-v" + std::to_string(type_.layoutVersion);
    SharedMemory mem = SharedMemory::OpenOrCreate(name, type_.size, ec, data_);
    if (mem) {
      // The mapping now sits at the block's address: it is never unmapped from there, only
      // replaced.
      mem.Release();
      if (JoinOrInitialiseBlock(*static_cast<SharedBlockHeader*>(data_), type_, fresh)) {
        origin_ = SharedBlockOrigin::kNamedObject;
        name_ = name;
        if (onAttach_) onAttach_(data_, root, fresh);
        return;
      }
    }
    // Foreign, corrupt, of another size or not ours: work on private memory rather than trust
    // or overwrite it.
  }
  if (mapped_ && !zeroed) {
    // A fresh private block in place of whatever was there.
    if (SharedMemory mem = SharedMemory::Anonymous(type_.size, ec, data_)) mem.Release();
  } else if (!data_) {
    // Without any mapping (address space exhausted) the process still gets a block of its own;
    // it can never be shared, so a later Attach keeps it.
    data_ = ::operator new(type_.size, std::align_val_t{alignof(std::max_align_t)});
    std::memset(data_, 0, type_.size);
  }
  JoinOrInitialiseBlock(*static_cast<SharedBlockHeader*>(data_), type_, fresh);
  origin_ = root.empty() ? SharedBlockOrigin::kPrivate : SharedBlockOrigin::kFallback;
  name_.clear();
  if (onAttach_) onAttach_(data_, root, fresh);
}

}  // namespace navmisc
