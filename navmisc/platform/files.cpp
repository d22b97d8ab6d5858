#include "navmisc/platform/files.h"

#include <dirent.h>
#include <errno.h>
#include <fcntl.h>
#include <limits.h>
#include <pwd.h>
#include <sys/stat.h>
#include <sys/types.h>
#include <time.h>
#include <unistd.h>

#include <algorithm>
#include <cstdlib>
#include <filesystem>
#include <cwctype>
#include <string>
#include <string_view>
#include <vector>

#include "navmisc/platform/root_confinement.h"
#include "navmisc/platform/detail/unique_fd.h"

namespace {

using Fd = navmisc::detail::UniqueFd;

std::wstring_view WView(const wchar_t* s) { return s ? std::wstring_view(s) : std::wstring_view(); }

// "*.*" and "*" select every entry: on the original platform "*.*" also matches names without
// a dot, and programs rely on that to empty a folder.
bool MatchesAll(std::wstring_view pattern) {
  return pattern.empty() || pattern == L"*.*" || pattern == L"*";
}

wchar_t FoldCase(wchar_t c) {
  if (c >= L'A' && c <= L'Z') return static_cast<wchar_t>(c - L'A' + L'a');
  if (c < 0x80) return c;
  return static_cast<wchar_t>(std::towlower(static_cast<wint_t>(c)));
}

// Wildcard match with the original platform's meaning: "*" any run of characters, "?" one
// character, everything else literal ("[" included), letters without regard to case. Works on
// characters, not bytes, so "?" matches one accented letter whatever the process locale is.
bool WildcardMatch(std::wstring_view pattern, std::wstring_view name) {
  size_t p = 0, n = 0;
  size_t starP = std::wstring_view::npos, starN = 0;
  while (n < name.size()) {
    if (p < pattern.size() && pattern[p] == L'*') {
      starP = p++;
      starN = n;
    } else if (p < pattern.size() &&
               (pattern[p] == L'?' || FoldCase(pattern[p]) == FoldCase(name[n]))) {
      ++p;
      ++n;
    } else if (starP != std::wstring_view::npos) {
      p = starP + 1;
      n = ++starN;
    } else {
      return false;
    }
  }
  while (p < pattern.size() && pattern[p] == L'*') ++p;
  return p == pattern.size();
}

bool NameMatches(std::wstring_view pattern, const char* name) {
  if (MatchesAll(pattern)) return true;
  CString wide = CString::FromUtf8(name);
  return WildcardMatch(pattern, wide.view());
}

bool IsDotOrDotDot(const char* name) {
  return name[0] == '.' && (name[1] == '\0' || (name[1] == '.' && name[2] == '\0'));
}

// The entry names of an open folder (the descriptor stays open and owned by the caller).
bool ListNames(int dirfd, std::vector<std::string>& names) {
  int dupfd = ::fcntl(dirfd, F_DUPFD_CLOEXEC, 0);
  if (dupfd < 0) return false;
  DIR* dir = ::fdopendir(dupfd);
  if (!dir) {
    ::close(dupfd);
    return false;
  }
  ::rewinddir(dir);
  errno = 0;
  while (struct dirent* e = ::readdir(dir)) {
    if (!IsDotOrDotDot(e->d_name)) names.emplace_back(e->d_name);
    errno = 0;
  }
  bool ok = errno == 0;
  ::closedir(dir);
  return ok;
}

// Removes the entries of the folder open as `dirfd` that match `pattern`, folders with all they
// hold. Every step is relative to an open descriptor and never follows a symbolic link, so a
// link (or a folder swapped for a link meanwhile) can never lead outside the starting folder.
// One descriptor is open per level of depth. True when every selected entry was removed.
bool RemoveEntries(int dirfd, std::wstring_view pattern) {
  std::vector<std::string> names;
  if (!ListNames(dirfd, names)) return false;
  bool ok = true;
  for (const std::string& name : names) {
    if (!NameMatches(pattern, name.c_str())) continue;
    struct stat st;
    if (::fstatat(dirfd, name.c_str(), &st, AT_SYMLINK_NOFOLLOW) != 0) {
      if (errno != ENOENT) ok = false;
      continue;
    }
    if (S_ISDIR(st.st_mode)) {
      Fd sub(::openat(dirfd, name.c_str(),
                      O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC));
      if (sub.ok()) {
        if (!RemoveEntries(sub.get(), L"*")) ok = false;
      } else if (errno == ELOOP || errno == ENOTDIR) {
        // Replaced by something that is not a folder since the fstatat: remove that as it is.
        if (::unlinkat(dirfd, name.c_str(), 0) != 0 && errno != ENOENT) ok = false;
        continue;
      }
      if (::unlinkat(dirfd, name.c_str(), AT_REMOVEDIR) != 0 && errno != ENOENT) ok = false;
    } else {
      if (::unlinkat(dirfd, name.c_str(), 0) != 0 && errno != ENOENT) {
        // A folder may have taken the name meanwhile; it is not ours to follow now.
        ok = false;
      }
    }
  }
  return ok;
}

// Drops trailing separators: "a/b/" names the folder "a/b", and a trailing "/" would make the
// system follow a final symbolic link.
std::string StripTrailingSeparators(std::string path) {
  while (path.size() > 1 && path.back() == '/') path.pop_back();
  return path;
}

bool NameIsGone(const std::string& path) {
  struct stat st;
  return ::lstat(path.c_str(), &st) != 0 && (errno == ENOENT || errno == ENOTDIR);
}

}  // namespace

