#include "navmisc/platform/cstring.h"

#include <algorithm>
#include <cwctype>

#include "navmisc/platform/format.h"
#include "navmisc/platform/textconv.h"

namespace {

wchar_t FoldCase(wchar_t c) {
  if (c >= L'A' && c <= L'Z') return static_cast<wchar_t>(c - L'A' + L'a');
  if (c < 0x80) return c;
  return static_cast<wchar_t>(std::towlower(static_cast<wint_t>(c)));
}

bool IsBlank(wchar_t c) { return c == L' ' || c == L'\t' || c == L'\r' || c == L'\n' || c == L'\v' || c == L'\f'; }

}  // namespace

CString CString::FromUtf8(std::string_view utf8) { return CString(navmisc::FromUtf8Lossy(utf8)); }
std::string CString::ToUtf8() const { return navmisc::ToUtf8Lossy(s_); }

int CString::CompareNoCase(const wchar_t* s) const {
  std::wstring_view b(s ? s : L"");
  const size_t n = std::min(s_.size(), b.size());
  for (size_t i = 0; i < n; ++i) {
    const wchar_t x = FoldCase(s_[i]), y = FoldCase(b[i]);
    if (x != y) return x < y ? -1 : 1;
  }
  if (s_.size() == b.size()) return 0;
  return s_.size() < b.size() ? -1 : 1;
}

CString CString::Left(int count) const {
  if (count <= 0) return {};
  return CString(s_.substr(0, static_cast<size_t>(count)));
}

CString CString::Right(int count) const {
  if (count <= 0) return {};
  const size_t n = std::min(s_.size(), static_cast<size_t>(count));
  return CString(s_.substr(s_.size() - n));
}

CString CString::Mid(int first, int count) const {
  if (first < 0) first = 0;
  if (static_cast<size_t>(first) >= s_.size() || count == 0) return {};
  return CString(s_.substr(static_cast<size_t>(first), count < 0 ? std::wstring::npos : static_cast<size_t>(count)));
}

int CString::Find(wchar_t ch, int start) const {
  if (start < 0) start = 0;
  const size_t p = s_.find(ch, static_cast<size_t>(start));
  return p == std::wstring::npos ? -1 : static_cast<int>(p);
}

int CString::Find(const wchar_t* sub, int start) const {
  if (!sub || start < 0) start = 0;
  const size_t p = s_.find(sub ? sub : L"", static_cast<size_t>(start));
  return p == std::wstring::npos ? -1 : static_cast<int>(p);
}

int CString::ReverseFind(wchar_t ch) const {
  const size_t p = s_.rfind(ch);
  return p == std::wstring::npos ? -1 : static_cast<int>(p);
}

int CString::Replace(const wchar_t* from, const wchar_t* to) {
  std::wstring_view f(from ? from : L"");
  std::wstring_view t(to ? to : L"");
  if (f.empty()) return 0;
  int count = 0;
  std::wstring out;
  size_t pos = 0;
  for (size_t hit; (hit = s_.find(f, pos)) != std::wstring::npos; pos = hit + f.size()) {
    out.append(s_, pos, hit - pos);
    out.append(t);
    ++count;
  }
  if (count == 0) return 0;
  out.append(s_, pos, std::wstring::npos);
  s_.swap(out);
  return count;
}

int CString::Replace(wchar_t from, wchar_t to) {
  int count = 0;
  for (auto& c : s_) {
    if (c == from) {
      c = to;
      ++count;
    }
  }
  return count;
}

CString& CString::MakeUpper() {
  for (auto& c : s_) c = static_cast<wchar_t>(std::towupper(static_cast<wint_t>(c)));
  return *this;
}

CString& CString::MakeLower() {
  for (auto& c : s_) c = static_cast<wchar_t>(std::towlower(static_cast<wint_t>(c)));
  return *this;
}

CString& CString::TrimLeft() {
  size_t i = 0;
  while (i < s_.size() && IsBlank(s_[i])) ++i;
  s_.erase(0, i);
  return *this;
}

CString& CString::TrimRight() {
  size_t n = s_.size();
  while (n > 0 && IsBlank(s_[n - 1])) --n;
  s_.resize(n);
  return *this;
}

CString& CString::Trim() { return TrimRight().TrimLeft(); }

void CString::FormatV(const wchar_t* fmt, va_list args) { s_ = navmisc::VFormatW(fmt, args); }

void CString::Format(const wchar_t* fmt, ...) {
  va_list args;
  va_start(args, fmt);
  s_ = navmisc::VFormatW(fmt, args);
  va_end(args);
}

void CString::AppendFormat(const wchar_t* fmt, ...) {
  va_list args;
  va_start(args, fmt);
  s_ += navmisc::VFormatW(fmt, args);
  va_end(args);
}

CString FormatString(const wchar_t* fmt, ...) {
  va_list args;
  va_start(args, fmt);
  CString s(navmisc::VFormatW(fmt, args));
  va_end(args);
  return s;
}
