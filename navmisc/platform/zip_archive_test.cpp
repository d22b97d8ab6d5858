#include "navmisc/platform/zip_archive.h"

#include <string>

#include <gtest/gtest.h>

#include "navmisc/platform/files.h"
#include "testutil.h"

namespace {

using navmisc::ZipArchiveWriter;
using navmisc::testutil::HaveProgram;
using navmisc::testutil::ReadFileBytes;
using navmisc::testutil::RunCommand;
using navmisc::testutil::ShellQuote;
using navmisc::testutil::TempDir;
using navmisc::testutil::WriteFileBytes;

TEST(ZipArchiveWriter, AddsFilesInOrderUnderTheirNames) {
  TempDir dir;
  WriteFileBytes(dir / L"b.jpg", std::string(10000, 'b'));
  WriteFileBytes(dir / L"doc.kml", "<kml/>");
  WriteFileBytes(dir / L"out.kmz", "an older file");
  ZipArchiveWriter zip;
  ASSERT_TRUE(zip.Create(dir / L"out.kmz"));
  EXPECT_TRUE(zip.AddFile(dir / L"b.jpg", L"1.jpg"));
  EXPECT_TRUE(zip.AddFile(dir / L"doc.kml", L"Z\u00fcrich.kml"));

  // Additions that fail leave the archive as it was.
  ASSERT_TRUE(MakeDir(dir / L"folder"));
  const struct {
    CString file;
    const wchar_t* name;
  } bad[] = {{dir / L"missing.jpg", L"2.jpg"},
             {dir / L"folder", L"3.jpg"},
             {dir / L"b.jpg", L""},
             {dir / L"b.jpg", L"1.jpg"},  // taken
             {dir / L"b.jpg", L"bad\xD800"}};
  for (const auto& c : bad) {
    EXPECT_FALSE(zip.AddFile(c.file, c.name)) << c.file.ToUtf8();
    EXPECT_FALSE(zip.error().empty());
  }
  EXPECT_EQ(ReadFileBytes(dir / L"out.kmz"), "an older file") << "nothing is written before Close";
  ASSERT_TRUE(zip.Close());
  EXPECT_FALSE(zip.AddFile(dir / L"b.jpg", L"late.jpg"));

  const std::string archive = ReadFileBytes(dir / L"out.kmz");
  ASSERT_EQ(archive.substr(0, 4), "PK\x03\x04");
  EXPECT_LT(archive.size(), 2000u) << "the entries are compressed";
  if (!HaveProgram("unzip")) GTEST_SKIP() << "unzip is not installed (scripts/setup.sh installs it)";
  const std::string kmz = ShellQuote((dir / L"out.kmz").ToUtf8());
  EXPECT_EQ(RunCommand("unzip -Z1 " + kmz).out, "1.jpg\nZ\xC3\xBCrich.kml\n");
  EXPECT_EQ(RunCommand("unzip -p " + kmz + " 1.jpg").out, std::string(10000, 'b'));
}

TEST(ZipArchiveWriter, UnfinishedOrFailedArchivesLeaveNothing) {
  TempDir dir;
  WriteFileBytes(dir / L"a.txt", "a");
  {
    ZipArchiveWriter zip;
    ASSERT_TRUE(zip.Create(dir / L"dropped.zip"));
    ASSERT_TRUE(zip.AddFile(dir / L"a.txt", L"a.txt"));
  }
  EXPECT_FALSE(FileExists(dir / L"dropped.zip"));

  ZipArchiveWriter zip;
  ASSERT_TRUE(zip.Create(dir / L"gone.zip"));
  ASSERT_TRUE(zip.AddFile(dir / L"a.txt", L"a.txt"));
  ASSERT_TRUE(DeleteFile(dir / L"a.txt"));  // vanishes before the archive is written
  EXPECT_FALSE(zip.Close());
  EXPECT_FALSE(zip.error().empty());
  EXPECT_FALSE(FileExists(dir / L"gone.zip"));

  WriteFileBytes(dir / L"a.txt", "a");
  if (zip.Create(dir / L"missing/x.zip")) {
    ASSERT_TRUE(zip.AddFile(dir / L"a.txt", L"a.txt"));
    EXPECT_FALSE(zip.Close());
  }
  EXPECT_FALSE(FileExists(dir / L"missing"));
}

}  // namespace
