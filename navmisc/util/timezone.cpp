#include "navmisc/util/timezone.h"

#include <time.h>

#include "navmisc/platform/datetime.h"

long GetOSTimeZomeShift() {
  const time_t now = ::time(nullptr);
  struct tm local {};
  if (!::localtime_r(&now, &local)) return 0;
  // The local wall-clock fields read as if they were universal time, minus the real time.
  return DateTimeToLong(local.tm_mon + 1, local.tm_mday, local.tm_year + 1900, local.tm_hour,
                        local.tm_min, local.tm_sec) -
         static_cast<long>(now);
}

int System_DayLight() {
  const time_t now = ::time(nullptr);
  struct tm local {};
  if (!::localtime_r(&now, &local)) return 0;
  // The local year, from its first to its last hour. An offset, once changed, stays for weeks,
  // so comparing it hour by hour finds every change (at most 8784 look-ups, about a
  // millisecond).
  const long offset_now = local.tm_gmtoff;
  const int year = local.tm_year + 1900;
  const time_t begin = DateTimeToLong(1, 1, year, 0, 0, 0) - offset_now;
  const time_t end = DateTimeToLong(1, 1, year + 1, 0, 0, 0) - offset_now;
  struct tm tm {};
  if (!::localtime_r(&begin, &tm)) return 0;
  const long first = tm.tm_gmtoff;
  for (time_t t = begin + 3600; t < end; t += 3600) {
    if (!::localtime_r(&t, &tm)) return 0;
    if (tm.tm_gmtoff != first) return 1;
  }
  return 0;
}
