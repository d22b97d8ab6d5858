// Where the password key is kept: only folders the library made are given its private mode, and
// no place that another user could have prepared is used.
#include "navmisc/platform/secret.h"

#include <gtest/gtest.h>
#include <pwd.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstdlib>
#include <optional>
#include <string>

#include "navmisc/platform/files.h"
#include "testutil.h"

namespace {

using navmisc::testutil::TempDir;

int Mode(const CString& path) {
  struct stat st;
  return stat(navmisc::NativePath(path).c_str(), &st) == 0 ? static_cast<int>(st.st_mode & 07777) : -1;
}

// Sets (or, with null, removes) the variables that locate the key, and puts them back after.
class KeyEnvironment {
 public:
  KeyEnvironment(const char* keyFile, const char* configHome, const char* home) {
    Set("NAVMISC_KEY_FILE", keyFile);
    Set("XDG_CONFIG_HOME", configHome);
    Set("HOME", home);
  }
  ~KeyEnvironment() {
    for (auto& [name, value] : saved_) {
      if (value) setenv(name, value->c_str(), 1);
      else unsetenv(name);
    }
  }

 private:
  void Set(const char* name, const char* value) {
    const char* old = std::getenv(name);
    saved_[count_++] = {name, old ? std::optional<std::string>(old) : std::nullopt};
    if (value) setenv(name, value, 1);
    else unsetenv(name);
  }
  std::pair<const char*, std::optional<std::string>> saved_[3];
  int count_ = 0;
};

TEST(SecretKey, OnlyFoldersItCreatesBecomePrivate) {
  TempDir dir;
  ASSERT_TRUE(MakeDir(dir / L"shared"));
  ASSERT_EQ(chmod(navmisc::NativePath(dir / L"shared").c_str(), 0755), 0);
  {
    KeyEnvironment env((dir / L"shared/secret.key").ToUtf8().c_str(), nullptr, "/nonexistent");
    EXPECT_FALSE(navmisc::ProtectSecret(L"pw").IsEmpty());
    EXPECT_EQ(Mode(dir / L"shared"), 0755) << "a folder that was there keeps its mode";
    EXPECT_EQ(Mode(dir / L"shared/secret.key"), 0600);
  }
  {
    KeyEnvironment env((dir / L"new1/new2/secret.key").ToUtf8().c_str(), nullptr, "/nonexistent");
    EXPECT_FALSE(navmisc::ProtectSecret(L"pw").IsEmpty());
    EXPECT_EQ(Mode(dir / L"new1"), 0700);
    EXPECT_EQ(Mode(dir / L"new1/new2"), 0700);
  }
}

// A key folder that others may write to could hold a key they planted, or lose ours to them.
TEST(SecretKey, RefusesPlacesOthersControl) {
  TempDir dir;
  ASSERT_TRUE(MakeDir(dir / L"open/navmisc"));
  ASSERT_EQ(chmod(navmisc::NativePath(dir / L"open/navmisc").c_str(), 0777), 0);
  {
    KeyEnvironment env(nullptr, (dir / L"open").ToUtf8().c_str(), "/nonexistent");
    navmisc::ClearFileRefusal();
    EXPECT_TRUE(navmisc::ProtectSecret(L"pw").IsEmpty());
    EXPECT_FALSE(FileExists(dir / L"open/navmisc/secret.key"));
    EXPECT_NE(navmisc::LastFileRefusal().find("writable by other users"), std::string::npos)
        << navmisc::LastFileRefusal();
    EXPECT_EQ(Mode(dir / L"open/navmisc"), 0777);
  }
  {  // without HOME the key goes under the home folder of the user's account, never under /tmp
    KeyEnvironment env(nullptr, nullptr, nullptr);
    const std::string path = navmisc::SecretKeyPath().ToUtf8();
    EXPECT_NE(path.rfind("/tmp/", 0), 0u) << path;
    const passwd* pw = getpwuid(geteuid());
    if (pw && pw->pw_dir && *pw->pw_dir) {
      EXPECT_EQ(path, std::string(pw->pw_dir) + "/.config/navmisc/secret.key");
    } else {
      EXPECT_EQ(path, "");
    }
  }
}

}  // namespace
