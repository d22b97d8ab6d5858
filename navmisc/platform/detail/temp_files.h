// The naming of temporary files beside a target, shared by AtomicFile and FileTransaction.
#pragma once

#include <string>

namespace navmisc::detail {

// ".<name>.tmp-": what the temporary files of the file `name` start with; six characters follow.
std::string TempFilePrefix(const std::string& name);
// rename(2), or the failure injected by testing::FailAtomicRenamesAfter.
int RenameIntoPlace(const std::string& from, const std::string& to);

}  // namespace navmisc::detail
