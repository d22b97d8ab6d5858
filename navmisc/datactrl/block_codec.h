// The packed form of every block kind: one pack and one unpack function per kind, used by both
// ends of the channel (the library's command thread and the data-control process).
// docs/data-control-channel.md lists every block's names in order.
#pragma once

#include <cstdint>

#include "navmisc/datactrl/cmd_blocks.h"
#include "navmisc/platform/package.h"

namespace navmisc::datactrl {

// Packing appends the block's values to `out`, header first. The header-only form serves the
// base block and the exit block.
void PackBlock(const CDataControlCmdBlk& block, CPackageBlk& out);
void PackBlock(const CDataControlConnectionStatus& block, CPackageBlk& out);
void PackBlock(const CDataControlProgressCmdBlk& block, CPackageBlk& out);
void PackBlock(const CDataControlCmdBlkKVDevice& block, CPackageBlk& out);
void PackBlock(const CDataControlCmdBlkKVDevice11& block, CPackageBlk& out);
void PackBlock(const CDataControlCmdBlkNet& block, CPackageBlk& out);
void PackBlock(const CDataControlCmdBlkFile& block, CPackageBlk& out);

// Unpacking reads the header and the block's own values. A value that is absent, or of the
// wrong size for its type, leaves its field as it was: callers start from a zeroed block (or
// the KV-11 defaults). Texts are cut to their capacity; lists take at most as many entries as
// the package holds, whatever count it claims.
void UnpackHeader(const CUnpackageBlk& in, CDataControlCmdBlk& block);
void UnpackBlock(const CUnpackageBlk& in, CDataControlConnectionStatus& block);
void UnpackBlock(const CUnpackageBlk& in, CDataControlProgressCmdBlk& block);
void UnpackBlock(const CUnpackageBlk& in, CDataControlCmdBlkKVDevice& block);
void UnpackBlock(const CUnpackageBlk& in, CDataControlCmdBlkKVDevice11& block);
void UnpackBlock(const CUnpackageBlk& in, CDataControlCmdBlkNet& block);
void UnpackBlock(const CUnpackageBlk& in, CDataControlCmdBlkFile& block);

// Whether a logger model belongs to the KV-11 family (model codes 8, 9, 18, 20, 21, 22).
bool IsKV11Model(uint16_t modelId);
// Whether a device block with `nDeviceCmd` travels in the KV-11 form: for a KV-11 logger
// (g_wDeviceModelID) and the commands that carry its settings (3, 4, 8).
bool UsesKV11Block(int32_t nDeviceCmd);

}  // namespace navmisc::datactrl
