#include "server.h"

#include <unistd.h>

namespace gpsdc {
namespace {

// The longest sleep between two looks at whether the parent still lives.
constexpr uint32_t kIdleWaitMs = 1000;

}  // namespace

ReplyChannel::ReplyChannel(CxSysMsgQueue& queue) : queue_(queue), parent_(::getppid()) {}

bool ReplyChannel::SendPackage(const CPackageBlk& package) {
  for (;;) {
    if (queue_.Send(package.GetPackagePtr(), package.GetPackageSize(), kIdleWaitMs)) return true;
    if (::getppid() != parent_ || !queue_.IsValid() ||
        package.GetPackageSize() > navmisc::kSysMsgMaxMessage)
      return false;
  }
}

HandlerTable MakeHandlerTable() {
  HandlerTable table;
  RegisterStatusHandlers(table);
  RegisterDeviceHandlers(table);
  RegisterFileHandlers(table);
  RegisterNetHandlers(table);
  return table;
}

DataControlServer::DataControlServer(CxSysMsgQueue& requests, CxSysMsgQueue& replies,
                                     Config config, Product product)
    : requests_(requests),
      replies_(replies),
      config_(std::move(config)),
      product_(product),
      handlers_(MakeHandlerTable()),
      parent_(::getppid()) {}

int DataControlServer::Run() {
  DeviceServiceScope device(replies_, config_, product_);
  // Unasked, so that a command thread that has just (re)started this process learns the state.
  for (int32_t source : {DC_SOURCE_DEVICE, DC_SOURCE_NET}) replies_.Send(CurrentStatus(source, config_));
  for (;;) {
    while (!waiting_.empty()) {
      const std::vector<uint8_t> next = std::move(waiting_.front());
      waiting_.pop_front();
      if (!Serve(next.data(), static_cast<uint32_t>(next.size()))) return 0;
    }
    if (exit_) return 0;
    CxSysMsgInfo info;
    if (auto request = requests_.Receive(kIdleWaitMs, &info, 1)) {
      if (!Serve(request.get(), info.nSize)) return 0;
    } else if (::getppid() != parent_) {
      return 0;  // nobody is left to read the replies
    }
  }
}

bool DataControlServer::Serve(const uint8_t* data, uint32_t size) {
  CUnpackageBlk package(data, size);
  if (!package.IsValid()) {
    ++dropped_;
    return true;
  }
  CDataControlCmdBlk header{};
  navmisc::datactrl::UnpackHeader(package, header);
  if (header.nCmdType == DC_CMD_EXIT) return false;
  const Handler* handler = handlers_.Find(header.nCmdType);
  if (!handler) {
    ++dropped_;
    return true;
  }
  RequestContext ctx{package, header, replies_, config_, product_};
  ctx.stopRequested = [this] { return StopRequested(); };
  stop_ = false;
  (*handler)(ctx);
  return true;
}

bool DataControlServer::StopRequested() {
  CxSysMsgInfo info;
  while (auto request = requests_.Receive(0, &info, 1)) {
    CUnpackageBlk package(request.get(), info.nSize);
    if (package.IsValid()) {
      CDataControlCmdBlk header{};
      navmisc::datactrl::UnpackHeader(package, header);
      if (header.nCmdType == DC_CMD_EXIT) {
        stop_ = exit_ = true;
        continue;  // nothing is served after the exit block
      }
      const uint8_t* value = nullptr;
      uint32_t size = 0;
      if (header.nCmdType == DC_CMD_DEVICE && package.GetData("nDeviceCmd", value, size) && size == 4 &&
          value[0] == DC_DEVICE_CANCEL_READ && value[1] == 0 && value[2] == 0 && value[3] == 0)
        stop_ = true;
    }
    if (!exit_) waiting_.emplace_back(request.get(), request.get() + info.nSize);
  }
  // Nobody is left to want the work's result.
  if (::getppid() != parent_) stop_ = exit_ = true;
  return stop_;
}

}  // namespace gpsdc
