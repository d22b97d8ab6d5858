#include "navmisc/datactrl/login_dialog.h"

#include "navmisc/datactrl/net_commands.h"
#include "navmisc/platform/resources.h"
#include "navmisc/records/user_profile.h"

namespace {
constexpr unsigned kTextLoginFailed = 9546;
}  // namespace

CLoginDlg::CLoginDlg(ILoginView& view, USER_MAP_INFO& user, CString uiLanguage)
    : CDataCtrlReplyDlg(view, std::move(uiLanguage)), loginView_(view), user_(user) {}

void CLoginDlg::OnInitDialog() {
  loginView_.SetUserName(user_.userAccount);
  loginView_.SetPassword(user_.keepPassword ? user_.password : CString());
  loginView_.SetKeepPassword(user_.keepPassword);
  OnChangeName();
  if (g_bLogon) loginView_.EndDialog(IDOK);
}

void CLoginDlg::OnChangeName() {
  loginView_.EnableOk(!loginView_.GetUserName().IsEmpty() && !loginView_.GetPassword().IsEmpty());
}

void CLoginDlg::BeginLogin() {
  const CString name = loginView_.GetUserName();
  const CString password = loginView_.GetPassword();
  if (name.IsEmpty() || password.IsEmpty()) return;
  EnableAll(false);
  DC_NET_UserLogin(name, password);
}

void CLoginDlg::EnableAll(bool enable) {
  loginView_.EnableOk(enable);
  loginView_.EnableOtherControls(enable);
}

long CLoginDlg::ProcessNet(CDataControlCmdBlk* block) {
  const auto& net = *static_cast<CDataControlCmdBlkNet*>(block);
  switch (net.nNetCmd) {
    case DC_NET_CMD_LOGIN:
      if (net.nLastError == 0) {
        user_.userAccount = loginView_.GetUserName();
        user_.password = loginView_.GetPassword();
        user_.keepPassword = loginView_.GetKeepPassword();
        user_.WriteInfo();
        g_bLogon = true;
        loginView_.EndDialog(IDOK);
      } else {
        loginView_.ShowMessageBox(LoadResString(kTextLoginFailed),
                                  IDataCtrlDialogView::Icon::kError, RightToLeft());
        EnableAll(true);
      }
      break;
    case DC_NET_CMD_GETUSERDATA:
      if (net.nLastError == 0)
        loginView_.EndDialog(IDOK);
      else
        EnableAll(true);
      break;
    default:
      break;
  }
  return 1;
}

long CLoginDlg::ProcessKVDevice(CDataControlCmdBlk* block) {
  const auto& device = *static_cast<CDataControlCmdBlkKVDevice*>(block);
  if (device.nDeviceCmd == DC_DEVICE_CLEAR_LOG) clearLogText_ = ClearLogOutcomeText(device.nLastError);
  return 1;
}
