// CString: the library's wide string, a small class over std::wstring with the operations the
// library's code uses. It converts implicitly to `const wchar_t*`.
#pragma once

#include <cstdarg>
#include <string>
#include <string_view>

class CString {
 public:
  CString() = default;
  CString(const wchar_t* s) : s_(s ? s : L"") {}  // NOLINT: implicit like the original
  CString(const wchar_t* s, int len) : s_(s ? std::wstring(s, static_cast<size_t>(len < 0 ? 0 : len)) : L"") {}
  CString(std::wstring s) : s_(std::move(s)) {}  // NOLINT
  CString(std::wstring_view s) : s_(s) {}        // NOLINT
  CString(wchar_t ch, int repeat) : s_(static_cast<size_t>(repeat < 0 ? 0 : repeat), ch) {}

  // Text from UTF-8 bytes; malformed sequences become U+FFFD.
  static CString FromUtf8(std::string_view utf8);
  // The text as UTF-8 (characters that cannot be encoded become "?").
  std::string ToUtf8() const;

  operator const wchar_t*() const { return s_.c_str(); }  // NOLINT
  const wchar_t* c_str() const { return s_.c_str(); }
  const std::wstring& str() const { return s_; }
  std::wstring& str() { return s_; }
  std::wstring_view view() const { return s_; }

  int GetLength() const { return static_cast<int>(s_.size()); }
  bool IsEmpty() const { return s_.empty(); }
  void Empty() { s_.clear(); }
  wchar_t GetAt(int i) const { return s_.at(static_cast<size_t>(i)); }
  void SetAt(int i, wchar_t ch) { s_.at(static_cast<size_t>(i)) = ch; }

  CString& operator=(const wchar_t* s) {
    s_ = s ? s : L"";
    return *this;
  }
  CString& operator+=(const CString& s) {
    s_ += s.s_;
    return *this;
  }
  CString& operator+=(const wchar_t* s) {
    if (s) s_ += s;
    return *this;
  }
  CString& operator+=(wchar_t ch) {
    s_ += ch;
    return *this;
  }

  int Compare(const wchar_t* s) const { return s_.compare(s ? s : L""); }
  // Compares without regard to case (ASCII letters and the letters towlower knows).
  int CompareNoCase(const wchar_t* s) const;

  CString Left(int count) const;
  CString Right(int count) const;
  CString Mid(int first, int count = -1) const;
  int Find(wchar_t ch, int start = 0) const;
  int Find(const wchar_t* sub, int start = 0) const;
  int ReverseFind(wchar_t ch) const;
  // Replaces every occurrence; returns how many were replaced.
  int Replace(const wchar_t* from, const wchar_t* to);
  int Replace(wchar_t from, wchar_t to);
  CString& MakeUpper();
  CString& MakeLower();
  CString& Trim();
  CString& TrimLeft();
  CString& TrimRight();

  // printf-style formatting with the library's meaning: "%s" is a wide string, "%S" narrow
  // UTF-8; numbers always in the "C" locale.
  void Format(const wchar_t* fmt, ...);
  void FormatV(const wchar_t* fmt, va_list args);
  void AppendFormat(const wchar_t* fmt, ...);

  friend bool operator==(const CString& a, const CString& b) { return a.s_ == b.s_; }
  friend bool operator==(const CString& a, const wchar_t* b) { return a.s_ == (b ? b : L""); }
  friend bool operator==(const wchar_t* a, const CString& b) { return b == a; }
  friend bool operator!=(const CString& a, const CString& b) { return !(a == b); }
  friend bool operator!=(const CString& a, const wchar_t* b) { return !(a == b); }
  friend bool operator!=(const wchar_t* a, const CString& b) { return !(b == a); }
  friend bool operator<(const CString& a, const CString& b) { return a.s_ < b.s_; }

  friend CString operator+(const CString& a, const CString& b) { return CString(a.s_ + b.s_); }
  friend CString operator+(const CString& a, const wchar_t* b) { return CString(a.s_ + (b ? b : L"")); }
  friend CString operator+(const wchar_t* a, const CString& b) { return CString((a ? a : L"") + b.s_); }
  friend CString operator+(const CString& a, wchar_t b) { return CString(a.s_ + b); }

 private:
  std::wstring s_;
};

// Builds a CString from a format in one call.
CString FormatString(const wchar_t* fmt, ...);
