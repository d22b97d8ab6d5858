#include "navmisc/datactrl/reply_dialog.h"

#include "navmisc/datactrl/dc_errors.h"
#include "navmisc/datactrl/device_commands.h"
#include "navmisc/platform/resources.h"

namespace {
constexpr unsigned kTextDeviceRefused = 9582;  // "%s": the device's identity
constexpr unsigned kTextClearFailed = 9583;    // "%d": the error
constexpr unsigned kTextClearDone = 9584;
constexpr unsigned kTextClearing = 9588;
}  // namespace

CString ClearLogOutcomeText(int32_t error) {
  return error != 0 ? navmisc::FormatResString(kTextClearFailed, std::to_wstring(error).c_str())
                    : LoadResString(kTextClearDone);
}

CDataCtrlReplyDlg::CDataCtrlReplyDlg(IDataCtrlDialogView& view, CString uiLanguage)
    : view_(view), uiLanguage_(std::move(uiLanguage)) {}

LRESULT CDataCtrlReplyDlg::WindowProc(UINT message, WPARAM wParam, LPARAM lParam) {
  switch (message) {
    case WM_DATACTRL_RECEIVE:
      return OnReceiveQueueMessage(wParam, lParam);
    case WM_DATACTRL_READY:
      OnDeviceReady();
      return 0;
    case WM_TIMER:
      OnTimer(wParam);
      return 0;
    default:
      return 0;
  }
}

LRESULT CDataCtrlReplyDlg::OnReceiveQueueMessage(WPARAM /*wParam*/, LPARAM lParam) {
  auto* block = reinterpret_cast<CDataControlCmdBlk*>(lParam);
  if (!block) return 0;
  switch (block->nCmdType) {
    case DC_CMD_DEVICE: return ProcessKVDevice(block);
    case DC_CMD_NET: return ProcessNet(block);
    case DC_CMD_FILE: return ProcessFile(block);
    case DC_CMD_CONNECTION_STATUS: return ProcessConnectionStatus(block);
    case DC_CMD_PROGRESS: return ProcessProgress(block);
    default: return 0;
  }
}

long CDataCtrlReplyDlg::ProcessKVDevice(CDataControlCmdBlk*) { return 1; }
long CDataCtrlReplyDlg::ProcessNet(CDataControlCmdBlk*) { return 1; }
long CDataCtrlReplyDlg::ProcessFile(CDataControlCmdBlk*) { return 1; }
long CDataCtrlReplyDlg::ProcessProgress(CDataControlCmdBlk*) { return 1; }

long CDataCtrlReplyDlg::ProcessConnectionStatus(CDataControlCmdBlk* block) {
  const auto& status = *static_cast<CDataControlConnectionStatus*>(block);
  if (status.nSource != DC_SOURCE_DEVICE || !status.bConnected) return 1;
  if (status.nLastError == DC_ERR_DEVICE_REFUSED) {
    view_.ShowMessageBox(navmisc::FormatResString(kTextDeviceRefused, status.szDeviceId),
                         IDataCtrlDialogView::Icon::kError, RightToLeft());
  } else {
    PostMessageW(GetSafeHwnd(), WM_DATACTRL_READY, 0, 0);
  }
  return 1;
}

CWaitDataCtrlProcDlg::CWaitDataCtrlProcDlg(IWaitDataCtrlProcView& view, CString uiLanguage)
    : CDataCtrlReplyDlg(view, std::move(uiLanguage)), waitView_(view) {}

void CWaitDataCtrlProcDlg::OnInitDialog() {
  waitView_.EnableButton(false);
  waitView_.SetMessageText(LoadResString(kTextClearing));
  pending_ = true;
  done_ = false;
  SetTimer(GetSafeHwnd(), kTimerId, kTimerMs);
}

void CWaitDataCtrlProcDlg::OnTimer(uintptr_t id) {
  if (id != kTimerId) return;
  if (pending_) {
    pending_ = false;
    DC_KVDEVICE_ClearLogData();
  } else if (done_) {
    waitView_.FlashMessageText();
  }
}

long CWaitDataCtrlProcDlg::ProcessKVDevice(CDataControlCmdBlk* block) {
  // Both device block classes begin with the header and nDeviceCmd.
  const auto& device = *static_cast<CDataControlCmdBlkKVDevice*>(block);
  if (device.nDeviceCmd != DC_DEVICE_CLEAR_LOG) return 1;
  waitView_.SetMessageText(ClearLogOutcomeText(device.nLastError));
  done_ = true;
  waitView_.EnableButton(true);
  return 0;
}
