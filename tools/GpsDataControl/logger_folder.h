// A logger that appears as a folder (USB mass storage): its description file, its log files and
// its navigation points (docs/logger-folder.md), and how the process finds it.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "config.h"
#include "navmisc/datactrl/cmd_blocks.h"
#include "navmisc/platform/cstring.h"

namespace gpsdc {

inline constexpr const wchar_t* kLoggerDescriptionFile = L"GPSLOGGER.INI";
inline constexpr const wchar_t* kLoggerLogFolder = L"LOG";
inline constexpr const wchar_t* kLoggerNaviFile = L"NAVI.DAT";
// Names the logger folder for the programs started afterwards; beats the configuration.
inline constexpr const char* kLoggerVariable = "NAVMISC_LOGGER";

// What the description file says about the logger itself.
struct LoggerIdentity {
  uint16_t model = 0;
  int32_t serial = 0;
  double firmware = 0;
  CString identity;          // normalised ("SN:2100001234")
  std::string gsmVersion;    // firmware of the modem, when it has one
  int32_t timeZone = 0;      // minutes east of UTC that the logger's clock is set to
  int32_t totalMemoryKiB = 0;
};

enum class LogFormat { kNmea, kGpx };

struct LogFile {
  CString path;
  CString name;
  LogFormat format;
  int64_t size = 0;
  int64_t modified = 0;  // nanoseconds since 1970
  // Whether the file on the logger is still the one listed (same size and time).
  bool Unchanged() const;
};

class LoggerFolder {
 public:
  // Reads the description file of `root`. False when `root` holds no description file, or one
  // without a model code.
  bool Open(const CString& root);

  const CString& root() const { return root_; }
  const LoggerIdentity& identity() const { return identity_; }
  // Whether the description file is still there (the logger has not been unplugged).
  bool StillThere() const;

  // The log files: regular files (links are not followed) in the log folder whose names end in
  // ".nmea", ".nma", ".log" (NMEA 0183) or ".gpx", in name order.
  std::vector<LogFile> Logs() const;
  // KiB taken by the logs and the navigation points, rounded up.
  int32_t UsedMemoryKiB() const;

  // The settings as the logger keeps them: factory values, overwritten by the description file.
  void ReadSettings(CDataControlCmdBlkKVDevice& block) const;
  void ReadSettings(CDataControlCmdBlkKVDevice11& block) const;
  // Replaces the settings of the block's kind in the description file (the file is rewritten
  // whole, atomically). False when it could not be written.
  bool WriteSettings(const CDataControlCmdBlkKVDevice& block);
  bool WriteSettings(const CDataControlCmdBlkKVDevice11& block);
  // Puts every setting back to its factory value and removes the navigation points.
  bool Reset();
  // Keeps the navigation entries of a NAVI field (up to the last entry that holds a point).
  bool WriteNavi(const uint8_t* navi);
  // Deletes the given logs when they are unchanged since they were listed; true when every one
  // of them is gone afterwards.
  bool DeleteLogs(const std::vector<LogFile>& logs) const;

 private:
  bool Rewrite(const CDataControlCmdBlkKVDevice& device, const CDataControlCmdBlkKVDevice11* kv11);

  CString root_;
  LoggerIdentity identity_;
  std::vector<std::pair<std::string, std::string>> identityKeys_;  // [LOGGER] as read
};

// The factory settings of a logger.
CDataControlCmdBlkKVDevice FactoryDeviceSettings();

// Where the logger is: the folder named by NAVMISC_LOGGER, else the configured [DEVICE] Path,
// else the first mounted volume (in `mountsTable`, the format of /proc/self/mounts) whose root
// holds a description file. Empty when there is none. A folder that is named but holds no
// description file counts as no logger; it does not lead to a search.
CString FindLogger(const Config& config, const char* mountsTable = "/proc/self/mounts");

}  // namespace gpsdc
