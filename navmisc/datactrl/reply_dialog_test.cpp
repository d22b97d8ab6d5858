// The dialogs' reply pattern: dispatch of message 1127 by kind, and what a connection state
// makes a dialog do (message 1128, or the message box of a refused logger).
#include <gtest/gtest.h>

#include <string>
#include <tuple>
#include <vector>

#include "navmisc/datactrl/dc_errors.h"
#include "navmisc/datactrl/reply_dialog.h"
#include "navmisc/platform/resources.h"
#include "testutil.h"

namespace {

using navmisc::testutil::TempDir;
using navmisc::testutil::WriteFileBytes;

struct Box {
  CString text;
  IDataCtrlDialogView::Icon icon;
  bool rightToLeft;
};

class RecordingView : public IDataCtrlDialogView {
 public:
  void ShowMessageBox(const CString& text, Icon icon, bool rightToLeft) override {
    boxes.push_back({text, icon, rightToLeft});
  }
  std::vector<Box> boxes;
};

// A dialog that counts the device-ready messages it handles.
class ReadyCounter : public CDataCtrlReplyDlg {
 public:
  using CDataCtrlReplyDlg::CDataCtrlReplyDlg;
  int ready = 0;

 protected:
  void OnDeviceReady() override { ++ready; }
};

// Handles this thread's messages for a moment, so that anything posted has arrived.
void Settle() { ReleaseCPUTime(50); }

LRESULT Receive(CDataCtrlReplyDlg& dialog, CDataControlCmdBlk& block) {
  return SendMessageW(dialog.GetSafeHwnd(), WM_DATACTRL_RECEIVE, 0, reinterpret_cast<LPARAM>(&block));
}

TEST(ReplyDialog, ConnectionStateStartsDeviceWorkOrShowsTheRefusal) {
  TempDir texts;
  WriteFileBytes(texts / L"texts.ini", "[STRINGS]\n9582=Logger %s refused.\n");
  navmisc::SetResourceFile(texts / L"texts.ini");
  const struct {
    const char* language;
    int32_t source;
    uint8_t connected;
    int32_t error;
    int ready;           // messages 1128 handled
    bool box;            // the refusal shown
    bool rightToLeft;
  } cases[] = {
      {"ENG", DC_SOURCE_DEVICE, 1, 0, 1, false, false},
      {"ENG", DC_SOURCE_DEVICE, 1, 5, 1, false, false},  // other errors still start the work
      {"ENG", DC_SOURCE_DEVICE, 2, 0, 1, false, false},  // any non-zero byte is connected
      {"ENG", DC_SOURCE_DEVICE, 0, 0, 0, false, false},
      {"ENG", DC_SOURCE_DEVICE, 0, DC_ERR_DEVICE_REFUSED, 0, false, false},
      {"ENG", DC_SOURCE_NET, 1, 0, 0, false, false},
      {"ENG", DC_SOURCE_NET, 1, DC_ERR_DEVICE_REFUSED, 0, false, false},
      {"ENG", 0, 1, 0, 0, false, false},
      {"ENG", DC_SOURCE_DEVICE, 1, DC_ERR_DEVICE_REFUSED, 0, true, false},
      {"Arabic", DC_SOURCE_DEVICE, 1, DC_ERR_DEVICE_REFUSED, 0, true, true},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(std::string(c.language) + " source " + std::to_string(c.source) + " connected " +
                 std::to_string(c.connected) + " error " + std::to_string(c.error));
    RecordingView view;
    ReadyCounter dialog(view, CString::FromUtf8(c.language));
    CDataControlConnectionStatus status{DC_CMD_CONNECTION_STATUS, L"KV-8 0042", c.error, c.source,
                                        c.connected};
    EXPECT_EQ(Receive(dialog, status), 1);
    Settle();
    EXPECT_EQ(dialog.ready, c.ready);
    ASSERT_EQ(view.boxes.size(), c.box ? 1u : 0u);
    if (c.box) {
      EXPECT_EQ(view.boxes[0].text, L"Logger KV-8 0042 refused.");
      EXPECT_EQ(view.boxes[0].icon, IDataCtrlDialogView::Icon::kError);
      EXPECT_EQ(view.boxes[0].rightToLeft, c.rightToLeft);
    }
  }
  navmisc::SetResourceFile(L"");
}

TEST(ReplyDialog, EachKindGoesToItsHandler) {
  // Records which handler took a block.
  class Dispatch : public CDataCtrlReplyDlg {
   public:
    using CDataCtrlReplyDlg::CDataCtrlReplyDlg;
    long ProcessKVDevice(CDataControlCmdBlk* b) override { return Took(1, b); }
    long ProcessNet(CDataControlCmdBlk* b) override { return Took(2, b); }
    long ProcessFile(CDataControlCmdBlk* b) override { return Took(3, b); }
    long ProcessConnectionStatus(CDataControlCmdBlk* b) override { return Took(4, b); }
    long ProcessProgress(CDataControlCmdBlk* b) override { return Took(5, b); }
    std::vector<std::pair<int, const CDataControlCmdBlk*>> taken;

   private:
    long Took(int handler, CDataControlCmdBlk* b) {
      taken.emplace_back(handler, b);
      return 100 + handler;
    }
  };
  RecordingView view;
  Dispatch dialog(view);
  for (int32_t kind : {1, 2, 3, 4, 5}) {
    CDataControlCmdBlk block{kind, L"", 0};
    EXPECT_EQ(Receive(dialog, block), 100 + kind) << kind;
    ASSERT_EQ(dialog.taken.size(), 1u) << kind;
    EXPECT_EQ(dialog.taken[0], std::pair(static_cast<int>(kind), static_cast<const CDataControlCmdBlk*>(&block)));
    dialog.taken.clear();
  }
  for (int32_t kind : {0, 6, 7, -1}) {
    CDataControlCmdBlk block{kind, L"", 0};
    EXPECT_EQ(Receive(dialog, block), 0) << kind;
  }
  EXPECT_EQ(dialog.OnReceiveQueueMessage(0, 0), 0);  // no block at all
  EXPECT_TRUE(dialog.taken.empty());

  // The base dialog takes every kind it has a handler for without acting on it.
  ReadyCounter plain(view);
  for (int32_t kind : {1, 2, 3, 5}) {
    CDataControlCmdBlk block{kind, L"", 0};
    EXPECT_EQ(Receive(plain, block), 1) << kind;
  }
  Settle();
  EXPECT_EQ(plain.ready, 0);
  EXPECT_TRUE(view.boxes.empty());
}

}  // namespace
