// The login dialog of the web service: a controller over an abstract view, so that a toolkit,
// the command-line tool or a test can give it a face.
#pragma once

#include "navmisc/datactrl/reply_dialog.h"
#include "navmisc/platform/cstring.h"
#include "navmisc/platform/dialog_results.h"

class USER_MAP_INFO;

// What the login dialog shows: the user-name and password fields, the keep-password box, the
// OK button and the other controls (Cancel and the two other actions).
class ILoginView : public IDataCtrlDialogView {
 public:
  virtual CString GetUserName() = 0;
  virtual CString GetPassword() = 0;
  virtual bool GetKeepPassword() = 0;
  virtual void SetUserName(const CString& name) = 0;
  virtual void SetPassword(const CString& password) = 0;
  virtual void SetKeepPassword(bool keep) = 0;
  virtual void EnableOk(bool enable) = 0;
  virtual void EnableOtherControls(bool enable) = 0;
  // Closes the dialog with IDOK or IDCANCEL.
  virtual void EndDialog(int result) = 0;
};

class CLoginDlg : public CDataCtrlReplyDlg {
 public:
  // `user` is the current user's profile: the name and password come from it and go back into
  // it after a successful login.
  CLoginDlg(ILoginView& view, USER_MAP_INFO& user, CString uiLanguage = L"ENG");

  // Fills the fields from the profile (the password only when it is kept) and sets OK. A user
  // already logged on (g_bLogon) closes the dialog at once with IDOK, without a request.
  void OnInitDialog();
  // After every change of either field: OK is enabled exactly when both are filled.
  void OnChangeName();
  // OK: with both fields filled, disables the controls and sends the login.
  void BeginLogin();

  // Login (1): success stores name, password and the keep flag into the profile (written to
  // its file), sets g_bLogon and closes with IDOK; failure shows text 9546 and enables the
  // controls again. User data (2): success closes with IDOK, failure enables the controls.
  // Other commands are ignored.
  long ProcessNet(CDataControlCmdBlk* block) override;
  // Of the device replies only the clear-log outcome is taken: its text is prepared.
  long ProcessKVDevice(CDataControlCmdBlk* block) override;

  // The outcome text of the last clear-log reply (text 9583 with the error, or 9584).
  const CString& clearLogText() const { return clearLogText_; }

 private:
  void EnableAll(bool enable);

  ILoginView& loginView_;
  USER_MAP_INFO& user_;
  CString clearLogText_;
};
