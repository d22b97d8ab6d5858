#include "terminal_view.h"

#include <cstdio>

namespace navmisc::cli {

void TerminalDialogView::ShowMessageBox(const CString& text, Icon icon, bool /*rightToLeft*/) {
  std::fprintf(stderr, "navmisc: %s%s\n", icon == Icon::kError ? "error: " : "", text.ToUtf8().c_str());
}

void TerminalDialogView::SetMessageText(const CString& text) {
  if (text == shown_) return;
  shown_ = text;
  std::printf("%s\n", text.ToUtf8().c_str());
  std::fflush(stdout);
}

}  // namespace navmisc::cli
