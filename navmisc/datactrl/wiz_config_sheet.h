// The logger's configuration wizard: a property sheet whose choices are remembered per logger in
// a small settings file ("device_<model>_<serial>.ini", see docs/device-settings-file.md), and
// whose last page writes the configuration (g_devConfig) to the logger or resets it.
//
// Sheet and page are controllers over an abstract view, so their logic runs without a display:
// a toolkit gives them a real view, the command-line tool a terminal one.
#pragma once

#include <cstdint>

#include "navmisc/datactrl/reply_dialog.h"
#include "navmisc/platform/cstring.h"
#include "navmisc/platform/window.h"

// One of the wizard's six named logging modes.
struct WIZ_MODE_INFO {
  int32_t nInterval = 5;               // seconds between two logged points
  CString szName;                      // "Mode 1" .. "Mode 6"
  bool bTricklePower = true;           // save power between fixes
  bool bSmartTracking = true;          // shorten the interval with speed
  int32_t nSmartTrackingInterval = 3;  // seconds, while smart tracking applies
  int32_t nSmartTrackingSpeed = 10;    // speed from which smart tracking applies
  int32_t nUnit = 0;                   // unit of that speed
};

// Posted by the last page to its sheet when it starts writing to the logger.
inline constexpr UINT WM_WIZCONFIG_WRITING = WM_USER + 112;  // 1136

class CWizConfigSheet;

// What the sheet shows.
class IWizConfigSheetView : public IDataCtrlDialogView {
 public:
  // Shows the sheet (its pages) and returns when it closes, with kIdOk or kIdCancel.
  virtual int RunModal(CWizConfigSheet& sheet) = 0;
  // Closes a sheet that RunModal shows, with `result`.
  virtual void EndSheet(int result) = 0;
  virtual void EnableSheetButton(int id, bool enable) = 0;
  // A Yes/No question with a warning icon; true for Yes.
  virtual bool AskYesNo(const CString& text, bool rightToLeft) = 0;
  // The last page is waiting for the logger: advance the busy indicator.
  virtual void StepProgress() = 0;
  // The logger answered the write (nDeviceCmd 4) or the reset (5) with `error` (0 = success).
  virtual void ShowWriteResult(int32_t deviceCmd, int32_t error) = 0;
};

// The last page: writes g_devConfig to the logger, or resets the logger when the sheet asks for
// it, and waits for the answer.
class CWizConfigFinishPage : public CDataCtrlReplyDlg {
 public:
  static constexpr uintptr_t kSendTimerId = 1000;      // sends the request once
  static constexpr uintptr_t kProgressTimerId = 1001;  // moves the busy indicator
  static constexpr unsigned kTimerMs = 300;

  explicit CWizConfigFinishPage(CWizConfigSheet& sheet);

  // Entering the page: tells the sheet that writing starts (message 1136) and starts both
  // timers. The request goes out on the first tick, after the sheet has handled 1136.
  void OnSetActive();
  // The answer to the write or the reset; other device replies are ignored.
  long ProcessKVDevice(CDataControlCmdBlk* block) override;

  bool requestSent() const { return sent_; }
  bool done() const { return done_; }

 protected:
  void OnTimer(uintptr_t id) override;

 private:
  void SendRequest();

  CWizConfigSheet& sheet_;
  bool sent_ = false;
  int32_t sentCmd_ = 0;
  bool done_ = false;
};

class CWizConfigSheet : public CWnd {
 public:
  static constexpr int kModes = 6;
  // A button press reaches the sheet as message kCommand with the button's id in wParam.
  static constexpr UINT kCommand = 0x0111;
  static constexpr int kIdOk = 1;
  static constexpr int kIdCancel = 2;
  static constexpr int kIdBack = 0x3023;
  static constexpr int kIdFinish = 0x3025;

  // `uiLanguage`: the user-interface language ("Arabic" reads right to left).
  explicit CWizConfigSheet(IWizConfigSheetView& view, CString uiLanguage = L"ENG");

  // The settings file of the connected logger (g_wDeviceModelID, g_wDeviceSerialID):
  // <folder>/vorla/device_<model>_<serial>.ini, where <folder> is g_szSoftwareCompanyname when it
  // is an absolute path, that name under the user's settings folder when it is relative, and the
  // user's settings folder ($XDG_CONFIG_HOME, else ~/.config) when it is empty.
  static CString GetSettingFilePath();

  // Sets the six modes to their defaults.
  void Init_Config_Value();
  // Reads the settings file at `settingFile`: a missing file keeps the defaults and takes the
  // daylight-saving flag from the system. Returns 1 when the file was read.
  int LoadSettingFile();
  // Writes the settings file at `settingFile` (its folder is made when missing). Returns 1 on
  // success; a file that cannot be written is left as it was.
  int WriteSettingFile();
  // Builds the path, reads the file and shows the sheet; returns kIdOk or kIdCancel.
  int DoModal();

  // Message 1136 disables Back, Cancel and Finish while the last page writes; the command
  // kIdCancel or kIdOk closes the sheet with it, kIdOk after writing the settings file.
  LRESULT WindowProc(UINT message, WPARAM wParam, LPARAM lParam) override;

  bool RightToLeft() const { return uiLanguage_ == L"Arabic"; }
  IWizConfigSheetView& view() { return view_; }

  // The file and the remembered choices.
  CString settingFile;
  WIZ_MODE_INFO modes[kModes];
  int32_t nTimeZone = -1;
  int32_t nDayLight = -1;
  int32_t nBeginTime = -1;
  bool bTricklePower = false;
  int32_t nDualMode = 0;
  int32_t nCycle = 0;
  bool bEnableAutoChangeInterval = false;
  int32_t nUnitSel = 0;
  int32_t nVScale = -1;
  bool bAccOn = true;
  bool bMotionDetect = true;

  // What the last page does: reset the logger instead of writing (after a question when
  // `bResetConfirm` is set).
  bool bResetRequest = false;
  bool bResetConfirm = false;

 private:
  IWizConfigSheetView& view_;
  CString uiLanguage_;
};
