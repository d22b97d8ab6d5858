// Dates and times. Times are seconds since 1970-01-01 00:00:00 UTC.
#pragma once

#include <cstdint>

#include "navmisc/platform/cstring.h"

// The current time, seconds since 1970 (UTC).
long GetCurDateTime();
// Splits a time into UTC calendar fields (month 1..12, four-digit year). The exact inverse of
// DateTimeToLong.
void GetDateTimeInfo(long time, int& year, int& month, int& day, int& hour, int& minute,
                     int& second);
// The same split in the local time zone of the process.
void GetLocalDateTimeInfo(long time, int& year, int& month, int& day, int& hour, int& minute,
                          int& second);
// The current local date and time as 14 digits, "YYYYMMDDhhmmss".
CString GetCurDateTimeDigitFmt();
// Calendar fields read as UTC (month from 1, four-digit year). Out-of-range fields are
// normalised the way timegm does. -1 when the result does not fit.
long DateTimeToLong(int month, int day, int year, int hour, int minute, int second);
// The text "MM/DD/YYYY hh:mm:ss" read as UTC; -1 when it does not have that form.
long DateTimeToLong(const wchar_t* text);
// "YYYY-MM-DDThh:mm:ss" in UTC, without a "Z". The flag is accepted for compatibility.
CString TimeTToStdStringTime(long time, int flag = 1);
// Reads "YYYY-MM-DDThh:mm:ss" (a trailing "Z" is allowed) as UTC; -1 when it does not parse.
long ConvertStdStringTimeT(const wchar_t* text);

// A date-time as days since 1899-12-30 00:00 (fractions are the time of day), with a status.
// Plain data: it may live in shared memory.
class COleDateTime {
 public:
  enum DateTimeStatus : int32_t { valid = 0, invalid = 1, null = 2 };

  COleDateTime() = default;
  explicit COleDateTime(double days) : m_dt(days), m_status(valid) {}
  COleDateTime(int year, int month, int day, int hour, int minute, int second);

  // The current UTC time.
  static COleDateTime GetCurrentTime();

  DateTimeStatus GetStatus() const { return static_cast<DateTimeStatus>(m_status); }
  void SetStatus(DateTimeStatus s) { m_status = s; }
  int SetDateTime(int year, int month, int day, int hour, int minute, int second);
  int GetYear() const;
  int GetMonth() const;
  int GetDay() const;
  int GetHour() const;
  int GetMinute() const;
  int GetSecond() const;
  // Span in days between two date-times.
  double operator-(const COleDateTime& other) const { return m_dt - other.m_dt; }
  bool operator==(const COleDateTime& o) const { return m_dt == o.m_dt && m_status == o.m_status; }

  double m_dt = 0.0;
  int32_t m_status = valid;
};

// Seconds since 1970 of a date-time; -1 when it is not valid or out of range.
long CovertOleDateTimeToTimeT(const COleDateTime& dt);
// The date-time of a time; a negative time gives an invalid date-time.
COleDateTime CovertTimeTToOleDateTime(long time);
