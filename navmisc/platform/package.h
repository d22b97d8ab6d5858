// Packages of named values: the form in which the data-control channel carries its blocks
// (docs/data-control-channel.md gives the byte layout with an example).
//
// A package is a short header and a sequence of entries, each a name and a value with their
// lengths. A value is plain bytes; a package can hold another package as the value of a name.
// Both directions live here so that writer and reader always agree on the framing.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string_view>
#include <unordered_map>
#include <vector>

namespace navmisc {

// The first four bytes of every package: "NPK" and the framing version.
inline constexpr uint8_t kPackageMagic[4] = {'N', 'P', 'K', 1};
inline constexpr size_t kPackageHeaderSize = 12;  // magic, entry count, body size
// Longest name an entry may have, in bytes. Names never hold a zero byte.
inline constexpr size_t kPackageMaxName = 255;

// Why a package was refused.
enum class PackageError {
  kNone,
  kEmpty,            // no data was set
  kTooShort,         // fewer bytes than a header
  kBadMagic,         // not a package, or another framing version
  kSizeMismatch,     // the body size in the header is not what follows it
  kTruncatedEntry,   // an entry's name or value runs past the end
  kBadName,          // an empty or over-long name, or one with a zero byte
  kCountMismatch,    // the header's entry count differs from the entries found
  kDuplicateName,    // a name occurs twice
};
const char* PackageErrorText(PackageError error);

}  // namespace navmisc

// Builds a package. Values are appended in call order; the flat bytes are valid after every
// call.
class CPackageBlk {
 public:
  // `empty` is accepted for the callers' sake: every package starts empty.
  explicit CPackageBlk(int empty = 1);

  // A wide text, stored as UTF-16 little-endian with its terminating zero; a null text is one
  // zero character. Characters beyond U+FFFF become surrogate pairs.
  void Add(const char* name, const wchar_t* text);
  // A raw value of `size` bytes (a nested package is added this way, from its flat bytes).
  void Add(const char* name, const void* data, size_t size);
  void Add(const char* name, const CPackageBlk& nested) {
    Add(name, nested.GetPackagePtr(), nested.GetPackageSize());
  }

  const uint8_t* GetPackagePtr() const { return bytes_.data(); }
  uint32_t GetPackageSize() const { return static_cast<uint32_t>(bytes_.size()); }
  uint32_t GetCount() const { return count_; }

 private:
  std::vector<uint8_t> bytes_;
  uint32_t count_ = 0;
};

// Reads a package. The bytes are checked as a whole when they are set: a package that is not
// exactly well-formed is refused (IsValid false, every lookup fails), never read in part.
// The reader refers to the caller's bytes, which must stay alive and unchanged while it is used.
class CUnpackageBlk {
 public:
  CUnpackageBlk() = default;
  CUnpackageBlk(const void* data, size_t size) { SetData(data, size); }
  // Copying would leave the index pointing into the other object; move the bytes' owner instead.
  CUnpackageBlk(const CUnpackageBlk&) = delete;
  CUnpackageBlk& operator=(const CUnpackageBlk&) = delete;

  // Takes a flat package (or a nested one, as GetData found it in its parent). False when the
  // bytes are not a well-formed package; error() tells why. Costs time in proportion to `size`.
  bool SetData(const void* data, size_t size);

  bool IsValid() const { return error_ == navmisc::PackageError::kNone; }
  navmisc::PackageError error() const { return error_; }

  // Finds a named value: its bytes inside the package and their count. False when the name is
  // absent (or the package was refused).
  bool GetData(const char* name, const uint8_t*& data, uint32_t& size) const;
  bool Has(const char* name) const;

  // The entries in package order.
  struct Entry {
    std::string_view name;
    const uint8_t* data;
    uint32_t size;
  };
  const std::vector<Entry>& Entries() const { return entries_; }
  uint32_t GetCount() const { return static_cast<uint32_t>(entries_.size()); }

 private:
  bool Refuse(navmisc::PackageError why);  // always false

  std::vector<Entry> entries_;
  std::unordered_map<std::string_view, uint32_t> index_;
  navmisc::PackageError error_ = navmisc::PackageError::kEmpty;
};
