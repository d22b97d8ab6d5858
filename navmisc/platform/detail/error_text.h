// The system's text for an errno value ("No space left on device").
#pragma once

#include <cstring>
#include <string>

namespace navmisc::detail {

inline std::string ErrorText(int err) {
  char buf[256];
  // The GNU strerror_r returns the text, which may or may not live in `buf`.
  return strerror_r(err, buf, sizeof buf);
}

}  // namespace navmisc::detail
