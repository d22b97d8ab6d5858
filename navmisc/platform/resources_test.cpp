#include "navmisc/platform/resources.h"

#include <gtest/gtest.h>

#include "navmisc/platform/files.h"
#include "testutil.h"

namespace {

using navmisc::testutil::ProgPathScope;
using navmisc::testutil::TempDir;
using navmisc::testutil::WriteFileBytes;

TEST(LoadResString, ReadsTextsByNumber) {
  TempDir tmp;
  WriteFileBytes(tmp / L"texts.ini",
                 "\xEF\xBB\xBF; comment\r\n[strings]\r\n9616=Trip\r\n"
                 "9684=\"Resetting erases its settings.\\nContinue?\"\r\n"
                 "42=Fahrt \xC3\xBC" "ber Stra\xC3\x9F" "e\r\n0=zero\r\n[OTHER]\r\n7=elsewhere\r\n");
  navmisc::SetResourceFile(tmp / L"texts.ini");
  struct Case {
    unsigned id;
    const wchar_t* text;
  } cases[] = {
      {9616, L"Trip"}, {9684, L"Resetting erases its settings.\nContinue?"},
      {42, L"Fahrt über Straße"}, {0, L"zero"}, {7, L""}, {1, L""},
  };
  for (const Case& c : cases) EXPECT_EQ(LoadResString(c.id), c.text) << c.id;

  // The override is read once; a new override is read anew.
  WriteFileBytes(tmp / L"texts.ini", "[STRINGS]\n9616=Changed\n");
  EXPECT_EQ(LoadResString(9616), L"Trip");
  navmisc::SetResourceFile(tmp / L"texts.ini");
  EXPECT_EQ(LoadResString(9616), L"Changed");
  navmisc::SetResourceFile(tmp / L"missing.ini");
  EXPECT_EQ(LoadResString(9616), L"");
  navmisc::SetResourceFile(L"");
}

TEST(LoadResString, LooksInTheProgramFolderThenItsShareFolder) {
  TempDir tmp;
  ASSERT_TRUE(MakeDir(tmp / L"a/bin"));
  ASSERT_TRUE(MakeDir(tmp / L"a/share/navmisc"));
  ASSERT_TRUE(MakeDir(tmp / L"b/bin"));
  WriteFileBytes(tmp / L"a/share/navmisc/navmisc-strings.ini", "[STRINGS]\n1=installed\n");
  WriteFileBytes(tmp / L"b/bin/navmisc-strings.ini", "[STRINGS]\n1=beside\n");
  navmisc::SetResourceFile(L"");
  {
    ProgPathScope prog(tmp / L"a/bin");
    EXPECT_EQ(LoadResString(1), L"installed");
    // Beside the program wins over the share folder.
    WriteFileBytes(tmp / L"a/bin/navmisc-strings.ini", "[STRINGS]\n1=first\n");
  }
  {
    ProgPathScope prog(tmp / L"b/bin");
    EXPECT_EQ(LoadResString(1), L"beside");
  }
  {
    ProgPathScope prog(tmp / L"a/bin");
    EXPECT_EQ(LoadResString(1), L"first");
  }
}

}  // namespace

namespace {

TEST(FormatResString, PutsTheArgumentInTheFirstPlaceholderOnly) {
  TempDir tmp;
  WriteFileBytes(tmp / L"texts.ini",
                 "[STRINGS]\n1=Error %d\n2=100%% of %s done\n3=%s and %s %x\n4=no place\n5=%\n");
  navmisc::SetResourceFile(tmp / L"texts.ini");
  const struct {
    unsigned id;
    const wchar_t* expected;
  } cases[] = {{1, L"Error 61"}, {2, L"100% of 61 done"}, {3, L"61 and %s %x"},
               {4, L"no place"}, {5, L"%"}, {6, L""}};
  for (const auto& c : cases) EXPECT_EQ(navmisc::FormatResString(c.id, L"61"), c.expected) << c.id;
  navmisc::SetResourceFile(L"");
}

}  // namespace