namespace navmisc {

std::string NativePath(const wchar_t* path) {
  if (!path || !*path) return std::string();
  return CString(path).ToUtf8();
}

namespace {
thread_local std::string t_refusal;

const char* KindOf(mode_t mode) {
  if (S_ISFIFO(mode)) return "a named pipe";
  if (S_ISCHR(mode)) return "a character device";
  if (S_ISBLK(mode)) return "a block device";
  if (S_ISSOCK(mode)) return "a socket";
  if (S_ISDIR(mode)) return "a folder";
  return "not a plain file";
}

bool RefuseUnlessRegular(const std::string& path, const struct stat& st) {
  if (S_ISREG(st.st_mode)) return false;
  NoteFileRefusal(path + " is " + KindOf(st.st_mode) + ", not a regular file");
  return true;
}
}  // namespace

std::string LastFileRefusal() { return t_refusal; }
void ClearFileRefusal() { t_refusal.clear(); }
void NoteFileRefusal(std::string why) { t_refusal = std::move(why); }

int OpenRegularFile(const std::string& path, bool followLink) {
  if (path.empty()) {
    errno = ENOENT;
    return -1;
  }
  // Opening a device can itself have effects, so its kind is looked at first; the check on the
  // open descriptor then covers a swap in between, and O_NONBLOCK keeps that open of a pipe
  // from waiting for a writer.
  struct stat st;
  const int looked = followLink ? ::stat(path.c_str(), &st) : ::lstat(path.c_str(), &st);
  if (looked == 0 && !S_ISLNK(st.st_mode) && RefuseUnlessRegular(path, st)) {
    errno = EINVAL;
    return -1;
  }
  if (!StaysInDataRoot(path, followLink)) {
    errno = EACCES;
    return -1;
  }
  Fd fd(::open(path.c_str(), O_RDONLY | O_NONBLOCK | O_NOCTTY | O_CLOEXEC | (followLink ? 0 : O_NOFOLLOW)));
  if (!fd.ok()) return -1;
  if (::fstat(fd.get(), &st) != 0) return -1;
  if (RefuseUnlessRegular(path, st)) {
    errno = EINVAL;
    return -1;
  }
  const int flags = ::fcntl(fd.get(), F_GETFL);
  if (flags >= 0) ::fcntl(fd.get(), F_SETFL, flags & ~O_NONBLOCK);
  return fd.release();
}

}  // namespace navmisc

using navmisc::NativePath;

