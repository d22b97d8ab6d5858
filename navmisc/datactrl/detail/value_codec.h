// How single values are written into a package and read back (docs/data-control-channel.md,
// "Values"). Shared by every block's pack and unpack functions.
//
// Reading: a name that is absent, or whose value has the wrong size for its type, leaves the
// field untouched and returns false.
#pragma once

#include <cstddef>
#include <cstdint>

#include "navmisc/platform/cstring.h"
#include "navmisc/platform/datetime.h"
#include "navmisc/platform/package.h"

namespace navmisc::datactrl::detail {

// Writing.
void PutInt32(CPackageBlk& p, const char* name, int32_t value);    // 4 bytes, little-endian
void PutUInt32(CPackageBlk& p, const char* name, uint32_t value);  // 4 bytes, little-endian
void PutUInt16(CPackageBlk& p, const char* name, uint16_t value);  // 2 bytes, little-endian
void PutUInt8(CPackageBlk& p, const char* name, uint8_t value);    // 1 byte
void PutFlag(CPackageBlk& p, const char* name, uint8_t value);     // 4 bytes, 0 or 1
void PutDouble(CPackageBlk& p, const char* name, double value);    // 8 bytes, IEEE 754, little-endian
// UTF-16 with its terminator; a null text is one zero character.
void PutText(CPackageBlk& p, const char* name, const wchar_t* text);
// The date-time's seconds since 1970 in the standard text form ("YYYY-MM-DDThh:mm:ss"); one
// that has no such time (conversion gives -1: invalid, or out of the 32-bit range) is an empty
// text.
void PutDateTime(CPackageBlk& p, const char* name, const COleDateTime& value);
// A byte text up to its terminator (at most `capacity` bytes), without the terminator.
void PutByteText(CPackageBlk& p, const char* name, const char* text, size_t capacity);
inline void PutBytes(CPackageBlk& p, const char* name, const void* data, size_t size) {
  p.Add(name, data, size);
}

// Reading.
bool GetInt32(const CUnpackageBlk& u, const char* name, int32_t& value);
bool GetUInt32(const CUnpackageBlk& u, const char* name, uint32_t& value);
bool GetUInt16(const CUnpackageBlk& u, const char* name, uint16_t& value);
bool GetUInt8(const CUnpackageBlk& u, const char* name, uint8_t& value);
bool GetDouble(const CUnpackageBlk& u, const char* name, double& value);
// The value's first byte, as it is (a flag packed as 4 bytes reads back from its first byte).
bool GetFirstByte(const CUnpackageBlk& u, const char* name, uint8_t& value);
// 1 when the value's first byte is greater than 0, else 0.
bool GetFlag(const CUnpackageBlk& u, const char* name, uint8_t& value);
// A wide text cut to `capacity` - 1 characters and terminated.
bool GetText(const CUnpackageBlk& u, const char* name, wchar_t* text, size_t capacity);
bool GetText(const CUnpackageBlk& u, const char* name, CString& text);
// Taken only when the text is not empty. A text that is no date-time reads as an invalid one.
bool GetDateTime(const CUnpackageBlk& u, const char* name, COleDateTime& value);
// Copies the value's bytes (at most `capacity`) and zeroes the rest of the field.
bool GetBytes(const CUnpackageBlk& u, const char* name, void* field, size_t capacity);
// A byte text up to its first zero, cut to `capacity` - 1 bytes, terminated.
bool GetByteText(const CUnpackageBlk& u, const char* name, char* text, size_t capacity);
// A nested package; false when it is absent or not well-formed.
bool GetNested(const CUnpackageBlk& u, const char* name, CUnpackageBlk& nested);

template <size_t N>
bool GetText(const CUnpackageBlk& u, const char* name, wchar_t (&text)[N]) {
  return GetText(u, name, text, N);
}
template <size_t N>
bool GetByteText(const CUnpackageBlk& u, const char* name, char (&text)[N]) {
  return GetByteText(u, name, text, N);
}
template <size_t N>
void PutByteText(CPackageBlk& p, const char* name, const char (&text)[N]) {
  PutByteText(p, name, text, N);
}

// "prefix" followed by the number, for the numbered entries of lists ("ptrPtList_3").
class NumberedName {
 public:
  NumberedName(const char* format, int index);
  operator const char*() const { return name_; }

 private:
  char name_[64];
};

}  // namespace navmisc::datactrl::detail
