// The data root of this process, and the names of what it shares with the other processes of the
// same user working on the same root (see docs/shared-state.md).
//
// Processes on one data root (the applications, the data-control process they start, several
// command-line runs) share device and progress state; processes on different roots never see
// each other's. A program chooses its root with UseDataRoot before it touches any shared global;
// programs it starts afterwards inherit the choice through the environment variable
// NAVMISC_DATA_ROOT, which the library also reads when it is loaded.
#pragma once

#include <string>
#include <string_view>

namespace navmisc {

// The environment variable that carries the chosen data root to the programs started later.
inline constexpr const char* kDataRootVariable = "NAVMISC_DATA_ROOT";

// Makes `root` (a folder, which need not exist yet) the data root of this process: every shared
// block is mapped to the objects of that root, `g_szAppDataPath` is set to its canonical form
// and NAVMISC_DATA_ROOT is set for programs started afterwards. Values written to the shared
// globals before the call stay behind in the previous memory. Call it before other threads use
// the shared globals. False, with nothing changed, when `root` is empty or cannot be resolved.
bool UseDataRoot(const wchar_t* root);

// The canonical data root chosen by UseDataRoot or inherited from NAVMISC_DATA_ROOT, as UTF-8;
// empty when none has been chosen (the shared blocks are then private to this process).
const std::string& ChosenDataRoot();

// `root` made absolute, with links of the part that exists resolved and "." and ".." removed:
// the form two processes compare. Empty when that fails.
std::string CanonicalDataRoot(const wchar_t* root);

// "/navmisc-<uid>-<16 hex digits>-<kind>": the name of a shared object of kind `kind` belonging
// to this user and to the canonical data root `root` (the digits are a hash of the root).
std::string PerRootObjectName(std::string_view kind, const std::string& root);

// Removes every shared object this user has for the data root `root` (blocks and queues alike);
// processes that still map them keep their memory. Returns how many were removed. For tests and
// for tidying up after a data root is deleted.
int RemovePerRootObjects(const wchar_t* root);

}  // namespace navmisc
