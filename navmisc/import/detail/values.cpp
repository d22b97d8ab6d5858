#include "navmisc/import/detail/values.h"

#include <charconv>
#include <cstdint>
#include <cmath>

namespace navmisc::import::detail {

namespace {

// Plain decimals of at most 15 digits ("47.3712345", "-8", "410.5"), the form nearly every
// track file writes. Both the digits, as an integer below 2^53, and the power of ten up to 10^22
// are exact doubles, so one division gives the correctly rounded value, as from_chars would.
// Anything else (exponents, more digits, junk) is left to the caller.
bool ParsePlainDecimal(std::string_view text, double& value) {
  static constexpr double kPowers[] = {1e0,  1e1,  1e2,  1e3,  1e4,  1e5,  1e6,  1e7,
                                       1e8,  1e9,  1e10, 1e11, 1e12, 1e13, 1e14, 1e15};
  size_t i = 0;
  const bool negative = !text.empty() && text[0] == '-';
  i += negative;
  uint64_t digits = 0;
  int count = 0, decimals = 0;
  bool point = false;
  for (; i < text.size(); ++i) {
    const char c = text[i];
    if (c >= '0' && c <= '9') {
      if (++count > 15) return false;
      digits = digits * 10 + static_cast<unsigned>(c - '0');
      decimals += point;
    } else if (c == '.' && !point) {
      point = true;
    } else {
      return false;
    }
  }
  if (count == 0) return false;
  const double v = static_cast<double>(digits) / kPowers[decimals];
  value = negative ? -v : v;
  return true;
}

}  // namespace

bool ParseNumber(std::string_view text, double& value) {
  text = TrimSpace(text);
  if (!text.empty() && text.front() == '+') text.remove_prefix(1);
  if (text.empty()) return false;
  if (ParsePlainDecimal(text, value)) return true;
  // from_chars reads "inf" and "nan" too; a number starts with a digit, a sign or a point.
  const char c = text.front();
  if (!(c == '-' || c == '.' || (c >= '0' && c <= '9'))) return false;
  double v = 0;
  const auto [end, ec] = std::from_chars(text.data(), text.data() + text.size(), v);
  if (ec != std::errc() || end != text.data() + text.size() || !std::isfinite(v)) return false;
  value = v;
  return true;
}

unsigned DaysInMonth(int64_t year, unsigned month) {
  static constexpr unsigned kDays[] = {31, 28, 31, 30, 31, 30, 31, 31, 30, 31, 30, 31};
  if (month == 2) {
    const bool leap = (year % 4 == 0 && year % 100 != 0) || year % 400 == 0;
    return leap ? 29 : 28;
  }
  return kDays[month - 1];
}

int64_t DaysFromCivil(int64_t y, unsigned m, unsigned d) {
  // The usual era-based conversion: years start in March so that the leap day comes last.
  y -= m <= 2;
  const int64_t era = (y >= 0 ? y : y - 399) / 400;
  const unsigned yoe = static_cast<unsigned>(y - era * 400);
  const unsigned doy = (153 * (m + (m > 2 ? -3 : 9)) + 2) / 5 + d - 1;
  const unsigned doe = yoe * 365 + yoe / 4 - yoe / 100 + doy;
  return era * 146097 + static_cast<int64_t>(doe) - 719468;
}

namespace {

// Reads exactly `n` digits at `pos`.
bool Digits(std::string_view s, size_t& pos, size_t n, int& out) {
  if (pos + n > s.size()) return false;
  int v = 0;
  for (size_t i = 0; i < n; ++i) {
    const char c = s[pos + i];
    if (c < '0' || c > '9') return false;
    v = v * 10 + (c - '0');
  }
  pos += n;
  out = v;
  return true;
}

bool Expect(std::string_view s, size_t& pos, char c) {
  if (pos >= s.size() || s[pos] != c) return false;
  ++pos;
  return true;
}

}  // namespace

bool ParseIsoTime(std::string_view text, int64_t& seconds) {
  const std::string_view s = TrimSpace(text);
  size_t pos = 0;
  int year = 0, month = 0, day = 0, hour = 0, minute = 0, second = 0;
  if (!Digits(s, pos, 4, year) || !Expect(s, pos, '-') || !Digits(s, pos, 2, month) ||
      !Expect(s, pos, '-') || !Digits(s, pos, 2, day))
    return false;
  if (pos >= s.size() || (s[pos] != 'T' && s[pos] != 't' && s[pos] != ' ')) return false;
  ++pos;
  if (!Digits(s, pos, 2, hour) || !Expect(s, pos, ':') || !Digits(s, pos, 2, minute) ||
      !Expect(s, pos, ':') || !Digits(s, pos, 2, second))
    return false;
  if (pos < s.size() && s[pos] == '.') {
    ++pos;
    const size_t start = pos;
    while (pos < s.size() && s[pos] >= '0' && s[pos] <= '9') ++pos;
    if (pos == start) return false;
  }
  int offset = 0;  // seconds east of UTC
  if (pos < s.size()) {
    const char z = s[pos];
    if (z == 'Z' || z == 'z') {
      ++pos;
    } else if (z == '+' || z == '-') {
      ++pos;
      int oh = 0, om = 0;
      if (!Digits(s, pos, 2, oh)) return false;
      if (pos < s.size()) {
        if (s[pos] == ':') ++pos;
        if (!Digits(s, pos, 2, om)) return false;
      }
      if (oh > 14 || om > 59) return false;
      offset = (oh * 60 + om) * 60 * (z == '-' ? -1 : 1);
    }
  }
  if (pos != s.size()) return false;
  if (month < 1 || month > 12 || day < 1 || static_cast<unsigned>(day) > DaysInMonth(year, month) ||
      hour > 23 || minute > 59 || second > 60)
    return false;
  seconds = DaysFromCivil(year, static_cast<unsigned>(month), static_cast<unsigned>(day)) * 86400 +
            hour * 3600 + minute * 60 + second - offset;
  return true;
}

bool TimeInRange(int64_t s) { return s >= 0 && s <= kMaxTime; }
bool LatitudeInRange(double d) { return d >= -90.0 && d <= 90.0; }
bool LongitudeInRange(double d) { return d >= -180.0 && d <= 180.0; }
bool AltitudeInRange(double m) { return m >= -100000.0 && m <= 100000.0; }
bool SpeedInRange(double v) { return v >= 0.0 && v <= 100000.0; }
bool CourseInRange(double d) { return d >= 0.0 && d <= 360.0; }
bool SampleInRange(double v) { return v >= 0.0 && v <= 254.0 && v == std::floor(v); }

void AppendCapped(std::string& out, std::string_view text, size_t limit) {
  if (out.size() >= limit) return;
  if (out.size() + text.size() <= limit) {
    out.append(text);
    return;
  }
  size_t take = limit - out.size();
  // Back off to the start of a character: never end on a lead byte or inside a sequence.
  while (take > 0 && (static_cast<unsigned char>(text[take]) & 0xC0) == 0x80) --take;
  out.append(text.substr(0, take));
}

}  // namespace navmisc::import::detail
