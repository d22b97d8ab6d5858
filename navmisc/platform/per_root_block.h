// Blocks of memory shared by every process of one user working on one data root (see
// docs/shared-state.md). A block has a fixed address for the life of the process, so references
// to its fields (the g_* names) stay valid when the process chooses its data root: choosing
// replaces the memory behind that address with the named object of the root.
//
// Until a data root is chosen the block is private to the process (and the children it forks).
#pragma once

#include <cstddef>
#include <cstdint>
#include <functional>
#include <string>
#include <string_view>

namespace navmisc {

// The first bytes of every block. `state` is only ever accessed atomically.
struct SharedBlockHeader {
  uint32_t state;
  uint32_t magic;
  uint32_t layoutVersion;
  uint32_t blockSize;
};

// Values of SharedBlockHeader::state.
enum SharedBlockState : uint32_t {
  kSharedBlockNew = 0,           // just created, all zeros
  kSharedBlockInitialising = 1,  // one process is filling in the fields
  kSharedBlockReady = 2,         // usable
};

// What a block is: its kind (part of the object's name), the identification written into its
// header, and its size. A different layout must come with a different version, which is part of
// the name too, so programs of two layouts never share one object.
struct SharedBlockType {
  const char* kind;  // a short lower-case word: "globals", "device"
  uint32_t magic;
  uint32_t layoutVersion;
  size_t size;  // sizeof the block, header included
};

// Where the memory of a block comes from.
enum class SharedBlockOrigin {
  kPrivate,      // no data root chosen yet: this process and the children it forks
  kNamedObject,  // the object of the chosen data root, shared with its other processes
  kFallback,     // the root's object was unusable (foreign, corrupt, wrong size): private
};

class PerRootBlock {
 public:
  // `onAttach` (may be empty) runs each time the block gets new memory (the private start included), before
  // anyone else uses it, with the canonical data root (empty while none is chosen) and whether
  // this process initialised the memory. Blocks are meant to be function-local statics.
  PerRootBlock(const SharedBlockType& type,
               std::function<void(void* block, const std::string& root, bool fresh)> onAttach);
  PerRootBlock(const PerRootBlock&) = delete;
  PerRootBlock& operator=(const PerRootBlock&) = delete;
  // The memory stays mapped until the process ends: static destructors elsewhere may still use
  // references into it.
  ~PerRootBlock() = default;

  void* data() const { return data_; }
  SharedBlockOrigin origin() const { return origin_; }
  // The name of the root's object ("/navmisc-<uid>-<root hash>-<kind>-v<layout>"), empty while
  // the block is private.
  const std::string& objectName() const { return name_; }

  // Gives the block the memory of `root` (canonical; empty = private). Called by UseDataRoot.
  void Attach(const std::string& root);

 private:
  SharedBlockType type_;
  std::function<void(void*, const std::string&, bool)> onAttach_;
  void* data_ = nullptr;
  bool mapped_ = false;  // data_ is a mapping that a named object may replace
  SharedBlockOrigin origin_ = SharedBlockOrigin::kPrivate;
  std::string name_;
};

// Makes `header` (the start of a block of `type`) ready for use if no other process has, or
// waits for the one that does. Sets `fresh` when this call initialised it (every byte after the
// state word zero, then the identification, then `initialise` when given, all before any other
// process may use the block). False when the memory holds no block of this type.
bool JoinOrInitialiseBlock(SharedBlockHeader& header, const SharedBlockType& type, bool& fresh,
                           void (*initialise)(SharedBlockHeader&) = nullptr);

}  // namespace navmisc
