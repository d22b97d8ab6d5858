#include "navmisc/platform/secret.h"

#include <fcntl.h>
#include <sodium.h>
#include <sys/stat.h>
#include <unistd.h>

#include <array>
#include <cstdlib>
#include <mutex>
#include <optional>
#include <string>
#include <vector>

#include "navmisc/platform/detail/unique_fd.h"
#include "navmisc/platform/files.h"

namespace navmisc {
namespace {

constexpr char kPrefix[] = "v1:";
using Key = std::array<unsigned char, crypto_secretbox_KEYBYTES>;

using Fd = navmisc::detail::UniqueFd;

bool ReadAll(int fd, unsigned char* p, size_t n) {
  while (n > 0) {
    ssize_t r = ::read(fd, p, n);
    if (r < 0 && errno == EINTR) continue;
    if (r <= 0) return false;
    p += r;
    n -= static_cast<size_t>(r);
  }
  return true;
}

bool WriteAll(int fd, const unsigned char* p, size_t n) {
  while (n > 0) {
    ssize_t r = ::write(fd, p, n);
    if (r < 0 && errno == EINTR) continue;
    if (r <= 0) return false;
    p += r;
    n -= static_cast<size_t>(r);
  }
  return true;
}

// A key folder must belong to the user and let nobody else write to it: another user who can
// write there could plant a key of their own (and read what is sealed with it) or take ours away.
// False (with the reason noted) when it does not hold; also false, silently, when it is missing.
bool SafeKeyFolder(const std::string& folder) {
  struct stat st;
  if (::stat(folder.c_str(), &st) != 0) return false;
  const char* problem = nullptr;
  if (!S_ISDIR(st.st_mode)) problem = "is not a folder";
  else if (st.st_uid != ::geteuid()) problem = "belongs to another user";
  else if (st.st_mode & (S_IWGRP | S_IWOTH)) problem = "is writable by other users";
  if (!problem) return true;
  NoteFileRefusal("the password key folder " + folder + " " + problem + "; no key is kept there");
  return false;
}

// Reads the key, creating it on first use. The key file is made with O_EXCL so that two
// processes racing to create it end up with the same key.
std::optional<Key> LoadKey(bool create) {
  const CString keyPath = SecretKeyPath();
  if (keyPath.IsEmpty()) {
    NoteFileRefusal("no place for the password key: set HOME, XDG_CONFIG_HOME or NAVMISC_KEY_FILE");
    return std::nullopt;
  }
  const std::string path = NativePath(keyPath);
  const CString folder = PathFolder(keyPath);
  // Only the folders made here get the private mode; one that was there is the user's own.
  if (create) MakeDir(folder, 0700);
  if (!SafeKeyFolder(NativePath(folder))) return std::nullopt;
  Key key;
  for (int attempt = 0; attempt < 2; ++attempt) {
    Fd in(OpenRegularFile(path, /*followLink=*/false));
    if (in.get() >= 0) {
      struct stat st;
      if (::fstat(in.get(), &st) != 0 || st.st_uid != ::geteuid()) {
        NoteFileRefusal("the password key " + path + " belongs to another user");
        return std::nullopt;
      }
      if (ReadAll(in.get(), key.data(), key.size())) return key;
      return std::nullopt;  // a damaged key file is never replaced: that would lose the secret
    }
    if (!create || errno != ENOENT) return std::nullopt;
    const std::string tmp = path + ".new";
    Fd out(::open(tmp.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC, 0600));
    if (out.get() < 0) continue;
    randombytes_buf(key.data(), key.size());
    const bool ok = WriteAll(out.get(), key.data(), key.size()) && ::fsync(out.get()) == 0;
    // link() fails when another process made the key first; then its key is read instead.
    if (ok) ::link(tmp.c_str(), path.c_str());
    ::unlink(tmp.c_str());
  }
  return std::nullopt;
}

bool SodiumReady() {
  static const bool ready = sodium_init() >= 0;
  return ready;
}

}  // namespace

CString SecretKeyPath() {
  if (const char* p = std::getenv("NAVMISC_KEY_FILE"); p && *p) return CString::FromUtf8(p);
  const CString folder = UserConfigFolder();
  return folder.IsEmpty() ? CString() : PathJoin(folder, L"navmisc/secret.key");
}

CString ProtectSecret(const CString& clear) {
  if (clear.IsEmpty() || !SodiumReady()) return {};
  const auto key = LoadKey(true);
  if (!key) return {};
  const std::string plain = clear.ToUtf8();
  std::vector<unsigned char> sealed(crypto_secretbox_NONCEBYTES + crypto_secretbox_MACBYTES + plain.size());
  unsigned char* nonce = sealed.data();
  randombytes_buf(nonce, crypto_secretbox_NONCEBYTES);
  crypto_secretbox_easy(nonce + crypto_secretbox_NONCEBYTES,
                        reinterpret_cast<const unsigned char*>(plain.data()), plain.size(), nonce,
                        key->data());
  std::string b64(sodium_base64_encoded_len(sealed.size(), sodium_base64_VARIANT_ORIGINAL), '\0');
  sodium_bin2base64(b64.data(), b64.size(), sealed.data(), sealed.size(), sodium_base64_VARIANT_ORIGINAL);
  b64.resize(std::char_traits<char>::length(b64.c_str()));
  return CString::FromUtf8(kPrefix + b64);
}

bool UnprotectSecret(const CString& stored, CString& clear) {
  clear.Empty();
  const std::string text = stored.ToUtf8();
  if (text.rfind(kPrefix, 0) != 0 || !SodiumReady()) return false;
  std::vector<unsigned char> sealed(text.size());
  size_t len = 0;
  if (sodium_base642bin(sealed.data(), sealed.size(), text.c_str() + 3, text.size() - 3, nullptr,
                        &len, nullptr, sodium_base64_VARIANT_ORIGINAL) != 0 ||
      len < crypto_secretbox_NONCEBYTES + crypto_secretbox_MACBYTES) {
    return false;
  }
  const auto key = LoadKey(false);
  if (!key) return false;
  std::string plain(len - crypto_secretbox_NONCEBYTES - crypto_secretbox_MACBYTES, '\0');
  if (crypto_secretbox_open_easy(reinterpret_cast<unsigned char*>(plain.data()),
                                 sealed.data() + crypto_secretbox_NONCEBYTES,
                                 len - crypto_secretbox_NONCEBYTES, sealed.data(), key->data()) != 0) {
    return false;
  }
  clear = CString::FromUtf8(plain);
  return true;
}

}  // namespace navmisc
