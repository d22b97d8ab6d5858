#include "navmisc/datactrl/device_errors.h"

#include "navmisc/datactrl/dc_errors.h"

namespace navmisc::datactrl {

const char* DeviceErrorText(int32_t code) {
  switch (code) {
    case DC_ERR_NONE: return "success";
    case DC_ERR_DEVICE_REFUSED: return "the logger cannot be used by this program";
    case DC_ERR_NOT_AVAILABLE: return "the data-control process does not carry out this command";
    case DC_ERR_UNKNOWN_COMMAND: return "unknown command";
    case DC_ERR_NOT_A_REQUEST: return "not a request";
    case DC_ERR_NO_DEVICE: return "no logger is connected";
    case DC_ERR_DEVICE_GONE: return "the logger went away";
    case DC_ERR_DEVICE_WRITE: return "the logger's files could not be written";
    case DC_ERR_LOG_NOT_READ: return "the log has not been read yet (clear after download is set)";
    case DC_ERR_MODEL_UNSUPPORTED: return "the connected logger model does not take this command";
    case DC_ERR_STORE_WRITE: return "the trips could not be written into the data root";
    default: return "";
  }
}

}  // namespace navmisc::datactrl
