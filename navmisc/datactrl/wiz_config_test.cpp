#include <gtest/gtest.h>
#include <stdlib.h>

#include <optional>
#include <string>
#include <tuple>
#include <utility>
#include <vector>

#include "channel_harness.h"
#include "navmisc/datactrl/device_state.h"
#include "navmisc/datactrl/wiz_config_sheet.h"
#include "navmisc/platform/files.h"
#include "navmisc/platform/format.h"
#include "navmisc/platform/shared_globals.h"
#include "testutil.h"

namespace {

using navmisc::testutil::ChannelRun;
using navmisc::testutil::ReadFileBytes;
using navmisc::testutil::TempDir;
using navmisc::testutil::TzScope;
using navmisc::testutil::Until;
using navmisc::testutil::WriteFileBytes;

// Records what the sheet and its last page show; answers the reset question with `answer`.
class FakeSheetView : public IWizConfigSheetView {
 public:
  void ShowMessageBox(const CString&, Icon, bool) override {}
  int RunModal(CWizConfigSheet& sheet) override {
    loadedName = sheet.modes[0].szName;
    SendMessageW(sheet.GetSafeHwnd(), CWizConfigSheet::kCommand, CWizConfigSheet::kIdOk, 0);
    return ended.value_or(0);
  }
  void EndSheet(int result) override { ended = result; }
  void EnableSheetButton(int id, bool enable) override { buttons.emplace_back(id, enable); }
  bool AskYesNo(const CString& text, bool rightToLeft) override {
    questions.emplace_back(text, rightToLeft);
    return answer;
  }
  void StepProgress() override { ++steps; }
  void ShowWriteResult(int32_t deviceCmd, int32_t error) override {
    results.emplace_back(deviceCmd, error);
  }

  bool answer = true;
  CString loadedName;
  std::optional<int> ended;
  std::vector<std::pair<int, bool>> buttons;
  std::vector<std::pair<CString, bool>> questions;
  int steps = 0;
  std::vector<std::pair<int32_t, int32_t>> results;
};

// Points the user's settings folder and the company folder somewhere for the test.
class SettingsFolderScope {
 public:
  explicit SettingsFolderScope(const CString& config, const wchar_t* company = L"") {
    if (const char* old = getenv("XDG_CONFIG_HOME")) old_ = old;
    setenv("XDG_CONFIG_HOME", config.ToUtf8().c_str(), 1);
    navmisc::SetSharedText(g_szSoftwareCompanyname, company);
  }
  ~SettingsFolderScope() {
    if (old_) setenv("XDG_CONFIG_HOME", old_->c_str(), 1); else unsetenv("XDG_CONFIG_HOME");
    navmisc::SetSharedText(g_szSoftwareCompanyname, L"");
  }

