// The suite's paths, product type and version, shared by every process of one user working on
// one data root (see docs/shared-state.md). Each name below is a reference to a field of a shared
// block, so a write through it is seen at once by the other processes of the same root. Each
// value is written whole and read without locks. The device and progress state shared the same
// way lives with the data-control channel (navmisc/datactrl/device_state.h).
#pragma once

#include <cstddef>
#include <cstdint>

#include "navmisc/platform/types.h"

// Version of the suite: four numbers, written as "%-d,%-d,%-d,%-d" into settings files.
struct VORLA_PC_VERSION_INFO {
  int32_t nMajor;
  int32_t nMinor;
  int32_t nBuild;
  int32_t nRevision;
};

namespace navmisc {
constexpr size_t kSharedPathChars = 4096;  // wide characters of each shared path text
constexpr size_t kSharedNameChars = 260;
}  // namespace navmisc

extern GPS_APP_PROG_TYPE& g_nProductId;
extern VORLA_PC_VERSION_INFO& g_sVersionInfo;
extern wchar_t (&g_szGapiInfo)[navmisc::kSharedNameChars];
extern wchar_t (&g_szExecProgPath)[navmisc::kSharedPathChars];
extern wchar_t (&g_szSoftwareCompanyname)[navmisc::kSharedNameChars];
extern wchar_t (&g_szAppDataPath)[navmisc::kSharedPathChars];
extern bool& g_bInitialFlag;

namespace navmisc {

// Copies a path into one of the shared wide texts (cut to its capacity, always terminated).
void SetSharedText(wchar_t* field, size_t capacity, const wchar_t* value);
template <size_t N>
void SetSharedText(wchar_t (&field)[N], const wchar_t* value) {
  SetSharedText(field, N, value);
}

}  // namespace navmisc
