// Saving several files as one unit. While a FileTransaction lives on a thread, every AtomicFile
// that this thread commits is written, flushed and synced to its temporary file but not yet
// renamed into place; the transaction's Commit renames them all, and only when every one of them
// succeeded. A failure anywhere (a full disk in the third file, a rename that fails after two
// others went through) leaves every target as it was before. See docs/data-root-safety.md.
#pragma once

#include <string>
#include <vector>

namespace navmisc {

class FileTransaction {
 public:
  // Becomes the thread's current transaction. Inside another one it joins that one: its files
  // then go into place with the outer transaction's Commit.
  FileTransaction();
  // Without a successful Commit, every file staged in it is dropped.
  ~FileTransaction();
  FileTransaction(const FileTransaction&) = delete;
  FileTransaction& operator=(const FileTransaction&) = delete;

  // Puts every staged file into place. False, with every target as before, when any file of the
  // transaction failed or was given up, when Fail was called, or when a rename fails (the files
  // renamed before it are put back). A joined transaction only reports whether the outer one
  // has failed so far.
  bool Commit();
  // Marks the transaction failed: a step of the save that is not a file write went wrong.
  void Fail(const std::string& why);
  // Why it failed, in words ("cannot write /d/TK_1.BIN: No space left on device"); the first
  // reason wins.
  const std::string& error() const;

  // The thread's current transaction, or null. AtomicFile stages its files there.
  static FileTransaction* Current();
  // Takes over a written and synced temporary file that is to replace `target` on Commit. A
  // second file for the same target replaces the first.
  void Stage(std::string temp, std::string target);

 private:
  struct Staged {
    std::string temp;
    std::string target;
  };
  void Drop();

  FileTransaction* outer_ = nullptr;  // the transaction this one joined
  bool failed_ = false;
  bool done_ = false;
  std::string error_;
  std::vector<Staged> staged_;
};

}  // namespace navmisc
