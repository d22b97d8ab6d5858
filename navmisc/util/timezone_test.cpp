#include "navmisc/util/timezone.h"

#include <gtest/gtest.h>

#include "testutil.h"

namespace {

using navmisc::testutil::TzScope;

TEST(TimeZone, ShiftAndDaylightByZone) {
  struct Case {
    const char* tz;
    long shift_a, shift_b;  // the offset in standard and in daylight-saving time
    int daylight;
  } cases[] = {
      {"Asia/Taipei", 28800, 28800, 0},
      {"Europe/Berlin", 3600, 7200, 1},
      {"UTC", 0, 0, 0},
      {"Australia/Adelaide", 34200, 37800, 1},  // half-hour offset, summer at the year's ends
  };
  for (const Case& c : cases) {
    TzScope tz(c.tz);
    const long shift = GetOSTimeZomeShift();
    EXPECT_TRUE(shift == c.shift_a || shift == c.shift_b) << c.tz << ": " << shift;
    EXPECT_EQ(System_DayLight(), c.daylight) << c.tz;
  }
}

}  // namespace
