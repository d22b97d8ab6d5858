// Error codes of the data-control process's device replies (nLastError), besides those of
// dc_errors.h. A problem with one of the logger's log files is reported with the import codes of
// the same file (navmisc/import/import_errors.h), a stopped read with DC_ERR_IMPORT_CANCELLED.
// docs/logger-folder.md tells when each one comes.
#pragma once

#include <cstdint>

enum : int32_t {
  DC_ERR_NO_DEVICE = 9201,          // no logger is connected
  DC_ERR_DEVICE_GONE = 9203,        // the logger went away while the command ran
  DC_ERR_DEVICE_WRITE = 9204,       // the logger's files could not be written
  DC_ERR_LOG_NOT_READ = 9205,       // clear refused: clear-after-download is set and a log is unread
  DC_ERR_MODEL_UNSUPPORTED = 9206,  // the connected model does not take this command
  DC_ERR_STORE_WRITE = 9207,        // the trips could not be written into the data root
};

namespace navmisc::datactrl {

// A short English text for each device code above, and for the codes of dc_errors.h
// ("no logger is connected"); "" for other codes.
const char* DeviceErrorText(int32_t code);

}  // namespace navmisc::datactrl
