// The block behind the g_* names of shared_globals.h (see docs/shared-state.md). Private to the
// library: code outside uses the g_* names.
#pragma once

#include "navmisc/platform/per_root_block.h"
#include "navmisc/platform/shared_globals.h"

namespace navmisc::detail {

struct SharedGlobalsBlock {
  SharedBlockHeader header;
  GPS_APP_PROG_TYPE nProductId;
  VORLA_PC_VERSION_INFO sVersionInfo;
  wchar_t szGapiInfo[kSharedNameChars];
  wchar_t szExecProgPath[kSharedPathChars];
  wchar_t szSoftwareCompanyname[kSharedNameChars];
  wchar_t szAppDataPath[kSharedPathChars];
  bool bInitialFlag;
};

// "NMSG" read as a little-endian word. Raise the version with every change of the layout.
inline constexpr SharedBlockType kSharedGlobalsType = {"globals", 0x47534D4E, 2,
                                                       sizeof(SharedGlobalsBlock)};

// The block of this process, mapped on first use.
PerRootBlock& SharedGlobals();
inline SharedGlobalsBlock& SharedGlobalsData() {
  return *static_cast<SharedGlobalsBlock*>(SharedGlobals().data());
}

}  // namespace navmisc::detail
