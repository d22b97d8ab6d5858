// The block of per-user shared memory behind the shared globals (see docs/shared-state.md).
// Private to the library: code outside uses the g_* names of shared_globals.h.
#pragma once

#include <cstddef>
#include <cstdint>

#include "navmisc/platform/shared_globals.h"

namespace navmisc {
namespace detail {

// "NMSB" read as a little-endian word.
constexpr uint32_t kSharedBlockMagic = 0x42534D4E;
// Raise with every change of SharedBlockData or of a block type it holds: the version is part of
// the object's name, so programs of two layouts never share one object.
constexpr uint32_t kSharedLayoutVersion = 1;

// Values of SharedBlockData::state.
enum SharedBlockState : uint32_t {
  kSharedBlockNew = 0,           // just created, all zeros
  kSharedBlockInitialising = 1,  // one process is filling in the fields
  kSharedBlockReady = 2,         // usable
};

// The layout of the block. The state word comes first so that it sits at the same place
// whatever follows; it is only ever accessed atomically (std::atomic_ref).
struct SharedBlockData {
  uint32_t state;
  uint32_t magic;
  uint32_t layoutVersion;
  uint32_t blockSize;  // sizeof(SharedBlockData)
  char szGSMVersion[32];
  char szDeviceId[32];
  s_gps_info gps_info;
  GPS_APP_PROG_TYPE nProductId;
  VORLA_PC_VERSION_INFO sVersionInfo;
  CDataControlCmdBlkKVDevice11 devConfig11;
  CDataControlCmdBlkKVDevice devConfig;
  wchar_t szGapiInfo[kSharedNameChars];
  wchar_t szExecProgPath[kSharedPathChars];
  wchar_t szSoftwareCompanyname[kSharedNameChars];
  wchar_t szAppDataPath[kSharedPathChars];
  bool bInitialFlag;
  bool bDeviceConnected;
  bool bNetConnected;
  double dDeviceVersion;
  uint16_t wDeviceModelID;
  uint16_t wLastDeviceError;
  int32_t wDeviceSerialID;
  int32_t nDeviceTimeZone;
  bool bRTCWorking;
  bool bPwdChecked;
  int32_t nCountOfProgress;
  int32_t nCurrentOfProgress;
  bool bClearLog;
  int32_t lTotolMemory;
  int32_t lUsedMemory;
  int32_t nScanProgress;
};

// Where the block came from.
enum class SharedBlockOrigin {
  kNamedObject,  // the per-user object (or the one NAVMISC_SHM_NAME names)
  kPrivate,      // NAVMISC_SHM_NAME=private: this process and its forked children
  kFallback,     // the named object was unusable (foreign, corrupt, wrong size): private block
};

SharedBlockOrigin SharedBlockSource();

// Makes `block` ready for use if no other process has, or waits for the one that does.
// False when the memory does not hold a block of this layout. Exposed for tests.
bool JoinOrInitialiseBlock(SharedBlockData& block);

}  // namespace detail

// The block of this process, mapped on first use and kept until the process ends.
detail::SharedBlockData& SharedBlock();

}  // namespace navmisc
