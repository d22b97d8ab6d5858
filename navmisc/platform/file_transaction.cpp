#include "navmisc/platform/file_transaction.h"

#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <random>
#include <set>

#include "navmisc/platform/detail/temp_files.h"

namespace navmisc {
namespace {

thread_local FileTransaction* t_current = nullptr;

// A second name for the file at `target`, in the form of its temporary files, so that a backup
// left by a crash is removed by the file's next save like any other leftover. Empty when the
// target does not exist or the file system has no hard links.
std::string LinkBackup(const std::string& target) {
  static thread_local std::mt19937 random{std::random_device{}()};
  static constexpr char kChars[] = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789";
  const size_t slash = target.rfind('/');
  const std::string prefix = target.substr(0, slash + 1) + detail::TempFilePrefix(target.substr(slash + 1));
  for (int attempt = 0; attempt < 16; ++attempt) {
    std::string backup = prefix;
    for (int i = 0; i < 6; ++i) backup += kChars[random() % (sizeof kChars - 1)];
    if (::link(target.c_str(), backup.c_str()) == 0) return backup;
    if (errno != EEXIST) break;
  }
  return {};
}

}  // namespace

FileTransaction::FileTransaction() : outer_(t_current) {
  if (!outer_) t_current = this;
}

FileTransaction::~FileTransaction() {
  if (!outer_) {
    if (!done_) Drop();
    t_current = nullptr;
  }
}

FileTransaction* FileTransaction::Current() { return t_current; }

void FileTransaction::Fail(const std::string& why) {
  if (outer_) return outer_->Fail(why);
  if (!failed_) error_ = why;
  failed_ = true;
}

const std::string& FileTransaction::error() const { return outer_ ? outer_->error() : error_; }

void FileTransaction::Stage(std::string temp, std::string target) {
  if (outer_) return outer_->Stage(std::move(temp), std::move(target));
  for (Staged& s : staged_) {
    if (s.target == target) {
      ::unlink(s.temp.c_str());
      s.temp = std::move(temp);
      return;
    }
  }
  staged_.push_back({std::move(temp), std::move(target)});
}

void FileTransaction::Drop() {
  for (const Staged& s : staged_) ::unlink(s.temp.c_str());
  staged_.clear();
}

bool FileTransaction::Commit() {
  if (outer_) return !outer_->failed_;
  if (done_) return !failed_;
  done_ = true;
  if (failed_) {
    Drop();
    return false;
  }
  // Every file is complete and on disk. Keep a second name for each file about to be replaced,
  // so that a rename failing half-way can put the earlier ones back.
  struct Undo {
    std::string backup;  // the old file under its second name; empty when there was none
    bool existed;
  };
  std::vector<Undo> undo;
  for (const Staged& s : staged_) {
    struct stat st;
    const bool existed = ::lstat(s.target.c_str(), &st) == 0;
    undo.push_back({existed ? LinkBackup(s.target) : std::string(), existed});
  }
  size_t renamed = 0;
  for (; renamed < staged_.size(); ++renamed) {
    if (detail::RenameIntoPlace(staged_[renamed].temp, staged_[renamed].target) != 0) {
      Fail("cannot replace " + staged_[renamed].target + ": " + detail::ErrorText(errno));
      break;
    }
  }
  if (failed_) {
    for (size_t i = renamed; i-- > 0;) {
      if (!undo[i].backup.empty()) ::rename(undo[i].backup.c_str(), staged_[i].target.c_str());
      else if (!undo[i].existed) ::unlink(staged_[i].target.c_str());
    }
    for (size_t i = renamed; i < staged_.size(); ++i) ::unlink(staged_[i].temp.c_str());
  }
  std::set<std::string> folders;
  for (size_t i = 0; i < staged_.size(); ++i) {
    if (!undo[i].backup.empty()) ::unlink(undo[i].backup.c_str());
    folders.insert(detail::FolderOf(staged_[i].target));
  }
  staged_.clear();
  // Make the renames themselves durable (either way round).
  for (const std::string& folder : folders) detail::SyncFolder(folder);
  return !failed_;
}

}  // namespace navmisc