bool MakeDir(const wchar_t* path, unsigned mode) {
  std::string p = StripTrailingSeparators(NativePath(path));
  if (p.empty() || !navmisc::StaysInDataRoot(p, true)) return false;
  struct stat st;
  if (::stat(p.c_str(), &st) == 0) return S_ISDIR(st.st_mode);
  // Create each level in turn. Failures are not decisive on their own: a level may exist
  // already, be made by another process meanwhile, or sit in a folder we may not list; the test
  // at the end says whether the whole path is there.
  for (size_t pos = p.find('/', 1);; pos = p.find('/', pos + 1)) {
    std::string part = p.substr(0, pos);
    if (!part.empty() && part.back() != '/') ::mkdir(part.c_str(), static_cast<mode_t>(mode));
    if (pos == std::string::npos) break;
  }
  return ::stat(p.c_str(), &st) == 0 && S_ISDIR(st.st_mode);
}

bool RemoveDir(const wchar_t* path, const wchar_t* pattern) {
  std::string p = StripTrailingSeparators(NativePath(path));
  if (p.empty() || p == "/" || !navmisc::StaysInDataRoot(p, false)) return false;
  {
    Fd dir(::open(p.c_str(), O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC));
    if (!dir.ok()) {
      // Missing is success; a symbolic link or a file in its place is left alone.
      return NameIsGone(p);
    }
    RemoveEntries(dir.get(), WView(pattern));
  }
  // rmdir does not follow a final symbolic link, so a swap of the folder for a link meanwhile
  // makes this fail instead of reaching elsewhere. A folder with entries left (a narrower
  // pattern) stays.
  ::rmdir(p.c_str());
  return NameIsGone(p);
}

