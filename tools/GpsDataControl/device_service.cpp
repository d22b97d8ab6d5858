#include "device_service.h"

#include <atomic>
#include <cwchar>

#include "navmisc/datactrl/device_state.h"

namespace gpsdc {
namespace {

std::atomic<DeviceService*> g_running{nullptr};
// Owns the running service; only DeviceServiceScope sets and clears it.
std::unique_ptr<DeviceService>& Owned() {
  static std::unique_ptr<DeviceService> owned;
  return owned;
}

}  // namespace

DeviceService* RunningDeviceService() { return g_running.load(); }

DeviceServiceScope::DeviceServiceScope(ReplyChannel& replies, const Config& config,
                                       Product product) {
  Owned() = product == Product::kDongle ? MakeDongleService(replies, config)
                                        : MakeTracerService(replies, config);
  g_running = Owned().get();
}

DeviceServiceScope::~DeviceServiceScope() {
  g_running = nullptr;
  Owned().reset();
}

void PublishDeviceConnection(bool connected, const std::function<void()>& describe) {
  if (!connected) {
    g_bDeviceConnected = false;
    std::atomic_thread_fence(std::memory_order_release);
  }
  describe();
  if (connected) {
    std::atomic_thread_fence(std::memory_order_release);
    g_bDeviceConnected = true;
  }
}

CDataControlConnectionStatus DeviceStatusBlock(bool connected, const wchar_t* deviceId) {
  CDataControlConnectionStatus status{};
  status.nCmdType = DC_CMD_CONNECTION_STATUS;
  status.nSource = DC_SOURCE_DEVICE;
  status.bConnected = connected;
  std::wcsncpy(status.szDeviceId, deviceId ? deviceId : L"", 32);
  return status;
}

}  // namespace gpsdc
