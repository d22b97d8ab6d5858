// Helpers of the photo tests: the real readers (exiftool, the exiv2 command) and the real
// tagging tool.
#pragma once

#include <map>
#include <string>
#include <vector>

#include "navmisc/platform/cstring.h"
#include "sample_photos.h"

namespace navmisc::testutil {

// True when exiftool and exiv2 are both installed; tests that need them skip otherwise.
bool HavePhotoReaders();
// The values exiftool prints for `tags` ("GPS:GPSLatitude", "XPComment", ...), as numbers (-n),
// one per tag in order; "-" for a tag the photo lacks.
std::vector<std::string> Exiftool(const CString& photo, const std::vector<std::string>& tags);
// Runs exiftool with `arguments` (shell words) on the photo, changing it in place; true on
// success.
bool ExiftoolWrite(const CString& photo, const std::string& arguments);
// Every Exif.GPSInfo tag the exiv2 command prints, key -> raw value ("47/1 22/1 368/10").
std::map<std::string, std::string> Exiv2Gps(const CString& photo);
// Runs the exiv2 command's modify commands ("set Exif.GPSInfo.GPSLatitude 300/1 0/1 0/1") on
// the photo; true on success.
bool Exiv2Modify(const CString& photo, const std::vector<std::string>& commands);
// Degrees from an exiv2 rational triple "d/1 m/1 s/1000000"; NaN when it does not parse.
double Exiv2Degrees(const std::string& rationals);

// Runs the tagging tool in NAVMISC_TOOLS_DIR on a command file; its exit status (-1 when it did
// not end within a minute, in which case it is killed).
int RunFixTag(const CString& commandFile);
// The path of the tagging tool.
CString FixTagPath();

}  // namespace navmisc::testutil
