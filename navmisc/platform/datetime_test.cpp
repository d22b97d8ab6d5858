#include "navmisc/platform/datetime.h"

#include <climits>
#include <string>
#include <tuple>

#include <gtest/gtest.h>

#include "testutil.h"

namespace {

// Reference values computed independently (Python's calendar.timegm).
struct CalendarCase {
  int year, month, day, hour, minute, second;
  long time;
  const wchar_t* iso;
};
const CalendarCase kCalendar[] = {
    {1970, 1, 1, 0, 0, 0, 0L, L"1970-01-01T00:00:00"},
    {1969, 12, 31, 23, 59, 59, -1L, L"1969-12-31T23:59:59"},
    {2000, 2, 29, 12, 34, 56, 951827696L, L"2000-02-29T12:34:56"},
    {2038, 1, 19, 3, 14, 7, 2147483647L, L"2038-01-19T03:14:07"},
    {2038, 1, 19, 3, 14, 8, 2147483648L, L"2038-01-19T03:14:08"},
    {1901, 12, 13, 20, 45, 52, -2147483648L, L"1901-12-13T20:45:52"},
    {1600, 2, 29, 23, 59, 59, -11670912001L, L"1600-02-29T23:59:59"},
    {2100, 3, 1, 0, 0, 0, 4107542400L, L"2100-03-01T00:00:00"},
    {1, 1, 1, 0, 0, 0, -62135596800L, L"0001-01-01T00:00:00"},
    {9999, 12, 31, 23, 59, 59, 253402300799L, L"9999-12-31T23:59:59"},
};

TEST(DateTime, CalendarRoundTrips) {
  for (const CalendarCase& c : kCalendar) {
    SCOPED_TRACE(c.iso);
    EXPECT_EQ(DateTimeToLong(c.month, c.day, c.year, c.hour, c.minute, c.second), c.time);
    int y, mo, d, h, mi, s;
    GetDateTimeInfo(c.time, y, mo, d, h, mi, s);
    EXPECT_EQ(std::tie(y, mo, d, h, mi, s),
              std::tie(c.year, c.month, c.day, c.hour, c.minute, c.second));
    EXPECT_EQ(TimeTToStdStringTime(c.time), c.iso);
    EXPECT_EQ(ConvertStdStringTimeT(c.iso), c.time);
    EXPECT_EQ(ConvertStdStringTimeT((CString(c.iso) + L"Z")), c.time);
    CString us;
    us.Format(L"%02d/%02d/%04d %02d:%02d:%02d", c.month, c.day, c.year, c.hour, c.minute,
              c.second);
    EXPECT_EQ(DateTimeToLong(us), c.time);
  }
}

TEST(DateTime, FieldsOutOfRangeAreNormalised) {
  EXPECT_EQ(DateTimeToLong(13, 1, 2020, 0, 0, 0), 1609459200L);   // 2021-01-01
  EXPECT_EQ(DateTimeToLong(2, 30, 2021, 0, 0, 0), 1614643200L);   // 2021-03-02
  EXPECT_EQ(DateTimeToLong(1, 1, 2020, -1, 0, 0), 1577833200L);   // 2019-12-31 23:00
  EXPECT_EQ(DateTimeToLong(1, 1, 2020, 24, 60, 60), 1577926860L); // 2020-01-02 01:01:00
}

TEST(DateTime, IndependentOfTimeZone) {
  const navmisc::testutil::TzScope tz("America/St_Johns");  // half-hour offset, daylight saving
  EXPECT_EQ(DateTimeToLong(7, 1, 2024, 12, 0, 0), 1719835200L);
  EXPECT_EQ(TimeTToStdStringTime(1719835200L), L"2024-07-01T12:00:00");
  int y, mo, d, h, mi, s;
  GetLocalDateTimeInfo(1719835200L, y, mo, d, h, mi, s);  // NDT is UTC-2:30
  EXPECT_EQ(h * 60 + mi, 9 * 60 + 30);
}

TEST(DateTime, MalformedTextsGiveMinusOne) {
  for (const wchar_t* text :
       {L"", L"1/2/2020 03:04:05", L"01/02/2020 03:04:05 ", L"01-02-2020 03:04:05",
        L"13/01/2020 00:00:00", L"02/29/2021 00:00:00", L"01/01/2020 24:00:00"}) {
    EXPECT_EQ(DateTimeToLong(text), -1) << text;
  }
  EXPECT_EQ(DateTimeToLong(static_cast<const wchar_t*>(nullptr)), -1);

  for (const wchar_t* text :
       {L"", L"2020-01-02", L"2020-01-02T03:04:05ZZ", L"2020-01-02T03:04:05+01:00",
        L"2020-1-02T03:04:05", L"2021-02-29T00:00:00", L"2020-01-02T25:04:05",
        L"2020-01-02t03:04:05"}) {
    EXPECT_EQ(ConvertStdStringTimeT(text), -1) << text;
  }
  EXPECT_EQ(ConvertStdStringTimeT(nullptr), -1);
}

TEST(OleDateTime, Conversions) {
  struct Case {
    int year, month, day, hour, minute, second;
    double days;
    long time;  // -1 where the time does not fit 32 bits
  } cases[] = {
      {1970, 1, 1, 0, 0, 0, 25569.0, 0},
      {1899, 12, 30, 0, 0, 0, 0.0, -1},
      {1899, 12, 29, 6, 0, 0, -1.25, -1},  // negative days count back, the hours forward
      {2000, 1, 1, 18, 0, 0, 36526.75, 946749600},
      {2038, 1, 19, 3, 14, 7, 50424.134803240740, 2147483647},
      {1901, 12, 13, 20, 45, 52, 713.86518518518640, -2147483648L},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(c.days);
    COleDateTime dt(c.year, c.month, c.day, c.hour, c.minute, c.second);
    ASSERT_EQ(dt.GetStatus(), COleDateTime::valid);
    EXPECT_NEAR(dt.m_dt, c.days, 1e-9);
    EXPECT_EQ(std::tuple(dt.GetYear(), dt.GetMonth(), dt.GetDay(), dt.GetHour(), dt.GetMinute(),
                         dt.GetSecond()),
              std::tie(c.year, c.month, c.day, c.hour, c.minute, c.second));
    EXPECT_EQ(CovertOleDateTimeToTimeT(dt), c.time);
    if (c.time >= 0) {
      const COleDateTime back = CovertTimeTToOleDateTime(c.time);
      EXPECT_EQ(back.GetStatus(), COleDateTime::valid);
      EXPECT_NEAR(back.m_dt, c.days, 1e-9);
    }
  }
  // Before 1901-12-13 20:45:52 and after 2038-01-19 03:14:07 a time does not fit 32 bits.
  EXPECT_EQ(CovertOleDateTimeToTimeT(COleDateTime(1901, 12, 13, 20, 45, 51)), -1);
  EXPECT_EQ(CovertOleDateTimeToTimeT(COleDateTime(2038, 1, 19, 3, 14, 8)), -1);
  // Rounded to the nearest second, also just below a whole second.
  EXPECT_EQ(CovertOleDateTimeToTimeT(COleDateTime(25569.0 + 10.4 / 86400)), 10);
  EXPECT_EQ(CovertOleDateTimeToTimeT(COleDateTime(25569.0 + 59.9999 / 86400)), 60);

  COleDateTime bad;
  bad.m_dt = 30000.0;
  bad.SetStatus(COleDateTime::invalid);
  EXPECT_EQ(CovertOleDateTimeToTimeT(bad), -1);
  EXPECT_EQ(CovertTimeTToOleDateTime(-1).GetStatus(), COleDateTime::invalid);

  struct Fields {
    int year, month, day, hour, minute, second;
  } invalid[] = {{2021, 2, 29, 0, 0, 0}, {99, 12, 31, 0, 0, 0}, {2020, 1, 1, 24, 0, 0}};
  for (const Fields& f : invalid) {
    COleDateTime dt(2000, 1, 1, 0, 0, 0);
    EXPECT_EQ(dt.SetDateTime(f.year, f.month, f.day, f.hour, f.minute, f.second), 1) << f.year;
    EXPECT_EQ(dt.GetStatus(), COleDateTime::invalid);
    EXPECT_EQ(dt.GetMonth(), -1);
  }
}

}  // namespace
