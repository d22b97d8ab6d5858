// The work of the tagging tool: the requests of one command file (docs/photo-tagging.md).
#pragma once

#include <cstdio>

namespace navmisc::fixtag {

struct Outcome {
  int done = 0;    // requests carried out
  int failed = 0;  // requests that could not be
};

// Carries out every "File.N" section of the command file at `path` whose N is below "Count":
// a copy request when it names a "New File", a read request when "ReadOnly" is "true", a write
// request otherwise. Only the sections the file holds are visited, whatever "Count" promises.
// The file is then written back with the answers of the read requests and, in each section that
// failed, an "Error" line; a failed request leaves its photo byte for byte as it was. One line
// per failure goes to `errors` when it is not null. False when the command file cannot be read
// or written back.
bool RunCommandFile(const wchar_t* path, Outcome& outcome, std::FILE* errors);

}  // namespace navmisc::fixtag
