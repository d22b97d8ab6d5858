// What AtomicFile and FileTransaction share: the naming of temporary files beside a target, the
// rename into place, making renames durable, and the system's words for an error.
#pragma once

#include <string>

#include "navmisc/platform/detail/error_text.h"

namespace navmisc::detail {

// ".<name>.tmp-": what the temporary files of the file `name` start with; six characters follow.
std::string TempFilePrefix(const std::string& name);
// rename(2), or the failure injected by testing::FailAtomicRenamesAfter.
int RenameIntoPlace(const std::string& from, const std::string& to);
// The folder of `path` ("." for a bare name).
std::string FolderOf(const std::string& path);
// Syncs a folder so that the renames inside it survive a crash; a folder that cannot be synced
// is left as it is (the files are in place either way).
void SyncFolder(const std::string& folder);

}  // namespace navmisc::detail