 private:
  std::optional<std::string> old_;
};

using ModeRow = std::tuple<int, std::wstring, bool, bool, int, int, int>;
ModeRow Row(const WIZ_MODE_INFO& m) {
  return {m.nInterval, m.szName.str(), m.bTricklePower, m.bSmartTracking,
          m.nSmartTrackingInterval, m.nSmartTrackingSpeed, m.nUnit};
}
using TzRow = std::tuple<int, int, int, bool, int, int, bool, int, int, bool, bool>;
TzRow Tz(const CWizConfigSheet& s) {
  return {s.nTimeZone, s.nDayLight, s.nBeginTime, s.bTricklePower, s.nDualMode, s.nCycle,
          s.bEnableAutoChangeInterval, s.nUnitSel, s.nVScale, s.bAccOn, s.bMotionDetect};
}

TEST(WizConfigFile, PathFollowsTheCompanyFolderAndTheConnectedLogger) {
  TempDir config;
  g_wDeviceModelID = 21;
  g_wDeviceSerialID = 1234;
  const struct {
    const wchar_t* company;
    CString expected;
  } cases[] = {
      {L"", config / L"vorla/device_21_1234.ini"},
      {L"Acme Tracks", config / L"Acme Tracks/vorla/device_21_1234.ini"},
      {L"/srv/suite", L"/srv/suite/vorla/device_21_1234.ini"},
  };
  for (const auto& c : cases) {
    SettingsFolderScope scope(config.path(), c.company);
    EXPECT_EQ(CWizConfigSheet::GetSettingFilePath(), c.expected);
  }
  g_wDeviceModelID = 0;
  g_wDeviceSerialID = 0;
}

TEST(WizConfigFile, DefaultsAbsentKeysAndTheWrittenFile) {
  TempDir dir;
  FakeSheetView view;
  const std::vector<ModeRow> defaults = {
      {15, L"Mode 1", false, false, 3, 10, 0}, {5, L"Mode 2", true, false, 3, 10, 0},
      {5, L"Mode 3", true, true, 3, 10, 0},    {5, L"Mode 4", true, true, 3, 15, 0},
      {5, L"Mode 5", true, true, 3, 20, 0},    {5, L"Mode 6", true, true, 3, 30, 0}};

  // No file: the defaults, and the daylight flag from the system's zone.
  for (auto [tz, daylight] : {std::pair{"UTC", 0}, {"Europe/Berlin", 1}}) {
    TzScope zone(tz);
    CWizConfigSheet sheet(view);
    sheet.settingFile = dir / L"missing.ini";
    EXPECT_EQ(sheet.LoadSettingFile(), 0);
    for (int i = 0; i < 6; ++i) EXPECT_EQ(Row(sheet.modes[i]), defaults[i]) << i;
    EXPECT_EQ(Tz(sheet), TzRow(-1, daylight, -1, false, 0, 0, false, 0, -1, true, true)) << tz;
  }

  // A file: -1 and empty names count as absent in the modes; every TZINFO key takes its
  // absent-key default, which turns the accelerometer and motion detection off.
  WriteFileBytes(dir / L"device.ini",
                 "[TZINFO]\nTimeZone=480\nVScale=2\n"
                 "[MODEL_0]\nInterval=30\nTricklePower=2\nName=Hiking\nUnit=1\n"
                 "[MODEL_1]\nInterval=-1\nSmartTracking=1\n"
                 "[MODEL_2]\nName=\nSmartTracking=0\nSmartTracking_Speed=-1\n"
                 "[MODEL_3]\nTricklePower=-1\nSmart_Tracking_Interval=7\n"
                 "[MODEL_4]\nTricklePower=-3\n");
  CWizConfigSheet sheet(view);
  sheet.settingFile = dir / L"device.ini";
  EXPECT_EQ(sheet.LoadSettingFile(), 1);
  std::vector<ModeRow> expected = defaults;
  expected[0] = {30, L"Hiking", true, false, 3, 10, 1};
  expected[1] = {5, L"Mode 2", true, true, 3, 10, 0};
  expected[2] = {5, L"Mode 3", true, false, 3, 10, 0};
  expected[3] = {5, L"Mode 4", true, true, 7, 15, 0};
  expected[4] = {5, L"Mode 5", false, true, 3, 20, 0};
  for (int i = 0; i < 6; ++i) EXPECT_EQ(Row(sheet.modes[i]), expected[i]) << i;
  EXPECT_EQ(Tz(sheet), TzRow(480, -1, -1, false, 0, 0, false, 0, 2, false, false));

  // Writing: TZINFO first, then the six modes, each key in its place.
  sheet.nCycle = 2;
  sheet.bAccOn = true;
  sheet.settingFile = dir / L"sub/written.ini";
  ASSERT_EQ(sheet.WriteSettingFile(), 1);
  std::string text =
      "[TZINFO]\nTimeZone=480\nDayLight=-1\nBeginTime=-1\nDualMode=0\nCycle=2\nTricklePower=0\n"
      "EnableAutoChangeInterval=0\nUnitSel=0\nVScale=2\nAccOn=1\nMotionDetect=0\n";
  for (int i = 0; i < 6; ++i) {
    const auto& [interval, name, trickle, smart, smartInterval, speed, unit] = expected[i];
    text += navmisc::FormatA(
        "\n[MODEL_%d]\nInterval=%d\nName=%s\nTricklePower=%d\nSmart_Tracking_Interval=%d\n"
        "SmartTracking_Speed=%d\nSmartTracking=%d\nUnit=%d\n",
        i, interval, CString(name).ToUtf8().c_str(), trickle, smartInterval, speed, smart, unit);
  }
  EXPECT_EQ(ReadFileBytes(sheet.settingFile), text);

  // DoModal reads the file of the connected logger before the sheet shows; OK writes it back.
  SettingsFolderScope scope(dir.path());
  g_wDeviceModelID = 1;
  g_wDeviceSerialID = 77;
  ASSERT_TRUE(MakeDir(dir / L"vorla"));
  WriteFileBytes(dir / L"vorla/device_1_77.ini", "[MODEL_0]\nName=Cycling\n");
  CWizConfigSheet modal(view);
  EXPECT_EQ(modal.DoModal(), CWizConfigSheet::kIdOk);
  EXPECT_EQ(view.loadedName, L"Cycling");
  EXPECT_NE(ReadFileBytes(dir / L"vorla/device_1_77.ini").find("[TZINFO]\nTimeZone=-1"),
            std::string::npos);
  g_wDeviceModelID = 0;
  g_wDeviceSerialID = 0;
}

// The last page with the real data-control process and a logger folder.
class WizLastPage : public ::testing::Test {
 protected:
  void SetUp() override {
    navmisc::testutil::MakeLogger(run_.Path(L"logger"), 1, 4242);
    run_.Configure("[DEVICE]\nPath=" + (run_.Path(L"logger")).ToUtf8() + "\n");
  }
  std::string Description() { return ReadFileBytes(run_.Path(L"logger/GPSLOGGER.INI")); }

