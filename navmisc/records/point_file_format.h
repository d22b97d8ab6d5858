// The line formats of a track's point files, shared by their writer and reader. Every file is
// text, one record per line, fields separated by single commas, lines ending in CR LF; integers
// are plain decimal, doubles fixed-point with six decimals (docs/point-files.md).
//
//   ".BIN"  time,lat,lon,altitude,speed,type,course,extraA,extraB
//   ".ID"   time,name,lat,lon
//   ".SOS"  time,name,lat,lon,altitude,speed,type,course,extraA
//   ".HR"   time,value,... (up to 24 values; a value of 255 ends the list and is written)
//   ".CS"   as ".HR"
//   ".SPD"  time,value,... (up to 12 doubles; -1.000000 ends the list and is written)
#pragma once

#include <string>
#include <string_view>

#include "navmisc/platform/cstring.h"

namespace navmisc::point_file {

inline constexpr const wchar_t* kPoints = L"BIN";
inline constexpr const wchar_t* kCellFixes = L"ID";
inline constexpr const wchar_t* kHelpPoints = L"SOS";
inline constexpr const wchar_t* kHeartRate = L"HR";
inline constexpr const wchar_t* kCadence = L"CS";
inline constexpr const wchar_t* kWheelSpeed = L"SPD";

inline constexpr int kDecimals = 6;
inline constexpr const char* kLineEnd = "\r\n";
// Lines are read through a buffer of this many characters; a longer line is read as several.
inline constexpr size_t kMaxLine = 255;

}  // namespace navmisc::point_file
