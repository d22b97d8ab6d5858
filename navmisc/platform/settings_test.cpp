#include "navmisc/platform/settings.h"

#include <sys/stat.h>

#include <algorithm>
#include <cfloat>
#include <climits>
#include <cmath>
#include <filesystem>
#include <string>
#include <tuple>
#include <vector>

#include <gtest/gtest.h>

#include "navmisc/platform/atomic_file.h"
#include "navmisc/platform/file_transaction.h"
#include "navmisc/platform/files.h"
#include "testutil.h"

namespace {

using navmisc::testutil::LocaleScope;
using navmisc::testutil::ReadFileBytes;
using navmisc::testutil::TempDir;
using navmisc::testutil::WriteFileBytes;

// Names of the entries in a folder, hidden ones included (temporary files start with a dot).
std::vector<std::string> FolderEntries(const CString& folder) {
  std::vector<std::string> names;
  for (const auto& e : std::filesystem::directory_iterator(navmisc::NativePath(folder))) {
    names.push_back(e.path().filename().string());
  }
  return names;
}

// The permission bits of a file, -1 when it cannot be examined.
int Mode(const CString& path) {
  struct stat st;
  if (stat(navmisc::NativePath(path).c_str(), &st) != 0) return -1;
  return static_cast<int>(st.st_mode & 0777);
}

// Opens `bytes` written to a file for reading.
unsigned long ReadBytes(const TempDir& dir, const std::string& bytes) {
  const CString path = dir / L"in.ini";
  WriteFileBytes(path, bytes);
  return RD_BEGIN(path);
}

TEST(SettingsTest, EveryStringShapeRoundTrips) {
  struct Case {
    std::wstring value;
    const char* written;  // the text after "k=" in the file, when it matters
  };
  const std::vector<Case> cases = {
      {L"", ""},
      {L"plain text", "plain text"},
      {L"a=b;c#d[e]", "a=b;c#d[e]"},
      {L";starts like a comment", ";starts like a comment"},
      {L"quote \"inside\" and at end\"", "quote \"inside\" and at end\""},
      {L"\"leading quote", R"("\"leading quote")"},
      {L" leading blank", R"(" leading blank")"},
      {L"trailing blank ", R"("trailing blank ")"},
      {L"\ttab at start", R"("\ttab at start")"},
      {L"cr\rlf\r\n", R"("cr\rlf\r\n")"},
      {L"back\\slash\\", R"("back\\slash\\")"},
      {L"\\n is not a newline", R"("\\n is not a newline")"},
      {L"bell\x07 del\x7F esc\x1B", R"("bell\x07 del\x7F esc\x1B")"},
      {L"Grüße, Zürich – 東京", "Grüße, Zürich – 東京"},
      {L"beyond the BMP: \U0001F6B4\U00010348", "beyond the BMP: \U0001F6B4\U00010348"},
      {L"\"", R"("\"")"},
  };
  TempDir dir;
  const CString path = dir / L"shapes.ini";
  const unsigned long w = WR_BEGIN(path);
  ASSERT_NE(w, 0u);
  for (size_t i = 0; i < cases.size(); ++i) {
    WR_STRING(w, L"S", FormatString(L"k%d", static_cast<int>(i)), cases[i].value.c_str());
  }
  ASSERT_EQ(WR_END(w), 1);

  const std::string file = ReadFileBytes(path);
  for (size_t i = 0; i < cases.size(); ++i) {
    const std::string line = "\nk" + std::to_string(i) + "=" + cases[i].written + "\n";
    EXPECT_NE(file.find(line), std::string::npos) << "value " << i << " not written as " << line;
  }

  const unsigned long r = RD_BEGIN(path);
  ASSERT_NE(r, 0u);
  for (size_t i = 0; i < cases.size(); ++i) {
    const CString key = FormatString(L"k%d", static_cast<int>(i));
    EXPECT_EQ(RD_STRING(r, L"S", key, L"<default>").str(), cases[i].value) << "value " << i;
  }
  RD_END(r);
}

TEST(SettingsTest, NamesMatchWithoutCaseAndRewritesReplaceInPlace) {
  TempDir dir;
  const CString path = dir / L"case.ini";
  const unsigned long w = WR_BEGIN(path);
  WR_STRING(w, L"Trip", L"Title", L"first");
  WR_INT(w, L"Other", L"n", 1);
  WR_STRING(w, L"TRIP", L"dimension_h0", L"480");
  WR_STRING(w, L"trip", L"TITLE", L"second");  // same key: replaces, keeps its place
  WR_STRING(w, L"Straße", L"Ä", L"umlaut");
  ASSERT_EQ(WR_END(w), 1);
  EXPECT_EQ(ReadFileBytes(path),
            "[Trip]\nTitle=second\ndimension_h0=480\n\n[Other]\nn=1\n\n[Straße]\nÄ=umlaut\n");

  const unsigned long r = RD_BEGIN(path);
  EXPECT_EQ(RD_STRING(r, L"tRiP", L"title"), L"second");
  EXPECT_EQ(RD_INT(r, L"trip", L"DIMENSION_H0", 0), 480);
  EXPECT_EQ(RD_INT(r, L"OTHER", L"N", 0), 1);
  // Only ASCII letters fold; other letters match exactly as written.
  EXPECT_EQ(RD_STRING(r, L"STRAßE", L"Ä"), L"umlaut");
  EXPECT_FALSE(RD_EXISTS(r, L"Straße", L"ä"));
  EXPECT_FALSE(RD_EXISTS(r, L"Trip", L"n"));
  RD_END(r);

  // Sections in the order they first appear, each once whatever its spelling later.
  TempDir other;
  const unsigned long s = ReadBytes(other, "k=top\n[File.1]\na=1\n[B]\n[file.1]\nb=2\n[File.0]\n");
  CStringList sections;
  EXPECT_EQ(RD_SECTIONS(s, sections), 3);
  std::vector<std::wstring> names;
  for (POSITION pos = sections.GetHeadPosition(); pos;) names.push_back(sections.GetNext(pos).str());
  EXPECT_EQ(names, (std::vector<std::wstring>{L"File.1", L"B", L"File.0"}));
  RD_END(s);
  EXPECT_EQ(RD_SECTIONS(s, sections), 0) << "an ended handle";
}

TEST(SettingsTest, NumbersRoundTripExactlyAndBadTextGivesDefault) {
  // Whatever the process locale: a comma-decimal one must change neither the file nor parsing.
  const LocaleScope comma("de_DE.UTF-8");
  const std::vector<double> doubles = {0.1,     -0.0,      DBL_MAX,  DBL_TRUE_MIN, 1.0 / 3,
                                       -2.5e+20, INFINITY, -INFINITY};
  const std::vector<int> ints = {0, -1, 42, INT_MAX, INT_MIN};
  TempDir dir;
  const CString path = dir / L"num.ini";
  const unsigned long w = WR_BEGIN(path);
  for (size_t i = 0; i < doubles.size(); ++i) WR_FLOAT(w, L"F", FormatString(L"d%d", int(i)), doubles[i]);
  for (size_t i = 0; i < ints.size(); ++i) WR_INT(w, L"I", FormatString(L"i%d", int(i)), ints[i]);
  WR_FLOAT(w, L"F", L"nan", NAN);
  ASSERT_EQ(WR_END(w), 1);
  EXPECT_NE(ReadFileBytes(path).find("\nd0=0.1\n"), std::string::npos);

  const unsigned long r = RD_BEGIN(path);
  for (size_t i = 0; i < doubles.size(); ++i) {
    const double got = RD_FLOAT(r, L"F", FormatString(L"d%d", int(i)), 7);
    EXPECT_EQ(got, doubles[i]) << i;
    EXPECT_EQ(std::signbit(got), std::signbit(doubles[i])) << i;
  }
  for (size_t i = 0; i < ints.size(); ++i) EXPECT_EQ(RD_INT(r, L"I", FormatString(L"i%d", int(i)), 7), ints[i]);
  EXPECT_TRUE(std::isnan(RD_FLOAT(r, L"F", L"nan", 7)));
  RD_END(r);

  struct Parse {
    const char* text;
    int as_int;  // -7 = the default
    double as_float;
  };
  const std::vector<Parse> parses = {
      {"+7", 7, 7},          {"-0", 0, -0.0},     {"\"12\"", 12, 12},   {"12abc", -7, -7},
      {"1.5", -7, 1.5},      {"1,5", -7, -7},     {"", -7, -7},         {"0x10", -7, -7},
      {"2147483648", -7, 2147483648.0},           {"1e999", -7, -7},    {"\" 12\"", -7, -7},
      {"1e3", -7, 1000},
  };
  std::string file = "[P]\n";
  for (size_t i = 0; i < parses.size(); ++i) file += "v" + std::to_string(i) + "=" + parses[i].text + "\n";
  const unsigned long p = ReadBytes(dir, file);
  for (size_t i = 0; i < parses.size(); ++i) {
    const CString key = FormatString(L"v%d", int(i));
    EXPECT_EQ(RD_INT(p, L"P", key, -7), parses[i].as_int) << parses[i].text;
    EXPECT_EQ(RD_FLOAT(p, L"P", key, -7), parses[i].as_float) << parses[i].text;
  }
  RD_END(p);
  if (!comma.ok()) GTEST_SKIP() << "de_DE.UTF-8 is not installed; checked in the C locale only";
}

TEST(SettingsTest, HandWrittenFilesReadAsDocumented) {
  const std::string file =
      "\xEF\xBB\xBF"
      "top=before any header\r\n"
      "; comment=not a key\r\n"
      "[ Trip ]\r\n"
      "  title =  Morning run  \r\n"
      "title=second occurrence is ignored\r\n"
      "no equals sign here\r\n"
      "=no key\r\n"
      "quoted=\"a\\tb\\x41\\q\" trailing text ignored\r\n"
      "open=\"unterminated \\n stays raw\r\n"
      "empty=\r\n"
      "eq=a=b\r\n"
      "[Other]\n"
      "k=other\n"
      "[TRIP]\n"
      "merged=yes\n"
      "title=later section, still a duplicate\n"
      "[broken\n"
      "lost=1\n"
      "[]\n"
      "nameless=ok\n";
  struct Expect {
    const wchar_t* section;
    const wchar_t* key;
    const wchar_t* value;  // null = absent
  };
  const std::vector<Expect> expects = {
      {L"", L"top", L"before any header"},
      {L"", L"comment", nullptr},
      {L"Trip", L"title", L"Morning run"},
      {L"Trip", L"no equals sign here", nullptr},
      {L"Trip", L"quoted", L"a\tbA\\q"},
      {L"Trip", L"open", L"\"unterminated \\n stays raw"},
      {L"Trip", L"empty", L""},
      {L"Trip", L"eq", L"a=b"},
      {L"Trip", L"merged", L"yes"},
      {L"other", L"k", L"other"},
      {L"Trip", L"lost", nullptr},
      {L"", L"nameless", L"ok"},
  };
  TempDir dir;
  const unsigned long r = ReadBytes(dir, file);
  ASSERT_NE(r, 0u);
  for (const auto& e : expects) {
    EXPECT_EQ(RD_EXISTS(r, e.section, e.key), e.value != nullptr) << e.key;
    if (e.value) {
      EXPECT_EQ(RD_STRING(r, e.section, e.key, L"<default>"), e.value) << e.key;
    }
  }
  RD_END(r);
}

TEST(SettingsTest, DamagedFilesReadWhatTheyCan) {
  TempDir dir;
  {  // NUL bytes, control characters and invalid UTF-8
    const char raw[] = "[S]\nnul=a\0b\nk\0x=1\n\xFF\xFE=2\nbad=\xC3(\xFF\nz=\"\\x00\"\n";
    const unsigned long r = ReadBytes(dir, std::string(raw, sizeof raw - 1));
    EXPECT_EQ(RD_STRING(r, L"S", L"nul").str(), L"a");
    EXPECT_EQ(RD_STRING(r, L"S", L"bad"), L"\xFFFD(\xFFFD");
    EXPECT_EQ(RD_STRING(r, L"S", L"z").str(), L"");
    EXPECT_TRUE(RD_EXISTS(r, L"S", L"z"));
    EXPECT_EQ(RD_INT(r, L"S", L"\xFFFD\xFFFD", 0), 2);
    RD_END(r);
  }
  {  // UTF-16 with or without a byte-order mark, both byte orders, a pair beyond the BMP included
    const std::u16string text = u"[S]\r\nk=Grüße \U0001F6B4\r\n";
    std::string le, be;
    for (char16_t u : text) {
      le += {static_cast<char>(u & 0xFF), static_cast<char>(u >> 8)};
      be += {static_cast<char>(u >> 8), static_cast<char>(u & 0xFF)};
    }
    for (const std::string& bytes : {"\xFF\xFE" + le, "\xFE\xFF" + be, le, be}) {
      const unsigned long r = ReadBytes(dir, bytes);
      EXPECT_EQ(RD_STRING(r, L"s", L"K"), L"Grüße \U0001F6B4");
      RD_END(r);
    }
  }
  {  // A 100 MB line costs neither unbounded memory nor the lines after it; values over 1 MiB
     // are dropped, values of exactly 1 MiB kept.
    std::string big = "[S]\nhuge=" + std::string(100 << 20, 'x') + "\nafter=1\n";
    big += "max=" + std::string(1 << 20, 'y') + "\nover=" + std::string((1 << 20) + 1, 'z') + "\n";
    const unsigned long r = ReadBytes(dir, big);
    EXPECT_FALSE(RD_EXISTS(r, L"S", L"huge"));
    EXPECT_EQ(RD_INT(r, L"S", L"after", 0), 1);
    EXPECT_EQ(RD_STRING(r, L"S", L"max").GetLength(), 1 << 20);
    EXPECT_FALSE(RD_EXISTS(r, L"S", L"over"));
    RD_END(r);
  }
  EXPECT_EQ(RD_BEGIN(dir.path()), 0u) << "a folder is not a settings file";
}

// Lists are found by the sections and keys present, never by walking a count.
TEST(SettingsTest, ListIndicesAreTheEntriesPresentBelowTheCount) {
  TempDir dir;
  const unsigned long r = ReadBytes(dir,
                                    "[SECTION_RN(0)]\n[section_rn(2)]\nk=1\n[SECTION_RN(02)]\n"
                                    "[SECTION_RN(10)]\n[SECTION_RN(2147483648)]\n[SECTION_RN(-1)]\n"
                                    "[SECTION_RN(3)x]\n[SECTION_0]\n[SECTION_0_4]\n[SECTION_1]\n"
                                    "[SECTION_0_4_7]\n[S]\nitem_(5)_id=a\nITEM_(1)_ID=b\nitem_(1)=c\n");
  using navmisc::KeyIndices;
  using navmisc::SectionIndices;
  EXPECT_EQ(SectionIndices(r, L"SECTION_RN(%d)", 2147483647), (std::vector<int>{0, 2, 10}));
  EXPECT_EQ(SectionIndices(r, L"%s_RN(%d)", L"SECTION", 10), (std::vector<int>{0, 2}));
  EXPECT_EQ(SectionIndices(r, L"%s_%d", L"SECTION", 5), (std::vector<int>{0, 1}));
  EXPECT_EQ(SectionIndices(r, L"%s_%d", L"SECTION_0", 5), (std::vector<int>{4}));
  EXPECT_EQ(SectionIndices(r, L"%s_%d", L"section_0_4", 8), (std::vector<int>{7}));
  EXPECT_EQ(KeyIndices(r, L"s", L"item_(%d)_id", 100), (std::vector<int>{1, 5}));
  EXPECT_EQ(KeyIndices(r, L"S", L"item_(%d)", 100), (std::vector<int>{1}));
  for (int count : {0, -5}) EXPECT_TRUE(SectionIndices(r, L"SECTION_RN(%d)", count).empty());
  EXPECT_TRUE(SectionIndices(r, L"SECTION_RN", 100).empty()) << "no number in the pattern";
  RD_END(r);
  EXPECT_TRUE(SectionIndices(r, L"SECTION_RN(%d)", 100).empty()) << "an ended handle";
}

// Documents in memory (what the fuzz targets use) read and write exactly as files do.
TEST(SettingsTest, MemoryDocumentsMatchFiles) {
  TempDir dir;
  for (const std::string& bytes : {std::string("[S]\nk=1\nK=2\n[t]\nv=\" x\"\n"), std::string("\xEF\xBB\xBF[S]\r\nk=\xC3(\r\n"),
                                  std::string("[\0S\0]\0\n\0k\0=\0\xE9\0", 14), std::string()}) {
    const unsigned long file = ReadBytes(dir, bytes), memory = navmisc::ReadSettingsFromMemory(bytes);
    auto sorted = [](std::vector<navmisc::SettingsEntry> v) {
      std::sort(v.begin(), v.end(), [](const auto& a, const auto& b) {
        return std::tie(a.section, a.key) < std::tie(b.section, b.key);
      });
      return v;
    };
    const auto entries = sorted(navmisc::SettingsEntries(file));
    EXPECT_EQ(entries, sorted(navmisc::SettingsEntries(memory)));
    EXPECT_EQ(entries.empty(), bytes.empty());
    for (const auto& e : entries) EXPECT_EQ(RD_STRING(memory, e.section, e.key), e.value);
    RD_END(file);
    RD_END(memory);
  }
  const CString path = dir / L"out.ini";
  const unsigned long toFile = WR_BEGIN(path), toMemory = WR_BEGIN(L"unused");
  for (unsigned long w : {toFile, toMemory}) {
    WR_STRING(w, L"S", L"text", L" padded ");
    WR_FLOAT(w, L"S", L"x", 0.1);
  }
  std::string document;
  ASSERT_EQ(WR_END(toFile), 1);
  ASSERT_TRUE(navmisc::EndSettingsToMemory(toMemory, document));
  EXPECT_EQ(ReadFileBytes(path), document);
  EXPECT_FALSE(navmisc::EndSettingsToMemory(toMemory, document)) << "the handle is gone";
}

TEST(SettingsTest, FailedOrUnfinishedWritesLeaveTheOldFile) {
  TempDir dir;
  const CString path = dir / L"keep.ini";
  const std::string old = "[S]\nk=old\n";
  WriteFileBytes(path, old);
  auto write_new = [&] {
    const unsigned long w = WR_BEGIN(path);
    WR_STRING(w, L"S", L"k", L"a new value that is longer than the old one");
    WR_INT(w, L"S", L"n", 5);
    return WR_END(w);
  };
  // The new document has 54 bytes: fail at its first, second, middle and last byte.
  for (long long budget : {0LL, 1LL, 20LL, 53LL}) {
    navmisc::testing::FailAtomicWritesAfter(budget);
    const int result = write_new();
    navmisc::testing::FailAtomicWritesAfter(-1);
    EXPECT_EQ(result, 0) << budget;
    EXPECT_EQ(ReadFileBytes(path), old) << budget;
    EXPECT_EQ(FolderEntries(dir.path()), std::vector<std::string>{"keep.ini"}) << budget;
  }

  const unsigned long unended = WR_BEGIN(path);
  WR_STRING(unended, L"S", L"k", L"never written");
  EXPECT_EQ(ReadFileBytes(path), old);
  EXPECT_EQ(WR_END(WR_BEGIN(dir / L"no/such/folder.ini")), 0);

  ASSERT_EQ(write_new(), 1);
  const unsigned long r = RD_BEGIN(path);
  EXPECT_EQ(RD_INT(r, L"S", L"n", 0), 5);
  RD_END(r);
  EXPECT_EQ(WR_END(unended), 1);  // still usable, and now it replaces the file
}

TEST(SettingsTest, EndedHandlesAndInvalidNamesDoNothing) {
  TempDir dir;
  const CString path = dir / L"h.ini";
  WriteFileBytes(path, "[S]\nk=1\n");
  const unsigned long r1 = RD_BEGIN(path), r2 = RD_BEGIN(path);
  ASSERT_NE(r1, 0u);
  RD_END(r1);
  EXPECT_EQ(RD_INT(r1, L"S", L"k", -3), -3);
  EXPECT_FALSE(RD_EXISTS(r1, L"S", L"k"));
  EXPECT_EQ(RD_INT(r2, L"S", L"k", -3), 1);  // the other reader is unaffected
  RD_END(r2);

  // Names that a file cannot carry are refused rather than written broken.
  const unsigned long w = WR_BEGIN(path);
  for (const wchar_t* key : {L"a=b", L"", L"; c", L"line\nbreak"}) WR_INT(w, L"S", key, 1);
  WR_INT(w, L"S ", L"k", 1);
  WR_INT(w, L"S", L"ok", 1);
  ASSERT_EQ(WR_END(w), 1);
  EXPECT_EQ(WR_END(w), 0);
  EXPECT_EQ(ReadFileBytes(path), "[S]\nok=1\n");
}

TEST(AtomicFileTest, WritesThroughLinksAndKeepsMode) {
  TempDir dir;
  const CString path = dir / L"points.txt";
  WriteFileBytes(path, "old");
  ASSERT_EQ(chmod(navmisc::NativePath(path).c_str(), 0600), 0);
  const std::string link = navmisc::NativePath(dir / L"link.txt");
  ASSERT_EQ(symlink("points.txt", link.c_str()), 0);

  // A write larger than the buffer goes out between buffered ones, in order.
  const std::string block(600 * 1024, 'b');
  {
    navmisc::AtomicFile f;
    ASSERT_TRUE(f.Open(CString::FromUtf8(link)));
    ASSERT_TRUE(f.Write("head\n") && f.Write(block) && f.Write("tail\n"));
    EXPECT_EQ(ReadFileBytes(path), "old");
    ASSERT_TRUE(f.Commit());
    EXPECT_FALSE(f.Write("late"));
  }
  EXPECT_TRUE(ReadFileBytes(path) == "head\n" + block + "tail\n");
  struct stat st;
  ASSERT_EQ(lstat(link.c_str(), &st), 0);
  EXPECT_TRUE(S_ISLNK(st.st_mode));
  EXPECT_EQ(Mode(path), 0600);

  navmisc::AtomicFile fresh;
  ASSERT_TRUE(fresh.Open(dir / L"fresh.txt") && fresh.Write("x") && fresh.Commit());
  EXPECT_EQ(Mode(dir / L"fresh.txt"), 0644);
}

TEST(AtomicFileTest, FailuresAndAbandonLeaveTargetAndNoTemporaryFile) {
  TempDir dir;
  const CString path = dir / L"t.txt";
  WriteFileBytes(path, "old");
  {
    navmisc::AtomicFile f;  // destroyed without Commit
    ASSERT_TRUE(f.Open(path));
    ASSERT_TRUE(f.Write(std::string(1 << 20, 'a')));
  }
  {  // a full disk in the middle of a large file: the failure sticks and Commit refuses
    navmisc::testing::FailAtomicWritesAfter(300 * 1024);
    navmisc::AtomicFile f;
    ASSERT_TRUE(f.Open(path));
    bool all_ok = true;
    for (int i = 0; i < 1000; ++i) all_ok = f.Write(std::string(1024, 'c')) && all_ok;
    navmisc::testing::FailAtomicWritesAfter(-1);
    EXPECT_FALSE(all_ok);
    EXPECT_FALSE(f.Write("more"));
    EXPECT_FALSE(f.Commit());
  }
  EXPECT_EQ(ReadFileBytes(path), "old");
  EXPECT_EQ(FolderEntries(dir.path()), std::vector<std::string>{"t.txt"});
  navmisc::AtomicFile f;
  EXPECT_FALSE(f.Open(dir / L"missing/t.txt"));
  EXPECT_FALSE(f.Open(L""));
}

TEST(AtomicFileTest, TransactionsPutFilesInPlaceTogetherOnCommit) {
  TempDir dir;
  auto write = [&](const wchar_t* name, const std::string& text) {
    navmisc::AtomicFile f;
    return f.Open(dir / name) && f.Write(text) && f.Commit();
  };
  {
    navmisc::FileTransaction outer;
    ASSERT_TRUE(write(L"a", "first"));
    {
      navmisc::FileTransaction inner;  // joins the outer one
      ASSERT_TRUE(write(L"b", "b"));
      ASSERT_TRUE(write(L"a", "second"));  // the same target again: the later text wins
      EXPECT_TRUE(inner.Commit());
    }
    EXPECT_FALSE(FileExists(dir / L"a")) << "nothing is in place before the outer Commit";
    ASSERT_TRUE(outer.Commit());
  }
  EXPECT_EQ(ReadFileBytes(dir / L"a"), "second");
  EXPECT_EQ(ReadFileBytes(dir / L"b"), "b");
  EXPECT_EQ(FolderEntries(dir.path()).size(), 2u) << "no temporary file is left";

  {  // a file given up half-way fails the whole transaction
    navmisc::FileTransaction tx;
    ASSERT_TRUE(write(L"a", "third"));
    navmisc::AtomicFile unfinished;
    ASSERT_TRUE(unfinished.Open(dir / L"b"));
    unfinished.Abandon();
    EXPECT_FALSE(tx.Commit());
    EXPECT_NE(tx.error().find("gave up writing"), std::string::npos) << tx.error();
  }
  {  // without Commit nothing happens
    navmisc::FileTransaction tx;
    ASSERT_TRUE(write(L"a", "fourth"));
  }
  EXPECT_EQ(ReadFileBytes(dir / L"a"), "second");
  EXPECT_EQ(FolderEntries(dir.path()).size(), 2u);
}

}  // namespace
