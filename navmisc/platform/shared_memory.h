// A mapping of POSIX shared memory, owned by one object: move-only, unmapped by its destructor.
#pragma once

#include <cstddef>
#include <string>
#include <system_error>

namespace navmisc {

class SharedMemory {
 public:
  SharedMemory() = default;
  // Unmaps. Never throws; call Unmap() to learn about a failure.
  ~SharedMemory();
  SharedMemory(SharedMemory&& other) noexcept;
  SharedMemory& operator=(SharedMemory&& other) noexcept;
  SharedMemory(const SharedMemory&) = delete;
  SharedMemory& operator=(const SharedMemory&) = delete;

  // Maps `size` bytes of the named object ("/name"), creating it with mode 0600 when it is
  // missing. An existing object is accepted only when it belongs to the effective user, grants
  // nothing to group and others (errc::permission_denied otherwise) and has exactly `size`
  // bytes, or none yet because its creator has not sized it (errc::invalid_argument otherwise).
  // A new object reads as zeros. With `at`, the mapping replaces whatever this process has
  // mapped at that page-aligned address (which must span `size` bytes and belong to the caller).
  static SharedMemory OpenOrCreate(const std::string& name, size_t size, std::error_code& ec,
                                   void* at = nullptr);
  // Maps the whole of an existing object; errc::no_such_file_or_directory when it is missing,
  // errc::permission_denied when it is not the user's own as OpenOrCreate requires.
  static SharedMemory OpenExisting(const std::string& name, std::error_code& ec);
  // `size` bytes of zeros shared with the children this process forks, and with nobody else.
  // `at` as for OpenOrCreate.
  static SharedMemory Anonymous(size_t size, std::error_code& ec, void* at = nullptr);
  // Removes the name; mappings that exist stay valid.
  static bool Unlink(const std::string& name, std::error_code& ec);

  void* data() const { return data_; }
  size_t size() const { return size_; }
  explicit operator bool() const { return data_ != nullptr; }

  // Unmaps now; the object is empty afterwards whatever the result.
  bool Unmap(std::error_code& ec);
  // Gives up ownership: the mapping stays for the life of the process.
  void* Release();

 private:
  SharedMemory(void* data, size_t size) : data_(data), size_(size) {}

  void* data_ = nullptr;
  size_t size_ = 0;
};

}  // namespace navmisc
