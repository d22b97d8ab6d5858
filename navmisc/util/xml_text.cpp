#include "navmisc/util/xml_text.h"

#include <string>

namespace navmisc {
namespace {

bool XmlCanHold(wchar_t c) {
  if (c == L'\t' || c == L'\n' || c == L'\r') return true;
  if (c < 0x20) return false;
  if (c >= 0xD800 && c <= 0xDFFF) return false;
  return c != 0xFFFE && c != 0xFFFF && static_cast<unsigned long>(c) <= 0x10FFFF;
}

size_t Utf8Length(wchar_t c) {
  if (c < 0x80) return 1;
  if (c < 0x800) return 2;
  if (c < 0x10000) return 3;
  return 4;
}

}  // namespace

CString XmlText(const CString& text, size_t maxBytes) {
  const std::wstring& in = text.str();
  std::wstring out;
  size_t bytes = 0;
  for (size_t i = 0; i < in.size(); ++i) {
    const wchar_t c = in[i];
    if (!XmlCanHold(c)) continue;
    std::wstring piece;
    if (c == L'\r' && i + 1 < in.size() && in[i + 1] == L'\n') {
      piece = L"&#13;";
      ++i;
    } else if (c == L'&') {
      piece = L"&amp;";
    } else if (c == L'<') {
      piece = L"&lt;";
    } else if (c == L'>') {
      piece = L"&gt;";
    } else if (c == L'"') {
      piece = L"&quot;";
    } else {
      piece.assign(1, c);
    }
    const size_t size = piece.size() == 1 ? Utf8Length(c) : piece.size();
    if (bytes + size > maxBytes) break;
    bytes += size;
    out += piece;
  }
  return CString(std::move(out));
}

CString XmlCharacters(const CString& text) {
  std::wstring out;
  for (wchar_t c : text.str()) {
    if (XmlCanHold(c)) out += c;
  }
  return CString(std::move(out));
}

}  // namespace navmisc
