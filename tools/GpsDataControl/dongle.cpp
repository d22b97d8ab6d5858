// "/Dongle": the where-am-I receiver, read through gpsd (docs/dongle.md). A thread keeps a
// session with gpsd open (opening it again a second after it fails or ends), takes its position
// reports, keeps g_gps_info, g_bDeviceConnected and the where-am-I position script up to date and
// announces when the receiver comes or goes. A receiver has no log and no settings: device
// commands are answered DC_ERR_NOT_AVAILABLE.
#include <gps.h>

#include <atomic>
#include <chrono>
#include <cmath>
#include <condition_variable>
#include <cstring>
#include <memory>
#include <mutex>
#include <string>
#include <thread>

#include "device_service.h"
#include "navmisc/datactrl/dc_errors.h"
#include "navmisc/datactrl/device_state.h"
#include "where_position.h"

namespace gpsdc {
namespace {

using Clock = std::chrono::steady_clock;

constexpr auto kRetryPeriod = std::chrono::seconds(1);
// The receiver counts as gone when gpsd has reported no device and no position for this long.
constexpr auto kSilenceLimit = std::chrono::seconds(5);
constexpr int kWaitMicroseconds = 250000;
// The position script is written at most this often.
constexpr auto kScriptPeriod = std::chrono::seconds(1);

// Takes what a report of gpsd carries into `info`: a report may leave out values (the first of
// a cycle has no time, one made from RMC alone no altitude), which then keep their last value.
void Accumulate(const gps_data_t& data, s_gps_info& info) {
  const gps_fix_t& fix = data.fix;
  info.nFixQuality = fix.mode < MODE_2D ? 0 : fix.status > 0 ? fix.status : 1;
  if (fix.mode >= MODE_2D && std::isfinite(fix.latitude) && std::isfinite(fix.longitude)) {
    info.dLatitude = fix.latitude;
    info.dLongitude = fix.longitude;
  }
  if (std::isfinite(fix.altMSL)) {
    info.dAltitude = fix.altMSL;
  } else if (std::isfinite(fix.altHAE)) {
    info.dAltitude = fix.altHAE;
  }
  if (std::isfinite(fix.speed)) info.nSpeed = static_cast<int32_t>(std::lround(fix.speed * 3600.0));
  if (std::isfinite(fix.track)) info.nCourse = static_cast<int32_t>(std::lround(fix.track)) % 360;
  if (data.set & SATELLITE_SET) info.nSatellites = data.satellites_used;
  if (fix.time.tv_sec > 0) info.tTime = static_cast<int32_t>(fix.time.tv_sec);
}

class DongleService : public DeviceService {
 public:
  DongleService(ReplyChannel& replies, const Config& config)
      : replies_(replies),
        host_(config.gpsdHost.ToUtf8()),
        port_(config.gpsdPort.ToUtf8()) {
    g_bDeviceConnected = false;
    thread_ = std::thread([this] { Run(); });
  }

  ~DongleService() override {
    {
      std::lock_guard lock(stopMutex_);
      stopping_ = true;
    }
    stopCv_.notify_all();
    thread_.join();
  }

  bool Connected() override {
    const bool connected = connected_.load();
    g_bDeviceConnected = connected;
    return connected;
  }

  void Handle(RequestContext& ctx) override {
    CDataControlCmdBlkKVDevice device{};
    navmisc::datactrl::UnpackBlock(ctx.request, device);
    device.nLastError = DC_ERR_NOT_AVAILABLE;
    replies_.Send(device);
  }

 private:
  bool Stopping() {
    std::lock_guard lock(stopMutex_);
    return stopping_;
  }
  // Waits `period` or until the service stops; true when it stops.
  bool WaitStop(Clock::duration period) {
    std::unique_lock lock(stopMutex_);
    return stopCv_.wait_for(lock, period, [this] { return stopping_; });
  }

  void SetConnected(bool connected, const std::string& device) {
    PublishDeviceConnection(connected, [&] {
      const size_t n = std::min(device.size(), sizeof g_szDeviceId - 1);
      std::memcpy(g_szDeviceId, device.data(), n);
      g_szDeviceId[n] = '\0';
    });
    if (connected == connected_.exchange(connected)) return;
    replies_.Send(DeviceStatusBlock(connected, CString::FromUtf8(device)));
  }

  void Run() {
    while (!Stopping()) {
      gps_data_t data;
      std::memset(&data, 0, sizeof data);
      if (gps_open(host_.c_str(), port_.c_str(), &data) != 0) {
        SetConnected(false, {});
        if (WaitStop(kRetryPeriod)) return;
        continue;
      }
      gps_stream(&data, WATCH_ENABLE | WATCH_JSON, nullptr);
      Follow(data);
      gps_stream(&data, WATCH_DISABLE, nullptr);
      gps_close(&data);
      SetConnected(false, {});
      if (WaitStop(kRetryPeriod)) return;
    }
  }

  // Takes gpsd's reports until the session ends or the service stops.
  void Follow(gps_data_t& data) {
    std::string device;
    bool devicesListed = false;
    Clock::time_point lastReport = Clock::now();
    Clock::time_point lastScript{};
    while (!Stopping()) {
      if (!gps_waiting(&data, kWaitMicroseconds)) {
        if (!devicesListed && Clock::now() - lastReport > kSilenceLimit) SetConnected(false, device);
        continue;
      }
      if (gps_read(&data, nullptr, 0) < 0) return;  // gpsd went away
      if (data.set & DEVICELIST_SET) {
        devicesListed = data.devices.ndevices > 0;
        device = devicesListed ? data.devices.list[0].path : "";
        lastReport = Clock::now();
        SetConnected(devicesListed, device);
      }
      if (!(data.set & MODE_SET) || data.fix.mode < MODE_NO_FIX) continue;
      lastReport = Clock::now();
      if (device.empty()) device = data.dev.path;
      SetConnected(true, device);
      Accumulate(data, current_);
      // A position counts once it has a fix and a time of its own.
      if (current_.nFixQuality == 0 || data.fix.time.tv_sec <= 0) continue;
      const s_gps_info info = current_;
      navmisc::datactrl::PublishGpsInfo(info);
      if (Clock::now() - lastScript >= kScriptPeriod) {
        lastScript = Clock::now();
        if (prepared_ || (prepared_ = where_.Prepare()))
          where_.Write(info.tTime, info.dLongitude, info.dLatitude, info.dAltitude, info.nSpeed);
      }
    }
  }

  ReplyChannel& replies_;
  const std::string host_;
  const std::string port_;
  std::atomic<bool> connected_{false};
  s_gps_info current_{0, 0, 0, 0, 0, 0, -1, 0};  // the position as the reports build it up
  WherePosition where_;
  bool prepared_ = false;
  std::thread thread_;
  std::mutex stopMutex_;
  std::condition_variable stopCv_;
  bool stopping_ = false;
};

}  // namespace

std::unique_ptr<DeviceService> MakeDongleService(ReplyChannel& replies, const Config& config) {
  return std::make_unique<DongleService>(replies, config);
}

}  // namespace gpsdc
