#include "navmisc/platform/package.h"

#include <cstring>
#include <string>

#include "navmisc/platform/textconv.h"

namespace navmisc {
namespace {

void PutU16(uint8_t* p, uint32_t v) {
  p[0] = static_cast<uint8_t>(v);
  p[1] = static_cast<uint8_t>(v >> 8);
}
void PutU32(uint8_t* p, uint32_t v) {
  for (int i = 0; i < 4; ++i) p[i] = static_cast<uint8_t>(v >> (8 * i));
}
uint32_t GetU16(const uint8_t* p) { return p[0] | (p[1] << 8); }
uint32_t GetU32(const uint8_t* p) {
  return p[0] | (p[1] << 8) | (p[2] << 16) | (static_cast<uint32_t>(p[3]) << 24);
}

}  // namespace

const char* PackageErrorText(PackageError error) {
  switch (error) {
    case PackageError::kNone: return "well-formed";
    case PackageError::kEmpty: return "no data";
    case PackageError::kTooShort: return "shorter than a package header";
    case PackageError::kBadMagic: return "not a package of this framing";
    case PackageError::kSizeMismatch: return "body size differs from the bytes that follow";
    case PackageError::kTruncatedEntry: return "an entry runs past the end";
    case PackageError::kBadName: return "an empty or over-long name, or one with a zero byte";
    case PackageError::kCountMismatch: return "entry count differs from the entries found";
    case PackageError::kDuplicateName: return "a name occurs twice";
  }
  return "unknown";
}

}  // namespace navmisc

using navmisc::PackageError;

CPackageBlk::CPackageBlk(int /*empty*/) : bytes_(navmisc::kPackageHeaderSize, 0) {
  std::memcpy(bytes_.data(), navmisc::kPackageMagic, 4);
}

void CPackageBlk::Add(const char* name, const wchar_t* text) {
  std::string utf16;
  navmisc::AppendUtf16Le(text ? std::wstring_view(text) : std::wstring_view(), utf16);
  utf16.append(2, '\0');
  Add(name, utf16.data(), utf16.size());
}

void CPackageBlk::Add(const char* name, const void* data, size_t size) {
  // The framing cannot express these; callers pass fixed names and values far below 4 GiB.
  const size_t nameLen = name ? std::strlen(name) : 0;
  if (nameLen == 0 || nameLen > navmisc::kPackageMaxName || size > UINT32_MAX - 64) return;
  const size_t at = bytes_.size();
  bytes_.resize(at + 2 + nameLen + 4 + size);
  uint8_t* p = bytes_.data() + at;
  navmisc::PutU16(p, static_cast<uint32_t>(nameLen));
  std::memcpy(p + 2, name, nameLen);
  navmisc::PutU32(p + 2 + nameLen, static_cast<uint32_t>(size));
  if (size) std::memcpy(p + 6 + nameLen, data, size);
  ++count_;
  navmisc::PutU32(bytes_.data() + 4, count_);
  navmisc::PutU32(bytes_.data() + 8,
                  static_cast<uint32_t>(bytes_.size() - navmisc::kPackageHeaderSize));
}

bool CUnpackageBlk::Refuse(PackageError why) {
  entries_.clear();
  index_.clear();
  error_ = why;
  return false;
}

bool CUnpackageBlk::SetData(const void* data, size_t size) {
  entries_.clear();
  index_.clear();
  error_ = PackageError::kNone;
  const auto* p = static_cast<const uint8_t*>(data);
  if (!p || size == 0) return Refuse(PackageError::kEmpty);
  if (size < navmisc::kPackageHeaderSize) return Refuse(PackageError::kTooShort);
  if (std::memcmp(p, navmisc::kPackageMagic, 4) != 0) return Refuse(PackageError::kBadMagic);
  const uint32_t count = navmisc::GetU32(p + 4);
  if (navmisc::GetU32(p + 8) != size - navmisc::kPackageHeaderSize)
    return Refuse(PackageError::kSizeMismatch);
  // The smallest entry takes 7 bytes, so the count cannot ask for more room than the bytes give.
  const size_t most = (size - navmisc::kPackageHeaderSize) / 7;
  entries_.reserve(count < most ? count : most);
  size_t at = navmisc::kPackageHeaderSize;
  while (at < size) {
    if (size - at < 2) return Refuse(PackageError::kTruncatedEntry);
    const uint32_t nameLen = navmisc::GetU16(p + at);
    if (nameLen == 0 || nameLen > navmisc::kPackageMaxName) return Refuse(PackageError::kBadName);
    if (size - at - 2 < nameLen + 4u) return Refuse(PackageError::kTruncatedEntry);
    const std::string_view name(reinterpret_cast<const char*>(p + at + 2), nameLen);
    if (name.find('\0') != std::string_view::npos) return Refuse(PackageError::kBadName);
    const uint32_t valueLen = navmisc::GetU32(p + at + 2 + nameLen);
    const size_t valueAt = at + 6 + nameLen;
    if (size - valueAt < valueLen) return Refuse(PackageError::kTruncatedEntry);
    if (!index_.emplace(name, static_cast<uint32_t>(entries_.size())).second)
      return Refuse(PackageError::kDuplicateName);
    entries_.push_back({name, p + valueAt, valueLen});
    at = valueAt + valueLen;
  }
  if (entries_.size() != count) return Refuse(PackageError::kCountMismatch);
  return true;
}

bool CUnpackageBlk::GetData(const char* name, const uint8_t*& data, uint32_t& size) const {
  if (!name) return false;
  const auto it = index_.find(std::string_view(name));
  if (it == index_.end()) return false;
  data = entries_[it->second].data;
  size = entries_[it->second].size;
  return true;
}

bool CUnpackageBlk::Has(const char* name) const {
  return name && index_.count(std::string_view(name)) != 0;
}
