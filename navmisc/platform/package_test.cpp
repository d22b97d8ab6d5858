#include "navmisc/platform/package.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "navmisc/platform/textconv.h"

namespace {

using navmisc::PackageError;

std::string Bytes(const CPackageBlk& p) {
  return std::string(reinterpret_cast<const char*>(p.GetPackagePtr()), p.GetPackageSize());
}

std::string Value(const CUnpackageBlk& u, const char* name) {
  const uint8_t* data = nullptr;
  uint32_t size = 0;
  if (!u.GetData(name, data, size)) return "<absent>";
  return std::string(reinterpret_cast<const char*>(data), size);
}

TEST(Package, LayoutOfTheDocumentedExample) {
  // The example of docs/data-control-channel.md, byte for byte.
  CPackageBlk inner(1);
  inner.Add("n", "\x07\x00\x00\x00", 4);
  CPackageBlk p(1);
  p.Add("id", L"A\U0001F600");
  p.Add("in", inner);
  const std::string expected(
      "NPK\x01" "\x02\x00\x00\x00" "\x2F\x00\x00\x00"  // 2 entries, 47 bytes follow
      "\x02\x00" "id" "\x08\x00\x00\x00" "A\x00" "\x3D\xD8\x00\xDE" "\x00\x00"
      "\x02\x00" "in" "\x17\x00\x00\x00"
      "NPK\x01" "\x01\x00\x00\x00" "\x0B\x00\x00\x00" "\x01\x00" "n" "\x04\x00\x00\x00"
      "\x07\x00\x00\x00",
      12 + 16 + 8 + 23);
  EXPECT_EQ(Bytes(p), expected);

  CUnpackageBlk u(p.GetPackagePtr(), p.GetPackageSize());
  ASSERT_TRUE(u.IsValid());
  const uint8_t* data = nullptr;
  uint32_t size = 0;
  ASSERT_TRUE(u.GetData("id", data, size));
  EXPECT_EQ(navmisc::Utf16LeToWide(data, size), L"A\U0001F600");
  ASSERT_TRUE(u.GetData("in", data, size));
  CUnpackageBlk nested(data, size);
  EXPECT_EQ(Value(nested, "n"), std::string("\x07\x00\x00\x00", 4));
  EXPECT_EQ(Value(u, "n"), "<absent>");  // names do not leak out of a nested package
  EXPECT_EQ(Value(u, "i"), "<absent>");
  ASSERT_EQ(u.Entries().size(), 2u);
  EXPECT_EQ(u.Entries()[1].name, "in");
}

TEST(Package, EveryValueShapeReadsBack) {
  const std::string big(100000, 'x');
  CPackageBlk p;
  p.Add("empty", "", 0);
  p.Add("null text", nullptr);
  p.Add("big", big.data(), big.size());
  p.Add(std::string(255, 'n').c_str(), "ok", 2);
  p.Add("", "dropped", 7);                           // no name: cannot be framed
  p.Add(std::string(256, 'n').c_str(), "dropped", 7);
  EXPECT_EQ(p.GetCount(), 4u);
  CUnpackageBlk u(p.GetPackagePtr(), p.GetPackageSize());
  ASSERT_TRUE(u.IsValid()) << navmisc::PackageErrorText(u.error());
  EXPECT_EQ(Value(u, "empty"), "");
  EXPECT_EQ(Value(u, "null text"), std::string(2, '\0'));
  EXPECT_EQ(Value(u, "big"), big);
  EXPECT_EQ(Value(u, std::string(255, 'n').c_str()), "ok");
}

TEST(Package, MalformedPackagesAreRefusedWhole) {
  CPackageBlk p;
  p.Add("ab", "xyz", 3);
  p.Add("cd", "", 0);
  const std::string good = Bytes(p);
  auto with = [&](size_t at, std::string bytes) {
    std::string s = good;
    s.replace(at, bytes.size(), bytes);
    return s;
  };
  CPackageBlk dup;
  dup.Add("ab", "1", 1);
  dup.Add("ab", "2", 1);
  struct Case {
    const char* what;
    std::string bytes;
    PackageError expected;
  };
  const std::vector<Case> cases = {
      {"nothing", "", PackageError::kEmpty},
      {"half a header", good.substr(0, 7), PackageError::kTooShort},
      {"another framing version", with(3, "\x02"), PackageError::kBadMagic},
      {"one byte cut off", good.substr(0, good.size() - 1), PackageError::kSizeMismatch},
      {"one byte too many", good + "!", PackageError::kSizeMismatch},
      {"count too high", with(4, std::string("\x03", 1)), PackageError::kCountMismatch},
      {"count too low", with(4, std::string("\x01", 1)), PackageError::kCountMismatch},
      {"value length past the end", with(16, std::string("\x00\x01", 2)), PackageError::kTruncatedEntry},
      {"value length near 4 GiB", with(16, "\xFF\xFF\xFF\xFF"), PackageError::kTruncatedEntry},
      {"name length past the end", with(12, std::string("\xFF\x00", 2)), PackageError::kTruncatedEntry},
      {"name length over 255", with(12, std::string("\x00\x01", 2)), PackageError::kBadName},
      {"name length 0", with(12, std::string("\x00\x00", 2)), PackageError::kBadName},
      {"a zero byte in a name", with(15, std::string("\x00", 1)), PackageError::kBadName},
      {"duplicate name", Bytes(dup), PackageError::kDuplicateName},
  };
  for (const Case& c : cases) {
    CUnpackageBlk u;
    EXPECT_FALSE(u.SetData(c.bytes.data(), c.bytes.size())) << c.what;
    EXPECT_EQ(u.error(), c.expected) << c.what << ": " << navmisc::PackageErrorText(u.error());
    EXPECT_EQ(Value(u, "ab"), "<absent>") << c.what;  // nothing of a refused package is read
    EXPECT_EQ(u.GetCount(), 0u) << c.what;
  }
  // Every shorter prefix of a good package is refused; the reader never guesses.
  for (size_t n = 0; n < good.size(); ++n) {
    CUnpackageBlk u;
    EXPECT_FALSE(u.SetData(good.data(), n)) << n;
  }
  CUnpackageBlk u;
  EXPECT_TRUE(u.SetData(good.data(), good.size()));
}

TEST(Package, Utf16Texts) {
  struct Case {
    std::string bytes;
    size_t maxChars;
    std::wstring expected;
  };
  const std::vector<Case> cases = {
      {std::string("h\0i\0\0\0", 6), SIZE_MAX, L"hi"},
      {std::string("h\0i\0", 4), SIZE_MAX, L"hi"},              // no terminator: the value's end
      {std::string("h\0i\0!", 5), SIZE_MAX, L"hi"},             // odd last byte ignored
      {std::string("h\0\0\0i\0", 6), SIZE_MAX, L"h"},           // stops at the first zero
      {std::string("\x3D\xD8\x00\xDE", 4), SIZE_MAX, L"\U0001F600"},
      {std::string("\x3D\xD8" "a\0", 4), SIZE_MAX, L"\xFFFD" L"a"},  // unpaired high surrogate
      {std::string("\x00\xDE", 2), SIZE_MAX, L"\xFFFD"},        // lone low surrogate
      {std::string("a\0b\0c\0", 6), 2, L"ab"},                  // cut to the capacity
  };
  for (const Case& c : cases) {
    EXPECT_EQ(navmisc::Utf16LeToWide(reinterpret_cast<const unsigned char*>(c.bytes.data()),
                                     c.bytes.size(), c.maxChars),
              c.expected);
  }
  std::string out;
  navmisc::AppendUtf16Le(std::wstring(L"a\U0010FFFF") + wchar_t(0xD800), out);
  EXPECT_EQ(out, std::string("a\0\xFF\xDB\xFF\xDF\xFD\xFF", 8));
}

}  // namespace
