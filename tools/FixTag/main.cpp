// FixTag.exe: the suite's tagging tool. Reads capture times, positions and comments of photos and
// writes geotags into them, as a command file asks (docs/photo-tagging.md).
#include <cstdio>
#include <cstring>

#include "fix_tag.h"
#include "navmisc/platform/cstring.h"

namespace {

constexpr const char* kUsage =
    "Usage: FixTag.exe -ZE COMMANDFILE\n"
    "\n"
    "Carries out the requests of COMMANDFILE (an INI file with a [PROP] section and one\n"
    "[File.N] section per photo): reads a photo's metadata, writes a position and a comment\n"
    "into a photo, or copies the GPS tags of one photo into another, and writes the answers\n"
    "back into COMMANDFILE. Photos are replaced whole, keeping their mode and times.\n"
    "\n"
    "Exit status: 0 when every request was carried out, 1 when some failed (each is named on\n"
    "stderr and has an Error line in COMMANDFILE), 2 when COMMANDFILE cannot be used.\n";

}  // namespace

int main(int argc, char** argv) {
  if (argc == 2 && (std::strcmp(argv[1], "--help") == 0 || std::strcmp(argv[1], "-h") == 0)) {
    std::fputs(kUsage, stdout);
    return 0;
  }
  if (argc == 2 && std::strcmp(argv[1], "--version") == 0) {
    std::printf("FixTag.exe %s\n", NAVMISC_VERSION);
    return 0;
  }
  if (argc != 3 || std::strcmp(argv[1], "-ZE") != 0) {
    std::fputs(kUsage, stderr);
    return 2;
  }
  navmisc::fixtag::Outcome outcome;
  if (!navmisc::fixtag::RunCommandFile(CString::FromUtf8(argv[2]), outcome, stderr)) {
    std::fprintf(stderr, "FixTag.exe: cannot read or write the command file %s\n", argv[2]);
    return 2;
  }
  return outcome.failed == 0 ? 0 : 1;
}
