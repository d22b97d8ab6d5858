#include "navmisc/platform/datetime.h"

#include <time.h>

#include <climits>
#include <cmath>
#include <cstdio>
#include <string_view>

// Calendar arithmetic is done here rather than with timegm/gmtime_r so that it does not depend
// on the TZ variable, covers every year that fits an int and gives the same answer on every
// system. Dates are proleptic Gregorian; "days" are days since 1970-01-01.

namespace {

constexpr int64_t kSecondsPerDay = 86400;
// 1899-12-30, the origin of COleDateTime, is 25569 days before 1970-01-01.
constexpr int64_t kOleEpochDays = 25569;
// The range COleDateTime accepts: 0100-01-01 .. 9999-12-31 (days since its origin).
constexpr double kOleMinDays = -657434.0;
constexpr double kOleMaxDays = 2958466.0;  // exclusive: the first day of year 10000

int64_t FloorDiv(int64_t a, int64_t b) {
  int64_t q = a / b;
  return (a % b != 0 && ((a < 0) != (b < 0))) ? q - 1 : q;
}

int64_t FloorMod(int64_t a, int64_t b) { return a - FloorDiv(a, b) * b; }

// Days since 1970-01-01 of a proleptic Gregorian date (month 1..12, day 1..31).
int64_t DaysFromCivil(int64_t y, int64_t m, int64_t d) {
  y -= m <= 2;
  const int64_t era = FloorDiv(y, 400);
  const int64_t yoe = y - era * 400;                                    // [0, 399]
  const int64_t doy = (153 * (m + (m > 2 ? -3 : 9)) + 2) / 5 + d - 1;   // [0, 365]
  const int64_t doe = yoe * 365 + yoe / 4 - yoe / 100 + doy;            // [0, 146096]
  return era * 146097 + doe - 719468;
}

struct Civil {
  int64_t year;
  int month;
  int day;
};

Civil CivilFromDays(int64_t z) {
  z += 719468;
  const int64_t era = FloorDiv(z, 146097);
  const int64_t doe = z - era * 146097;
  const int64_t yoe = (doe - doe / 1460 + doe / 36524 - doe / 146096) / 365;
  const int64_t doy = doe - (365 * yoe + yoe / 4 - yoe / 100);
  const int64_t mp = (5 * doy + 2) / 153;
  const int day = static_cast<int>(doy - (153 * mp + 2) / 5 + 1);
  const int month = static_cast<int>(mp < 10 ? mp + 3 : mp - 9);
  return {yoe + era * 400 + (month <= 2), month, day};
}

bool IsLeap(int64_t y) { return (y % 4 == 0 && y % 100 != 0) || y % 400 == 0; }

int DaysInMonth(int64_t y, int m) {
  static constexpr int kDays[12] = {31, 28, 31, 30, 31, 30, 31, 31, 30, 31, 30, 31};
  return m == 2 && IsLeap(y) ? 29 : kDays[m - 1];
}

bool FieldsInRange(int64_t y, int mo, int d, int h, int mi, int s) {
  return mo >= 1 && mo <= 12 && d >= 1 && d <= DaysInMonth(y, mo) && h >= 0 && h <= 23 &&
         mi >= 0 && mi <= 59 && s >= 0 && s <= 59;
}

// Seconds since 1970 of UTC fields, normalising out-of-range fields the way timegm does.
// Every int input gives a result well inside int64_t, so no overflow is possible.
int64_t FieldsToSeconds(int64_t year, int64_t month, int64_t day, int64_t hour, int64_t minute,
                        int64_t second) {
  int64_t m0 = month - 1;
  year += FloorDiv(m0, 12);
  m0 = FloorMod(m0, 12);
  const int64_t days = DaysFromCivil(year, m0 + 1, 1) + day - 1;
  return days * kSecondsPerDay + hour * 3600 + minute * 60 + second;
}

struct Fields {
  int64_t year;
  int month, day, hour, minute, second;
};

Fields SecondsToFields(int64_t t) {
  const int64_t days = FloorDiv(t, kSecondsPerDay);
  const int64_t rem = t - days * kSecondsPerDay;
  const Civil c = CivilFromDays(days);
  return {c.year, c.month, c.day, static_cast<int>(rem / 3600), static_cast<int>(rem / 60 % 60),
          static_cast<int>(rem % 60)};
}

// Reads exactly `count` decimal digits at `pos`.
bool Digits(std::wstring_view s, size_t pos, size_t count, int& out) {
  if (pos + count > s.size()) return false;
  int v = 0;
  for (size_t i = pos; i < pos + count; ++i) {
    if (s[i] < L'0' || s[i] > L'9') return false;
    v = v * 10 + (s[i] - L'0');
  }
  out = v;
  return true;
}

bool LocalFields(time_t t, struct tm& tm) { return ::localtime_r(&t, &tm) != nullptr; }

// Conversions between seconds since the COleDateTime origin and its day count. A negative day
// count keeps the original encoding: the whole part counts days back, the fraction is the time
// of that day counted forward, so 1899-12-29 06:00 is -1.25.
double OleDaysFromSeconds(int64_t s) {
  const int64_t days = FloorDiv(s, kSecondsPerDay);
  const double frac = static_cast<double>(s - days * kSecondsPerDay) / kSecondsPerDay;
  return days >= 0 ? static_cast<double>(days) + frac : static_cast<double>(days) - frac;
}

bool OleUsable(const COleDateTime& dt) {
  return dt.GetStatus() == COleDateTime::valid && std::isfinite(dt.m_dt) &&
         dt.m_dt >= kOleMinDays && dt.m_dt < kOleMaxDays;
}

// Seconds since the origin, rounded to the nearest second. REQUIRES: OleUsable(dt).
int64_t OleSeconds(const COleDateTime& dt) {
  const double whole = std::trunc(dt.m_dt);
  const double frac = std::fabs(dt.m_dt - whole);
  return static_cast<int64_t>(whole) * kSecondsPerDay +
         static_cast<int64_t>(std::llround(frac * kSecondsPerDay));
}

Fields OleFields(const COleDateTime& dt) {
  return SecondsToFields(OleSeconds(dt) - kOleEpochDays * kSecondsPerDay);
}

}  // namespace

