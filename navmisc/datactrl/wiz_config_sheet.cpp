// The wizard's sheet and last page as controllers.
#include "navmisc/datactrl/wiz_config_sheet.h"

#include "navmisc/datactrl/device_commands.h"
#include "navmisc/datactrl/device_state.h"
#include "navmisc/platform/resources.h"

namespace {
constexpr unsigned kTextResetQuestion = 9684;
}  // namespace

CWizConfigSheet::CWizConfigSheet(IWizConfigSheetView& view, CString uiLanguage)
    : view_(view), uiLanguage_(std::move(uiLanguage)) {
  Init_Config_Value();
}

int CWizConfigSheet::DoModal() {
  settingFile = GetSettingFilePath();
  LoadSettingFile();
  return view_.RunModal(*this);
}

LRESULT CWizConfigSheet::WindowProc(UINT message, WPARAM wParam, LPARAM /*lParam*/) {
  if (message == WM_WIZCONFIG_WRITING) {
    for (int id : {kIdBack, kIdCancel, kIdFinish}) view_.EnableSheetButton(id, false);
  } else if (message == kCommand && (wParam == kIdOk || wParam == kIdCancel)) {
    // Confirming is what makes the choices worth remembering.
    if (wParam == kIdOk) WriteSettingFile();
    view_.EndSheet(static_cast<int>(wParam));
  }
  return 0;
}

CWizConfigFinishPage::CWizConfigFinishPage(CWizConfigSheet& sheet)
    : CDataCtrlReplyDlg(sheet.view()), sheet_(sheet) {}

void CWizConfigFinishPage::OnSetActive() {
  sent_ = done_ = false;
  sentCmd_ = 0;
  PostMessageW(sheet_.GetSafeHwnd(), WM_WIZCONFIG_WRITING, 0, 0);
  SetTimer(GetSafeHwnd(), kSendTimerId, kTimerMs);
  SetTimer(GetSafeHwnd(), kProgressTimerId, kTimerMs);
}

void CWizConfigFinishPage::OnTimer(uintptr_t id) {
  if (id == kSendTimerId) {
    KillTimer(GetSafeHwnd(), kSendTimerId);
    if (!sent_) SendRequest();
  } else if (id == kProgressTimerId && !done_) {
    sheet_.view().StepProgress();
  }
}

void CWizConfigFinishPage::SendRequest() {
  sent_ = true;
  if (!sheet_.bResetRequest) {
    sentCmd_ = DC_DEVICE_WRITE_SETTING;
    g_devConfig.nDeviceCmd = DC_DEVICE_WRITE_SETTING;
    DC_KVDEVICE_WriteSetting(g_devConfig);
    return;
  }
  if (sheet_.bResetConfirm &&
      !sheet_.view().AskYesNo(LoadResString(kTextResetQuestion), sheet_.RightToLeft())) {
    // The user keeps the logger as it is: leave the wizard the way Cancel does.
    KillTimer(GetSafeHwnd(), kProgressTimerId);
    done_ = true;
    sheet_.view().EnableSheetButton(CWizConfigSheet::kIdCancel, true);
    PostMessageW(sheet_.GetSafeHwnd(), CWizConfigSheet::kCommand, CWizConfigSheet::kIdCancel, 0);
    return;
  }
  sentCmd_ = DC_DEVICE_RESET;
  DC_KVDEVICE_Reset();
}

long CWizConfigFinishPage::ProcessKVDevice(CDataControlCmdBlk* block) {
  // Both device block classes begin with the header and nDeviceCmd.
  const auto& reply = *static_cast<CDataControlCmdBlkKVDevice*>(block);
  if (!sent_ || done_ || reply.nDeviceCmd != sentCmd_) return 1;
  done_ = true;
  KillTimer(GetSafeHwnd(), kProgressTimerId);
  sheet_.view().ShowWriteResult(reply.nDeviceCmd, reply.nLastError);
  sheet_.view().EnableSheetButton(CWizConfigSheet::kIdFinish, true);
  return 0;
}
