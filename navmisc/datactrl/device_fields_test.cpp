#include "navmisc/datactrl/device_fields.h"

#include <gtest/gtest.h>

#include <cstring>
#include <memory>
#include <string>

#include "sample_blocks.h"

namespace {

using namespace navmisc::datactrl;
using navmisc::datactrl::testing::SampleDevice;
using navmisc::datactrl::testing::SampleKV11;

// Every setting read out as text and set again into a block that only shares the request part
// gives the block back: nothing is left out, nothing changes on the way.
TEST(DeviceFields, EverySettingRoundTripsThroughItsText) {
  const CDataControlCmdBlkKVDevice device = SampleDevice();
  CDataControlCmdBlkKVDevice back;
  InitDeviceBlockDefaults(back);
  static_cast<CDataControlCmdBlk&>(back) = device;
  back.nDeviceCmd = device.nDeviceCmd;
  back.tPointStartTime = device.tPointStartTime;
  back.tPointEndTime = device.tPointEndTime;
  int count = 0;
  ForEachSetting(device, [&](const char* key, const std::string& value) {
    EXPECT_EQ(SetSetting(back, key, value), "") << key;
    EXPECT_TRUE(IsDeviceSetting(key) && !IsKV11Setting(key)) << key;
    ++count;
  });
  EXPECT_EQ(count, 17);
  EXPECT_TRUE(back == device);

  const auto kv11 = std::make_unique<CDataControlCmdBlkKVDevice11>(SampleKV11());
  auto kvBack = std::make_unique<CDataControlCmdBlkKVDevice11>();
  std::memset(static_cast<void*>(kvBack.get()), 0, sizeof *kvBack);
  static_cast<CDataControlCmdBlk&>(*kvBack) = *kv11;
  kvBack->nDeviceCmd = kv11->nDeviceCmd;
  std::memcpy(kvBack->NAVI, kv11->NAVI, sizeof kv11->NAVI);  // entries of their own
  count = 0;
  ForEachSetting(*kv11, [&](const char* key, const std::string& value) {
    EXPECT_EQ(SetSetting(*kvBack, key, value), "") << key;
    EXPECT_TRUE(IsKV11Setting(key) && !IsDeviceSetting(key)) << key;
    ++count;
  });
  EXPECT_EQ(count, 99);
  EXPECT_TRUE(*kvBack == *kv11);
  EXPECT_FALSE(IsKV11Setting("NAVI"));
}

TEST(DeviceFields, TextsThatDoNotFitLeaveTheBlockAsItWas) {
  const struct {
    const char* key;
    std::string value;
    const char* why;
  } device[] = {
      {"nInterval", "12x", "not a whole number from -2147483648 to 2147483647"},
      {"nInterval", "", "not a whole number from -2147483648 to 2147483647"},
      {"nInterval", "2147483648", "not a whole number from -2147483648 to 2147483647"},
      {"bAccOn", "2", "not a whole number from 0 to 1"},
      {"cVersion", "-1", "not a whole number from 0 to 255"},
      {"tDestStartScheduleTimeUTC", "yesterday", "not a time of the form YYYY-MM-DDThh:mm:ss"},
      {"bTimeTable", "ABC", "not 20160 hexadecimal digits"},
      {"bTimeTable", std::string(20160, 'G'), "not 20160 hexadecimal digits"},
      {"szPassword", std::string(253, 'x'), "longer than 252 bytes"},
      {"nosuch", "1", "unknown setting"},
      {"SERVER_PORT", "80", "unknown setting"},
  };
  for (const auto& c : device) {
    CDataControlCmdBlkKVDevice block = SampleDevice();
    EXPECT_EQ(SetSetting(block, c.key, c.value), c.why) << c.key;
    EXPECT_TRUE(block == SampleDevice()) << c.key;
  }
  const struct {
    const char* key;
    std::string value;
    const char* why;
  } kv11[] = {
      {"DEVICE_ID", std::string(33, 'd'), "longer than 32 bytes"},
      {"GSM_APN", std::string(65, 'a'), "longer than 64 bytes"},
      {"PIN", "12345678901234", "longer than 13 bytes"},
      {"PIN", std::string("12\0" "34", 5), "holds a zero byte"},
      {"RING_DURATION", "65536", "not a whole number from 0 to 65535"},
      {"POI_9_u32Flag", "-1", "not a whole number from 0 to 4294967295"},
      {"NAVI", "00", "unknown setting"},
  };
  for (const auto& c : kv11) {
    auto block = std::make_unique<CDataControlCmdBlkKVDevice11>(SampleKV11());
    EXPECT_EQ(SetSetting(*block, c.key, c.value), c.why) << c.key;
    EXPECT_TRUE(*block == SampleKV11()) << c.key;
  }
  // Names match without regard to case; the texts that fit do change the block.
  CDataControlCmdBlkKVDevice block = SampleDevice();
  EXPECT_EQ(SetSetting(block, "NINTERVAL", "-7"), "");
  EXPECT_EQ(SetSetting(block, "bTimeTable", ""), "");
  EXPECT_EQ(SetSetting(block, "tDestStartScheduleTimeUTC", ""), "");
  EXPECT_EQ(block.nInterval, -7);
  EXPECT_EQ(block.sSchedule.bTimeTable[0] + block.sSchedule.bTimeTable[3], 0);
  EXPECT_EQ(CovertOleDateTimeToTimeT(block.sSchedule.tDestStartScheduleTimeUTC), -1);
  std::string shown;
  ForEachSetting(block, [&](const char* key, const std::string& value) {
    if (std::string(key) == "bTimeTable" || std::string(key) == "tDestStartScheduleTimeUTC")
      shown += key + ("=" + value) + ";";
  });
  EXPECT_EQ(shown, "tDestStartScheduleTimeUTC=;bTimeTable=;");
}

}  // namespace