int GetContent(const wchar_t* folder, const wchar_t* pattern, CStringList& names) {
  std::string p = NativePath(folder);
  if (p.empty()) return -1;
  Fd dir(::open(p.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
  if (!dir.ok()) return -1;
  std::vector<std::string> all;
  if (!ListNames(dir.get(), all)) return -1;
  std::wstring_view pat = WView(pattern);
  std::vector<CString> found;
  for (const std::string& name : all) {
    if (NameMatches(pat, name.c_str())) found.push_back(CString::FromUtf8(name));
  }
  std::sort(found.begin(), found.end());
  for (CString& name : found) names.AddTail(std::move(name));
  return static_cast<int>(found.size());
}

bool CopyFile(const wchar_t* from, const wchar_t* to, bool failIfExists) {
  std::string src = NativePath(from);
  std::string dst = NativePath(to);
  if (src.empty() || dst.empty() || !navmisc::StaysInDataRoot(dst, true)) return false;
  Fd in(navmisc::OpenRegularFile(src));
  if (!in.ok()) return false;
  struct stat sst;
  if (::fstat(in.get(), &sst) != 0) return false;
  struct stat dst_st;
  if (::stat(dst.c_str(), &dst_st) == 0) {
    if (failIfExists) return false;
    // Copying a file onto itself would truncate it before reading it.
    if (dst_st.st_dev == sst.st_dev && dst_st.st_ino == sst.st_ino) return false;
  }
  int flags = O_WRONLY | O_CREAT | O_CLOEXEC | (failIfExists ? O_EXCL : O_TRUNC);
  Fd out(::open(dst.c_str(), flags, sst.st_mode & 07777));
  if (!out.ok()) return false;
  bool ok = true;
  std::vector<char> buf(1 << 16);
  for (;;) {
    ssize_t n = ::read(in.get(), buf.data(), buf.size());
    if (n < 0 && errno == EINTR) continue;
    if (n < 0) {
      ok = false;
      break;
    }
    if (n == 0) break;
    for (ssize_t done = 0; done < n;) {
      ssize_t w = ::write(out.get(), buf.data() + done, static_cast<size_t>(n - done));
      if (w < 0 && errno == EINTR) continue;
      if (w <= 0) {
        ok = false;
        break;
      }
      done += w;
    }
    if (!ok) break;
  }
  if (ok && ::fchmod(out.get(), sst.st_mode & 07777) != 0) ok = false;
  if (::close(out.release()) != 0) ok = false;
  // A half-written copy is worse than none.
  if (!ok) ::unlink(dst.c_str());
  return ok;
}

bool DeleteFile(const wchar_t* path) {
  std::string p = NativePath(path);
  return !p.empty() && navmisc::StaysInDataRoot(p, false) && ::unlink(p.c_str()) == 0;
}

int PathStatus(const wchar_t* path) {
  std::string p = NativePath(path);
  if (p.empty()) return 2;
  struct stat st;
  if (::lstat(p.c_str(), &st) == 0) return 0;
  if (errno == ENOENT) return 2;
  if (errno == ENOTDIR) return 3;
  return errno + 1000;
}

bool FileExists(const wchar_t* path) {
  std::string p = NativePath(path);
  struct stat st;
  return !p.empty() && ::stat(p.c_str(), &st) == 0;
}

bool IsDirectory(const wchar_t* path) {
  std::string p = NativePath(path);
  struct stat st;
  return !p.empty() && ::stat(p.c_str(), &st) == 0 && S_ISDIR(st.st_mode);
}

bool IsRealDirectory(const wchar_t* path) {
  std::string p = NativePath(path);
  struct stat st;
  return !p.empty() && ::lstat(p.c_str(), &st) == 0 && S_ISDIR(st.st_mode);
}

bool GetFileBirthTime(const wchar_t* path, long long& seconds, long& nanoseconds) {
  std::string p = NativePath(path);
  if (p.empty()) return false;
  Fd fd(::open(p.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK));
  if (!fd.ok()) return false;
  struct statx sx {};
  if (::statx(fd.get(), "", AT_EMPTY_PATH, STATX_BTIME | STATX_CTIME, &sx) == 0) {
    const struct statx_timestamp& t = (sx.stx_mask & STATX_BTIME) ? sx.stx_btime : sx.stx_ctime;
    seconds = t.tv_sec;
    nanoseconds = static_cast<long>(t.tv_nsec);
    return true;
  }
  struct stat st;
  if (::fstat(fd.get(), &st) != 0) return false;
  seconds = st.st_ctim.tv_sec;
  nanoseconds = st.st_ctim.tv_nsec;
  return true;
}

bool IsFileWritable(const wchar_t* path) {
  const int mode = GetFileMode(path);
  return mode >= 0 && (mode & 0222) != 0 && ::access(NativePath(path).c_str(), W_OK) == 0;
}

int GetFileMode(const wchar_t* path) {
  std::string p = NativePath(path);
  struct stat st;
  if (p.empty() || ::stat(p.c_str(), &st) != 0) return -1;
  return static_cast<int>(st.st_mode & 07777);
}

bool SetFileMode(const wchar_t* path, int mode) {
  std::string p = NativePath(path);
  return !p.empty() && mode >= 0 && ::chmod(p.c_str(), static_cast<mode_t>(mode & 07777)) == 0;
}

bool SetFileNormal(const wchar_t* path) {
  std::string p = NativePath(path);
  struct stat st;
  if (p.empty() || ::lstat(p.c_str(), &st) != 0) return false;
  // A link has no mode of its own, and the file it names is not the caller's to change.
  if (S_ISLNK(st.st_mode) || (st.st_mode & S_IWUSR)) return true;
  if (!navmisc::StaysInDataRoot(p, false)) return false;
  return ::chmod(p.c_str(), (st.st_mode & 07777) | S_IWUSR) == 0;
}

void ClearTargetFile(const wchar_t* path) {
  constexpr int kAttempts = 3;
  if (PathFileName(path).IsEmpty()) return;
  for (int attempt = 1; attempt <= kAttempts; ++attempt) {
    int status = PathStatus(path);
    if (status == 2 || status == 3) return;
    SetFileNormal(path);
    if (DeleteFile(path)) return;
    if (attempt < kAttempts) SleepMs(50);
  }
}

bool DeleteFileRetry(const wchar_t* path) {
  constexpr int kAttempts = 3;
  for (int attempt = 1; attempt <= kAttempts; ++attempt) {
    int status = PathStatus(path);
    if (status == 2 || status == 3) return true;
    if (DeleteFile(path)) return true;
    if (attempt < kAttempts) SleepMs(50);
  }
  int status = PathStatus(path);
  return status == 2 || status == 3;
}

void SleepMs(unsigned ms) {
  struct timespec req;
  req.tv_sec = static_cast<time_t>(ms / 1000);
  req.tv_nsec = static_cast<long>(ms % 1000) * 1000000L;
  while (::nanosleep(&req, &req) != 0 && errno == EINTR) {
  }
}

CString GetCurrentExecPath() {
  std::string buf(PATH_MAX, '\0');
  ssize_t n = ::readlink("/proc/self/exe", buf.data(), buf.size());
  if (n <= 0 || static_cast<size_t>(n) >= buf.size()) return CString();
  buf.resize(static_cast<size_t>(n));
  return PathFolder(CString::FromUtf8(buf));
}

namespace {
// The home folder of the user's account, for a process started without HOME.
std::string AccountHome() {
  std::string buf(16384, '\0');
  passwd entry;
  passwd* found = nullptr;
  if (::getpwuid_r(::geteuid(), &entry, buf.data(), buf.size(), &found) != 0 || !found || !found->pw_dir) return {};
  return found->pw_dir;
}
}  // namespace

CString UserConfigFolder() {
  if (const char* x = std::getenv("XDG_CONFIG_HOME"); x && *x == '/') return CString::FromUtf8(x);
  // Without HOME the account's home folder, never a shared folder such as /tmp, where another
  // user could prepare the path first.
  const char* home = std::getenv("HOME");
  const std::string folder = home && *home ? std::string(home) : AccountHome();
  if (folder.empty() || folder[0] != '/') return {};
  return CString::FromUtf8(folder + "/.config");
}

CString AbsolutePath(const wchar_t* path) {
  std::error_code ec;
  const std::filesystem::path abs = std::filesystem::absolute(NativePath(path), ec);
  if (ec || NativePath(path).empty()) return {};
  return CString::FromUtf8(abs.lexically_normal().string());
}

CString PathJoin(const wchar_t* folder, const wchar_t* name) {
  std::wstring_view f = WView(folder);
  std::wstring_view n = WView(name);
  if (f.empty()) return CString(n);
  if (n.empty()) return CString(f);
  std::wstring out(f);
  bool folderEnds = out.back() == L'/';
  bool nameStarts = n.front() == L'/';
  if (folderEnds && nameStarts) {
    n.remove_prefix(1);
  } else if (!folderEnds && !nameStarts) {
    out += L'/';
  }
  out += n;
  return CString(std::move(out));
}

CString PathFolder(const wchar_t* path) {
  std::wstring_view p = WView(path);
  size_t slash = p.rfind(L'/');
  if (slash == std::wstring_view::npos) return CString();
  if (slash == 0) return CString(L"/");
  return CString(p.substr(0, slash));
}

CString PathFileName(const wchar_t* path) {
  std::wstring_view p = WView(path);
  size_t slash = p.rfind(L'/');
  return CString(slash == std::wstring_view::npos ? p : p.substr(slash + 1));
}

CString PathFileTitle(const wchar_t* path) {
  CString name = PathFileName(path);
  int dot = name.ReverseFind(L'.');
  return dot < 0 ? name : name.Left(dot);
}

CString PathExtension(const wchar_t* path) {
  CString name = PathFileName(path);
  int dot = name.ReverseFind(L'.');
  return dot < 0 ? CString() : name.Mid(dot + 1);
}

bool IsPlainPathComponent(const wchar_t* name) {
  std::wstring_view n = WView(name);
  if (n.empty() || n == L"." || n == L"..") return false;
  // A NUL cannot occur inside the C string itself; the separator is the only danger left.
  return n.find(L'/') == std::wstring_view::npos;
}
