#include "navmisc/platform/files.h"

#include <sys/stat.h>
#include <unistd.h>

#include <chrono>
#include <cstdlib>
#include <string>
#include <tuple>
#include <vector>

#include <gtest/gtest.h>

#include "testutil.h"

namespace {

using navmisc::NativePath;
using navmisc::testutil::ReadFileBytes;
using navmisc::testutil::TempDir;
using navmisc::testutil::WriteFileBytes;

std::vector<std::wstring> Names(const CStringList& list) {
  std::vector<std::wstring> out;
  for (POSITION pos = list.GetHeadPosition(); pos;) out.push_back(list.GetNext(pos).str());
  return out;
}

void Symlink(const CString& target, const CString& link) {
  ASSERT_EQ(::symlink(NativePath(target).c_str(), NativePath(link).c_str()), 0);
}

bool LinkExists(const CString& path) {
  struct stat st;
  return ::lstat(NativePath(path).c_str(), &st) == 0;
}

TEST(RemoveDir, NeverFollowsSymbolicLinks) {
  TempDir tmp;
  const CString outside = tmp / L"outside";
  ASSERT_TRUE(MakeDir(outside + L"/deep"));
  WriteFileBytes(outside + L"/keep.txt", "precious");
  WriteFileBytes(outside + L"/deep/keep2.txt", "precious too");

  const CString victim = tmp / L"victim";
  ASSERT_TRUE(MakeDir(victim + L"/sub/subsub"));
  WriteFileBytes(victim + L"/sub/subsub/f.bin", "x");
  Symlink(outside, victim + L"/link-to-folder");
  Symlink(outside + L"/keep.txt", victim + L"/link-to-file");
  Symlink(outside, victim + L"/sub/subsub/nested-link");
  Symlink(tmp / L"missing", victim + L"/dangling");

  EXPECT_TRUE(RemoveDir(victim, L"*.*"));
  EXPECT_FALSE(LinkExists(victim));
  EXPECT_EQ(ReadFileBytes(outside + L"/keep.txt"), "precious");
  EXPECT_EQ(ReadFileBytes(outside + L"/deep/keep2.txt"), "precious too");

  // A link given as the folder itself is left alone, and so is what it points to.
  const CString link = tmp / L"link-as-root";
  Symlink(outside, link);
  EXPECT_FALSE(RemoveDir(link, L"*"));
  EXPECT_TRUE(LinkExists(link));
  EXPECT_TRUE(FileExists(outside + L"/keep.txt"));
  EXPECT_FALSE(RemoveDir(link + L"/", L"*"));
  EXPECT_TRUE(FileExists(outside + L"/keep.txt"));
}

// A program's own static object may still remove its scratch folder in the data root while the
// program exits, after any static state the library made on its first file step.
TEST(RemoveDir, WorksFromAStaticObjectWhileTheProgramExits) {
  GTEST_FLAG_SET(death_test_style, "threadsafe");  // a fresh process: statics in the order made here
  EXPECT_EXIT(
      {
        struct Scratch {
          CString path;
          ~Scratch() {
            RemoveDir(path, L"*.*");
            if (PathStatus(path) != 2) std::_Exit(3);
          }
        };
        std::string folder = "/tmp/navmisc-exit-XXXXXX";
        if (!::mkdtemp(folder.data())) std::_Exit(2);
        static Scratch scratch{CString::FromUtf8(folder)};
        navmisc::testutil::DataRootScope root(scratch.path);
        if (!MakeDir(scratch.path + L"/sub")) std::_Exit(2);
        std::exit(0);
      },
      ::testing::ExitedWithCode(0), "");
}

TEST(RemoveDir, PatternSelectsEntriesAndFolderStaysWhenNotEmpty) {
  TempDir tmp;
  const CString dir = tmp / L"d";
  ASSERT_TRUE(MakeDir(dir + L"/a.BIN.dir"));
  for (const wchar_t* name : {L"one.bin", L"TWO.BIN", L"three.txt", L"bin", L"[x].bin"})
    WriteFileBytes(dir + L"/" + name, "data");

  EXPECT_FALSE(RemoveDir(dir, L"*.bin"));  // other entries remain, so the folder does too
  CStringList left;
  ASSERT_EQ(GetContent(dir, L"*.*", left), 3);
  EXPECT_EQ(Names(left), (std::vector<std::wstring>{L"a.BIN.dir", L"bin", L"three.txt"}));

  EXPECT_TRUE(RemoveDir(dir, L"*"));
  EXPECT_FALSE(LinkExists(dir));
  EXPECT_TRUE(RemoveDir(dir, L"*"));  // already gone
}

TEST(GetContent, Patterns) {
  TempDir tmp;
  for (const wchar_t* name : {L"b.txt", L"a.TXT", L"noext", L".hidden", L"c.txt.bak", L"é.gpx",
                              L"x[1].jpg"})
    WriteFileBytes(tmp / name, "");
  ASSERT_TRUE(MakeDir(tmp / L"folder.txt"));

  const std::vector<std::wstring> all = {L".hidden",    L"a.TXT",  L"b.txt",    L"c.txt.bak",
                                         L"folder.txt", L"noext",  L"x[1].jpg", L"é.gpx"};
  struct Case {
    const wchar_t* pattern;
    std::vector<std::wstring> expected;
  } cases[] = {
      {L"*.*", all},
      {L"*.txt", {L"a.TXT", L"b.txt", L"folder.txt"}},
      {L"?.gpx", {L"é.gpx"}},
      {L"x[1].*", {L"x[1].jpg"}},
  };
  for (const Case& c : cases) {
    CStringList names;
    names.AddTail(CString(L"kept"));  // results are appended
    const int n = GetContent(tmp.path(), c.pattern, names);
    std::vector<std::wstring> expected = c.expected;
    expected.insert(expected.begin(), L"kept");
    EXPECT_EQ(n, static_cast<int>(c.expected.size())) << c.pattern;
    EXPECT_EQ(Names(names), expected) << c.pattern;
  }
  CStringList none;
  EXPECT_EQ(GetContent(tmp / L"missing", L"*.*", none), -1);
  EXPECT_EQ(GetContent(tmp / L"b.txt", L"*.*", none), -1);
}

TEST(Files, MakeDirCopyDeleteAndStatus) {
  TempDir tmp;
  const CString deep = tmp / L"x/y/z/";
  EXPECT_TRUE(MakeDir(deep));
  EXPECT_TRUE(MakeDir(deep));  // existing is fine
  EXPECT_TRUE(IsDirectory(tmp / L"x/y/z"));
  WriteFileBytes(tmp / L"file", "abc");
  EXPECT_FALSE(MakeDir(tmp / L"file"));

  ::chmod(NativePath(tmp / L"file").c_str(), 0640);
  EXPECT_TRUE(CopyFile(tmp / L"file", tmp / L"copy", true));
  EXPECT_EQ(ReadFileBytes(tmp / L"copy"), "abc");
  struct stat st;
  ASSERT_EQ(::stat(NativePath(tmp / L"copy").c_str(), &st), 0);
  EXPECT_EQ(st.st_mode & 0777, 0640u);
  WriteFileBytes(tmp / L"other", "longer content");
  // from, failing if the target exists, result, the target's content afterwards
  for (const auto& [from, failIfExists, ok, content] :
       {std::tuple{L"other", true, false, "abc"}, {L"other", false, true, "longer content"},
        {L"copy", false, false, "longer content"}}) {  // onto itself: untouched
    EXPECT_EQ(CopyFile(tmp / from, tmp / L"copy", failIfExists), ok) << from << failIfExists;
    EXPECT_EQ(ReadFileBytes(tmp / L"copy"), content) << from << failIfExists;
  }

  // Status 0: something is there (a dangling link too); 2: nothing; 3: no such folder.
  Symlink(tmp / L"missing", tmp / L"dangling");
  for (const auto& [name, status, exists, folder] :
       {std::tuple{L"file", 0, true, false}, {L"x", 0, true, true}, {L"dangling", 0, false, false},
        {L"missing", 2, false, false}, {L"file/child", 3, false, false}}) {
    EXPECT_EQ(std::tuple(PathStatus(tmp / name), FileExists(tmp / name), IsDirectory(tmp / name)),
              std::tuple(status, exists, folder)) << name;
  }

  EXPECT_FALSE(DeleteFile(tmp / L"x"));  // folders are not files
  EXPECT_TRUE(DeleteFileRetry(tmp / L"other"));
  EXPECT_TRUE(DeleteFileRetry(tmp / L"other"));  // missing counts as gone
}

TEST(ClearTargetFile, ReadOnlyAndMissingTargetsAndSetFileNormal) {
  TempDir tmp;
  const CString target = tmp / L"out.gpx";
  WriteFileBytes(target, "old export");
  ASSERT_EQ(::chmod(NativePath(target).c_str(), 0444), 0);
  ClearTargetFile(target);
  EXPECT_EQ(PathStatus(target), 2);

  ClearTargetFile(tmp.path() + L"/");
  EXPECT_TRUE(IsDirectory(tmp.path()));  // no file-name part: the folder stays

  // A folder in the place of the file cannot be deleted: three attempts, two pauses.
  ASSERT_TRUE(MakeDir(tmp / L"dir.gpx"));
  const auto before = std::chrono::steady_clock::now();
  ClearTargetFile(tmp / L"dir.gpx");
  EXPECT_GE(std::chrono::steady_clock::now() - before, std::chrono::milliseconds(100));
  EXPECT_TRUE(IsDirectory(tmp / L"dir.gpx"));

  // Making a file writable adds the owner's write bit and nothing else.
  WriteFileBytes(target, "");
  ASSERT_EQ(::chmod(NativePath(target).c_str(), 0440), 0);
  EXPECT_TRUE(SetFileNormal(target));
  struct stat st;
  ASSERT_EQ(::stat(NativePath(target).c_str(), &st), 0);
  EXPECT_EQ(st.st_mode & 0777, 0640u);
  EXPECT_FALSE(SetFileNormal(tmp / L"missing"));
}

TEST(Paths, TextHelpers) {
  struct Case {
    const wchar_t* path;
    const wchar_t* folder;
    const wchar_t* name;
    const wchar_t* title;
    const wchar_t* ext;
  } cases[] = {
      {L"c.txt", L"", L"c.txt", L"c", L"txt"},
      {L"/c.tar.gz", L"/", L"c.tar.gz", L"c.tar", L"gz"},
      {L"a.d/noext", L"a.d", L"noext", L"noext", L""},
      {L"a/.hidden", L"a", L".hidden", L"", L"hidden"},
      {L"a/b/", L"a/b", L"", L"", L""},
  };
  for (const Case& c : cases) {
    EXPECT_EQ(PathFolder(c.path), c.folder) << c.path;
    EXPECT_EQ(PathFileName(c.path), c.name) << c.path;
    EXPECT_EQ(PathFileTitle(c.path), c.title) << c.path;
    EXPECT_EQ(PathExtension(c.path), c.ext) << c.path;
  }
  for (const auto& [a, b, joined] :
       {std::tuple{L"a", L"b", L"a/b"}, {L"a/", L"/b", L"a/b"}, {L"", L"b", L"b"}})
    EXPECT_EQ(PathJoin(a, b), joined) << a << " + " << b;
}

TEST(Paths, IsPlainPathComponent) {
  struct Case {
    const wchar_t* name;
    bool plain;
  } cases[] = {
      {L"trip_1234", true}, {L"1234.BIN", true}, {L"..hidden", true}, {L"...", true},
      {L"a b", true},       {L"é", true},        {L"a\\b", true},      {L"", false},
      {L".", false},        {L"..", false},      {L"a/b", false},      {L"/", false},
      {L"../x", false},     {L"x/", false},      {nullptr, false},
  };
  for (const Case& c : cases)
    EXPECT_EQ(IsPlainPathComponent(c.name), c.plain) << (c.name ? c.name : L"(null)");
}

}  // namespace
