#include "navmisc/platform/root_confinement.h"

#include <limits.h>
#include <sys/stat.h>
#include <unistd.h>

#include <deque>
#include <mutex>
#include <string_view>
#include <vector>

#include "navmisc/platform/files.h"
#include "navmisc/platform/shared_globals.h"

namespace navmisc {
namespace {

// As many links as the kernel follows in one lookup before it gives up with ELOOP.
constexpr int kMaxLinks = 40;

std::string CurrentFolder() {
  std::string buf(PATH_MAX, '\0');
  if (!::getcwd(buf.data(), buf.size())) return "/";
  buf.resize(std::char_traits<char>::length(buf.c_str()));
  return buf;
}

void SplitInto(std::string_view path, std::deque<std::string>& parts, bool front) {
  std::vector<std::string> found;
  size_t start = 0;
  while (start <= path.size()) {
    size_t slash = path.find('/', start);
    if (slash == std::string_view::npos) slash = path.size();
    if (slash > start) found.emplace_back(path.substr(start, slash - start));
    start = slash + 1;
  }
  if (front) parts.insert(parts.begin(), found.begin(), found.end());
  else parts.insert(parts.end(), found.begin(), found.end());
}

void DropLast(std::string& path) {
  const size_t slash = path.rfind('/');
  path.resize(slash == std::string::npos ? 0 : slash);
}

// `path` absolute, without empty or "." components; ".." is kept as written, so that a path
// that climbs out of the data root still counts as lying under it and gets resolved.
std::string AsWritten(const std::string& path) {
  std::deque<std::string> parts;
  if (path.empty() || path[0] != '/') SplitInto(CurrentFolder(), parts, false);
  SplitInto(path, parts, false);
  std::string out;
  for (const std::string& part : parts) {
    if (part == ".") continue;
    out += '/';
    out += part;
  }
  return out.empty() ? "/" : out;
}

bool IsUnder(const std::string& path, const std::string& root) {
  if (root == "/") return true;
  return path.compare(0, root.size(), root) == 0 && (path.size() == root.size() || path[root.size()] == '/');
}

// The data root as written and resolved. Resolving it is a walk over its folders; it is done
// again only when the data root's text changes.
bool DataRoot(std::string& written, std::string& resolved) {
  static std::mutex mu;
  static std::string lastText, lastWritten, lastResolved;
  const std::string text = NativePath(g_szAppDataPath);
  if (text.empty()) return false;
  std::lock_guard lock(mu);
  if (text != lastText) {
    lastText = text;
    lastWritten = AsWritten(text);
    lastResolved = ResolveLinks(text, true);
  }
  written = lastWritten;
  resolved = lastResolved;
  return !resolved.empty();
}

}  // namespace

std::string ResolveLinks(const std::string& path, bool followLast) {
  std::deque<std::string> pending;
  if (path.empty() || path[0] != '/') SplitInto(CurrentFolder(), pending, false);
  SplitInto(path, pending, false);
  std::string done;  // resolved so far, without a trailing "/"; empty = the root folder
  bool exists = true;  // every component so far exists, so links may still come
  int links = 0;
  while (!pending.empty()) {
    std::string part = std::move(pending.front());
    pending.pop_front();
    if (part == ".") continue;
    if (part == "..") {
      DropLast(done);
      continue;
    }
    std::string next = done + "/" + part;
    struct stat st;
    const bool mayFollow = exists && (followLast || !pending.empty());
    if (mayFollow && ::lstat(next.c_str(), &st) != 0) exists = false;
    if (!mayFollow || !exists || !S_ISLNK(st.st_mode)) {
      done = std::move(next);
      continue;
    }
    if (++links > kMaxLinks) return {};
    std::string target(PATH_MAX, '\0');
    const ssize_t n = ::readlink(next.c_str(), target.data(), target.size());
    if (n <= 0) return {};
    target.resize(static_cast<size_t>(n));
    if (target[0] == '/') done.clear();
    SplitInto(target, pending, true);
  }
  return done.empty() ? "/" : done;
}

bool StaysInDataRoot(const std::string& path, bool followLast) {
  std::string rootWritten, rootResolved;
  if (path.empty() || !DataRoot(rootWritten, rootResolved)) return true;
  if (!IsUnder(AsWritten(path), rootWritten)) return true;
  const std::string resolved = ResolveLinks(path, followLast);
  if (!resolved.empty() && IsUnder(resolved, rootResolved)) return true;
  NoteFileRefusal(path + (resolved.empty() ? " leads into a loop of links" : " leads outside the data root (to " + resolved + ")"));
  return false;
}

}  // namespace navmisc
