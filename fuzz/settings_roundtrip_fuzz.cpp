// Write, read, compare: documents built from the input with WR_* (any names, any text, any int,
// any double bit pattern) read back exactly as the format promises. Names a file cannot carry are
// refused by the writer, text that is not Unicode comes back as U+FFFD, a NUL ends a text, the
// last write of a name wins, and names match without regard to ASCII case.
//
// Run: settings_roundtrip_fuzz -max_len=2048

#include <fuzzer/FuzzedDataProvider.h>

#include <climits>
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <map>
#include <string>
#include <utility>

#include "navmisc/platform/settings.h"
#include "navmisc/platform/textconv.h"

namespace {

[[noreturn]] void Fail(const char* what, const std::wstring& section, const std::wstring& key) {
  std::fprintf(stderr, "settings write-read: %s [%s] %s\n", what, navmisc::ToUtf8Lossy(section).c_str(),
               navmisc::ToUtf8Lossy(key).c_str());
  std::abort();
}

// Characters that exercise the format: its own punctuation, blanks, controls, non-ASCII text,
// and code points that are not Unicode at all.
std::wstring Text(FuzzedDataProvider& in, size_t maxLength) {
  static constexpr wchar_t kSpecial[] = {L'[', L']', L'=', L';', L'#', L'"', L'\\', L' ', L'\t', L'\n', L'\r',
                                         L'\0', 0x7F, 0x01, L'A', L'z', 0xE9, 0xDF, 0x20AC, 0x1F6B4,
                                         0xD800, 0xDFFF, 0x110000, L'x', L'\'', L'%'};
  std::wstring out;
  const size_t length = in.ConsumeIntegralInRange<size_t>(0, maxLength);
  for (size_t i = 0; i < length && in.remaining_bytes() > 0; ++i) {
    const uint8_t b = in.ConsumeIntegral<uint8_t>();
    if (b < 2 * std::size(kSpecial)) out += kSpecial[b % std::size(kSpecial)];
    else out += static_cast<wchar_t>(b < 0xF0 ? 0x20 + b % 0x5F : in.ConsumeIntegralInRange<uint32_t>(0, 0x10FFFF));
  }
  return out;
}

// A wide text as the library receives it: up to its first NUL.
std::wstring AsPassed(const std::wstring& s) { return std::wstring(s.c_str()); }

bool IsUnicode(wchar_t c) { return static_cast<uint32_t>(c) <= 0x10FFFF && !(c >= 0xD800 && c <= 0xDFFF); }

// The rules of docs/settings-format.md for names.
bool ValidName(const std::wstring& name, bool key) {
  std::string utf8;
  for (wchar_t c : name) {
    if (!IsUnicode(c) || c < 0x20 || c == 0x7F) return false;
  }
  if (!navmisc::WideToUtf8(name, utf8) || utf8.size() > 4096) return false;
  if (!name.empty() && (name.front() == L' ' || name.front() == L'\t' || name.back() == L' ' || name.back() == L'\t')) return false;
  if (!key) return true;
  return !name.empty() && name.find(L'=') == std::wstring::npos && name.front() != L'[' && name.front() != L';' &&
         name.front() != L'#';
}

std::wstring Fold(std::wstring s) {
  for (wchar_t& c : s) {
    if (c >= L'A' && c <= L'Z') c = static_cast<wchar_t>(c - L'A' + L'a');
  }
  return s;
}

struct Expected {
  int kind;  // 0 text, 1 int, 2 double
  std::wstring text;
  int integer;
  double real;
  std::wstring section, key;  // as first written
};

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  FuzzedDataProvider in(data, size);
  std::map<std::pair<std::wstring, std::wstring>, Expected> model;
  const unsigned long w = WR_BEGIN(L"memory");
  for (int n = 0; n < 64 && in.remaining_bytes() > 0; ++n) {
    const std::wstring section = AsPassed(Text(in, 8)), key = AsPassed(Text(in, 8));
    Expected e{in.ConsumeIntegralInRange(0, 2), {}, 0, 0.0, section, key};
    if (e.kind == 0) {
      const std::wstring value = AsPassed(Text(in, 24));
      WR_STRING(w, section.c_str(), key.c_str(), value.c_str());
      for (wchar_t c : value) e.text += IsUnicode(c) ? c : static_cast<wchar_t>(0xFFFD);
    } else if (e.kind == 1) {
      e.integer = in.ConsumeIntegral<int>();
      WR_INT(w, section.c_str(), key.c_str(), e.integer);
    } else {
      const uint64_t bits = in.ConsumeIntegral<uint64_t>();
      std::memcpy(&e.real, &bits, sizeof e.real);
      WR_FLOAT(w, section.c_str(), key.c_str(), e.real);
    }
    if (!ValidName(section, false) || !ValidName(key, true)) continue;
    auto [it, added] = model.try_emplace({Fold(section), Fold(key)}, e);
    if (!added) {  // the name keeps its first spelling, the value is the last one
      e.section = it->second.section;
      e.key = it->second.key;
      it->second = e;
    }
  }
  std::string doc;
  if (!navmisc::EndSettingsToMemory(w, doc)) std::abort();

  const unsigned long r = navmisc::ReadSettingsFromMemory(doc);
  if (navmisc::SettingsEntries(r).size() != model.size()) Fail("entries appeared or went missing", L"", L"");
  for (const auto& [name, e] : model) {
    // Any spelling of the name finds it.
    const wchar_t* s = name.first.c_str();
    const wchar_t* k = e.key.c_str();
    if (!RD_EXISTS(r, s, k)) Fail("value lost", e.section, e.key);
    if (e.kind == 0 && RD_STRING(r, s, k, L"\x1").str() != e.text) Fail("text changed", e.section, e.key);
    if (e.kind == 1 && RD_INT(r, s, k, 0) != e.integer) Fail("int changed", e.section, e.key);
    if (e.kind == 2) {
      const double back = RD_FLOAT(r, s, k, 0.0);
      if (!(std::isnan(back) && std::isnan(e.real)) && std::memcmp(&back, &e.real, sizeof back) != 0)
        Fail("double changed", e.section, e.key);
    }
  }
  RD_END(r);
  return 0;
}
