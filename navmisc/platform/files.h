// Files and folders. Every path is a wide string; the separator is "/".
#pragma once

#include "navmisc/platform/cstring.h"
#include "navmisc/platform/lists.h"

// Creates the folder and every missing parent. True when the folder exists afterwards.
bool MakeDir(const wchar_t* path);
// Removes the entries of `path` that match `pattern` ("*.*" or "*" = all) with everything in
// them, then the folder itself when it is empty. Symbolic links are removed as links, never
// followed; nothing outside `path` is touched. When `path` itself is a symbolic link nothing is
// removed. True when `path` is gone afterwards (also when it was missing).
//
// Patterns, here and in GetContent: "*" any run of characters, "?" one character, letters
// match without regard to case, every other character (also "[") stands for itself.
bool RemoveDir(const wchar_t* path, const wchar_t* pattern = L"*.*");
// Appends to `names` the entry names of `folder` matching `pattern` ("*.*" = all, also names
// without a dot; "*" and "?" wildcards), "." and ".." excluded, sorted by character code. Returns the number appended, -1 when the folder
// cannot be read.
int GetContent(const wchar_t* folder, const wchar_t* pattern, CStringList& names);
// Copies a file (content and permission bits). With failIfExists, an existing target fails.
bool CopyFile(const wchar_t* from, const wchar_t* to, bool failIfExists);
bool DeleteFile(const wchar_t* path);
// 0 when the path exists, else the system error of the test: 2 = not found (ENOENT),
// 3 = a path component is not a folder (ENOTDIR), otherwise the errno value + 1000.
// The name itself is tested: a symbolic link exists even when what it points to does not.
int PathStatus(const wchar_t* path);
// True when the path leads to something (a file or a folder), following symbolic links.
bool FileExists(const wchar_t* path);
// True when the path leads to a folder, following symbolic links.
bool IsDirectory(const wchar_t* path);
// Makes the file writable by its owner ("attributes normal").
bool SetFileNormal(const wchar_t* path);
// The clearing of an export's target: up to 3 attempts; stop when the file-name part is empty or
// the file does not exist (errors 2 and 3); otherwise make it writable and delete it, waiting
// 50 ms after a failed attempt.
void ClearTargetFile(const wchar_t* path);
// Deletes a file with up to three tries 50 ms apart; stops early when it is found missing.
// True when the file is gone afterwards.
bool DeleteFileRetry(const wchar_t* path);
void SleepMs(unsigned ms);
// The folder of the running executable, without a trailing separator.
CString GetCurrentExecPath();

// Path text helpers (no file system access).
CString PathJoin(const wchar_t* folder, const wchar_t* name);
CString PathFolder(const wchar_t* path);     // "a/b/c.txt" -> "a/b"; "c.txt" -> ""
CString PathFileName(const wchar_t* path);   // "a/b/c.txt" -> "c.txt"
CString PathFileTitle(const wchar_t* path);  // "a/b/c.txt" -> "c"
CString PathExtension(const wchar_t* path);  // "a/b/c.txt" -> "txt"; none -> ""
// Title and extension split the file name at its last dot: "a.tar.gz" -> "a.tar" + "gz",
// ".hidden" -> "" + "hidden", as on the original platform.
// A folder or file name taken from a file may be used only when it is one plain path component:
// not empty, not "." or "..", no "/" and no NUL.
bool IsPlainPathComponent(const wchar_t* name);
// `path` made absolute against the current folder (nothing resolved, nothing tested); `path`
// itself when it is absolute or the current folder is unknown.
CString AbsolutePath(const wchar_t* path);

namespace navmisc {
// The narrow (UTF-8) form of a path, for the system calls.
std::string NativePath(const wchar_t* path);
}  // namespace navmisc