  ChannelRun run_;
  FakeSheetView view_;
  CWizConfigSheet sheet_{view_};
  CWizConfigFinishPage page_{sheet_};
};

TEST_F(WizLastPage, WritesTheConfigurationAndWaitsForTheAnswer) {
  run_.Start(&page_);
  InitDeviceBlockDefaults(g_devConfig);
  g_devConfig.nInterval = 15;
  g_devConfig.bDualMode = 1;
  page_.OnSetActive();
  ASSERT_TRUE(Until([&] { return page_.done(); }));
  EXPECT_EQ(view_.results, (std::vector<std::pair<int32_t, int32_t>>{{4, 0}}));
  // Back, Cancel and Finish go grey while the logger is written; Finish comes back.
  EXPECT_EQ(view_.buttons, (std::vector<std::pair<int, bool>>{{CWizConfigSheet::kIdBack, false},
                                                             {CWizConfigSheet::kIdCancel, false},
                                                             {CWizConfigSheet::kIdFinish, false},
                                                             {CWizConfigSheet::kIdFinish, true}}));
  EXPECT_NE(Description().find("nInterval=15\n"), std::string::npos);
  EXPECT_NE(Description().find("bDualMode=1\n"), std::string::npos);
  EXPECT_TRUE(view_.questions.empty());
}

TEST_F(WizLastPage, AResetAsksFirstWhenTheSheetWantsAConfirmation) {
  // The logger holds settings of its own.
  WriteFileBytes(run_.Path(L"logger/GPSLOGGER.INI"),
                 "[LOGGER]\nModel=1\nSerial=4242\n[SETTINGS]\nnInterval=60\n");
  run_.Start(&page_);
  sheet_.bResetRequest = true;
  sheet_.bResetConfirm = true;

  // No: nothing is sent, the sheet leaves as by Cancel.
  view_.answer = false;
  page_.OnSetActive();
  ASSERT_TRUE(Until([&] { return view_.ended.has_value(); }));
  EXPECT_EQ(view_.ended, CWizConfigSheet::kIdCancel);
  EXPECT_EQ(view_.buttons.back(), std::pair(CWizConfigSheet::kIdCancel, true));
  EXPECT_TRUE(view_.results.empty());
  EXPECT_NE(Description().find("nInterval=60\n"), std::string::npos);

  // Yes: the logger is reset.
  view_.answer = true;
  view_.ended.reset();
  page_.OnSetActive();
  ASSERT_TRUE(Until([&] { return page_.done(); }));
  EXPECT_EQ(view_.results, (std::vector<std::pair<int32_t, int32_t>>{{5, 0}}));
  EXPECT_EQ(view_.questions.size(), 2u);
  EXPECT_NE(Description().find("nInterval=5\n"), std::string::npos);
  EXPECT_NE(Description().find("Serial=4242\n"), std::string::npos);
}

}  // namespace
