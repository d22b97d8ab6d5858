// Settings files: INI-style text read and written through small numeric handles.
//
// Reading: RD_BEGIN reads and indexes the whole file once; every RD_* call is a lookup.
// Sections and keys match without regard to case. A value that is missing or does not parse
// gives the caller's default. Writing: WR_BEGIN starts an empty document, WR_* append to it in
// call order, WR_END replaces the file atomically. A writer that is never ended leaves the old
// file untouched. An unknown handle makes every call do nothing and return the default.
// The format is described in docs/settings-format.md.
#pragma once

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
