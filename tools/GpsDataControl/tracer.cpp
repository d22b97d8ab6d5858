// "/Tracer": the logger that appears as a folder. Commands run on the server's thread; a read of
// the log asks the server between points whether CancelRead (or the exit block) has come, and
// requests that come meanwhile are served after it. A watcher looks for the logger once a second
// and announces when it comes or goes.
#include <algorithm>
#include <atomic>
#include <condition_variable>
#include <cstring>
#include <memory>
#include <mutex>
#include <optional>
#include <thread>

#include "device_service.h"
#include "log_reader.h"
#include "logger_folder.h"
#include "navmisc/datactrl/dc_errors.h"
#include "navmisc/datactrl/device_errors.h"
#include "navmisc/datactrl/device_state.h"
#include "navmisc/platform/shared_globals.h"

namespace gpsdc {
namespace {

using navmisc::datactrl::UnpackBlock;
using navmisc::datactrl::UsesKV11Block;

constexpr auto kWatchPeriod = std::chrono::seconds(1);

template <size_t N>
void SetByteText(char (&field)[N], const std::string& text) {
  const size_t n = std::min(text.size(), N - 1);
  std::memcpy(field, text.data(), n);
  std::memset(field + n, 0, N - n);
}

// The header and command of `from` over settings read from the logger.
template <class Block>
void KeepRequestHead(const Block& from, Block& to) {
  static_cast<CDataControlCmdBlk&>(to) = from;
  to.nDeviceCmd = from.nDeviceCmd;
}

bool SameLog(const LogFile& a, const LogFile& b) {
  return a.path == b.path && a.size == b.size && a.modified == b.modified;
}

GPS_APP_PROG_TYPE TripApplication() {
  switch (g_nProductId) {
    case GPS_APP_SPORT:
    case GPS_APP_TRACKER:
      return g_nProductId;
    default:
      return GPS_APP_TRIP;
  }
}

class TracerService : public DeviceService {
 public:
  TracerService(ReplyChannel& replies, const Config& config)
      : replies_(replies), config_(config) {
    Refresh();
    announced_ = g_bDeviceConnected;
    announcedId_ = DeviceIdText();
    watcher_ = std::thread([this] { Watch(); });
  }

  ~TracerService() override {
    {
      std::lock_guard lock(stopMutex_);
      stopping_ = true;
    }
    stopCv_.notify_all();
    watcher_.join();
  }

  bool Connected() override { return Refresh().has_value(); }

  void Handle(RequestContext& ctx) override {
    CDataControlCmdBlkKVDevice device{};
    UnpackBlock(ctx.request, device);
    const int32_t cmd = device.nDeviceCmd;
    if (cmd == DC_DEVICE_CANCEL_READ) {
      // A read it was meant for has stopped already (requests wait while a read runs).
      ctx.replies.Send(device);
      return;
    }
    std::optional<LoggerFolder> logger = Refresh();
    // A KV-11 logger's settings travel in that family's block, but a plain device block with
    // options may be written to it too (the wizard writes g_devConfig to every model).
    if (UsesKV11Block(cmd) && !(cmd == DC_DEVICE_WRITE_SETTING && ctx.request.Has("nInterval"))) {
      auto kv11 = std::make_unique<CDataControlCmdBlkKVDevice11>();
      InitKV11BlockDefaults(*kv11);
      UnpackBlock(ctx.request, *kv11);
      kv11->nLastError = logger ? RunKV11(*kv11, *logger) : int32_t{DC_ERR_NO_DEVICE};
      ctx.replies.Send(*kv11);
      return;
    }
    switch (cmd) {
      case DC_DEVICE_READ_LOG:
      case DC_DEVICE_CLEAR_LOG:
      case DC_DEVICE_READ_SETTING:
      case DC_DEVICE_WRITE_SETTING:
      case DC_DEVICE_RESET:
      case DC_DEVICE_WRITE_NAVI:
        device.nLastError = logger ? Run(device, *logger, ctx) : int32_t{DC_ERR_NO_DEVICE};
        break;
      default:
        device.nLastError = DC_ERR_UNKNOWN_COMMAND;
        break;
    }
    Refresh();  // the memory in use may have changed
    ctx.replies.Send(device);
  }

 private:
  int32_t Run(CDataControlCmdBlkKVDevice& block, LoggerFolder& logger, RequestContext& ctx) {
    switch (block.nDeviceCmd) {
      case DC_DEVICE_READ_LOG:
        return ReadLog(block, logger, ctx);
      case DC_DEVICE_CLEAR_LOG:
        return ClearLogs(logger);
      case DC_DEVICE_READ_SETTING: {
        const CDataControlCmdBlkKVDevice request = block;
        logger.ReadSettings(block);
        KeepRequestHead(request, block);
        g_devConfig = block;
        return DC_ERR_NONE;
      }
      case DC_DEVICE_WRITE_SETTING:
        if (!logger.WriteSettings(block)) return DC_ERR_DEVICE_WRITE;
        g_devConfig = block;
        return DC_ERR_NONE;
      case DC_DEVICE_RESET:
        if (!logger.Reset()) return DC_ERR_DEVICE_WRITE;
        g_devConfig = FactoryDeviceSettings();
        InitKV11BlockDefaults(g_devConfig11);
        return DC_ERR_NONE;
      default:  // navigation points: only the KV-11 family takes them
        return DC_ERR_MODEL_UNSUPPORTED;
    }
  }

