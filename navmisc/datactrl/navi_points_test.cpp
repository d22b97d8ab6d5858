#include "navmisc/datactrl/navi_points.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <limits>
#include <memory>
#include <vector>

#include "channel_harness.h"
#include "navmisc/datactrl/device_commands.h"
#include "navmisc/datactrl/device_errors.h"
#include "navmisc/datactrl/device_state.h"
#include "testutil.h"

namespace {

using namespace navmisc::datactrl;
using navmisc::testutil::ChannelRun;
using navmisc::testutil::MakeLogger;
using navmisc::testutil::ReadFileBytes;
using navmisc::testutil::Until;

int32_t Int32At(const uint8_t* p) {
  return static_cast<int32_t>(p[0] | p[1] << 8 | p[2] << 16 | static_cast<uint32_t>(p[3]) << 24);
}

TEST(NaviPoints, EntryBytes) {
  const struct {
    double lat, lon, alt;
    int32_t iLat, iLon, iAlt;
  } cases[] = {
      {51.12345678, 7.5, 123.9, 511234567, 75000000, 123},
      // Toward zero on both sides.
      {-33.87654329, -0.12345678, -12.9, -338765432, -1234567, -12},
      // Beyond the 32-bit range, or no number at all: saturated, never wrapped.
      {1e6, -1e6, 3e9, 2147483647, -2147483647 - 1, 2147483647},
      {std::nan(""), 0.0, std::nan(""), 0, 0, 0},
  };
  for (const auto& c : cases) {
    NAVI_POINT_INFO point;
    point.dLatitude = c.lat;
    point.dLongitude = c.lon;
    point.dAltitude = c.alt;
    point.nIcon = 7;
    point.nRadius = -50;
    point.nFlag = 0x01020304;
    point.nReserved = 9;
    std::memcpy(point.szText, "Harbour \xE2\x9A\x93", 11);
    point.szText[255] = 0xAB;
    uint8_t entry[kNaviEntryBytes];
    std::memset(entry, 0xEE, sizeof entry);
    PackNaviEntry(point, entry);
    // The tag, little-endian.
    EXPECT_EQ(std::vector<uint8_t>(entry, entry + 4), (std::vector<uint8_t>{0xB8, 0x48, 0x20, 0x02}));
    EXPECT_EQ(Int32At(entry + 4), c.iLat) << c.lat;
    EXPECT_EQ(Int32At(entry + 8), c.iLon) << c.lon;
    EXPECT_EQ(Int32At(entry + 12), c.iAlt) << c.alt;
    EXPECT_EQ(std::vector<uint8_t>(entry + 16, entry + 32),
              (std::vector<uint8_t>{7, 0, 0, 0, 0xCE, 0xFF, 0xFF, 0xFF, 4, 3, 2, 1, 9, 0, 0, 0}));
    EXPECT_EQ(std::memcmp(entry + 32, point.szText, 256), 0);
    NAVI_POINT_INFO back;
    ASSERT_TRUE(UnpackNaviEntry(entry, back));
    EXPECT_EQ(back.dLatitude, c.iLat / 1e7);
    EXPECT_EQ(std::memcmp(back.szText, point.szText, 256), 0);
  }
  const uint8_t zeros[kNaviEntryBytes] = {};
  NAVI_POINT_INFO untouched;
  untouched.nIcon = 5;
  EXPECT_FALSE(UnpackNaviEntry(zeros, untouched));
  EXPECT_EQ(untouched.nIcon, 5);
}

// The upload through the real data-control process to a logger folder of the KV-11 family.
TEST(NaviPoints, UploadKeepsTheFirstHundredInTheirPlaces) {
  ChannelRun run;
  MakeLogger(run.Path(L"logger"), 21, 99);
  run.Configure("[DEVICE]\nPath=" + run.Path(L"logger").ToUtf8() + "\n");
  run.Start();
  ASSERT_TRUE(Until([] { return g_wDeviceModelID == 21; }));

  std::vector<std::unique_ptr<NAVI_POINT_INFO>> points;
  CxPtrList list;
  for (int i = 0; i < 150; ++i) {
    auto p = std::make_unique<NAVI_POINT_INFO>();
    p->dLatitude = 50 + i * 0.001;
    p->dLongitude = 8 - i * 0.001;
    p->nIcon = i;
    list.AddTail(i == 3 || i == 40 ? nullptr : p.get());
    points.push_back(std::move(p));
  }
  DC_KVDEVICE_WriteNaviData(list);
  auto& log = run.log();
  ASSERT_TRUE(Until([&] { return !log.kv11.empty(); }));
  EXPECT_EQ(std::pair(log.kv11[0].nDeviceCmd, log.kv11[0].nLastError), std::pair(8, 0));

  const std::string stored = ReadFileBytes(run.Path(L"logger/NAVI.DAT"));
  ASSERT_EQ(stored.size(), 100 * kNaviEntryBytes);
  const auto* bytes = reinterpret_cast<const uint8_t*>(stored.data());
  for (int i = 0; i < 100; ++i) {
    NAVI_POINT_INFO got;
    const bool present = UnpackNaviEntry(bytes + i * kNaviEntryBytes, got);
    if (i == 3 || i == 40) {
      EXPECT_FALSE(present) << i;
      EXPECT_EQ(stored.substr(i * kNaviEntryBytes, kNaviEntryBytes), std::string(kNaviEntryBytes, '\0'));
    } else {
      ASSERT_TRUE(present) << i;
      EXPECT_EQ(got.nIcon, i);
      EXPECT_EQ(Int32At(bytes + i * kNaviEntryBytes + 4),
                static_cast<int32_t>(points[i]->dLatitude * 1e7)) << i;
    }
  }

  // Reading the settings brings the entries back.
  DC_KVDEVICE_ReadSetting();
  ASSERT_TRUE(Until([&] { return log.kv11.size() == 2; }));
  EXPECT_EQ(std::memcmp(log.kv11[1].NAVI, stored.data(), stored.size()), 0);

  // A model outside the family takes none.
  MakeLogger(run.Path(L"logger"), 1, 99);
  ASSERT_TRUE(Until([] { return g_wDeviceModelID == 1; }));
  DC_KVDEVICE_WriteNaviData(list);
  ASSERT_TRUE(Until([&] { return !log.Devices(DC_DEVICE_WRITE_NAVI).empty(); }));
  EXPECT_EQ(log.Devices(DC_DEVICE_WRITE_NAVI)[0].nLastError, DC_ERR_MODEL_UNSUPPORTED);
}

}  // namespace
