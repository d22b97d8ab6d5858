#include "navmisc/platform/data_root.h"

#include <dirent.h>
#include <stdlib.h>
#include <sys/mman.h>
#include <unistd.h>

#include <cinttypes>
#include <cstdio>
#include <filesystem>
#include <mutex>
#include <vector>

#include "navmisc/platform/cstring.h"
#include "navmisc/platform/detail/per_root_registry.h"
#include "navmisc/platform/files.h"
#include "navmisc/platform/per_root_block.h"

namespace navmisc {
namespace {

struct RootState {
  std::mutex mutex;
  std::string root;
  std::vector<PerRootBlock*> blocks;
};

RootState& State() {
  static RootState* const state = [] {
    auto* s = new RootState;  // never destroyed: blocks outlive every static destructor
    if (const char* inherited = ::getenv(kDataRootVariable); inherited && *inherited)
      s->root = CanonicalDataRoot(CString::FromUtf8(inherited));
    return s;
  }();
  return *state;
}

// FNV-1a, 64 bits: stable across programs and builds, which std::hash is not.
uint64_t RootHash(const std::string& root) {
  uint64_t h = 0xcbf29ce484222325ULL;
  for (unsigned char c : root) {
    h ^= c;
    h *= 0x100000001b3ULL;
  }
  return h;
}

}  // namespace

namespace detail {
void RegisterPerRootBlock(PerRootBlock* block) {
  RootState& s = State();
  std::lock_guard lock(s.mutex);
  s.blocks.push_back(block);
}
}  // namespace detail

std::string CanonicalDataRoot(const wchar_t* root) {
  if (!root || !*root) return {};
  std::error_code ec;
  const std::filesystem::path abs = std::filesystem::absolute(NativePath(root), ec);
  if (ec) return {};
  std::filesystem::path canonical = std::filesystem::weakly_canonical(abs, ec);
  if (ec) return {};
  std::string text = canonical.lexically_normal().string();
  while (text.size() > 1 && text.back() == '/') text.pop_back();
  return text;
}

bool UseDataRoot(const wchar_t* root) {
  const std::string canonical = CanonicalDataRoot(root);
  if (canonical.empty()) return false;
  RootState& s = State();
  std::lock_guard lock(s.mutex);
  s.root = canonical;
  for (PerRootBlock* block : s.blocks) block->Attach(canonical);
  ::setenv(kDataRootVariable, canonical.c_str(), 1);
  return true;
}

const std::string& ChosenDataRoot() { return State().root; }

std::string PerRootObjectName(std::string_view kind, const std::string& root) {
  char hash[17];
  std::snprintf(hash, sizeof hash, "%016" PRIx64, RootHash(root));
  return "/navmisc-" + std::to_string(::geteuid()) + "-" + hash + "-" + std::string(kind);
}

int RemovePerRootObjects(const wchar_t* root) {
  const std::string canonical = CanonicalDataRoot(root);
  if (canonical.empty()) return 0;
  // Every object of the root starts with the name of kind "" up to its final "-".
  const std::string prefix = PerRootObjectName("", canonical).substr(1);
  int removed = 0;
  DIR* dir = ::opendir("/dev/shm");
  if (!dir) return 0;
  std::vector<std::string> names;
  while (const dirent* e = ::readdir(dir)) {
    if (std::string_view(e->d_name).starts_with(prefix)) names.emplace_back(e->d_name);
  }
  ::closedir(dir);
  for (const std::string& name : names) removed += ::shm_unlink(("/" + name).c_str()) == 0;
  return removed;
}

}  // namespace navmisc
