// Keeping the library's file steps inside the data root: a symbolic link placed in the data root
// (by a careless tool, a restored archive or another user) must not lead a write, copy, rename,
// delete, change of mode, archive step or read to a file elsewhere. See
// docs/data-root-safety.md.
#pragma once

#include <string>

namespace navmisc {

// False when `path` lies under the data root as written (g_szAppDataPath) but leads outside it
// once symbolic links are followed: the links along its folders always, the last component's
// own link when `followLast`. The refusal is recorded for LastFileRefusal. A path that does not
// lie under the data root as written is not judged here (true): the user named it.
bool StaysInDataRoot(const std::string& path, bool followLast);

// `path` made absolute, with every symbolic link along it resolved (the last component's only
// when `followLast`), as far as the components exist; the rest is appended as written, with "."
// and ".." applied. Empty when the links loop.
std::string ResolveLinks(const std::string& path, bool followLast);

}  // namespace navmisc
