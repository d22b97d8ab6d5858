// Fuzzing of the channel's packages: the framing reader and every block's unpacker. Whatever
// the bytes, the reader either refuses them whole or indexes them; every unpacker then fills its
// block without reading outside the package; and packing what was read reaches a fixed point
// after one round (a value read into the wrong field would show as a difference).
//
// Run: package_fuzz -max_len=65536 fuzz/corpus/package

#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>

#include "navmisc/datactrl/block_codec.h"
#include "navmisc/platform/package.h"

namespace {

// Visits every entry, and every entry that is itself a package, to a bounded depth.
void Walk(const CUnpackageBlk& u, int depth) {
  size_t sum = 0;
  for (const auto& e : u.Entries()) {
    const uint8_t* data;
    uint32_t size;
    if (!u.GetData(std::string(e.name).c_str(), data, size) || data != e.data || size != e.size) {
      std::fprintf(stderr, "an indexed name is not found again\n");
      std::abort();
    }
    if (size) sum += data[0] + data[size - 1];  // touches both ends of every value
    if (depth < 8) {
      CUnpackageBlk nested(e.data, e.size);
      if (nested.IsValid()) Walk(nested, depth + 1);
    }
  }
  (void)sum;
}

template <class Block>
void Check(const CUnpackageBlk& u, const Block& start, const char* what) {
  Block once = start;
  navmisc::datactrl::UnpackBlock(u, once);
  CPackageBlk first;
  navmisc::datactrl::PackBlock(once, first);
  CUnpackageBlk again(first.GetPackagePtr(), first.GetPackageSize());
  if (!again.IsValid()) {
    std::fprintf(stderr, "%s: a packed block is not a well-formed package\n", what);
    std::abort();
  }
  Block twice = start;
  navmisc::datactrl::UnpackBlock(again, twice);
  CPackageBlk second;
  navmisc::datactrl::PackBlock(twice, second);
  // The blocks themselves may differ: a date-time read from a text can lie beyond what a text
  // carries (after 2038, say) and is packed as none.
  if (first.GetPackageSize() != second.GetPackageSize() ||
      std::memcmp(first.GetPackagePtr(), second.GetPackagePtr(), first.GetPackageSize()) != 0) {
    std::fprintf(stderr, "%s: packing what was read does not read back the same\n", what);
    std::abort();
  }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  CUnpackageBlk u(data, size);
  if (!u.IsValid()) {
    if (u.GetCount() != 0) std::abort();  // a refused package shows nothing
    return 0;
  }
  Walk(u, 0);
  CDataControlCmdBlk header{};
  navmisc::datactrl::UnpackHeader(u, header);
  Check(u, CDataControlConnectionStatus{}, "status");
  Check(u, CDataControlProgressCmdBlk{}, "progress");
  Check(u, CDataControlCmdBlkKVDevice{}, "device");
  CDataControlCmdBlkKVDevice11 kv11;
  InitKV11BlockDefaults(kv11);
  Check(u, kv11, "KV-11 device");
  Check(u, CDataControlCmdBlkNet{}, "net");
  Check(u, CDataControlCmdBlkFile{}, "file");
  return 0;
}
