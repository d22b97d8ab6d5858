// Reading the numbers and times of track files: strict, locale-free, and with the ranges a
// trip can store.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

namespace navmisc::import::detail {

// `text` without the XML white space (blank, tab, CR, LF) around it.
inline std::string_view TrimSpace(std::string_view text) {
  auto space = [](char c) { return c == ' ' || c == '\t' || c == '\r' || c == '\n'; };
  while (!text.empty() && space(text.front())) text.remove_prefix(1);
  while (!text.empty() && space(text.back())) text.remove_suffix(1);
  return text;
}

// A decimal number ("-12.5", "+3", "1e3"); surrounding white space allowed. False for anything
// else, for NaN and for infinities.
bool ParseNumber(std::string_view text, double& value);
// An XML Schema date-time "YYYY-MM-DDThh:mm:ss[.fff][Z|+hh:mm|-hh:mm|+hhmm|+hh]" as seconds
// since 1970 (UTC; a time without a zone is taken as UTC; fractions are dropped). A blank may
// stand for the "T". False when it does not read or names no real date.
bool ParseIsoTime(std::string_view text, int64_t& seconds);
// Days since 1970-01-01 of a proleptic Gregorian date (month 1..12).
int64_t DaysFromCivil(int64_t year, unsigned month, unsigned day);
unsigned DaysInMonth(int64_t year, unsigned month);

// Ranges a trip stores.
inline constexpr int64_t kMaxTime = 2147483647;  // times are signed 32-bit seconds
bool TimeInRange(int64_t seconds);
bool LatitudeInRange(double degrees);
bool LongitudeInRange(double degrees);
bool AltitudeInRange(double metres);      // -100 km .. 100 km
bool SpeedInRange(double metresPerSecond);  // 0 .. 100 km/s
bool CourseInRange(double degrees);       // 0 .. 360
bool SampleInRange(double value);         // heart rate or cadence: whole 0 .. 254

// Appends `text` to `out` as long as `out` stays within `limit` bytes; the cut falls at a whole
// UTF-8 character.
void AppendCapped(std::string& out, std::string_view text, size_t limit);

}  // namespace navmisc::import::detail
