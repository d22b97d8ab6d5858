// The terminal as the view of the channel's dialogs: message boxes become lines on standard
// error, the dialog's message text a line on standard output.
#pragma once

#include "navmisc/datactrl/reply_dialog.h"

namespace navmisc::cli {

class TerminalDialogView : public IWaitDataCtrlProcView {
 public:
  // "navmisc: TEXT" on stderr; an error box is marked as one. Right-to-left texts need no
  // special handling: the terminal lays out the characters.
  void ShowMessageBox(const CString& text, Icon icon, bool rightToLeft) override;
  // A terminal has no button: the user ends the command with its end (or Ctrl-C).
  void EnableButton(bool) override {}
  void SetMessageText(const CString& text) override;  // the text on stdout, once per change
  void FlashMessageText() override {}                 // the line is already the last one shown

 private:
  CString shown_;
};

}  // namespace navmisc::cli
