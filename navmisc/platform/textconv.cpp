#include "navmisc/platform/textconv.h"

#include <cstring>

#include "navmisc/platform/detail/utf8.h"

namespace navmisc {
namespace {

bool ValidScalar(char32_t c) { return c <= 0x10FFFF && (c < 0xD800 || c > 0xDFFF); }

// Decodes one UTF-8 sequence at in[i]; returns false for a malformed one (overlong forms,
// surrogates and values beyond U+10FFFF included). `len` receives the bytes to skip.
bool DecodeUtf8(std::string_view in, size_t i, char32_t& c, size_t& len) {
  const unsigned char b0 = static_cast<unsigned char>(in[i]);
  len = 1;
  if (b0 < 0x80) {
    c = b0;
    return true;
  }
  size_t need;
  char32_t min;
  if ((b0 & 0xE0) == 0xC0) {
    need = 1; c = b0 & 0x1F; min = 0x80;
  } else if ((b0 & 0xF0) == 0xE0) {
    need = 2; c = b0 & 0x0F; min = 0x800;
  } else if ((b0 & 0xF8) == 0xF0) {
    need = 3; c = b0 & 0x07; min = 0x10000;
  } else {
    return false;
  }
  if (i + need >= in.size()) return false;  // truncated sequence at the end
  for (size_t k = 1; k <= need; ++k) {
    const unsigned char b = static_cast<unsigned char>(in[i + k]);
    if ((b & 0xC0) != 0x80) return false;
    c = (c << 6) | (b & 0x3F);
  }
  len = need + 1;
  return c >= min && ValidScalar(c);
}

}  // namespace

bool WideToUtf8(std::wstring_view in, std::string& out) {
  out.clear();
  out.reserve(in.size());
  for (wchar_t w : in) {
    const char32_t c = static_cast<char32_t>(w);
    if (c < 0x80) {  // most text is ASCII
      out.push_back(static_cast<char>(c));
      continue;
    }
    if (!ValidScalar(c)) {
      out.clear();
      return false;
    }
    detail::AppendUtf8(out, c);
  }
  return true;
}

bool Utf8ToWide(std::string_view in, std::wstring& out) {
  out.clear();
  out.reserve(in.size());
  for (size_t i = 0; i < in.size();) {
    char32_t c;
    size_t len;
    if (!DecodeUtf8(in, i, c, len)) {
      out.clear();
      return false;
    }
    out.push_back(static_cast<wchar_t>(c));
    i += len;
  }
  return true;
}

std::string ToUtf8Lossy(std::wstring_view in) {
  std::string out;
  out.reserve(in.size());
  for (wchar_t w : in) {
    const char32_t c = static_cast<char32_t>(w);
    if (ValidScalar(c)) detail::AppendUtf8(out, c);
    else out.push_back('?');
  }
  return out;
}

std::wstring FromUtf8Lossy(std::string_view in) {
  std::wstring out;
  out.reserve(in.size());
  for (size_t i = 0; i < in.size();) {
    char32_t c;
    size_t len;
    if (DecodeUtf8(in, i, c, len)) {
      out.push_back(static_cast<wchar_t>(c));
    } else {
      out.push_back(L'\xFFFD');
    }
    i += len;
  }
  return out;
}

void AppendUtf16Le(std::wstring_view in, std::string& out) {
  out.reserve(out.size() + in.size() * 2);
  auto unit = [&out](char32_t u) {
    out.push_back(static_cast<char>(u & 0xFF));
    out.push_back(static_cast<char>(u >> 8));
  };
  for (wchar_t w : in) {
    char32_t c = static_cast<char32_t>(w);
    if (!ValidScalar(c)) c = 0xFFFD;
    if (c < 0x10000) {
      unit(c);
    } else {
      c -= 0x10000;
      unit(0xD800 + (c >> 10));
      unit(0xDC00 + (c & 0x3FF));
    }
  }
}

std::wstring Utf16LeToWide(const unsigned char* data, size_t size, size_t maxChars) {
  std::wstring out;
  const size_t units = size / 2;
  auto at = [data](size_t i) { return static_cast<char32_t>(data[2 * i] | (data[2 * i + 1] << 8)); };
  for (size_t i = 0; i < units && out.size() < maxChars; ++i) {
    char32_t c = at(i);
    if (c == 0) break;
    if (c >= 0xD800 && c <= 0xDBFF && i + 1 < units && at(i + 1) >= 0xDC00 && at(i + 1) <= 0xDFFF) {
      c = 0x10000 + ((c - 0xD800) << 10) + (at(i + 1) - 0xDC00);
      ++i;
    } else if (c >= 0xD800 && c <= 0xDFFF) {
      c = 0xFFFD;
    }
    out.push_back(static_cast<wchar_t>(c));
  }
  return out;
}

}  // namespace navmisc

int WCSToMBS(const wchar_t* src, char* dst, int size, bool /*utf8*/) {
  if (!dst || size <= 0) return 0;
  dst[0] = '\0';
  if (!src) return 0;
  std::string out;
  if (!navmisc::WideToUtf8(src, out) || out.size() + 1 > static_cast<size_t>(size)) return 0;
  std::memcpy(dst, out.c_str(), out.size() + 1);
  return static_cast<int>(out.size());
}

int MBSToWCS(const char* src, wchar_t* dst, int size, bool /*utf8*/) {
  if (!dst || size <= 0) return 0;
  dst[0] = L'\0';
  if (!src) return 0;
  std::wstring out;
  if (!navmisc::Utf8ToWide(src, out) || out.size() + 1 > static_cast<size_t>(size)) return 0;
  std::wmemcpy(dst, out.c_str(), out.size() + 1);
  return static_cast<int>(out.size());
}
