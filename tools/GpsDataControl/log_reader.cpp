#include "log_reader.h"

#include "navmisc/datactrl/dc_errors.h"

namespace gpsdc {

// The logs become trips through the import readers, which are not part of this build yet; until
// then a read is answered as a command this process does not carry out.
LogReadResult ReadLoggerLogs(const LoggerFolder&, GPS_APP_PROG_TYPE, ReplyChannel&,
                             const std::atomic<bool>&) {
  LogReadResult result;
  result.error = DC_ERR_NOT_AVAILABLE;
  return result;
}

}  // namespace gpsdc
