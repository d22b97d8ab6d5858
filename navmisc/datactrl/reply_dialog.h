// The way every dialog of the suite takes the channel's replies: the dialog's window gets
// message 1127 and dispatches the block by its kind to one handler each. Dialogs are
// controllers over an abstract view, so their logic runs without a display; a toolkit gives
// them a real view, the command-line tool a terminal one.
#pragma once

#include "navmisc/datactrl/cmd_blocks.h"
#include "navmisc/datactrl/request_queue.h"
#include "navmisc/platform/cstring.h"
#include "navmisc/platform/window.h"

// What a channel dialog shows.
class IDataCtrlDialogView {
 public:
  enum class Icon { kNone, kInformation, kWarning, kError };
  virtual ~IDataCtrlDialogView() = default;
  // A message box with an OK button. `rightToLeft`: right-aligned and read right to left.
  virtual void ShowMessageBox(const CString& text, Icon icon, bool rightToLeft) = 0;
};

class CDataCtrlReplyDlg : public CWnd {
 public:
  // `uiLanguage` is the user-interface language of the application ("Arabic" reads right to
  // left).
  explicit CDataCtrlReplyDlg(IDataCtrlDialogView& view, CString uiLanguage = L"ENG");

  // Message 1127 goes to OnReceiveQueueMessage, 1128 to OnDeviceReady, timers to OnTimer.
  LRESULT WindowProc(UINT message, WPARAM wParam, LPARAM lParam) override;

  // Calls the handler of the block's kind (lParam is the block); kinds without one give 0.
  LRESULT OnReceiveQueueMessage(WPARAM wParam, LPARAM lParam);

  // The handlers. Those of kinds a dialog does not care about return 1 without action.
  virtual long ProcessKVDevice(CDataControlCmdBlk* block);
  virtual long ProcessNet(CDataControlCmdBlk* block);
  virtual long ProcessFile(CDataControlCmdBlk* block);
  virtual long ProcessProgress(CDataControlCmdBlk* block);
  // Acts only when the logger (source 1) reports that it is connected: error 61 shows text 9582
  // with the device's identity, anything else posts message 1128 to the dialog so that it
  // starts its device work.
  virtual long ProcessConnectionStatus(CDataControlCmdBlk* block);

 protected:
  virtual void OnTimer(uintptr_t /*id*/) {}
  virtual void OnDeviceReady() {}
  bool RightToLeft() const { return uiLanguage_ == L"Arabic"; }
  IDataCtrlDialogView& view() { return view_; }

 private:
  IDataCtrlDialogView& view_;
  CString uiLanguage_;
};

// The outcome of clearing the logger's memory, as the dialogs show it: text 9583 with the
// error, or 9584 when it worked.
CString ClearLogOutcomeText(int32_t error);

// What the wait dialog for clearing the logger's memory shows.
class IWaitDataCtrlProcView : public IDataCtrlDialogView {
 public:
  virtual void EnableButton(bool enable) = 0;
  virtual void SetMessageText(const CString& text) = 0;
  // Draws attention to the message text (the clear is done).
  virtual void FlashMessageText() = 0;
};

// Clears the logger's memory and waits for the outcome (dialog resource 519).
class CWaitDataCtrlProcDlg : public CDataCtrlReplyDlg {
 public:
  static constexpr int IDD = 519;
  static constexpr uintptr_t kTimerId = 1002;
  static constexpr unsigned kTimerMs = 500;

  CWaitDataCtrlProcDlg(IWaitDataCtrlProcView& view, CString uiLanguage = L"ENG");

  // Disables the button, shows text 9588, marks a clear as pending and starts the timer.
  void OnInitDialog();
  // The outcome of the clear (device command 2): text 9583 with the error, or 9584; enables the
  // button. Replies to other device commands are ignored.
  long ProcessKVDevice(CDataControlCmdBlk* block) override;

  bool done() const { return done_; }

 protected:
  // The first tick sends the clear; once it is done every tick flashes the text.
  void OnTimer(uintptr_t id) override;

 private:
  IWaitDataCtrlProcView& waitView_;
  bool pending_ = false;
  bool done_ = false;
};