long GetCurDateTime() { return static_cast<long>(::time(nullptr)); }

void GetDateTimeInfo(long time, int& year, int& month, int& day, int& hour, int& minute,
                     int& second) {
  const Fields f = SecondsToFields(time);
  year = static_cast<int>(f.year);
  month = f.month;
  day = f.day;
  hour = f.hour;
  minute = f.minute;
  second = f.second;
}

void GetLocalDateTimeInfo(long time, int& year, int& month, int& day, int& hour, int& minute,
                          int& second) {
  struct tm tm {};
  if (!LocalFields(static_cast<time_t>(time), tm)) {
    GetDateTimeInfo(time, year, month, day, hour, minute, second);
    return;
  }
  year = tm.tm_year + 1900;
  month = tm.tm_mon + 1;
  day = tm.tm_mday;
  hour = tm.tm_hour;
  minute = tm.tm_min;
  second = tm.tm_sec;
}

CString GetCurDateTimeDigitFmt() {
  int y, mo, d, h, mi, s;
  GetLocalDateTimeInfo(GetCurDateTime(), y, mo, d, h, mi, s);
  char buf[32];
  std::snprintf(buf, sizeof buf, "%04d%02d%02d%02d%02d%02d", y, mo, d, h, mi, s);
  return CString::FromUtf8(buf);
}

long DateTimeToLong(int month, int day, int year, int hour, int minute, int second) {
  const int64_t t = FieldsToSeconds(year, month, day, hour, minute, second);
  if (t < LONG_MIN || t > LONG_MAX) return -1;
  return static_cast<long>(t);
}

long DateTimeToLong(const wchar_t* text) {
  // Exactly "MM/DD/YYYY hh:mm:ss".
  const std::wstring_view s = text ? std::wstring_view(text) : std::wstring_view();
  int mo, d, y, h, mi, sec;
  if (s.size() != 19 || s[2] != L'/' || s[5] != L'/' || s[10] != L' ' || s[13] != L':' ||
      s[16] != L':')
    return -1;
  if (!Digits(s, 0, 2, mo) || !Digits(s, 3, 2, d) || !Digits(s, 6, 4, y) ||
      !Digits(s, 11, 2, h) || !Digits(s, 14, 2, mi) || !Digits(s, 17, 2, sec))
    return -1;
  if (!FieldsInRange(y, mo, d, h, mi, sec)) return -1;
  return DateTimeToLong(mo, d, y, h, mi, sec);
}

