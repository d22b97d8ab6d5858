#include "navmisc/util/xml_text.h"

#include <gtest/gtest.h>

#include "testutil.h"

namespace {

TEST(XmlText, EscapesDropsWhatXmlCannotHoldAndNeverCutsAnEntity) {
  const struct {
    std::wstring in;
    size_t maxBytes;
    std::wstring out;
  } cases[] = {
      {L"Fish & <chips> \"here\" 'n' more", 100, L"Fish &amp; &lt;chips&gt; &quot;here&quot; 'n' more"},
      {L"line\r\nnext\rlone\nlf\ttab", 100, L"line&#13;next\rlone\nlf\ttab"},
      {L"bell\x07 nul\x01 \xFFFE\xFFFF ok", 100, L"bell nul  ok"},
      {std::wstring(L"a\xD800" L"b"), 100, L"ab"},
      {L"abc&def", 7, L"abc"},        // "&amp;" would end at byte 8
      {L"abc&def", 8, L"abc&amp;"},
      {L"\u00fc\u00fc", 3, L"\u00fc"},  // two bytes each
      {L"\U0001F600x", 4, L"\U0001F600"},
      {L"", 10, L""},
  };
  for (const auto& c : cases) {
    EXPECT_EQ(navmisc::XmlText(CString(c.in), c.maxBytes).str(), c.out) << CString(c.in).ToUtf8();
  }
  EXPECT_EQ(navmisc::XmlCharacters(CString(L"a&b\x01<c>\xFFFF")).str(), L"a&b<c>");
}

}  // namespace
