// Conversion between wide text (wchar_t, UTF-32 on Linux) and UTF-8.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

// Converts `src` to UTF-8 into `dst` (capacity `size` bytes, terminator included). The flag that
// chose between UTF-8 and the ANSI code page on the original platform is accepted and ignored:
// the code page is UTF-8 here. Returns the number of bytes written without the terminator.
// Invalid input (a surrogate or a value beyond U+10FFFF) or a too small buffer leaves an empty,
// terminated result and returns 0.
int WCSToMBS(const wchar_t* src, char* dst, int size, bool utf8 = true);
// The reverse: UTF-8 to wide text, `size` in characters. Malformed UTF-8 or a too small buffer
// leaves an empty, terminated result and returns 0.
int MBSToWCS(const char* src, wchar_t* dst, int size, bool utf8 = true);

namespace navmisc {

// Strict conversions: false (and `out` emptied) on malformed input.
bool WideToUtf8(std::wstring_view in, std::string& out);
bool Utf8ToWide(std::string_view in, std::wstring& out);
// Lenient conversions: malformed sequences become U+FFFD (or "?" on the way to UTF-8).
std::string ToUtf8Lossy(std::wstring_view in);
std::wstring FromUtf8Lossy(std::string_view in);

// Appends `in` as UTF-16 little-endian code units (two bytes each, characters beyond U+FFFF as
// surrogate pairs, invalid values as U+FFFD), without a terminator.
void AppendUtf16Le(std::wstring_view in, std::string& out);
// Reads UTF-16 little-endian text from `size` bytes: up to the first zero unit or the end, an odd
// last byte ignored, unpaired surrogates read as U+FFFD. At most `maxChars` characters are kept.
std::wstring Utf16LeToWide(const unsigned char* data, size_t size, size_t maxChars = SIZE_MAX);

}  // namespace navmisc