CString TimeTToStdStringTime(long time, int /*flag*/) {
  const Fields f = SecondsToFields(time);
  char buf[64];
  std::snprintf(buf, sizeof buf, "%04lld-%02d-%02dT%02d:%02d:%02d",
                static_cast<long long>(f.year), f.month, f.day, f.hour, f.minute, f.second);
  return CString::FromUtf8(buf);
}

long ConvertStdStringTimeT(const wchar_t* text) {
  // Exactly "YYYY-MM-DDThh:mm:ss", optionally followed by "Z".
  std::wstring_view s = text ? std::wstring_view(text) : std::wstring_view();
  if (s.size() == 20 && s.back() == L'Z') s.remove_suffix(1);
  int y, mo, d, h, mi, sec;
  if (s.size() != 19 || s[4] != L'-' || s[7] != L'-' || s[10] != L'T' || s[13] != L':' ||
      s[16] != L':')
    return -1;
  if (!Digits(s, 0, 4, y) || !Digits(s, 5, 2, mo) || !Digits(s, 8, 2, d) ||
      !Digits(s, 11, 2, h) || !Digits(s, 14, 2, mi) || !Digits(s, 17, 2, sec))
    return -1;
  if (!FieldsInRange(y, mo, d, h, mi, sec)) return -1;
  return DateTimeToLong(mo, d, y, h, mi, sec);
}

// ---- COleDateTime ------------------------------------------------------------------------------

COleDateTime::COleDateTime(int year, int month, int day, int hour, int minute, int second) {
  SetDateTime(year, month, day, hour, minute, second);
}

COleDateTime COleDateTime::GetCurrentTime() { return CovertTimeTToOleDateTime(GetCurDateTime()); }

int COleDateTime::SetDateTime(int year, int month, int day, int hour, int minute, int second) {
  if (year < 100 || year > 9999 || !FieldsInRange(year, month, day, hour, minute, second)) {
    m_dt = 0.0;
    m_status = invalid;
    return 1;
  }
  const int64_t s = FieldsToSeconds(year, month, day, hour, minute, second) +
                    kOleEpochDays * kSecondsPerDay;
  m_dt = OleDaysFromSeconds(s);
  m_status = valid;
  return 0;
}

int COleDateTime::GetYear() const { return OleUsable(*this) ? static_cast<int>(OleFields(*this).year) : -1; }
int COleDateTime::GetMonth() const { return OleUsable(*this) ? OleFields(*this).month : -1; }
int COleDateTime::GetDay() const { return OleUsable(*this) ? OleFields(*this).day : -1; }
int COleDateTime::GetHour() const { return OleUsable(*this) ? OleFields(*this).hour : -1; }
int COleDateTime::GetMinute() const { return OleUsable(*this) ? OleFields(*this).minute : -1; }
int COleDateTime::GetSecond() const { return OleUsable(*this) ? OleFields(*this).second : -1; }

long CovertOleDateTimeToTimeT(const COleDateTime& dt) {
  if (!OleUsable(dt)) return -1;
  const int64_t t = OleSeconds(dt) - kOleEpochDays * kSecondsPerDay;
  if (t < INT32_MIN || t > INT32_MAX) return -1;
  return static_cast<long>(t);
}

COleDateTime CovertTimeTToOleDateTime(long time) {
  COleDateTime dt;
  if (time < 0) {
    dt.SetStatus(COleDateTime::invalid);
    return dt;
  }
  dt.m_dt = OleDaysFromSeconds(static_cast<int64_t>(time) + kOleEpochDays * kSecondsPerDay);
  if (dt.m_dt >= kOleMaxDays) {
    dt.m_dt = 0.0;
    dt.SetStatus(COleDateTime::invalid);
  }
  return dt;
}
