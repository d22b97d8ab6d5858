#include "logger_folder.h"

#include <dirent.h>
#include <sys/stat.h>

#include <algorithm>
#include <cctype>
#include <climits>
#include <cstdlib>
#include <fstream>
#include <memory>

#include "navmisc/datactrl/block_codec.h"
#include "navmisc/datactrl/device_fields.h"
#include "navmisc/datactrl/navi_points.h"
#include "navmisc/platform/atomic_file.h"
#include "navmisc/platform/files.h"
#include "navmisc/platform/settings.h"
#include "navmisc/util/device_identity.h"

namespace gpsdc {
namespace {

constexpr const wchar_t* kLoggerSection = L"LOGGER";
constexpr const wchar_t* kSettingsSection = L"SETTINGS";
constexpr const wchar_t* kKV11Section = L"KV11";
// The keys of [LOGGER], kept as they are when the settings are rewritten.
constexpr const wchar_t* kIdentityKeys[] = {L"Model",      L"Serial",   L"Firmware",
                                            L"Identity",   L"Name",     L"GSMVersion",
                                            L"TimeZone",   L"TotalMemory"};

std::string Native(const wchar_t* path) { return navmisc::NativePath(path); }

// Size and modification time of a regular file that is not a link; false for anything else.
bool RegularFileInfo(const CString& path, int64_t& size, int64_t& modified) {
  struct stat st;
  if (::lstat(Native(path).c_str(), &st) != 0 || !S_ISREG(st.st_mode)) return false;
  size = st.st_size;
  modified = static_cast<int64_t>(st.st_mtim.tv_sec) * 1000000000 + st.st_mtim.tv_nsec;
  return true;
}

bool HasSuffixNoCase(const CString& name, const wchar_t* suffix) {
  const CString s = suffix;
  return name.GetLength() > s.GetLength() &&
         name.Right(s.GetLength()).CompareNoCase(s) == 0;
}

bool LogFormatOf(const CString& name, LogFormat& format) {
  for (const wchar_t* nmea : {L".nmea", L".nma", L".log"}) {
    if (HasSuffixNoCase(name, nmea)) {
      format = LogFormat::kNmea;
      return true;
    }
  }
  if (HasSuffixNoCase(name, L".gpx")) {
    format = LogFormat::kGpx;
    return true;
  }
  return false;
}

// A mount point as /proc/self/mounts writes it: blanks, tabs, line ends and backslashes as
// three octal digits after a backslash.
std::string UnescapeMountPoint(const std::string& text) {
  std::string out;
  for (size_t i = 0; i < text.size(); ++i) {
    if (text[i] == '\\' && i + 3 < text.size() &&
        std::isdigit(static_cast<unsigned char>(text[i + 1])) &&
        std::isdigit(static_cast<unsigned char>(text[i + 2])) &&
        std::isdigit(static_cast<unsigned char>(text[i + 3]))) {
      out += static_cast<char>((text[i + 1] - '0') * 64 + (text[i + 2] - '0') * 8 + (text[i + 3] - '0'));
      i += 3;
    } else {
      out += text[i];
    }
  }
  return out;
}

// Whether a mounted file system may be a logger: the file systems of removable media anywhere,
// anything mounted where removable media are mounted.
bool MayBeLogger(const std::string& mountPoint, const std::string& type) {
  static constexpr const char* kRemovable[] = {"vfat", "msdos", "exfat", "fuseblk", "ntfs",
                                               "ntfs3", "hfsplus", "udf"};
  for (const char* t : kRemovable)
    if (type == t) return true;
  for (const char* base : {"/media/", "/run/media/", "/mnt/"})
    if (mountPoint.starts_with(base)) return true;
  return false;
}

bool HasDescription(const CString& root) {
  int64_t size, modified;
  return RegularFileInfo(PathJoin(root, kLoggerDescriptionFile), size, modified);
}

std::string Utf8Of(const CString& text) { return text.ToUtf8(); }

// Reads the settings of one section over the block's current values; values that do not fit
// their setting keep what the block had.
template <class Block>
void ReadSection(unsigned long ini, const wchar_t* section, Block& block) {
  std::vector<std::string> keys;
  navmisc::datactrl::ForEachSetting(block, [&](const char* key, const std::string&) { keys.emplace_back(key); });
  for (const std::string& key : keys) {
    const CString wkey = CString::FromUtf8(key);
    if (!RD_EXISTS(ini, section, wkey)) continue;
    navmisc::datactrl::SetSetting(block, key, Utf8Of(RD_STRING(ini, section, wkey)));
  }
}

template <class Block>
void WriteSection(unsigned long ini, const wchar_t* section, const Block& block) {
  navmisc::datactrl::ForEachSetting(block, [&](const char* key, const std::string& value) {
    WR_STRING(ini, section, CString::FromUtf8(key), CString::FromUtf8(value));
  });
}

}  // namespace

bool LogFile::Unchanged() const {
  int64_t nowSize, nowModified;
  return RegularFileInfo(path, nowSize, nowModified) && nowSize == size && nowModified == modified;
}

CDataControlCmdBlkKVDevice FactoryDeviceSettings() {
  CDataControlCmdBlkKVDevice block;
  InitDeviceBlockDefaults(block);
  block.nInterval = 5;
  block.bEnableLED = 1;
  block.bEnableButton = 1;
  return block;
}

bool LoggerFolder::Open(const CString& root) {
  root_ = root;
  identity_ = {};
  identityKeys_.clear();
  const CString description = PathJoin(root, kLoggerDescriptionFile);
  int64_t size, modified;
  if (!RegularFileInfo(description, size, modified)) return false;
  const unsigned long ini = RD_BEGIN(description);
  if (!ini) return false;
  for (const wchar_t* key : kIdentityKeys) {
    if (RD_EXISTS(ini, kLoggerSection, key))
      identityKeys_.emplace_back(Utf8Of(key), Utf8Of(RD_STRING(ini, kLoggerSection, key)));
  }
  const int model = RD_INT(ini, kLoggerSection, L"Model", 0);
  identity_.model = model > 0 && model <= 0xFFFF ? static_cast<uint16_t>(model) : 0;
  identity_.serial = RD_INT(ini, kLoggerSection, L"Serial", 0);
  identity_.firmware = RD_FLOAT(ini, kLoggerSection, L"Firmware", 0.0);
  identity_.gsmVersion = Utf8Of(RD_STRING(ini, kLoggerSection, L"GSMVersion"));
  identity_.timeZone = RD_INT(ini, kLoggerSection, L"TimeZone", 0);
  identity_.totalMemoryKiB = std::max(0, RD_INT(ini, kLoggerSection, L"TotalMemory", 0));
  // The identity as the logger reports it, in the form the suite shows; without one, that form
  // of model and serial.
  identity_.identity = RD_STRING(ini, kLoggerSection, L"Identity");
  if (identity_.identity.IsEmpty())
    identity_.identity = FormatString(L"SN:%02d%08d", model, identity_.serial);
  ChangeModelDspName(identity_.identity);
  RD_END(ini);
  return identity_.model != 0;
}

bool LoggerFolder::StillThere() const { return HasDescription(root_); }

std::vector<LogFile> LoggerFolder::Logs() const {
  std::vector<LogFile> logs;
  const CString folder = PathJoin(root_, kLoggerLogFolder);
  CStringList names;
  if (GetContent(folder, L"*", names) < 0) return logs;
  for (POSITION pos = names.GetHeadPosition(); pos;) {
    const CString& name = names.GetNext(pos);
    LogFile log;
    log.name = name;
    log.path = PathJoin(folder, name);
    if (LogFormatOf(name, log.format) && RegularFileInfo(log.path, log.size, log.modified))
      logs.push_back(std::move(log));
  }
  return logs;
}

int32_t LoggerFolder::UsedMemoryKiB() const {
  int64_t bytes = 0;
  for (const LogFile& log : Logs()) bytes += log.size;
  int64_t size, modified;
  if (RegularFileInfo(PathJoin(root_, kLoggerNaviFile), size, modified)) bytes += size;
  return static_cast<int32_t>(std::min<int64_t>((bytes + 1023) / 1024, INT32_MAX));
}

void LoggerFolder::ReadSettings(CDataControlCmdBlkKVDevice& block) const {
  block = FactoryDeviceSettings();
  if (const unsigned long ini = RD_BEGIN(PathJoin(root_, kLoggerDescriptionFile))) {
    ReadSection(ini, kSettingsSection, block);
    RD_END(ini);
  }
}

void LoggerFolder::ReadSettings(CDataControlCmdBlkKVDevice11& block) const {
  InitKV11BlockDefaults(block);
  if (const unsigned long ini = RD_BEGIN(PathJoin(root_, kLoggerDescriptionFile))) {
    ReadSection(ini, kKV11Section, block);
    RD_END(ini);
  }
  // The navigation entries: at most a NAVI field's worth, from a regular file only.
  const CString navi = PathJoin(root_, kLoggerNaviFile);
  int64_t size, modified;
  if (!RegularFileInfo(navi, size, modified)) return;
  std::ifstream in(Native(navi), std::ios::binary);
  in.read(reinterpret_cast<char*>(block.NAVI), sizeof block.NAVI);
  block.nNaviCount = navmisc::datactrl::UsedNaviEntries(block.NAVI);
}

bool LoggerFolder::Rewrite(const CDataControlCmdBlkKVDevice& device,
                           const CDataControlCmdBlkKVDevice11* kv11) {
  const unsigned long ini = WR_BEGIN(PathJoin(root_, kLoggerDescriptionFile));
  if (!ini) return false;
  for (const auto& [key, value] : identityKeys_)
    WR_STRING(ini, kLoggerSection, CString::FromUtf8(key), CString::FromUtf8(value));
  WriteSection(ini, kSettingsSection, device);
  if (kv11) WriteSection(ini, kKV11Section, *kv11);
  return WR_END(ini) == 1;
}

bool LoggerFolder::WriteSettings(const CDataControlCmdBlkKVDevice& block) {
  if (!navmisc::datactrl::IsKV11Model(identity_.model)) return Rewrite(block, nullptr);
  auto kv11 = std::make_unique<CDataControlCmdBlkKVDevice11>();
  ReadSettings(*kv11);
  return Rewrite(block, kv11.get());
}

bool LoggerFolder::WriteSettings(const CDataControlCmdBlkKVDevice11& block) {
  CDataControlCmdBlkKVDevice device;
  ReadSettings(device);
  return Rewrite(device, &block);
}

bool LoggerFolder::Reset() {
  auto kv11 = std::make_unique<CDataControlCmdBlkKVDevice11>();
  InitKV11BlockDefaults(*kv11);
  const bool family = navmisc::datactrl::IsKV11Model(identity_.model);
  if (!Rewrite(FactoryDeviceSettings(), family ? kv11.get() : nullptr)) return false;
  const CString navi = PathJoin(root_, kLoggerNaviFile);
  return PathStatus(navi) != 0 || DeleteFile(navi);
}

bool LoggerFolder::WriteNavi(const uint8_t* navi) {
  const int used = navmisc::datactrl::UsedNaviEntries(navi);
  navmisc::AtomicFile file;
  return file.Open(PathJoin(root_, kLoggerNaviFile)) &&
         file.Write(navi, static_cast<size_t>(used) * navmisc::datactrl::kNaviEntryBytes) &&
         file.Commit();
}

bool LoggerFolder::DeleteLogs(const std::vector<LogFile>& logs) const {
  bool all = true;
  for (const LogFile& log : logs) {
    // A log that grew or was replaced since it was listed holds points nobody has read.
    if (!log.Unchanged() || !DeleteFile(log.path)) all = false;
  }
  return all;
}

CString FindLogger(const Config& config, const char* mountsTable) {
  if (const char* named = std::getenv(kLoggerVariable); named && *named) {
    const CString root = CString::FromUtf8(named);
    return HasDescription(root) ? root : CString();
  }
  if (!config.devicePath.IsEmpty())
    return HasDescription(config.devicePath) ? config.devicePath : CString();
  std::ifstream mounts(mountsTable);
  std::vector<std::string> candidates;
  std::string device, mountPoint, type, rest;
  while (mounts >> device >> mountPoint >> type && std::getline(mounts, rest)) {
    mountPoint = UnescapeMountPoint(mountPoint);
    if (MayBeLogger(mountPoint, type)) candidates.push_back(mountPoint);
  }
  std::sort(candidates.begin(), candidates.end());
  for (const std::string& candidate : candidates) {
    const CString root = CString::FromUtf8(candidate);
    if (HasDescription(root)) return root;
  }
  return {};
}

}  // namespace gpsdc
