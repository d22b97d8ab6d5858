// Error codes that the data-control process puts into nLastError of its replies
// (docs/data-control-channel.md, "Error codes"). 0 is success.
#pragma once

#include <cstdint>

enum : int32_t {
  DC_ERR_NONE = 0,
  // The connected logger cannot be used by this program; dialogs show text 9582 for it.
  DC_ERR_DEVICE_REFUSED = 61,
  // The process knows the command but does not carry it out yet (device and file commands of
  // this version).
  DC_ERR_NOT_AVAILABLE = 9001,
  // The command code (nDeviceCmd, nNetCmd, nFileCmd) or status source is not one the process
  // knows.
  DC_ERR_UNKNOWN_COMMAND = 9002,
  // The block's kind only ever travels as a reply (progress); it was sent as a request.
  DC_ERR_NOT_A_REQUEST = 9003,

  // Web-service commands (docs/web-service.md). Besides these, an answer of the service outside
  // 200-299 reports its HTTP status (401, 404, 500, ...) as the error.
  // The service has no such function (photos, markers, pages, accounts, map offsets).
  DC_ERR_NET_NOT_OFFERED = 9101,
  // The command needs a logged-on user; log on first (command 1).
  DC_ERR_NET_NOT_LOGGED_ON = 9102,
  // The access token belongs to another user than the name given at login.
  DC_ERR_NET_WRONG_USER = 9103,
  // The block lacks what the command needs (a trace id, a GPX file, a readable cell list).
  DC_ERR_NET_BAD_REQUEST = 9104,
  // The GPX to upload cannot be read, is not a regular file or is not a well-formed GPX document.
  DC_ERR_NET_BAD_GPX = 9105,
  // The configured service address is not usable: only https, or plain http to the loopback
  // address.
  DC_ERR_NET_BAD_ADDRESS = 9106,
  // The service could not be reached (name not found, connection refused).
  DC_ERR_NET_UNREACHABLE = 9107,
  // The service's certificate could not be verified, or the secure connection failed.
  DC_ERR_NET_TLS = 9108,
  // The answer did not come within the time limit.
  DC_ERR_NET_TIMEOUT = 9109,
  // The connection broke or the service answered something that is not HTTP.
  DC_ERR_NET_TRANSFER = 9110,
  // The answer (or the file to upload) is larger than the process accepts.
  DC_ERR_NET_TOO_LARGE = 9111,
  // The answer's body could not be read (not the document the command expects).
  DC_ERR_NET_BAD_REPLY = 9112,
  // The process was told to end while the command ran.
  DC_ERR_NET_CANCELLED = 9113,
  // Too many web-service commands were waiting; this one was not run.
  DC_ERR_NET_BUSY = 9114,
};
