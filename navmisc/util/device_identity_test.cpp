#include "navmisc/util/device_identity.h"

#include <gtest/gtest.h>

#include "navmisc/datactrl/device_state.h"
#include "testutil.h"

namespace {

TEST(DeviceIdentity, ModelDisplayNamesFollowTheModelCodeAndTheKV7Firmware) {
  const struct {
    uint16_t model;
    double version;
    const wchar_t* name;
  } cases[] = {
      {1, 0, L"KV-1"},    {2, 0, L"KV-3"},     {3, 0, L"KV-6"},      {4, 0, L"KV-5"},
      {8, 7.01, L"KV-7"}, {8, 7.02, L"KV-7P"}, {8, 9.0, L"KV-7P"},   {9, 7.01, L"KV-9"},
      {11, 0, L"KV-2"},   {12, 0, L"KV-3e"},   {18, 0, L"KV-11"},    {20, 0, L"KV-9P"},
      {21, 0, L"KV-8"},   {22, 0, L"KV-8P"},   {5, 0, L""},          {0, 0, L""},
      {0xFFFF, 0, L""},
  };
  for (const auto& c : cases) {
    g_wDeviceModelID = c.model;
    g_dDeviceVersion = c.version;
    EXPECT_EQ(GetCurrentModelDspName(), CString(c.name)) << c.model << " " << c.version;
  }
  g_wDeviceModelID = 0;
  g_dDeviceVersion = 0;
}

TEST(DeviceIdentity, ReportedIdentitiesBecomeSerialTexts) {
  const struct {
    const wchar_t* reported;
    const wchar_t* shown;
  } cases[] = {
      // The number is read from four characters after "SN:", skipping the logger's blank.
      {L"M:0001-SN: 123", L"SN:0100000123"},
      {L"M:0011-SN:4567", L"SN:1100000567"},
      {L"M:0018-IMEI:356789", L"SN:18356789"},
      // Without a known prefix only the case changes; prefixes match case and all.
      {L"abc-Def 12", L"ABC-DEF 12"},
      {L"m:0001-sn: 5", L"M:0001-SN: 5"},
      // A prefix without a marker is only taken out.
      {L"M:0003-hello", L"HELLO"},
      // Every occurrence goes; the modem identity replaces the whole text.
      {L"x M:0002-M:0002-IMEI:12ab", L"SN:0212AB"},
      // Prefixes are tried in their order (0001 before 0004), and a serial ends the search.
      {L"M:0004-SN: 7 M:0001-", L"SN:0100000007"},
      // After a modem identity the search goes on, over the rewritten text.
      {L"M:0002-IMEI:1M:0018-", L"SN:1800000021"},
      {L"", L""},
  };
  for (const auto& c : cases) {
    CString text = c.reported;
    ChangeModelDspName(text);
    EXPECT_EQ(text, CString(c.shown)) << testing::PrintToString(CString(c.reported));
  }
}

}  // namespace
