// Encoding and decoding of single point-file lines (formats in point_file_format.h).
#pragma once

#include <string>
#include <string_view>

#include "navmisc/records/items.h"

namespace navmisc::point_file {

// Appends one line, line end included.
void AppendPointLine(std::string& out, const WAYPOINT_ITEM_INFO& p);
void AppendCellFixLine(std::string& out, const BASE_ITEM_INFO& c);
void AppendHelpPointLine(std::string& out, const WAYPOINT_ITEM_INFO& p);
void AppendHeartRateLine(std::string& out, int32_t time, const uint8_t* values, int count);
void AppendWheelSpeedLine(std::string& out, const WHEEL_SPEED_ITEM_INFO& w);

// Scans a ".BIN" line into `p` field by field, as "%d,%lf,%lf,%lf,%d,%d,%d,%d,%d" would: the
// scan stops at the first field that does not match, and the fields after it keep their values.
// Returns the number of fields read.
int ScanPointLine(std::string_view line, WAYPOINT_ITEM_INFO& p);
// Comma-separated side-file lines: token 0 the time, then the fields in order; missing tokens
// leave the fields as they are. Tokens convert like atoi/atof (leading number, else 0).
void ParseCellFixLine(std::string_view line, BASE_ITEM_INFO& c);
void ParseHelpPointLine(std::string_view line, WAYPOINT_ITEM_INFO& p);
void ParseByteSampleLine(std::string_view line, int32_t& time, uint8_t* values, int capacity);
void ParseWheelSpeedLine(std::string_view line, WHEEL_SPEED_ITEM_INFO& w);

}  // namespace navmisc::point_file
