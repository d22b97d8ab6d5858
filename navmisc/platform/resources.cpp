#include "navmisc/platform/resources.h"

#include <mutex>
#include <string>

#include "navmisc/platform/files.h"
#include "navmisc/platform/settings.h"
#include "navmisc/platform/shared_globals.h"

namespace {

constexpr const wchar_t* kResourceFileName = L"navmisc-strings.ini";
constexpr const wchar_t* kStringsSection = L"STRINGS";

// The open resource file. The settings reader indexes a file once at RD_BEGIN, so keeping the
// handle is keeping the parsed file. The file is looked up again only when what decides where
// it is (the override, the program folder) has changed.
struct ResourceCache {
  std::mutex mutex;
  CString override_path;  // set by SetResourceFile; empty = default lookup
  bool resolved = false;
  CString resolved_for;   // the program folder the lookup was made with
  unsigned long handle = 0;
};

ResourceCache& Cache() {
  // Never destroyed: texts may still be asked for from other static destructors.
  static ResourceCache* cache = new ResourceCache;
  return *cache;
}

unsigned long OpenFirst(const CString& prog_path) {
  CString candidates[3];
  int count = 0;
  if (!prog_path.IsEmpty()) {
    candidates[count++] = PathJoin(prog_path, kResourceFileName);
    candidates[count++] =
        PathJoin(PathJoin(prog_path, L"../share/navmisc"), kResourceFileName);
  }
  CString exe = GetCurrentExecPath();
  if (!exe.IsEmpty()) candidates[count++] = PathJoin(exe, kResourceFileName);
  for (int i = 0; i < count; ++i) {
    if (!FileExists(candidates[i])) continue;
    if (unsigned long h = RD_BEGIN(candidates[i])) return h;
  }
  return 0;
}

// REQUIRES: cache.mutex held.
void Close(ResourceCache& cache) {
  if (cache.handle) RD_END(cache.handle);
  cache.handle = 0;
  cache.resolved = false;
}

}  // namespace

CString LoadResString(unsigned id) {
  ResourceCache& cache = Cache();
  std::lock_guard<std::mutex> lock(cache.mutex);
  if (cache.override_path.IsEmpty()) {
    const CString prog_path(g_szExecProgPath);
    if (cache.resolved && cache.resolved_for != prog_path) Close(cache);
    if (!cache.resolved) {
      cache.handle = OpenFirst(prog_path);
      cache.resolved_for = prog_path;
      cache.resolved = true;
    }
  } else if (!cache.resolved) {
    cache.handle = RD_BEGIN(cache.override_path);
    cache.resolved = true;
  }
  if (!cache.handle) return CString();
  return RD_STRING(cache.handle, kStringsSection, std::to_wstring(id).c_str(), L"");
}

namespace navmisc {

void SetResourceFile(const wchar_t* path) {
  ResourceCache& cache = Cache();
  std::lock_guard<std::mutex> lock(cache.mutex);
  Close(cache);
  cache.override_path = path ? path : L"";
}

}  // namespace navmisc

namespace navmisc {

CString FormatResString(unsigned id, const wchar_t* argument) {
  const std::wstring text = LoadResString(id).str();
  std::wstring out;
  bool placed = false;
  for (size_t i = 0; i < text.size(); ++i) {
    if (text[i] == L'%' && i + 1 < text.size()) {
      const wchar_t next = text[i + 1];
      if (next == L'%') {
        out += L'%';
        ++i;
        continue;
      }
      if (!placed && (next == L's' || next == L'd')) {
        out += argument ? argument : L"";
        placed = true;
        ++i;
        continue;
      }
    }
    out += text[i];
  }
  return CString(std::move(out));
}

}  // namespace navmisc
