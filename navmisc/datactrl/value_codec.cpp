#include "navmisc/datactrl/detail/value_codec.h"

#include <cstdio>
#include <cstring>

#include "navmisc/platform/textconv.h"

namespace navmisc::datactrl::detail {
namespace {

template <class T>
void PutLittleEndian(CPackageBlk& p, const char* name, T value) {
  uint8_t bytes[sizeof(T)];
  for (size_t i = 0; i < sizeof(T); ++i) bytes[i] = static_cast<uint8_t>(value >> (8 * i));
  p.Add(name, bytes, sizeof bytes);
}

template <class T>
bool GetLittleEndian(const CUnpackageBlk& u, const char* name, T& value) {
  const uint8_t* data;
  uint32_t size;
  if (!u.GetData(name, data, size) || size != sizeof(T)) return false;
  T v = 0;
  for (size_t i = 0; i < sizeof(T); ++i) v |= static_cast<T>(static_cast<T>(data[i]) << (8 * i));
  value = v;
  return true;
}

}  // namespace

void PutInt32(CPackageBlk& p, const char* name, int32_t value) {
  PutLittleEndian(p, name, static_cast<uint32_t>(value));
}
void PutUInt32(CPackageBlk& p, const char* name, uint32_t value) { PutLittleEndian(p, name, value); }
void PutUInt16(CPackageBlk& p, const char* name, uint16_t value) { PutLittleEndian(p, name, value); }
void PutUInt8(CPackageBlk& p, const char* name, uint8_t value) { p.Add(name, &value, 1); }
void PutFlag(CPackageBlk& p, const char* name, uint8_t value) { PutInt32(p, name, value ? 1 : 0); }

void PutDouble(CPackageBlk& p, const char* name, double value) {
  uint64_t bits;
  std::memcpy(&bits, &value, sizeof bits);
  PutLittleEndian(p, name, bits);
}

void PutText(CPackageBlk& p, const char* name, const wchar_t* text) { p.Add(name, text); }

void PutDateTime(CPackageBlk& p, const char* name, const COleDateTime& value) {
  const long t = CovertOleDateTimeToTimeT(value);
  p.Add(name, t == -1 ? L"" : TimeTToStdStringTime(t, 1).c_str());
}

void PutByteText(CPackageBlk& p, const char* name, const char* text, size_t capacity) {
  p.Add(name, text, text ? ::strnlen(text, capacity) : 0);
}

bool GetInt32(const CUnpackageBlk& u, const char* name, int32_t& value) {
  uint32_t v;
  if (!GetLittleEndian(u, name, v)) return false;
  value = static_cast<int32_t>(v);
  return true;
}
bool GetUInt32(const CUnpackageBlk& u, const char* name, uint32_t& value) {
  return GetLittleEndian(u, name, value);
}
bool GetUInt16(const CUnpackageBlk& u, const char* name, uint16_t& value) {
  return GetLittleEndian(u, name, value);
}
bool GetUInt8(const CUnpackageBlk& u, const char* name, uint8_t& value) {
  return GetLittleEndian(u, name, value);
}

bool GetDouble(const CUnpackageBlk& u, const char* name, double& value) {
  uint64_t bits;
  if (!GetLittleEndian(u, name, bits)) return false;
  std::memcpy(&value, &bits, sizeof value);
  return true;
}

bool GetFirstByte(const CUnpackageBlk& u, const char* name, uint8_t& value) {
  const uint8_t* data;
  uint32_t size;
  if (!u.GetData(name, data, size) || size == 0) return false;
  value = data[0];
  return true;
}

bool GetFlag(const CUnpackageBlk& u, const char* name, uint8_t& value) {
  uint8_t first;
  if (!GetFirstByte(u, name, first)) return false;
  value = first > 0 ? 1 : 0;
  return true;
}

bool GetText(const CUnpackageBlk& u, const char* name, wchar_t* text, size_t capacity) {
  const uint8_t* data;
  uint32_t size;
  if (capacity == 0 || !u.GetData(name, data, size)) return false;
  const std::wstring w = Utf16LeToWide(data, size, capacity - 1);
  std::wmemcpy(text, w.c_str(), w.size() + 1);
  return true;
}

bool GetText(const CUnpackageBlk& u, const char* name, CString& text) {
  const uint8_t* data;
  uint32_t size;
  if (!u.GetData(name, data, size)) return false;
  text = CString(Utf16LeToWide(data, size));
  return true;
}

bool GetDateTime(const CUnpackageBlk& u, const char* name, COleDateTime& value) {
  CString text;
  if (!GetText(u, name, text) || text.IsEmpty()) return false;
  value = CovertTimeTToOleDateTime(ConvertStdStringTimeT(text));
  return true;
}

bool GetBytes(const CUnpackageBlk& u, const char* name, void* field, size_t capacity) {
  const uint8_t* data;
  uint32_t size;
  if (!u.GetData(name, data, size)) return false;
  const size_t n = size < capacity ? size : capacity;
  std::memcpy(field, data, n);
  std::memset(static_cast<uint8_t*>(field) + n, 0, capacity - n);
  return true;
}

bool GetByteText(const CUnpackageBlk& u, const char* name, char* text, size_t capacity) {
  const uint8_t* data;
  uint32_t size;
  if (capacity == 0 || !u.GetData(name, data, size)) return false;
  size_t n = ::strnlen(reinterpret_cast<const char*>(data), size);
  if (n > capacity - 1) n = capacity - 1;
  std::memcpy(text, data, n);
  text[n] = '\0';
  return true;
}

bool GetNested(const CUnpackageBlk& u, const char* name, CUnpackageBlk& nested) {
  const uint8_t* data;
  uint32_t size;
  return u.GetData(name, data, size) && nested.SetData(data, size);
}

NumberedName::NumberedName(const char* format, int index) {
  std::snprintf(name_, sizeof name_, format, index);
}

}  // namespace navmisc::datactrl::detail
