#include "navmisc/records/point_codec.h"

#include <cctype>
#include <charconv>
#include <cstdint>
#include <cstdlib>

#include "navmisc/platform/format.h"
#include "navmisc/records/point_file_format.h"

namespace navmisc::point_file {
namespace {

void Int(std::string& out, long long v) { AppendInt(out, v); }
void Fixed(std::string& out, double v) { AppendFixed(out, v, kDecimals); }
void Comma(std::string& out) { out.push_back(','); }
void End(std::string& out) { out.append(kLineEnd); }

bool IsSpace(char c) { return c == ' ' || c == '\t' || c == '\n' || c == '\r' || c == '\v' || c == '\f'; }

// "%d": blanks, an optional sign, at least one digit.
[[gnu::always_inline]] inline bool ScanInt(std::string_view s, size_t& i, int32_t& out) {
  const char* p = s.data() + i;
  const char* const end = s.data() + s.size();
  while (p < end && IsSpace(*p)) ++p;
  bool neg = false;
  if (p < end && (*p == '+' || *p == '-')) neg = *p++ == '-';
  const char* const digits = p;
  // Up to 18 digits cannot overflow; longer runs take the careful loop.
  uint64_t v = 0;
  const char* fast_end = end - p > 18 ? p + 18 : end;
  while (p < fast_end && static_cast<unsigned>(*p - '0') < 10) v = v * 10 + static_cast<unsigned>(*p++ - '0');
  if (p == digits) return false;
  // Like the C reader: the number is taken as a long, clamped on overflow, then cut to 32 bits.
  constexpr uint64_t kMax = 9223372036854775807ull;
  bool overflow = false;
  while (p < end && static_cast<unsigned>(*p - '0') < 10) {
    const unsigned d = static_cast<unsigned>(*p++ - '0');
    if (overflow || v > kMax / 10 || (v == kMax / 10 && d > kMax % 10)) overflow = true;
    else v = v * 10 + d;
  }
  long long signedV;
  if (overflow) signedV = neg ? (-9223372036854775807ll - 1) : 9223372036854775807ll;
  else signedV = neg ? -static_cast<long long>(v) : static_cast<long long>(v);
  out = static_cast<int32_t>(static_cast<uint32_t>(static_cast<unsigned long long>(signedV)));
  i = static_cast<size_t>(p - s.data());
  return true;
}

// "%lf": blanks, then a floating-point number as strtod reads it.
[[gnu::always_inline]] inline bool ScanDouble(std::string_view s, size_t& i, double& out) {
  size_t p = i;
  while (p < s.size() && IsSpace(s[p])) ++p;
  const char* first = s.data() + p;
  const char* last = s.data() + s.size();
  bool plus = false;
  if (first < last && *first == '+') {
    plus = true;
    ++first;
  }
  // The common case, "-ddd.dddddd": with at most 15 digits the digits form an exact integer and
  // 10^k is exact, so one IEEE division gives the correctly rounded value, the same double that
  // strtod gives. Anything else takes the general readers.
  {
    const char* q = first;
    const bool neg = q < last && *q == '-' && !plus;
    if (neg) ++q;
    uint64_t m = 0;
    int digits = 0, fraction = 0;
    const char* d = q;
    while (d < last && *d >= '0' && *d <= '9') { m = m * 10 + static_cast<unsigned>(*d - '0'); ++d; ++digits; }
    if (d < last && *d == '.') {
      ++d;
      while (d < last && *d >= '0' && *d <= '9') { m = m * 10 + static_cast<unsigned>(*d - '0'); ++d; ++digits; ++fraction; }
    }
    const bool more = d < last && (*d == 'e' || *d == 'E' || *d == 'x' || *d == 'X' || *d == 'p' || *d == 'P');
    if (digits > 0 && digits <= 15 && !more && d - q > (fraction ? 1 : 0)) {
      static constexpr double kPow10[] = {1e0, 1e1, 1e2, 1e3, 1e4, 1e5, 1e6, 1e7, 1e8,
                                          1e9, 1e10, 1e11, 1e12, 1e13, 1e14, 1e15};
      double v = static_cast<double>(m);
      if (fraction) v /= kPow10[fraction];
      out = neg ? -v : v;
      i = static_cast<size_t>(d - s.data());
      return true;
    }
  }
  // from_chars reads no hexadecimal: "0x.." (after a sign) goes through strtod below.
  const char* digits = (first < last && *first == '-') ? first + 1 : first;
  const bool hex = last - digits >= 2 && digits[0] == '0' && (digits[1] == 'x' || digits[1] == 'X');
  double v;
  auto r = std::from_chars(first, last, v);
  if (!hex && r.ec == std::errc() && !(plus && *first == '-')) {
    out = v;
    i = static_cast<size_t>(r.ptr - s.data());
    return true;
  }
  // Rare forms (inf, nan, hexadecimal, out of range): the C library's reading.
  std::string copy(s.substr(p, 64));
  CLocaleScope c_locale;
  char* end = nullptr;
  v = std::strtod(copy.c_str(), &end);
  if (end == copy.c_str()) return false;
  out = v;
  i = p + static_cast<size_t>(end - copy.c_str());
  return true;
}

[[gnu::always_inline]] inline bool Expect(std::string_view s, size_t& i, char c) {
  if (i < s.size() && s[i] == c) {
    ++i;
    return true;
  }
  return false;
}

// atoi/atof of one token.
int32_t TokenInt(std::string_view t) {
  size_t i = 0;
  int32_t v = 0;
  return ScanInt(t, i, v) ? v : 0;
}
double TokenDouble(std::string_view t) {
  size_t i = 0;
  double v = 0.0;
  return ScanDouble(t, i, v) ? v : 0.0;
}

// Calls `f(index, token)` for each comma-separated token.
template <class F>
void ForEachToken(std::string_view line, F f) {
  int index = 0;
  size_t start = 0;
  for (;;) {
    const size_t comma = line.find(',', start);
    f(index++, line.substr(start, comma == std::string_view::npos ? std::string_view::npos : comma - start));
    if (comma == std::string_view::npos) return;
    start = comma + 1;
  }
}

}  // namespace

void AppendPointLine(std::string& out, const WAYPOINT_ITEM_INFO& p) {
  // The hot path of saving a track: the line is built in place, then appended once.
  char line[4 * 12 + 3 * 340 + 16];
  char* at = line;
  auto integer = [&](int32_t v) { at = std::to_chars(at, at + 12, v).ptr; };
  auto fixed = [&](double v) { at = WriteFixed(at, v, kDecimals); };
  integer(p.time); *at++ = ',';
  fixed(p.latitude); *at++ = ',';
  fixed(p.longitude); *at++ = ',';
  fixed(p.altitude); *at++ = ',';
  integer(p.speed); *at++ = ',';
  integer(p.type); *at++ = ',';
  integer(p.course); *at++ = ',';
  integer(p.extraA); *at++ = ',';
  integer(p.extraB);
  *at++ = '\r';
  *at++ = '\n';
  out.append(line, static_cast<size_t>(at - line));
}

void AppendCellFixLine(std::string& out, const BASE_ITEM_INFO& c) {
  Int(out, c.time); Comma(out);
  out += c.name.ToUtf8(); Comma(out);
  Fixed(out, c.latitude); Comma(out);
  Fixed(out, c.longitude);
  End(out);
}

void AppendHelpPointLine(std::string& out, const WAYPOINT_ITEM_INFO& p) {
  Int(out, p.time); Comma(out);
  out += p.name.ToUtf8(); Comma(out);
  Fixed(out, p.latitude); Comma(out);
  Fixed(out, p.longitude); Comma(out);
  Fixed(out, p.altitude); Comma(out);
  Int(out, p.speed); Comma(out);
  Int(out, p.type); Comma(out);
  Int(out, p.course); Comma(out);
  Int(out, p.extraA);
  End(out);
}

void AppendHeartRateLine(std::string& out, int32_t time, const uint8_t* values, int count) {
  Int(out, time);
  // The terminating 255 is written too, so a short record ends in ",255".
  for (int i = 0; i < count; ++i) {
    Comma(out);
    Int(out, values[i]);
    if (values[i] == 255) break;
  }
  End(out);
}

void AppendWheelSpeedLine(std::string& out, const WHEEL_SPEED_ITEM_INFO& w) {
  Int(out, w.time);
  for (double v : w.values) {
    Comma(out);
    Fixed(out, v);
    if (v == -1.0) break;
  }
  End(out);
}

int ScanPointLine(std::string_view line, WAYPOINT_ITEM_INFO& p) {
  size_t i = 0;
  int32_t time = p.time, speed = p.speed, type = p.type, course = p.course, a = p.extraA, b = p.extraB;
  double lat = p.latitude, lon = p.longitude, alt = p.altitude;
  int n = 0;
  // Each field is stored as soon as it is read, so a line that breaks off keeps what it had.
  if (ScanInt(line, i, time)) { p.time = time; ++n; } else return n;
  if (!Expect(line, i, ',') || !ScanDouble(line, i, lat)) return n;
  p.latitude = lat; ++n;
  if (!Expect(line, i, ',') || !ScanDouble(line, i, lon)) return n;
  p.longitude = lon; ++n;
  if (!Expect(line, i, ',') || !ScanDouble(line, i, alt)) return n;
  p.altitude = alt; ++n;
  if (!Expect(line, i, ',') || !ScanInt(line, i, speed)) return n;
  p.speed = speed; ++n;
  if (!Expect(line, i, ',') || !ScanInt(line, i, type)) return n;
  p.type = type; ++n;
  if (!Expect(line, i, ',') || !ScanInt(line, i, course)) return n;
  p.course = course; ++n;
  if (!Expect(line, i, ',') || !ScanInt(line, i, a)) return n;
  p.extraA = a; ++n;
  if (!Expect(line, i, ',') || !ScanInt(line, i, b)) return n;
  p.extraB = b; ++n;
  return n;
}

void ParseCellFixLine(std::string_view line, BASE_ITEM_INFO& c) {
  ForEachToken(line, [&](int k, std::string_view t) {
    switch (k) {
      case 0: c.time = TokenInt(t); break;
      case 1: c.name = CString::FromUtf8(t); break;
      case 2: c.latitude = TokenDouble(t); break;
      case 3: c.longitude = TokenDouble(t); break;
      default: break;
    }
  });
}

void ParseHelpPointLine(std::string_view line, WAYPOINT_ITEM_INFO& p) {
  ForEachToken(line, [&](int k, std::string_view t) {
    switch (k) {
      case 0: p.time = TokenInt(t); break;
      case 1: p.name = CString::FromUtf8(t); break;
      case 2: p.latitude = TokenDouble(t); break;
      case 3: p.longitude = TokenDouble(t); break;
      case 4: p.altitude = TokenDouble(t); break;
      case 5: p.speed = TokenInt(t); break;
      case 6: p.type = TokenInt(t); break;
      case 7: p.course = TokenInt(t); break;
      case 8: p.extraA = TokenInt(t); break;
      default: break;
    }
  });
}

void ParseByteSampleLine(std::string_view line, int32_t& time, uint8_t* values, int capacity) {
  ForEachToken(line, [&](int k, std::string_view t) {
    if (k == 0) time = TokenInt(t);
    else if (k <= capacity) values[k - 1] = static_cast<uint8_t>(TokenInt(t));
  });
}

void ParseWheelSpeedLine(std::string_view line, WHEEL_SPEED_ITEM_INFO& w) {
  ForEachToken(line, [&](int k, std::string_view t) {
    if (k == 0) w.time = TokenInt(t);
    else if (k <= WHEEL_SPEED_ITEM_INFO::kValues) w.values[k - 1] = TokenDouble(t);
  });
}

}  // namespace navmisc::point_file
