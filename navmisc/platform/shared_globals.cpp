#include "navmisc/platform/shared_globals.h"

#include <time.h>
#include <unistd.h>

#include <atomic>
#include <cstdlib>
#include <cstring>
#include <cwchar>
#include <new>
#include <string>
#include <system_error>

#include "navmisc/platform/detail/shared_block.h"
#include "navmisc/platform/shared_memory.h"

namespace navmisc {
namespace detail {
namespace {

static_assert(std::atomic_ref<uint32_t>::is_always_lock_free,
              "the state word must be usable between processes without a lock");
static_assert(std::is_trivially_copyable_v<SharedBlockData>);

// How long a process waits for another one to finish initialising the block before it decides
// that the other one died half-way and does the work itself.
constexpr int kInitWaitMs = 2000;

std::string ComputeBlockName() {
  const char* env = std::getenv("NAVMISC_SHM_NAME");
  if (env && *env) {
    std::string name(env);
    if (name == "private" || name.front() == '/') return name;
    return "/" + name;
  }
  return "/navmisc-shared-" + std::to_string(::geteuid()) + "-v" +
         std::to_string(kSharedLayoutVersion);
}

const std::string& BlockName() {
  static const std::string name = ComputeBlockName();
  return name;
}

// Everything but the state word becomes zero, then the identification is written. Both device
// configurations start zeroed: a configuration is only meaningful once read from a logger.
void FillNewBlock(SharedBlockData& block) {
  constexpr size_t kStateSize = sizeof block.state;
  std::memset(reinterpret_cast<unsigned char*>(&block) + kStateSize, 0,
              sizeof block - kStateSize);
  block.magic = kSharedBlockMagic;
  block.layoutVersion = kSharedLayoutVersion;
  block.blockSize = sizeof block;
}

bool HasThisLayout(const SharedBlockData& block) {
  return block.magic == kSharedBlockMagic && block.layoutVersion == kSharedLayoutVersion &&
         block.blockSize == sizeof block;
}

void SleepOneMs() {
  struct timespec ts = {0, 1000000};
  ::nanosleep(&ts, nullptr);
}

SharedBlockOrigin g_origin = SharedBlockOrigin::kFallback;

SharedBlockData* Attach() {
  std::error_code ec;
  SharedMemory mem;
  if (BlockName() != "private") {
    mem = SharedMemory::OpenOrCreate(BlockName(), sizeof(SharedBlockData), ec);
    if (mem && JoinOrInitialiseBlock(*static_cast<SharedBlockData*>(mem.data()))) {
      g_origin = SharedBlockOrigin::kNamedObject;
      // Kept mapped until the process ends: the g_* references point into it, and code in
      // other static destructors may still use them.
      return static_cast<SharedBlockData*>(mem.Release());
    }
    // Foreign, corrupt, of another size or not ours: work on a private block rather than
    // trust or overwrite it.
    mem = SharedMemory();
  }
  mem = SharedMemory::Anonymous(sizeof(SharedBlockData), ec);
  if (mem) {
    auto* block = static_cast<SharedBlockData*>(mem.Release());
    JoinOrInitialiseBlock(*block);
    g_origin = BlockName() == "private" ? SharedBlockOrigin::kPrivate : SharedBlockOrigin::kFallback;
    return block;
  }
  // Without any mapping (address space exhausted) the process still gets a block of its own.
  static SharedBlockData last_resort;
  JoinOrInitialiseBlock(last_resort);
  g_origin = SharedBlockOrigin::kFallback;
  return &last_resort;
}

}  // namespace

bool JoinOrInitialiseBlock(SharedBlockData& block) {
  std::atomic_ref<uint32_t> state(block.state);
  uint32_t seen = kSharedBlockNew;
  if (state.compare_exchange_strong(seen, kSharedBlockInitialising, std::memory_order_acq_rel)) {
    FillNewBlock(block);
    state.store(kSharedBlockReady, std::memory_order_release);
    return true;
  }
  for (int waited = 0; seen == kSharedBlockInitialising && waited < kInitWaitMs; ++waited) {
    SleepOneMs();
    seen = state.load(std::memory_order_acquire);
  }
  if (seen == kSharedBlockInitialising) {
    // The initialising process has died between claiming and publishing: finish its work.
    // Should it only be slow, both write the same zeros and the same identification.
    FillNewBlock(block);
    state.store(kSharedBlockReady, std::memory_order_release);
    return true;
  }
  return seen == kSharedBlockReady && HasThisLayout(block);
}

SharedBlockOrigin SharedBlockSource() {
  SharedBlock();
  return g_origin;
}

}  // namespace detail

detail::SharedBlockData& SharedBlock() {
  static detail::SharedBlockData* const block = detail::Attach();
  return *block;
}

const char* SharedBlockName() { return detail::BlockName().c_str(); }

void SetSharedText(wchar_t* field, size_t capacity, const wchar_t* value) {
  if (!field || capacity == 0) return;
  const size_t len = value ? ::wcsnlen(value, capacity - 1) : 0;
  // The value may be (part of) the field itself.
  if (len) std::wmemmove(field, value, len);
  field[len] = L'\0';
}

}  // namespace navmisc

