// printf-style formatting with the meaning the library's texts were written for, and number
// formatting that never depends on the process locale.
//
// In the wide functions "%s" takes a wide string (const wchar_t*) and "%S" a narrow UTF-8 one;
// in the narrow functions "%s" takes a narrow string and "%S" a wide one, converted to UTF-8.
// "%ls" is always wide and "%hs" always narrow. Numbers are formatted in the "C" locale: the
// decimal separator is always a point, whatever the user's locale. "%n" is ignored.
#pragma once

#include <clocale>
#include <cstdarg>
#include <string>
#include <string_view>

namespace navmisc {

std::wstring VFormatW(const wchar_t* fmt, va_list args);
std::wstring FormatW(const wchar_t* fmt, ...);
std::string VFormatA(const char* fmt, va_list args);
std::string FormatA(const char* fmt, ...) __attribute__((format(printf, 1, 2)));

// Appends fixed-point text of `value` with `decimals` digits after the point, as "%.*f" would in
// the "C" locale (rounding included), without going through printf.
void AppendFixed(std::string& out, double value, int decimals);
void AppendFixed(std::wstring& out, double value, int decimals);
// Writes the same text at `p` and returns its end. REQUIRES: room for 330 + decimals characters
// (the longest "%.*f" of a double).
char* WriteFixed(char* p, double value, int decimals);
// Appends a plain decimal integer ("%d").
void AppendInt(std::string& out, long long value);
void AppendInt(std::wstring& out, long long value);
// Shortest text that reads back to exactly the same double ("C" locale, no exponent for
// ordinary magnitudes).
std::string ShortestDouble(double value);

// Switches the calling thread to the "C" locale for the lifetime of the object, so that
// snprintf, strtod and friends use a decimal point; the previous locale comes back afterwards.
class CLocaleScope {
 public:
  CLocaleScope();
  ~CLocaleScope();
  CLocaleScope(const CLocaleScope&) = delete;
  CLocaleScope& operator=(const CLocaleScope&) = delete;

 private:
  locale_t previous_;
};

}  // namespace navmisc
