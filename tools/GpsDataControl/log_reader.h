// Reading a logger's logs into trips of the data root (docs/logger-folder.md, "Reading the
// log").
#pragma once

#include <cstdint>
#include <functional>
#include <string>
#include <vector>

#include "handlers.h"
#include "logger_folder.h"
#include "navmisc/platform/types.h"

namespace gpsdc {

struct LogReadResult {
  int32_t error = 0;           // 0, DC_ERR_* of the device or of the import
  std::string message;         // for people, when error is not 0
  long firstTime = -1;         // the time range of the points read; -1 without points
  long lastTime = -1;
  std::vector<LogFile> read;   // the logs that became trips (or held no point)
  int trips = 0;
};

// Turns every log of `logger` into a trip of application `app` (one trip per log, one track per
// segment of the log), sending progress blocks (source 1) for each log and every thousand
// points. All or nothing: when `stopRequested` says so (asked between points), when a log
// cannot be read or when the logger goes away, the trips made so far are removed again. Logs
// without any point (empty ones too) make no trip but count as read.
LogReadResult ReadLoggerLogs(const LoggerFolder& logger, GPS_APP_PROG_TYPE app,
                             ReplyChannel& replies, const std::function<bool()>& stopRequested);

}  // namespace gpsdc
