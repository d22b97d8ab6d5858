#include "photo_testutil.h"

#include <cmath>
#include <cstdio>
#include <sstream>

#include "navmisc/platform/process.h"
#include "testutil.h"

namespace navmisc::testutil {

bool HavePhotoReaders() {
  return HaveProgram("exiftool") && HaveProgram("exiv2");
}

std::vector<std::string> Exiftool(const CString& photo, const std::vector<std::string>& tags) {
  std::string command = "exiftool -n -f -s3";
  for (const std::string& t : tags) command += " " + ShellQuote("-" + t);
  const CommandResult r = RunCommand(command + " " + ShellQuote(photo.ToUtf8()) + " 2>/dev/null");
  std::vector<std::string> values;
  std::istringstream lines(r.out);
  for (std::string line; std::getline(lines, line);) values.push_back(line);
  values.resize(tags.size(), "(missing)");
  return values;
}

bool ExiftoolWrite(const CString& photo, const std::string& arguments) {
  return RunCommand("exiftool -q -q -overwrite_original " + arguments + " " +
                    ShellQuote(photo.ToUtf8()) + " >/dev/null 2>&1")
             .status == 0;
}

std::map<std::string, std::string> Exiv2Gps(const CString& photo) {
  const CommandResult r =
      RunCommand("exiv2 -Pkv -g Exif.GPSInfo. " + ShellQuote(photo.ToUtf8()) + " 2>/dev/null");
  std::map<std::string, std::string> tags;
  std::istringstream lines(r.out);
  for (std::string line; std::getline(lines, line);) {
    const size_t space = line.find(' ');
    if (space == std::string::npos) continue;
    const size_t value = line.find_first_not_of(' ', space);
    tags[line.substr(0, space)] = value == std::string::npos ? "" : line.substr(value);
  }
  return tags;
}

bool Exiv2Modify(const CString& photo, const std::vector<std::string>& commands) {
  std::string command = "exiv2";
  for (const std::string& c : commands) command += " -M" + ShellQuote(c);
  return RunCommand(command + " " + ShellQuote(photo.ToUtf8()) + " >/dev/null 2>&1").status == 0;
}

double Exiv2Degrees(const std::string& rationals) {
  double parts[3];
  unsigned long n[3], d[3];
  if (std::sscanf(rationals.c_str(), "%lu/%lu %lu/%lu %lu/%lu", &n[0], &d[0], &n[1], &d[1], &n[2],
                  &d[2]) != 6) {
    return NAN;
  }
  for (int i = 0; i < 3; ++i) parts[i] = static_cast<double>(n[i]) / static_cast<double>(d[i]);
  return parts[0] + parts[1] / 60.0 + parts[2] / 3600.0;
}

CString FixTagPath() {
  return CString::FromUtf8(NAVMISC_TOOLS_DIR "/FixTag.exe");
}

int RunFixTag(const CString& commandFile) {
  ChildProcess tool;
  if (!tool.Start({FixTagPath().ToUtf8(), "-ZE", commandFile.ToUtf8()},
                  {.nullStdin = true, .nullStdout = true, .nullStderr = true})) {
    return -1;
  }
  if (!tool.WaitFor(60000)) return -1;  // the destructor kills it
  return tool.exitStatus();
}

}  // namespace navmisc::testutil
