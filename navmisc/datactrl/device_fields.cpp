#include "navmisc/datactrl/device_fields.h"

#include <charconv>
#include <cstdint>
#include <cstring>
#include <limits>
#include <strings.h>

#include "navmisc/datactrl/detail/kv11_fields.h"
#include "navmisc/platform/datetime.h"

namespace navmisc::datactrl {
namespace {

// How a setting is written as text.
enum class Form {
  kInt32,
  kUInt32,
  kUInt16,
  kUInt8,
  kFlag,      // a byte that is 0 or 1
  kText,      // a terminated byte text; `size` includes the terminator
  kRawText,   // `size` bytes of text, terminated only when shorter
  kDateTime,  // COleDateTime
  kHex,       // `size` bytes as hexadecimal digits; empty when all zero
};

// One setting: where it lives in the block and how it reads. `field` is the whole member (zeroed
// beyond the text when a text is set).
struct Field {
  const char* key;
  Form form;
  void* ptr;
  size_t size;
  size_t fieldSize;
};

template <class Block, class Visit>
void ForEachDeviceField(Block& b, Visit visit) {
  auto field = [&](const char* key, Form form, auto& member) {
    visit(Field{key, form, const_cast<void*>(static_cast<const void*>(&member)), sizeof member,
                sizeof member});
  };
  field("nInterval", Form::kInt32, b.nInterval);
  field("nVelocity_Scale", Form::kInt32, b.nVelocity_Scale);
  field("nVsleep", Form::kInt32, b.nVsleep);
  field("bDebugMode", Form::kFlag, b.bDebugMode);
  field("bTricklePower", Form::kFlag, b.bTricklePower);
  field("bDualMode", Form::kFlag, b.bDualMode);
  field("bCycle", Form::kFlag, b.bCycle);
  field("bMotionDetect", Form::kFlag, b.bMotionDetect);
  field("bAccOn", Form::kFlag, b.bAccOn);
  field("bEnableLED", Form::kFlag, b.bEnableLED);
  field("bEnableSchedule", Form::kFlag, b.bEnableSchedule);
  field("bEnableButton", Form::kFlag, b.bEnableButton);
  field("tDestStartScheduleTimeUTC", Form::kDateTime, b.sSchedule.tDestStartScheduleTimeUTC);
  field("bTimeTable", Form::kHex, b.sSchedule.bTimeTable);
  field("cVersion", Form::kUInt8, b.sSecurity.cVersion);
  field("bOnOff", Form::kFlag, b.sSecurity.bOnOff);
  field("szPassword", Form::kText, b.sSecurity.szPassword);
}

template <class Block, class Visit>
void ForEachKV11SettingField(Block& b, Visit visit) {
  detail::ForEachKV11Field(b, [&](const char* name, detail::Kind kind, auto* p, size_t capacity,
                                  size_t packed) {
    void* ptr = const_cast<void*>(static_cast<const void*>(p));
    switch (kind) {
      case detail::Kind::kBytes:
        // The navigation points are entries of their own, not a setting.
        if (packed != sizeof b.NAVI) visit(Field{name, Form::kRawText, ptr, packed, capacity});
        break;
      case detail::Kind::kByteText: visit(Field{name, Form::kText, ptr, capacity, capacity}); break;
      case detail::Kind::kInt32: visit(Field{name, Form::kInt32, ptr, 4, 4}); break;
      case detail::Kind::kUInt32: visit(Field{name, Form::kUInt32, ptr, 4, 4}); break;
      case detail::Kind::kUInt16: visit(Field{name, Form::kUInt16, ptr, 2, 2}); break;
      case detail::Kind::kUInt8: visit(Field{name, Form::kUInt8, ptr, 1, 1}); break;
    }
  });
}

template <class T>
T Load(const void* p) {
  T v;
  std::memcpy(&v, p, sizeof v);
  return v;
}

std::string HexText(const uint8_t* bytes, size_t size) {
  static constexpr char kDigits[] = "0123456789ABCDEF";
  bool any = false;
  for (size_t i = 0; i < size && !any; ++i) any = bytes[i] != 0;
  if (!any) return {};
  std::string text;
  text.reserve(size * 2);
  for (size_t i = 0; i < size; ++i) {
    text += kDigits[bytes[i] >> 4];
    text += kDigits[bytes[i] & 15];
  }
  return text;
}

std::string FieldText(const Field& f) {
  switch (f.form) {
    case Form::kInt32: return std::to_string(Load<int32_t>(f.ptr));
    case Form::kUInt32: return std::to_string(Load<uint32_t>(f.ptr));
    case Form::kUInt16: return std::to_string(Load<uint16_t>(f.ptr));
    case Form::kUInt8: return std::to_string(Load<uint8_t>(f.ptr));
    case Form::kFlag: return Load<uint8_t>(f.ptr) ? "1" : "0";
    case Form::kText:
    case Form::kRawText: {
      const char* text = static_cast<const char*>(f.ptr);
      return std::string(text, ::strnlen(text, f.form == Form::kText ? f.size - 1 : f.size));
    }
    case Form::kDateTime: {
      const long t = CovertOleDateTimeToTimeT(Load<COleDateTime>(f.ptr));
      return t == -1 ? std::string() : TimeTToStdStringTime(t).ToUtf8();
    }
    case Form::kHex: return HexText(static_cast<const uint8_t*>(f.ptr), f.size);
  }
  return {};
}

template <class T>
std::string SetNumber(const Field& f, std::string_view text, T low, T high) {
  long long v = 0;
  const char* end = text.data() + text.size();
  const auto [p, ec] = std::from_chars(text.data(), end, v);
  if (text.empty() || ec != std::errc() || p != end || v < static_cast<long long>(low) ||
      v > static_cast<long long>(high)) {
    return "not a whole number from " + std::to_string(low) + " to " + std::to_string(high);
  }
  const T value = static_cast<T>(v);
  std::memcpy(f.ptr, &value, sizeof value);
  return {};
}

int HexDigit(char c) {
  if (c >= '0' && c <= '9') return c - '0';
  if (c >= 'a' && c <= 'f') return c - 'a' + 10;
  if (c >= 'A' && c <= 'F') return c - 'A' + 10;
  return -1;
}

std::string SetField(const Field& f, std::string_view text) {
  switch (f.form) {
    case Form::kInt32:
      return SetNumber<int32_t>(f, text, std::numeric_limits<int32_t>::min(),
                                std::numeric_limits<int32_t>::max());
    case Form::kUInt32: return SetNumber<uint32_t>(f, text, 0, std::numeric_limits<uint32_t>::max());
    case Form::kUInt16: return SetNumber<uint16_t>(f, text, 0, 65535);
    case Form::kUInt8: return SetNumber<uint8_t>(f, text, 0, 255);
    case Form::kFlag: return SetNumber<uint8_t>(f, text, 0, 1);
    case Form::kText:
    case Form::kRawText: {
      const size_t room = f.form == Form::kText ? f.size - 1 : f.size;
      if (text.size() > room) return "longer than " + std::to_string(room) + " bytes";
      if (text.find('\0') != std::string_view::npos) return "holds a zero byte";
      std::memset(f.ptr, 0, f.fieldSize);
      std::memcpy(f.ptr, text.data(), text.size());
      return {};
    }
    case Form::kDateTime: {
      COleDateTime value;  // empty text: no time
      if (!text.empty()) {
        const long t = ConvertStdStringTimeT(CString::FromUtf8(text));
        if (t == -1) return "not a time of the form YYYY-MM-DDThh:mm:ss";
        value = CovertTimeTToOleDateTime(t);
      }
      std::memcpy(f.ptr, &value, sizeof value);
      return {};
    }
    case Form::kHex: {
      if (!text.empty() && text.size() != 2 * f.size)
        return "not " + std::to_string(2 * f.size) + " hexadecimal digits";
      auto* out = static_cast<uint8_t*>(f.ptr);
      for (size_t i = 0; i < text.size(); i += 2) {
        const int hi = HexDigit(text[i]);
        const int lo = HexDigit(text[i + 1]);
        if (hi < 0 || lo < 0) return "not " + std::to_string(2 * f.size) + " hexadecimal digits";
      }
      if (text.empty()) {
        std::memset(out, 0, f.size);
      } else {
        for (size_t i = 0; i < f.size; ++i)
          out[i] = static_cast<uint8_t>(HexDigit(text[2 * i]) << 4 | HexDigit(text[2 * i + 1]));
      }
      return {};
    }
  }
  return "unknown setting";
}

bool SameKey(const char* a, std::string_view b) {
  return std::strlen(a) == b.size() && ::strncasecmp(a, b.data(), b.size()) == 0;
}

template <class Block, class ForEach>
std::string SetByKey(Block& block, std::string_view key, std::string_view value, ForEach forEach) {
  std::string result = "unknown setting";
  bool found = false;
  forEach(block, [&](const Field& f) {
    if (found || !SameKey(f.key, key)) return;
    found = true;
    result = SetField(f, value);
  });
  return result;
}

template <class Block, class ForEach>
bool HasKey(std::string_view key, ForEach forEach) {
  static Block probe{};  // only its field names are looked at
  bool found = false;
  forEach(probe, [&](const Field& f) { found = found || SameKey(f.key, key); });
  return found;
}

}  // namespace

void ForEachSetting(const CDataControlCmdBlkKVDevice& block, const SettingVisitor& visit) {
  ForEachDeviceField(block, [&](const Field& f) { visit(f.key, FieldText(f)); });
}

void ForEachSetting(const CDataControlCmdBlkKVDevice11& block, const SettingVisitor& visit) {
  ForEachKV11SettingField(block, [&](const Field& f) { visit(f.key, FieldText(f)); });
}

bool IsDeviceSetting(std::string_view key) {
  return HasKey<CDataControlCmdBlkKVDevice>(
      key, [](auto& b, auto visit) { ForEachDeviceField(b, visit); });
}

bool IsKV11Setting(std::string_view key) {
  return HasKey<CDataControlCmdBlkKVDevice11>(
      key, [](auto& b, auto visit) { ForEachKV11SettingField(b, visit); });
}

std::string SetSetting(CDataControlCmdBlkKVDevice& block, std::string_view key,
                       std::string_view value) {
  return SetByKey(block, key, value, [](auto& b, auto visit) { ForEachDeviceField(b, visit); });
}

std::string SetSetting(CDataControlCmdBlkKVDevice11& block, std::string_view key,
                       std::string_view value) {
  return SetByKey(block, key, value,
                  [](auto& b, auto visit) { ForEachKV11SettingField(b, visit); });
}

}  // namespace navmisc::datactrl
