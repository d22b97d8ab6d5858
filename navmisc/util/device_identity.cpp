#include "navmisc/util/device_identity.h"

#include <climits>
#include <cwchar>
#include <cwctype>

#include "navmisc/datactrl/device_state.h"

namespace {

// The leading integer of a text as the C library reads one: blanks skipped, an optional sign,
// then digits up to the first other character; out-of-range values clamp; no digits give 0.
int LeadingInt(const CString& text) {
  const wchar_t* p = text.c_str();
  while (std::iswspace(static_cast<wint_t>(*p))) ++p;
  const long value = std::wcstol(p, nullptr, 10);
  if (value > INT_MAX) return INT_MAX;
  if (value < INT_MIN) return INT_MIN;
  return static_cast<int>(value);
}

// Model prefixes of a reported identity, in the order they are tried.
constexpr const wchar_t* kIdentityPrefixes[] = {L"M:0001-", L"M:0002-", L"M:0003-", L"M:0004-",
                                                 L"M:0011-", L"M:0012-", L"M:0018-"};

}  // namespace

CString GetCurrentModelDspName() {
  switch (g_wDeviceModelID & 0xFFFF) {
    case 1: return L"KV-1";
    case 2: return L"KV-3";
    case 3: return L"KV-6";
    case 4: return L"KV-5";
    case 8: return g_dDeviceVersion < 7.02 ? L"KV-7" : L"KV-7P";
    case 9: return L"KV-9";
    case 11: return L"KV-2";
    case 12: return L"KV-3e";
    case 18: return L"KV-11";
    case 20: return L"KV-9P";
    case 21: return L"KV-8";
    case 22: return L"KV-8P";
    default: return L"";
  }
}

void ChangeModelDspName(CString& identity) {
  for (const wchar_t* prefix : kIdentityPrefixes) {
    if (identity.Replace(prefix, L"") == 0) continue;
    // "M:0011-" names model 11: the number after "M:".
    const int model = LeadingInt(CString(prefix).Mid(2));
    if (const int sn = identity.Find(L"SN:"); sn >= 0) {
      // The number is read from four characters after the marker, which skips the blank that
      // loggers put behind it.
      identity = FormatString(L"SN:%02d%08d", model, LeadingInt(identity.Mid(sn + 4)));
      break;
    }
    if (const int imei = identity.Find(L"IMEI:"); imei >= 0) {
      identity = FormatString(L"SN:%02d%s", model, identity.Mid(imei + 5).c_str());
    }
  }
  identity.MakeUpper();
}
