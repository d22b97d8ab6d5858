// The settings of the two device blocks as named texts: what a logger's description file keeps
// and what `navmisc device settings` shows and sets (docs/logger-folder.md lists every name).
// The names are the blocks' package names ("nInterval", "bAccOn", "SERVER_PORT", "admin_0").
#pragma once

#include <functional>
#include <string>
#include <string_view>

#include "navmisc/datactrl/cmd_blocks.h"

namespace navmisc::datactrl {

// Receives one setting: its name and its value as UTF-8 text.
using SettingVisitor = std::function<void(const char* key, const std::string& value)>;

// Every setting of the block, in a fixed order. The device block gives its options, flags
// (0 or 1), schedule (start time as "YYYY-MM-DDThh:mm:ss" in UTC or empty; the week's time
// table as hexadecimal, empty when all zero) and security record; the KV-11 block its
// parameters, navigation points excluded.
void ForEachSetting(const CDataControlCmdBlkKVDevice& block, const SettingVisitor& visit);
void ForEachSetting(const CDataControlCmdBlkKVDevice11& block, const SettingVisitor& visit);

// Whether `key` (matched without regard to case) names a setting of that block kind.
bool IsDeviceSetting(std::string_view key);
bool IsKV11Setting(std::string_view key);

// Sets the setting `key` from its text. Returns an empty text on success, otherwise why the
// block was left unchanged ("unknown setting", "not a number from 0 to 255", ...).
std::string SetSetting(CDataControlCmdBlkKVDevice& block, std::string_view key,
                       std::string_view value);
std::string SetSetting(CDataControlCmdBlkKVDevice11& block, std::string_view key,
                       std::string_view value);

}  // namespace navmisc::datactrl
