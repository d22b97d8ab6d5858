// Round-trip fuzzing of settings files: whatever a file holds, every value the reader finds must
// come back identical after it is written with WR_* and read again, and numbers must parse the
// same way from the rewritten file.
//
// Run: settings_fuzz -max_len=4096 fuzz/corpus/settings

#include <stdlib.h>
#include <unistd.h>

#include <cmath>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <fstream>
#include <set>
#include <string>
#include <string_view>
#include <vector>

#include "navmisc/platform/settings.h"
#include "navmisc/platform/textconv.h"

namespace {

[[noreturn]] void Fail(const char* what, const std::wstring& section, const std::wstring& key) {
  fprintf(stderr, "settings round trip: %s [%s] %s\n", what, navmisc::ToUtf8Lossy(section).c_str(),
          navmisc::ToUtf8Lossy(key).c_str());
  abort();
}

const std::string& WorkDir() {
  static const std::string dir = [] {
    std::string templ = (access("/dev/shm", W_OK) == 0 ? "/dev/shm" : "/tmp");
    templ += "/settings-fuzz-XXXXXX";
    if (!mkdtemp(templ.data())) abort();
    return templ;
  }();
  return dir;
}

std::string_view Trim(std::string_view s) {
  while (!s.empty() && (s.front() == ' ' || s.front() == '\t')) s.remove_prefix(1);
  while (!s.empty() && (s.back() == ' ' || s.back() == '\t' || s.back() == '\r')) s.remove_suffix(1);
  return s;
}

// Section and key names the input seems to hold, found with a deliberately naive reading of
// the lines, plus a few fixed ones. Names that the reader does not know simply give nothing.
void Candidates(std::string_view data, std::set<std::wstring>& sections, std::set<std::wstring>& keys) {
  sections = {L"", L"S", L"SECTION"};
  keys = {L"k", L"key"};
  while (!data.empty() && sections.size() < 48 && keys.size() < 96) {
    const size_t lf = data.find('\n');
    const std::string_view line = Trim(data.substr(0, lf));
    data.remove_prefix(lf == std::string_view::npos ? data.size() : lf + 1);
    if (line.size() >= 2 && line.front() == '[' && line.back() == ']') {
      sections.insert(navmisc::FromUtf8Lossy(Trim(line.substr(1, line.size() - 2))));
    } else if (const size_t eq = line.find('='); eq != std::string_view::npos) {
      keys.insert(navmisc::FromUtf8Lossy(Trim(line.substr(0, eq))));
    }
  }
}

struct Entry {
  std::wstring section, key, value;
  int as_int;
  double as_float;
};

bool SameDouble(double a, double b) {
  return (std::isnan(a) && std::isnan(b)) || std::memcmp(&a, &b, sizeof a) == 0;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  const std::string in_path = WorkDir() + "/in.ini";
  const std::string out_path = WorkDir() + "/out.ini";
  {
    std::ofstream out(in_path, std::ios::binary | std::ios::trunc);
    out.write(reinterpret_cast<const char*>(data), static_cast<std::streamsize>(size));
  }
  const std::wstring in_wide = navmisc::FromUtf8Lossy(in_path);
  const std::wstring out_wide = navmisc::FromUtf8Lossy(out_path);

  std::set<std::wstring> sections, keys;
  Candidates(std::string_view(reinterpret_cast<const char*>(data), size), sections, keys);

  const unsigned long r = RD_BEGIN(in_wide.c_str());
  if (!r) abort();  // a regular file always opens
  std::vector<Entry> found;
  for (const auto& s : sections) {
    for (const auto& k : keys) {
      // Two different defaults tell a stored value from a default that happens to match it.
      const CString a = RD_STRING(r, s.c_str(), k.c_str(), L"a");
      const CString b = RD_STRING(r, s.c_str(), k.c_str(), L"b");
      const bool exists = RD_EXISTS(r, s.c_str(), k.c_str());
      if (exists ? a != b : (a != L"a" || b != L"b")) Fail("RD_EXISTS disagrees with RD_STRING", s, k);
      if (exists) {
        found.push_back({s, k, a.str(), RD_INT(r, s.c_str(), k.c_str(), -12345),
                         RD_FLOAT(r, s.c_str(), k.c_str(), -0.5)});
      }
    }
  }
  RD_END(r);

  const unsigned long w = WR_BEGIN(out_wide.c_str());
  for (const auto& e : found) WR_STRING(w, e.section.c_str(), e.key.c_str(), e.value.c_str());
  if (WR_END(w) != 1) abort();

  const unsigned long back = RD_BEGIN(out_wide.c_str());
  if (!back) abort();
  for (const auto& e : found) {
    if (!RD_EXISTS(back, e.section.c_str(), e.key.c_str())) Fail("value lost", e.section, e.key);
    if (RD_STRING(back, e.section.c_str(), e.key.c_str()).str() != e.value) Fail("string changed", e.section, e.key);
    if (RD_INT(back, e.section.c_str(), e.key.c_str(), -12345) != e.as_int) Fail("int changed", e.section, e.key);
    if (!SameDouble(RD_FLOAT(back, e.section.c_str(), e.key.c_str(), -0.5), e.as_float)) {
      Fail("float changed", e.section, e.key);
    }
  }
  RD_END(back);
  return 0;
}
