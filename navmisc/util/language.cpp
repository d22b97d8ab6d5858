#include "navmisc/util/language.h"

#include <cstring>
#include <string>

namespace {

struct Language {
  unsigned long lcid;
  const char* posix;      // language, or language_TERRITORY
  const wchar_t* web;
};

// Territory-specific entries come first so that they win over the bare language.
constexpr Language kLanguages[] = {
    {0x0404, "zh_TW", L"zh-TW"}, {0x0C04, "zh_HK", L"zh-TW"}, {0x0804, "zh_CN", L"zh-CN"},
    {0x0416, "pt_BR", L"pt-BR"}, {0x0816, "pt_PT", L"pt"},    {0x0409, "en", L"en"},
    {0x0407, "de", L"de"},       {0x040C, "fr", L"fr"},       {0x0410, "it", L"it"},
    {0x0C0A, "es", L"es"},       {0x0413, "nl", L"nl"},       {0x0411, "ja", L"ja"},
    {0x0412, "ko", L"ko"},       {0x0419, "ru", L"ru"},       {0x0415, "pl", L"pl"},
    {0x0405, "cs", L"cs"},       {0x041D, "sv", L"sv"},       {0x0406, "da", L"da"},
    {0x0414, "no", L"no"},       {0x040B, "fi", L"fi"},       {0x0408, "el", L"el"},
    {0x041F, "tr", L"tr"},       {0x0401, "ar", L"ar"},       {0x040D, "he", L"he"},
    {0x041E, "th", L"th"},       {0x040E, "hu", L"hu"},       {0x0804, "zh", L"zh-CN"},
};

}  // namespace

CString GetHttpLNGFromLCID(unsigned long lcid) {
  for (const Language& l : kLanguages)
    if (l.lcid == lcid) return l.web;
  // Other territories of a known language: match the primary language (low 10 bits).
  for (const Language& l : kLanguages)
    if ((l.lcid & 0x3FF) == (lcid & 0x3FF)) return l.web;
  return L"en";
}

unsigned long LcidFromLocaleName(const char* name) {
  if (!name || !*name || std::strcmp(name, "C") == 0 || std::strcmp(name, "POSIX") == 0) return 0x0409;
  std::string n(name);
  n = n.substr(0, n.find_first_of(".@"));
  for (const Language& l : kLanguages)
    if (n == l.posix) return l.lcid;
  const std::string lang = n.substr(0, n.find('_'));
  for (const Language& l : kLanguages)
    if (lang == l.posix) return l.lcid;
  return 0x0409;
}
