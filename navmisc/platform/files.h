// Files and folders. Every path is a wide string; the separator is "/".
#pragma once

#include "navmisc/platform/cstring.h"
#include "navmisc/platform/lists.h"

// Creates the folder and every missing parent, those it creates with `mode` (narrowed by the
// umask); folders that exist keep theirs. True when the folder exists afterwards.
bool MakeDir(const wchar_t* path, unsigned mode = 0777);
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
// True when the path itself is a folder: a symbolic link, even to a folder, is not one.
bool IsRealDirectory(const wchar_t* path);
// When the file was made: its birth time where the file system records one, else the time its
// status last changed (the nearest a Linux file system without birth times comes to it). Seconds
// and nanoseconds since 1970 (UTC). False when the file cannot be opened for reading.
bool GetFileBirthTime(const wchar_t* path, long long& seconds, long& nanoseconds);
// True when the calling user may write the file: it has a write permission bit (a file without
// any counts as write-protected even for root, who could write it) and the system grants this
// user writing.
bool IsFileWritable(const wchar_t* path);
// The permission bits of a file (07777), following a symbolic link; -1 when it cannot be read.
int GetFileMode(const wchar_t* path);
bool SetFileMode(const wchar_t* path, int mode);
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
// The user's folder for settings: $XDG_CONFIG_HOME when it is an absolute path, else
// $HOME/.config (the account's home folder without HOME); empty when there is no home folder.
CString UserConfigFolder();

// `path` made absolute against the current folder, with "." and ".." steps removed (links are
// not resolved). Empty when the current folder cannot be found.
CString AbsolutePath(const wchar_t* path);

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

namespace navmisc {
// The narrow (UTF-8) form of a path, for the system calls.
std::string NativePath(const wchar_t* path);

// Opens a file for reading only when it is a regular file: a named pipe or a device in its
// place is refused without blocking (a pipe could wait forever for a writer, /dev/zero never
// ends). -1 when the file cannot be opened (errno tells why) or is refused (recorded for
// LastFileRefusal). The descriptor is blocking and close-on-exec. Without `followLink`, a
// symbolic link as the last component fails (ELOOP).
int OpenRegularFile(const std::string& nativePath, bool followLink = true);

// Why the last file step of this thread was refused for safety, in words for the user:
// "/data/Resource/T1/TK_1.BIN is a named pipe, not a regular file". Empty when none was since
// ClearFileRefusal. Callers that get only 0 or false from a read use it to say why.
std::string LastFileRefusal();
void ClearFileRefusal();
// Records a refusal (the platform layer's own steps call it).
void NoteFileRefusal(std::string why);
}  // namespace navmisc
