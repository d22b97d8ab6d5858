// Error codes that the data-control process puts into nLastError of its replies
// (docs/data-control-channel.md, "Error codes"). 0 is success.
#pragma once

#include <cstdint>

enum : int32_t {
  DC_ERR_NONE = 0,
  // The connected logger cannot be used by this program; dialogs show text 9582 for it.
  DC_ERR_DEVICE_REFUSED = 61,
  // The process knows the command but does not carry it out yet (device, file and web-service
  // commands of this version).
  DC_ERR_NOT_AVAILABLE = 9001,
  // The command code (nDeviceCmd, nNetCmd, nFileCmd) or status source is not one the process
  // knows.
  DC_ERR_UNKNOWN_COMMAND = 9002,
  // The block's kind only ever travels as a reply (progress); it was sent as a request.
  DC_ERR_NOT_A_REQUEST = 9003,
};
