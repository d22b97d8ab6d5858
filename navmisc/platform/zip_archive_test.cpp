// Entry order, names and content are checked through the KMZ export (export/kml_export_test.cpp);
// here the failures that export never meets.
#include "navmisc/platform/zip_archive.h"

#include <gtest/gtest.h>
#include <sys/stat.h>

#include "navmisc/platform/files.h"
#include "testutil.h"

namespace {

using navmisc::ZipArchiveWriter;
using navmisc::testutil::TempDir;
using navmisc::testutil::WriteFileBytes;

TEST(ZipArchiveWriter, RefusedAdditionsAndUnfinishedArchivesLeaveNothing) {
  TempDir dir;
  WriteFileBytes(dir / L"a.txt", "a");
  ASSERT_TRUE(MakeDir(dir / L"folder"));
  ASSERT_EQ(mkfifo(navmisc::NativePath(dir / L"pipe").c_str(), 0600), 0);  // must not block
  {
    ZipArchiveWriter zip;
    ASSERT_TRUE(zip.Create(dir / L"dropped.zip"));
    ASSERT_TRUE(zip.AddFile(dir / L"a.txt", L"a.txt"));
    for (const auto& [file, name] : {std::pair{dir / L"folder", L"f"}, {dir / L"pipe", L"p"},
                                     {dir / L"a.txt", L"a.txt"},
                                     {dir / L"a.txt", L""}, {dir / L"a.txt", L"bad\xD800"}}) {
      EXPECT_FALSE(zip.AddFile(file, name)) << file.ToUtf8();
      EXPECT_FALSE(zip.error().empty());
    }
  }  // never closed
  EXPECT_FALSE(FileExists(dir / L"dropped.zip"));

  ZipArchiveWriter zip;
  ASSERT_TRUE(zip.Create(dir / L"gone.zip"));
  ASSERT_TRUE(zip.AddFile(dir / L"a.txt", L"a.txt"));
  ASSERT_TRUE(DeleteFile(dir / L"a.txt"));  // vanishes before the archive is written
  EXPECT_FALSE(zip.Close());
  EXPECT_FALSE(zip.error().empty());
  EXPECT_FALSE(FileExists(dir / L"gone.zip"));
  EXPECT_FALSE(zip.AddFile(dir / L"folder", L"late"));
}

}  // namespace
