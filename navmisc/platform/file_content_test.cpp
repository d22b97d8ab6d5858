#include "navmisc/platform/file_content.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <time.h>
#include <unistd.h>

#include <string>
#include <vector>

#include "navmisc/platform/files.h"
#include "testutil.h"

namespace {

using navmisc::FileContent;
using navmisc::NativePath;
using navmisc::testutil::ReadFileBytes;
using navmisc::testutil::TempDir;
using navmisc::testutil::WriteFileBytes;

struct stat Stat(const CString& path) {
  struct stat st {};
  EXPECT_EQ(::stat(NativePath(path).c_str(), &st), 0);
  return st;
}

TEST(FileContent, LoadsOnlyRegularFilesWithinTheLimit) {
  TempDir dir;
  WriteFileBytes(dir / L"a.jpg", "0123456789");
  ASSERT_EQ(::mkfifo(NativePath(dir / L"fifo").c_str(), 0600), 0);
  const struct {
    CString path;
    size_t limit;
    bool ok;
    const char* error;
  } cases[] = {
      {dir / L"a.jpg", 10, true, ""},
      {dir / L"a.jpg", 9, false, "file too large"},
      {dir / L"fifo", 100, false, "not a regular file"},
      {dir.path(), 100, false, "not a regular file"},
      {dir / L"missing.jpg", 100, false, "cannot open: No such file or directory"},
  };
  for (const auto& c : cases) {
    FileContent f;
    EXPECT_EQ(f.Load(c.path, c.limit), c.ok) << c.path.ToUtf8();
    EXPECT_EQ(f.error(), c.error);
    EXPECT_EQ(f.bytes(), c.ok ? "0123456789" : "");
  }
}

TEST(FileContent, ReplaceKeepsModeAndTimes) {
  TempDir dir;
  const CString path = dir / L"photo.jpg";
  WriteFileBytes(path, "old content");
  ASSERT_EQ(::chmod(NativePath(path).c_str(), 0640), 0);
  const struct timespec times[2] = {{1300000000, 5}, {1200000000, 123456789}};
  ASSERT_EQ(::utimensat(AT_FDCWD, NativePath(path).c_str(), times, 0), 0);

  FileContent f;
  ASSERT_TRUE(f.Load(path, 1 << 20));
  ASSERT_TRUE(f.Replace("new and longer content")) << f.error();
  const struct stat st = Stat(path);  // before reading it back moves the access time
  EXPECT_EQ(ReadFileBytes(path), "new and longer content");
  EXPECT_EQ(st.st_mode & 07777, 0640u);
  EXPECT_EQ(st.st_mtim.tv_sec, 1200000000);
  EXPECT_EQ(st.st_mtim.tv_nsec, 123456789);
  EXPECT_EQ(st.st_atim.tv_sec, 1300000000);
  // Replaced twice from one load: the name still leads to a file written by us, but not to the
  // one that was loaded.
  EXPECT_FALSE(f.Replace("again"));
  EXPECT_EQ(f.error(), "the file was replaced by another");
}

TEST(FileContent, ReplaceLeavesProtectedDeletedAndSwappedFilesAlone) {
  TempDir dir;
  const CString path = dir / L"p.jpg";
  const struct {
    const char* name;
    void (*change)(const CString& path);
    const char* error;
    bool exists;
  } cases[] = {
      {"read-only", [](const CString& p) { ::chmod(NativePath(p).c_str(), 0444); },
       "the file is read-only", true},
      {"deleted", [](const CString& p) { ::unlink(NativePath(p).c_str()); }, "the file was deleted",
       false},
      {"swapped",
       [](const CString& p) {
         WriteFileBytes(p + L".other", "other");
         ::rename(NativePath(p + L".other").c_str(), NativePath(p).c_str());
       },
       "the file was replaced by another", true},
  };
  for (const auto& c : cases) {
    WriteFileBytes(path, "original");
    ::chmod(NativePath(path).c_str(), 0644);
    FileContent f;
    ASSERT_TRUE(f.Load(path, 100));
    c.change(path);
    const std::string expected = c.exists ? ReadFileBytes(path) : "";
    EXPECT_FALSE(f.Replace("tagged")) << c.name;
    EXPECT_EQ(f.error(), c.error) << c.name;
    EXPECT_EQ(FileExists(path), c.exists) << c.name;
    if (c.exists) {
      EXPECT_EQ(ReadFileBytes(path), expected) << c.name;
    }
    ::chmod(NativePath(path).c_str(), 0644);
  }
}

TEST(FileReplaceBatch, PutsManyFilesInPlaceTogetherAndSkipsThoseChangedMeanwhile) {
  TempDir dir;
  constexpr int kFiles = 8;  // more than are synced one by one
  navmisc::FileReplaceBatch batch;
  for (int i = 0; i < kFiles; ++i) {
    const CString path = dir / FormatString(L"p%d.jpg", i);
    WriteFileBytes(path, "old " + std::to_string(i));
    const struct timespec times[2] = {{1300000000, 0}, {1200000000 + i, 0}};
    ASSERT_EQ(::utimensat(AT_FDCWD, NativePath(path).c_str(), times, 0), 0);
    FileContent f;
    ASSERT_TRUE(f.Load(path, 100));
    std::string error;
    ASSERT_TRUE(batch.Stage(f, "new " + std::to_string(i), error)) << error;
    EXPECT_EQ(ReadFileBytes(path), "old " + std::to_string(i)) << "nothing visible before the commit";
  }
  ::unlink(NativePath(dir / L"p2.jpg").c_str());
  WriteFileBytes(dir / L"other", "swapped in");
  ::rename(NativePath(dir / L"other").c_str(), NativePath(dir / L"p5.jpg").c_str());

  const std::vector<std::string> errors = batch.Commit();
  ASSERT_EQ(errors.size(), static_cast<size_t>(kFiles));
  for (int i = 0; i < kFiles; ++i) {
    const CString path = dir / FormatString(L"p%d.jpg", i);
    if (i == 2) {
      EXPECT_EQ(errors[i], "the file was deleted");
      EXPECT_FALSE(FileExists(path));
    } else if (i == 5) {
      EXPECT_EQ(errors[i], "the file was replaced by another");
      EXPECT_EQ(ReadFileBytes(path), "swapped in");
    } else {
      EXPECT_EQ(errors[i], "") << i;
      EXPECT_EQ(Stat(path).st_mtim.tv_sec, 1200000000 + i);
      EXPECT_EQ(ReadFileBytes(path), "new " + std::to_string(i));
    }
  }
  CStringList left;
  EXPECT_EQ(GetContent(dir.path(), L".*", left), 0) << "no temporary file stays behind";
}

TEST(GetFileBirthTime, RecentForANewFileAndFalseWhenMissing) {
  TempDir dir;
  const CString path = dir / L"new.jpg";
  WriteFileBytes(path, "x");
  // An old modification time must not be taken for the creation.
  const struct timespec times[2] = {{1000000000, 0}, {1000000000, 0}};
  ASSERT_EQ(::utimensat(AT_FDCWD, NativePath(path).c_str(), times, 0), 0);
  long long seconds = 0;
  long nanos = -1;
  ASSERT_TRUE(GetFileBirthTime(path, seconds, nanos));
  EXPECT_NEAR(static_cast<double>(seconds), static_cast<double>(::time(nullptr)), 600.0);
  EXPECT_GE(nanos, 0);
  EXPECT_FALSE(GetFileBirthTime(dir / L"missing", seconds, nanos));
}

}  // namespace
