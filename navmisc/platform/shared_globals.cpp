#include "navmisc/platform/shared_globals.h"

#include <cwchar>

#include "navmisc/platform/cstring.h"
#include "navmisc/platform/detail/shared_globals_block.h"

namespace navmisc {
namespace detail {

static_assert(std::is_trivially_copyable_v<SharedGlobalsBlock>);

PerRootBlock& SharedGlobals() {
  // A block that a data root's process made holds that root already; a private one, or one just
  // made for the root, learns it here.
  static PerRootBlock block(kSharedGlobalsType, [](void* data, const std::string& root, bool) {
    auto& b = *static_cast<SharedGlobalsBlock*>(data);
    if (!root.empty()) SetSharedText(b.szAppDataPath, CString::FromUtf8(root));
  });
  return block;
}

}  // namespace detail

void SetSharedText(wchar_t* field, size_t capacity, const wchar_t* value) {
  if (!field || capacity == 0) return;
  const size_t len = value ? ::wcsnlen(value, capacity - 1) : 0;
  // The value may be (part of) the field itself.
  if (len) std::wmemmove(field, value, len);
  field[len] = L'\0';
}

}  // namespace navmisc

// Each name refers to its field of the block; the block is mapped when the first of these is
// initialised, which is when the library is loaded. Its address never changes afterwards:
// choosing a data root replaces the memory behind it. Code of the library must therefore not use
// the names from its own static initialisers (it may call navmisc::detail::SharedGlobalsData()).
using navmisc::detail::SharedGlobalsData;
GPS_APP_PROG_TYPE& g_nProductId = SharedGlobalsData().nProductId;
VORLA_PC_VERSION_INFO& g_sVersionInfo = SharedGlobalsData().sVersionInfo;
wchar_t (&g_szGapiInfo)[navmisc::kSharedNameChars] = SharedGlobalsData().szGapiInfo;
wchar_t (&g_szExecProgPath)[navmisc::kSharedPathChars] = SharedGlobalsData().szExecProgPath;
wchar_t (&g_szSoftwareCompanyname)[navmisc::kSharedNameChars] =
    SharedGlobalsData().szSoftwareCompanyname;
wchar_t (&g_szAppDataPath)[navmisc::kSharedPathChars] = SharedGlobalsData().szAppDataPath;
bool& g_bInitialFlag = SharedGlobalsData().bInitialFlag;