  int32_t RunKV11(CDataControlCmdBlkKVDevice11& block, LoggerFolder& logger) {
    switch (block.nDeviceCmd) {
      case DC_DEVICE_READ_SETTING: {
        auto request = std::make_unique<CDataControlCmdBlkKVDevice11>(block);
        logger.ReadSettings(block);
        KeepRequestHead(*request, block);
        g_devConfig11 = block;
        // The wizard edits the plain configuration of every model.
        logger.ReadSettings(g_devConfig);
        g_devConfig.nDeviceCmd = DC_DEVICE_READ_SETTING;
        return DC_ERR_NONE;
      }
      case DC_DEVICE_WRITE_SETTING:
        if (!logger.WriteSettings(block)) return DC_ERR_DEVICE_WRITE;
        g_devConfig11 = block;
        return DC_ERR_NONE;
      default:  // DC_DEVICE_WRITE_NAVI
        return logger.WriteNavi(block.NAVI) ? int32_t{DC_ERR_NONE} : int32_t{DC_ERR_DEVICE_WRITE};
    }
  }

  // With clear-after-download set, a log is erased only once it has been read into trips.
  int32_t ClearLogs(LoggerFolder& logger) {
    const std::vector<LogFile> logs = logger.Logs();
    if (g_bClearLog) {
      std::lock_guard lock(mutex_);
      for (const LogFile& log : logs) {
        if (std::none_of(readLogs_.begin(), readLogs_.end(),
                         [&](const LogFile& r) { return SameLog(r, log); }))
          return DC_ERR_LOG_NOT_READ;
      }
    }
    return logger.DeleteLogs(logs) ? int32_t{DC_ERR_NONE} : int32_t{DC_ERR_DEVICE_WRITE};
  }

  int32_t ReadLog(CDataControlCmdBlkKVDevice& block, const LoggerFolder& logger, RequestContext& ctx) {
    const LogReadResult result =
        ReadLoggerLogs(logger, TripApplication(), ctx.replies, ctx.stopRequested);
    if (result.error != DC_ERR_NONE) return result.error;
    {
      std::lock_guard lock(mutex_);
      readLogs_.insert(readLogs_.end(), result.read.begin(), result.read.end());
    }
    // Only after every log has become a trip; a log that changed since is kept.
    if (g_bClearLog) logger.DeleteLogs(result.read);
    if (result.firstTime >= 0) {
      block.tPointStartTime = CovertTimeTToOleDateTime(result.firstTime);
      block.tPointEndTime = CovertTimeTToOleDateTime(result.lastTime);
    }
    return DC_ERR_NONE;
  }

  CString DeviceIdText() const { return CString::FromUtf8(g_szDeviceId); }

  // Looks for the logger and brings the shared globals up to date.
  std::optional<LoggerFolder> Refresh() {
    LoggerFolder logger;
    const bool found = logger.Open(FindLogger(config_));
    std::lock_guard lock(mutex_);
    PublishDeviceConnection(found, [&] {
      const LoggerIdentity& id = logger.identity();
      g_wDeviceModelID = found ? id.model : 0;
      g_dDeviceVersion = found ? id.firmware : 0;
      g_wDeviceSerialID = found ? id.serial : 0;
      g_nDeviceTimeZone = found ? id.timeZone : 0;
      g_lTotolMemory = found ? id.totalMemoryKiB : 0;
      g_lUsedMemory = found ? logger.UsedMemoryKiB() : 0;
      g_bRTCWorking = found;
      SetByteText(g_szDeviceId, found ? id.identity.ToUtf8() : std::string());
      SetByteText(g_szGSMVersion, found ? id.gsmVersion : std::string());
    });
    if (!found) return std::nullopt;
    return logger;
  }

  void Watch() {
    std::unique_lock lock(stopMutex_);
    while (!stopCv_.wait_for(lock, kWatchPeriod, [this] { return stopping_; })) {
      lock.unlock();
      const bool connected = Connected();
      const CString id = DeviceIdText();
      if (connected != announced_ || id != announcedId_) {
        announced_ = connected;
        announcedId_ = id;
        replies_.Send(DeviceStatusBlock(connected, id));
      }
      lock.lock();
    }
  }

  ReplyChannel& replies_;
  const Config config_;
  std::mutex mutex_;               // the shared globals' updates and readLogs_
  std::vector<LogFile> readLogs_;  // logs that became trips in this run
  std::thread watcher_;
  std::mutex stopMutex_;
  std::condition_variable stopCv_;
  bool stopping_ = false;
  bool announced_ = false;  // what the watcher announced last (watcher thread only)
  CString announcedId_;
};

}  // namespace

std::unique_ptr<DeviceService> MakeTracerService(ReplyChannel& replies, const Config& config) {
  return std::make_unique<TracerService>(replies, config);
}

}  // namespace gpsdc
