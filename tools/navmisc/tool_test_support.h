// Running the navmisc program from its tests.
#pragma once

#include <string>

#include "testutil.h"

namespace navmisc::testutil {

// `ENV navmisc ARGS` in a shell (ENV: variable settings or shell commands run first), standard
// error joined to standard output, no input.
inline CommandResult RunTool(const std::string& args, const std::string& env = "") {
  return RunCommand(env + " " + ShellQuote(NAVMISC_TOOL_PATH) + " " + args + " 2>&1 </dev/null");
}

}  // namespace navmisc::testutil
