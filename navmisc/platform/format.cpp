#include "navmisc/platform/format.h"

#include <charconv>
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <cwchar>
#include <limits>
#include <system_error>

#include "navmisc/platform/textconv.h"

namespace navmisc {
namespace {

locale_t CLocale() {
  static const locale_t loc = newlocale(LC_ALL_MASK, "C", static_cast<locale_t>(nullptr));
  return loc;
}

// One conversion of a format, split into its parts.
struct Conversion {
  std::string flags;
  int width = -1;
  int precision = -1;
  std::string length;  // "", "h", "hh", "l", "ll", "L", "z", "j", "t", "I64"
  char conv = 0;
};

template <class Out>
void AppendAscii(Out& out, std::string_view text) {
  out.append(text.begin(), text.end());
}

template <class Out>
void Pad(Out& out, size_t len, const Conversion& s, auto emit) {
  const bool left = s.flags.find('-') != std::string::npos;
  const size_t w = s.width > 0 ? static_cast<size_t>(s.width) : 0;
  if (!left && w > len) out.append(w - len, ' ');
  emit();
  if (left && w > len) out.append(w - len, ' ');
}

std::string BuildConversion(const Conversion& s, const char* length_override, char conv) {
  std::string f = "%";
  f += s.flags;
  if (s.width >= 0) f += std::to_string(s.width);
  if (s.precision >= 0) {
    f += '.';
    f += std::to_string(s.precision);
  }
  f += length_override;
  f += conv;
  return f;
}

template <class T>
std::string Snprintf(const std::string& pattern, T value) {
  char buf[128];
  int n = std::snprintf(buf, sizeof buf, pattern.c_str(), value);
  if (n < 0) return {};
  if (static_cast<size_t>(n) < sizeof buf) return std::string(buf, static_cast<size_t>(n));
  std::string big(static_cast<size_t>(n) + 1, '\0');
  std::snprintf(big.data(), big.size(), pattern.c_str(), value);
  big.resize(static_cast<size_t>(n));
  return big;
}

// Formats one numeric or pointer conversion, consuming its argument.
std::string FormatNumber(const Conversion& s, va_list& args) {
  const char c = s.conv;
  const std::string& l = s.length;
  if (c == 'd' || c == 'i') {
    long long v;
    if (l == "ll" || l == "I64" || l == "j") v = va_arg(args, long long);
    else if (l == "l" || l == "z" || l == "t") v = va_arg(args, long);
    else v = va_arg(args, int);
    if (l == "h") v = static_cast<short>(v);
    if (l == "hh") v = static_cast<signed char>(v);
    return Snprintf(BuildConversion(s, "ll", c), v);
  }
  if (c == 'u' || c == 'o' || c == 'x' || c == 'X') {
    unsigned long long v;
    if (l == "ll" || l == "I64" || l == "j") v = va_arg(args, unsigned long long);
    else if (l == "l" || l == "z" || l == "t") v = va_arg(args, unsigned long);
    else v = va_arg(args, unsigned int);
    if (l == "h") v = static_cast<unsigned short>(v);
    if (l == "hh") v = static_cast<unsigned char>(v);
    return Snprintf(BuildConversion(s, "ll", c), v);
  }
  if (c == 'f' || c == 'F' || c == 'e' || c == 'E' || c == 'g' || c == 'G' || c == 'a' ||
      c == 'A') {
    if (l == "L") return Snprintf(BuildConversion(s, "L", c), va_arg(args, long double));
    return Snprintf(BuildConversion(s, "", c), va_arg(args, double));
  }
  if (c == 'p') return Snprintf(BuildConversion(s, "", 'p'), va_arg(args, void*));
  return {};
}

template <class Char>
size_t StrLen(const Char* p, int precision) {
  size_t n = 0;
  while ((precision < 0 || n < static_cast<size_t>(precision)) && p[n]) ++n;
  return n;
}

// The shared engine. `wide_out` tells which string kind "%s" means (the output's own).
template <class Char>
std::basic_string<Char> VFormat(const Char* fmt, va_list in_args) {
  constexpr bool kWide = sizeof(Char) == sizeof(wchar_t);
  std::basic_string<Char> out;
  if (!fmt) return out;
  CLocaleScope c_locale;
  va_list args;
  va_copy(args, in_args);
  for (const Char* p = fmt; *p;) {
    if (*p != '%') {
      out.push_back(*p++);
      continue;
    }
    ++p;
    if (*p == '%') {
      out.push_back('%');
      ++p;
      continue;
    }
    Conversion s;
    while (*p == '-' || *p == '+' || *p == ' ' || *p == '#' || *p == '0') s.flags += static_cast<char>(*p++);
    if (*p == '*') {
      s.width = va_arg(args, int);
      if (s.width < 0) {
        s.flags += '-';
        s.width = -s.width;
      }
      ++p;
    } else {
      while (*p >= '0' && *p <= '9') s.width = (s.width < 0 ? 0 : s.width * 10) + (*p++ - '0');
    }
    if (*p == '.') {
      ++p;
      s.precision = 0;
      if (*p == '*') {
        s.precision = va_arg(args, int);
        if (s.precision < 0) s.precision = -1;
        ++p;
      } else {
        while (*p >= '0' && *p <= '9') s.precision = s.precision * 10 + (*p++ - '0');
      }
    }
    if (p[0] == 'I' && p[1] == '6' && p[2] == '4') {
      s.length = "I64";
      p += 3;
    } else {
      while (*p == 'h' || *p == 'l' || *p == 'L' || *p == 'z' || *p == 'j' || *p == 't') s.length += static_cast<char>(*p++);
    }
    if (!*p) break;
    s.conv = static_cast<char>(*p++);
    switch (s.conv) {
      case 's':
      case 'S': {
        // Which kind of string the argument is.
        bool arg_wide = (s.conv == 's') == kWide;
        if (s.length == "l" || s.length == "w") arg_wide = true;
        if (s.length == "h") arg_wide = false;
        std::basic_string<Char> piece;
        if (arg_wide) {
          const wchar_t* w = va_arg(args, const wchar_t*);
          if (!w) w = L"(null)";
          std::wstring_view v(w, StrLen(w, s.precision));
          if constexpr (kWide) piece.assign(v.begin(), v.end());
          else piece = ToUtf8Lossy(v);
        } else {
          const char* a = va_arg(args, const char*);
          if (!a) a = "(null)";
          std::string_view v(a, StrLen(a, s.precision));
          if constexpr (kWide) piece = FromUtf8Lossy(v);
          else piece.assign(v.begin(), v.end());
        }
        Pad(out, piece.size(), s, [&] { out += piece; });
        break;
      }
      case 'c':
      case 'C': {
        bool arg_wide = (s.conv == 'c') == kWide;
        if (s.length == "l" || s.length == "w") arg_wide = true;
        if (s.length == "h") arg_wide = false;
        std::basic_string<Char> piece;
        if (arg_wide) {
          wchar_t ch = static_cast<wchar_t>(va_arg(args, wint_t));
          if constexpr (kWide) piece.push_back(ch);
          else piece = ToUtf8Lossy(std::wstring_view(&ch, 1));
        } else {
          char ch = static_cast<char>(va_arg(args, int));
          piece.push_back(static_cast<Char>(static_cast<unsigned char>(ch)));
        }
        Pad(out, piece.size(), s, [&] { out += piece; });
        break;
      }
      case 'n':
        (void)va_arg(args, void*);
        break;
      default: {
        std::string num = FormatNumber(s, args);
        AppendAscii(out, num);
        break;
      }
    }
  }
  va_end(args);
  return out;
}

// |value| * 10^d rounded as printf rounds it. The double is m * 2^e with an integer m, so the
// product is m * 10^d / 2^-e, an exact 128-bit integer division whose remainder decides the
// rounding (half to even, like printf on an exact tie).
unsigned __int128 ScaledExactly(double value, uint64_t scale) {
  uint64_t bits;
  std::memcpy(&bits, &value, sizeof bits);
  const int exp_bits = static_cast<int>((bits >> 52) & 0x7FF);
  uint64_t mant = bits & ((uint64_t{1} << 52) - 1);
  int e;
  if (exp_bits == 0) {
    e = -1074;  // subnormal (or zero)
  } else {
    mant |= uint64_t{1} << 52;
    e = exp_bits - 1075;
  }
  if (e >= 0) return (static_cast<unsigned __int128>(mant) * scale) << e;  // |value| < 1e15
  const int shift = -e;
  if (shift > 100) return 0;  // far below half a unit of the last digit
  const unsigned __int128 n = static_cast<unsigned __int128>(mant) * scale;
  unsigned __int128 q = n >> shift;
  const unsigned __int128 rem = n - (q << shift);
  const unsigned __int128 half = static_cast<unsigned __int128>(1) << (shift - 1);
  if (rem > half || (rem == half && (q & 1))) ++q;
  return q;
}

// "%.*f" for the common case, exactly as printf writes it. Returns false when the value is
// outside the range this handles.
bool FastFixed(char* buf, size_t& len, double value, int decimals) {
  if (decimals < 0 || decimals > 9 || !std::isfinite(value) || std::fabs(value) >= 1e15) return false;
  static constexpr uint64_t kPow10[] = {1, 10, 100, 1000, 10000, 100000, 1000000, 10000000,
                                        100000000, 1000000000};
  const bool negative = std::signbit(value);
  const uint64_t scale = kPow10[decimals];
  // Below 2^40 the rounded product |value| * 10^d is within 2^-14 of the exact one; unless the
  // fraction is that close to a half, rounding it gives what the exact division would.
  unsigned __int128 q128;
  const double y = std::fabs(value) * static_cast<double>(scale);
  const double floor = std::floor(y);
  if (y < 0x1p40 && std::fabs(y - floor - 0.5) > 0x1p-11) {
    q128 = static_cast<uint64_t>(floor) + (y - floor > 0.5 ? 1 : 0);
  } else {
    q128 = ScaledExactly(value, scale);
  }
  uint64_t whole, frac;
  if ((q128 >> 64) == 0) {  // the usual case: plain 64-bit division
    const uint64_t q = static_cast<uint64_t>(q128);
    whole = q / scale;
    frac = q % scale;
  } else {
    whole = static_cast<uint64_t>(q128 / scale);
    frac = static_cast<uint64_t>(q128 % scale);
  }
  char* p = buf;
  if (negative) *p++ = '-';
  p = std::to_chars(p, p + 24, whole).ptr;
  if (decimals > 0) {
    *p++ = '.';
    for (int i = decimals - 1; i >= 0; --i) {
      p[i] = static_cast<char>('0' + frac % 10);
      frac /= 10;
    }
    p += decimals;
  }
  len = static_cast<size_t>(p - buf);
  return true;
}

template <class Out>
void AppendFixedImpl(Out& out, double value, int decimals) {
  char buf[400];
  size_t len;
  if (FastFixed(buf, len, value, decimals)) {
    AppendAscii(out, std::string_view(buf, len));
    return;
  }
  auto r = std::to_chars(buf, buf + sizeof buf, value, std::chars_format::fixed, decimals);
  if (r.ec != std::errc()) {
    AppendAscii(out, Snprintf("%." + std::to_string(decimals) + "f", value));
    return;
  }
  AppendAscii(out, std::string_view(buf, static_cast<size_t>(r.ptr - buf)));
}

template <class Out>
void AppendIntImpl(Out& out, long long value) {
  char buf[32];
  auto r = std::to_chars(buf, buf + sizeof buf, value);
  AppendAscii(out, std::string_view(buf, static_cast<size_t>(r.ptr - buf)));
}

}  // namespace

CLocaleScope::CLocaleScope() : previous_(uselocale(CLocale())) {}
CLocaleScope::~CLocaleScope() { uselocale(previous_); }

std::wstring VFormatW(const wchar_t* fmt, va_list args) { return VFormat<wchar_t>(fmt, args); }
std::string VFormatA(const char* fmt, va_list args) { return VFormat<char>(fmt, args); }

std::wstring FormatW(const wchar_t* fmt, ...) {
  va_list args;
  va_start(args, fmt);
  std::wstring s = VFormatW(fmt, args);
  va_end(args);
  return s;
}

std::string FormatA(const char* fmt, ...) {
  va_list args;
  va_start(args, fmt);
  std::string s = VFormatA(fmt, args);
  va_end(args);
  return s;
}

void AppendFixed(std::string& out, double value, int decimals) { AppendFixedImpl(out, value, decimals); }

char* WriteFixed(char* p, double value, int decimals) {
  size_t len;
  if (FastFixed(p, len, value, decimals)) return p + len;
  std::string slow;
  AppendFixedImpl(slow, value, decimals);
  std::memcpy(p, slow.data(), slow.size());
  return p + slow.size();
}
void AppendFixed(std::wstring& out, double value, int decimals) { AppendFixedImpl(out, value, decimals); }
void AppendInt(std::string& out, long long value) { AppendIntImpl(out, value); }
void AppendInt(std::wstring& out, long long value) { AppendIntImpl(out, value); }

std::string ShortestDouble(double value) {
  char buf[64];
  auto r = std::to_chars(buf, buf + sizeof buf, value);
  return std::string(buf, static_cast<size_t>(r.ptr - buf));
}

}  // namespace navmisc
