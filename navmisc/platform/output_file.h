// A document written front to back straight into its target, for the exporters: unlike
// AtomicFile the bytes land in the named file itself, so a reader that opens it while it is
// written sees a growing file, and a failed export leaves what was written so far.
#pragma once

#include <cstdio>
#include <string>
#include <string_view>

namespace navmisc {

class OutputFile {
 public:
  OutputFile() = default;
  // Closes the file if it is still open; errors are then lost (call Close to see them).
  ~OutputFile();
  OutputFile(const OutputFile&) = delete;
  OutputFile& operator=(const OutputFile&) = delete;

  // Creates `path`, or empties it when it exists ("wb"). False when that is impossible; the
  // reason is then in error() and in LastOpenError() of this thread.
  bool Open(const wchar_t* path);
  bool IsOpen() const { return file_ != nullptr; }
  // Writes every byte. False once any write has failed; later writes are ignored.
  bool Write(std::string_view bytes);
  // Closes the file. False when a write or the close failed.
  bool Close();
  // The system's reason for the first failure ("Permission denied"), empty when none.
  const std::string& error() const { return error_; }

 private:
  void Failed(int err);

  std::FILE* file_ = nullptr;
  bool failed_ = false;
  std::string error_;
};

// The reason the last OutputFile::Open on the calling thread failed ("No such file or
// directory"), empty when it succeeded. Callers that get only 1 or 0 from an exporter use it to
// tell the user why a target could not be written.
std::string LastOpenError();

}  // namespace navmisc