// Each name refers to its field of the block; the block is mapped when the first of these is
// initialised, which is when the library is loaded. Code of the library must therefore not use
// the names from its own static initialisers (it may call navmisc::SharedBlock() instead).
char (&g_szGSMVersion)[32] = navmisc::SharedBlock().szGSMVersion;
char (&g_szDeviceId)[32] = navmisc::SharedBlock().szDeviceId;
s_gps_info& g_gps_info = navmisc::SharedBlock().gps_info;
GPS_APP_PROG_TYPE& g_nProductId = navmisc::SharedBlock().nProductId;
VORLA_PC_VERSION_INFO& g_sVersionInfo = navmisc::SharedBlock().sVersionInfo;
CDataControlCmdBlkKVDevice11& g_devConfig11 = navmisc::SharedBlock().devConfig11;
CDataControlCmdBlkKVDevice& g_devConfig = navmisc::SharedBlock().devConfig;
wchar_t (&g_szGapiInfo)[navmisc::kSharedNameChars] = navmisc::SharedBlock().szGapiInfo;
wchar_t (&g_szExecProgPath)[navmisc::kSharedPathChars] = navmisc::SharedBlock().szExecProgPath;
wchar_t (&g_szSoftwareCompanyname)[navmisc::kSharedNameChars] =
    navmisc::SharedBlock().szSoftwareCompanyname;
wchar_t (&g_szAppDataPath)[navmisc::kSharedPathChars] = navmisc::SharedBlock().szAppDataPath;
bool& g_bInitialFlag = navmisc::SharedBlock().bInitialFlag;
bool& g_bDeviceConnected = navmisc::SharedBlock().bDeviceConnected;
bool& g_bNetConnected = navmisc::SharedBlock().bNetConnected;
double& g_dDeviceVersion = navmisc::SharedBlock().dDeviceVersion;
uint16_t& g_wDeviceModelID = navmisc::SharedBlock().wDeviceModelID;
uint16_t& g_wLastDeviceError = navmisc::SharedBlock().wLastDeviceError;
int32_t& g_wDeviceSerialID = navmisc::SharedBlock().wDeviceSerialID;
int32_t& g_nDeviceTimeZone = navmisc::SharedBlock().nDeviceTimeZone;
bool& g_bRTCWorking = navmisc::SharedBlock().bRTCWorking;
bool& g_bPwdChecked = navmisc::SharedBlock().bPwdChecked;
int32_t& g_nCountOfProgress = navmisc::SharedBlock().nCountOfProgress;
int32_t& g_nCurrentOfProgress = navmisc::SharedBlock().nCurrentOfProgress;
bool& g_bClearLog = navmisc::SharedBlock().bClearLog;
int32_t& g_lTotolMemory = navmisc::SharedBlock().lTotolMemory;
int32_t& g_lUsedMemory = navmisc::SharedBlock().lUsedMemory;
int32_t& g_nScanProgress = navmisc::SharedBlock().nScanProgress;
