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
  (*handler)(ctx);
  return true;
}

}  // namespace gpsdc
