// Settings files: INI-style text read and written through small numeric handles.
//
// Reading: RD_BEGIN reads and indexes the whole file once; every RD_* call is a lookup.
// Sections and keys match without regard to case. A value that is missing or does not parse
// gives the caller's default. Writing: WR_BEGIN starts an empty document, WR_* append to it in
// call order, WR_END replaces the file atomically. A writer that is never ended leaves the old
// file untouched. An unknown handle makes every call do nothing and return the default.
// The format is described in docs/settings-format.md.
#pragma once

#include <string>
#include <string_view>
#include <vector>

#include "navmisc/platform/cstring.h"
#include "navmisc/platform/lists.h"

// Opens `path` for reading; 0 when it cannot be opened.
unsigned long RD_BEGIN(const wchar_t* path);
int RD_INT(unsigned long handle, const wchar_t* section, const wchar_t* key, int def);
double RD_FLOAT(unsigned long handle, const wchar_t* section, const wchar_t* key, double def);
CString RD_STRING(unsigned long handle, const wchar_t* section, const wchar_t* key,
                  const wchar_t* def = L"");
// True when the key is present in the section (whatever its value).
bool RD_EXISTS(unsigned long handle, const wchar_t* section, const wchar_t* key);
// Appends the names of the file's sections to `names` in the order they first appear, each
// once; returns how many. Lets a reader visit what a file holds instead of trying every name a
// count inside the file promises.
int RD_SECTIONS(unsigned long handle, CStringList& names);
void RD_END(unsigned long handle);

// Starts a new document for `path`; 0 when `path` is empty.
unsigned long WR_BEGIN(const wchar_t* path);
void WR_INT(unsigned long handle, const wchar_t* section, const wchar_t* key, int value);
void WR_FLOAT(unsigned long handle, const wchar_t* section, const wchar_t* key, double value);
void WR_STRING(unsigned long handle, const wchar_t* section, const wchar_t* key,
               const wchar_t* value);
// Writes the document atomically and releases the handle: 1 on success, 0 when the file could
// not be written (the previous file is then intact).
int WR_END(unsigned long handle);
// Drops an unfinished document and releases the handle; the file stays as it was.
void WR_ABANDON(unsigned long handle);

namespace navmisc {

// Lists are stored as a count key plus one section (or key) per entry. These give the entry
// numbers n, ascending and below `count`, for which the section named by `pattern` with n in
// place of its one "%d" exists (a section with a header counts even without keys), or the key
// of `section` named so. n is matched in plain decimal as the writer puts it; the text after
// "%d" must not hold a digit. Reading a list through them costs time in proportion to the file,
// however large the count it states.
std::vector<int> SectionIndices(unsigned long handle, const wchar_t* pattern, int count);
// The same for sections named after a parent section, as the files name their lists:
// `pattern` "%s_RN(%d)" with `parent` "SECTION" looks for SECTION_RN(0), SECTION_RN(1), ...
std::vector<int> SectionIndices(unsigned long handle, const wchar_t* pattern, const wchar_t* parent, int count);
std::vector<int> KeyIndices(unsigned long handle, const wchar_t* section, const wchar_t* pattern, int count);


// Settings documents in memory, read and written exactly as files are (for tests and fuzzing):
// a reader over `bytes` as RD_BEGIN over a file holding them (release it with RD_END), and the
// end of a writer that hands over the document WR_END would write. False for an unknown handle.
unsigned long ReadSettingsFromMemory(std::string_view bytes);
bool EndSettingsToMemory(unsigned long handle, std::string& document);
// Every entry a reader holds, its section and key with ASCII letters in lower case and its
// value as RD_STRING gives it, in no particular order.
struct SettingsEntry {
  CString section, key, value;
  friend bool operator==(const SettingsEntry&, const SettingsEntry&) = default;
};
std::vector<SettingsEntry> SettingsEntries(unsigned long handle);

}  // namespace navmisc
