// The data-control process's requests: what a handler gets, and the table that finds the
// handler of a block kind (docs/data-control-channel.md, "The data-control process").
//
// Each block kind has its handler in a file of its own: status_handler.cpp (connection status,
// and progress blocks sent the wrong way), device_handler.cpp, file_handler.cpp and
// net_handler.cpp. The device, file and web-service work plugs into those files: each has one
// function per command family with a switch over the command code.
#pragma once

#include <cstdint>
#include <functional>
#include <map>

#include "config.h"
#include "navmisc/datactrl/block_codec.h"
#include "navmisc/platform/msg_queue.h"
#include "navmisc/platform/package.h"

namespace gpsdc {

// The product the process serves, from its switch.
enum class Product {
  kTracer,  // "/Tracer": the loggers of the trip, sport and tracker applications
  kDongle,  // "/Dongle": the where-am-I receiver
};

// The reply queue "Data_Control_Recv".
class ReplyChannel {
 public:
  explicit ReplyChannel(CxSysMsgQueue& queue);
  // Packs and sends one block, waiting while the ring is full as long as the process that
  // reads the replies (this process's parent) lives. False when the reply could not go.
  template <class Block>
  bool Send(const Block& block) {
    CPackageBlk package(1);
    navmisc::datactrl::PackBlock(block, package);
    return SendPackage(package);
  }

 private:
  bool SendPackage(const CPackageBlk& package);

  CxSysMsgQueue& queue_;
  int parent_;
};

// One request being handled.
struct RequestContext {
  const CUnpackageBlk& request;     // the whole package
  const CDataControlCmdBlk& header; // its header, already read
  ReplyChannel& replies;
  const Config& config;
  Product product;
  // For long work (a log read, a file import), asked between two of its steps: true once a
  // cancel request (a device block with DC_DEVICE_CANCEL_READ) or the exit block has come.
  // Requests that arrive meanwhile wait and are served after the work, in order (the cancel
  // request too, so that it gets its own reply).
  std::function<bool()> stopRequested = [] { return false; };
};

using Handler = std::function<void(RequestContext&)>;

class HandlerTable {
 public:
  void Set(int32_t kind, Handler handler) { handlers_[kind] = std::move(handler); }
  const Handler* Find(int32_t kind) const {
    const auto it = handlers_.find(kind);
    return it == handlers_.end() ? nullptr : &it->second;
  }

 private:
  std::map<int32_t, Handler> handlers_;
};

// Every handler of the process.
HandlerTable MakeHandlerTable();

// The common answer to a command: reads the request into `block` (holding its starting values),
// lets `run` fill it in for the reply and give the code for nLastError, and sends it back.
template <class Block>
void AnswerInPlace(RequestContext& ctx, Block& block, int32_t (*run)(Block&, RequestContext&)) {
  navmisc::datactrl::UnpackBlock(ctx.request, block);
  block.nLastError = run(block, ctx);
  ctx.replies.Send(block);
}

void RegisterStatusHandlers(HandlerTable& table);  // kinds 4 and 5
void RegisterDeviceHandlers(HandlerTable& table);  // kind 1
void RegisterFileHandlers(HandlerTable& table);    // kind 3
void RegisterNetHandlers(HandlerTable& table);     // kind 2

// Makes the device service of `product` the running one for its lifetime (device_service.cpp):
// the server holds one while it serves, so that the device's own threads have stopped before
// the reply queue goes.
class DeviceServiceScope {
 public:
  DeviceServiceScope(ReplyChannel& replies, const Config& config, Product product);
  ~DeviceServiceScope();
  DeviceServiceScope(const DeviceServiceScope&) = delete;
  DeviceServiceScope& operator=(const DeviceServiceScope&) = delete;
};

// Whether the logger (or the receiver) can be reached: asks the running device service, or,
// without one, looks for the logger (device_handler.cpp).
bool DeviceConnected(const Config& config);
// Whether the web service can be reached, from what is configured (net_handler.cpp).
bool WebServiceConnected(const Config& config);
// The connection state of `source` (1 device, 2 web service) as a reply block; an unknown
// source is answered not connected, with DC_ERR_UNKNOWN_COMMAND. Also sets the shared
// g_bDeviceConnected or g_bNetConnected.
CDataControlConnectionStatus CurrentStatus(int32_t source, const Config& config);

}  // namespace gpsdc
