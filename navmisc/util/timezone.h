// What the operating system says about the local time zone.
#pragma once

// Local time minus universal time at this moment, in seconds (positive east of Greenwich,
// daylight saving included when in force). The name is spelled so on purpose.
long GetOSTimeZomeShift();
// 1 when the process's current time zone changes its offset from universal time at some
// moment of the current year (it observes daylight saving), else 0.
int System_DayLight();
