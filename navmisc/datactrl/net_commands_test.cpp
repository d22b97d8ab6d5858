// The web-service front functions, their log texts and the login dialog, with the request
// queue read back directly (no data-control process).
#include "navmisc/datactrl/net_commands.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <memory>
#include <optional>
#include <vector>

#include "navmisc/datactrl/block_codec.h"
#include "navmisc/datactrl/detail/channel_state.h"
#include "navmisc/datactrl/login_dialog.h"
#include "navmisc/datactrl/request_queue.h"
#include "navmisc/platform/data_root.h"
#include "navmisc/platform/msg_queue.h"
#include "navmisc/platform/resources.h"
#include "navmisc/records/user_profile.h"
#include "sample_blocks.h"
#include "testutil.h"

namespace {

using namespace navmisc::datactrl;
using navmisc::testutil::TempDir;

// Makes the request queue of a temporary data root the destination of requests, and reads
// back what the front functions send.
class NetFront : public ::testing::Test {
 protected:
  void SetUp() override {
    ASSERT_TRUE(navmisc::UseDataRoot(root_.path()));
    setenv("NAVMISC_KEY_FILE", (root_ / L"secret.key").ToUtf8().c_str(), 1);
    prog_ = std::make_unique<navmisc::testutil::ProgPathScope>(CString::FromUtf8(NAVMISC_TOOLS_DIR));
    queue_ = std::make_shared<CxSysMsgQueue>(kRequestQueueName, 256, navmisc::kSysMsgOpenOrCreate);
    ASSERT_TRUE(queue_->IsValid());
    detail::PublishRequestQueue(queue_);
    g_bLogon = false;
  }
  void TearDown() override {
    detail::PublishRequestQueue(nullptr);
    queue_->Unlink();
    unsetenv("NAVMISC_KEY_FILE");
    g_bLogon = false;
    navmisc::RemovePerRootObjects(root_.path());
  }

  // The next request sent, as the block of its kind; nullopt when none waits.
  template <class Block>
  std::optional<Block> Next() {
    CxSysMsgInfo info;
    auto message = queue_->Receive(0, &info, 1);
    if (!message) return std::nullopt;
    CUnpackageBlk package(message.get(), info.nSize);
    Block block{};
    UnpackBlock(package, block);
    return block;
  }
  std::optional<CDataControlCmdBlkNet> NextNet() { return Next<CDataControlCmdBlkNet>(); }

  TempDir root_;
  std::unique_ptr<navmisc::testutil::ProgPathScope> prog_;
  std::shared_ptr<CxSysMsgQueue> queue_;
};

CDataControlCmdBlkNet Reply(int32_t netCmd, int32_t error) {
  CDataControlCmdBlkNet r;
  r.nNetCmd = netCmd;
  r.nLastError = error;
  return r;
}

TEST_F(NetFront, EachFunctionSendsItsCommandFromAnEmptyBlock) {
  CxStringList cells;
  cells.AddTail(L"262,1,1234,56789");
  cells.AddTail(L"262,1,1234,56790,-71,lte");
  struct Case {
    void (*send)(CxStringList&);
    int32_t netCmd;
    void (*expect)(CDataControlCmdBlkNet&);
  };
  const Case cases[] = {
      {[](CxStringList&) { DC_NET_UserLogin(L"ann", L"tok"); }, 1,
       [](CDataControlCmdBlkNet& b) {
         b.userInfo.szUserName = L"ann";
         b.userInfo.szPassword = L"tok";
       }},
      {[](CxStringList&) { DC_NET_GetUserData(); }, 2, [](CDataControlCmdBlkNet&) {}},
      {[](CxStringList&) { DC_NET_QueryTrackList(7); }, 13,
       [](CDataControlCmdBlkNet& b) { b.trackInfo.nPageId = 7; }},
      {[](CxStringList&) { DC_NET_DelAllTrkFiles(L"TK_1"); }, 20,
       [](CDataControlCmdBlkNet& b) { b.trackInfo.szTrackId = L"TK_1"; }},
      {[](CxStringList&) { DC_NET_DelAllTrkMarkers(L"TK_2"); }, 21,
       [](CDataControlCmdBlkNet& b) { b.trackInfo.szTrackId = L"TK_2"; }},
      {[](CxStringList&) { DC_NET_QueryGpsOffset(54.25, -10.5); }, 25,
       [](CDataControlCmdBlkNet& b) {
         b.trackInfo.ptStart.dLatitude = 54.25;
         b.trackInfo.ptStart.dLongitude = -10.5;
       }},
      {[](CxStringList& c) { DC_NET_QueryPositionByCellId(c); }, 26,
       [](CDataControlCmdBlkNet& b) {
         b.cellInfo.CellInfo = {L"262,1,1234,56789", L"262,1,1234,56790,-71,lte"};
       }},
  };
  for (const Case& c : cases) {
    c.send(cells);
    auto sent = NextNet();
    ASSERT_TRUE(sent) << c.netCmd;
    CDataControlCmdBlkNet expected;
    expected.nNetCmd = c.netCmd;
    c.expect(expected);
    EXPECT_TRUE(*sent == expected) << c.netCmd;
  }
  EXPECT_EQ(cells.GetCount(), 2) << "the caller's list stays the caller's";

  DC_NET_QueryNetStatus();
  auto status = Next<CDataControlConnectionStatus>();
  ASSERT_TRUE(status);
  EXPECT_EQ(status->nCmdType, DC_CMD_CONNECTION_STATUS);
  EXPECT_EQ(status->nSource, DC_SOURCE_NET);
  EXPECT_EQ(status->bConnected, 0);
  EXPECT_FALSE(NextNet());
}

TEST_F(NetFront, TextsAreCutToTheirCapacity) {
  const CString longText(L'n', 300);
  DC_NET_UserLogin(longText, CString(L'p', 256));
  auto login = NextNet();
  ASSERT_TRUE(login);
  EXPECT_EQ(login->userInfo.szUserName, CString(L'n', 255));
  EXPECT_EQ(login->userInfo.szPassword, CString(L'p', 255));
  DC_NET_UserLogin(CString(L'n', 255), L"short");
  EXPECT_EQ(NextNet()->userInfo.szUserName, CString(L'n', 255));

  DC_NET_DelAllTrkFiles(longText);
  EXPECT_EQ(NextNet()->trackInfo.szTrackId, CString(L'n', 254));
  DC_NET_DelAllTrkMarkers(CString(L't', 254));
  EXPECT_EQ(NextNet()->trackInfo.szTrackId, CString(L't', 254));
}

TEST_F(NetFront, CallerBuiltBlocksGoAsTheyAre) {
  void (*const senders[])(CDataControlCmdBlkNet&) = {
      DC_NET_CreateAccount, DC_NET_UploadTrack,         DC_NET_RemoveTrack,     DC_NET_UploadPhoto,
      DC_NET_RemovePhoto,   DC_NET_AddTrackPhoto,       DC_NET_AddTrackPOI,     DC_NET_AddTrackHtml,
      DC_NET_RemoveMarker,  DC_NET_AddTrackFile,        DC_NET_QueryPreDefCategory,
      DC_NET_QueryUserDefTag, DC_NET_QueryTrack,        DC_NET_TrackMarkerList, DC_NET_GetFile,
      DC_NET_TrackInfo,     DC_NET_GetGMapInfo};
  int i = 0;
  for (auto send : senders) {
    CDataControlCmdBlkNet block = navmisc::datactrl::testing::SampleNet();
    block.nNetCmd = 100 + i++;  // whatever the caller put there
    const CDataControlCmdBlkNet before = block;
    send(block);
    EXPECT_TRUE(block == before);
    auto sent = NextNet();
    ASSERT_TRUE(sent);
    EXPECT_TRUE(*sent == before) << block.nNetCmd;
  }
}

TEST(NetReplyLog, TextsOfEveryReply) {
  struct Case {
    int32_t netCmd;
    int32_t error;
    const wchar_t* text;
  };
  const Case cases[] = {
      {1, 401, L"Failed to DC_NET_CMD_LOGIN. (Error=401)"},
      {2, 9102, L"DC_NET_CMD_GETUSERDATA Failed (Error=9102)"},
      {3, 9101, L"DC_NET_CMD_CREATE_ACCOUNT Failed (Error=9101)"},
      {4, 0, L"DC_NET_CMD_UPLOAD_TRACK OK"},
      {4, 500, L"DC_NET_CMD_UPLOAD_TRACK Failed (Error=500)"},
      {5, 0, L"DC_NET_CMD_REMOVE_TRACK OK"},
      {5, 404, L"DC_NET_CMD_REMOVE_TRACK Failed (Error=404)"},
      {6, 0, L"DC_NET_CMD_UPLOAD_PHOTO OK"},
      {6, 7, L"DC_NET_CMD_UPLOAD_PHOTO Failed (Error=7)"},
      {7, 0, L"DC_NET_CMD_REMOVE_PHOTO OK"},
      {7, 7, L""},
      {8, 9101, L"DC_NET_CMD_UPLOAD_PHOTO Failed (Error=9101)"},
      {9, 0, L"DC_NET_CMD_ADD_POI_TO_TRACK OK"},
      {9, -1, L"DC_NET_CMD_ADD_POI_TO_TRACK Failed (Error=-1)"},
      {10, 0, L"DC_NET_CMD_ADD_HTML_TO_TRACK OK"},
      {10, 3, L"DC_NET_CMD_ADD_HTML_TO_TRACK Failed (Error=3)"},
      {11, 0, L"DC_NET_CMD_REMOVE_MARKER OK"},
      {11, 3, L"DC_NET_CMD_REMOVE_MARKER Failed (Error=3)"},
      {12, 0, L"DC_NET_CMD_ADD_FILE_TO_TRACK OK"},
      {12, 3, L"DC_NET_CMD_ADD_FILE_TO_TRACK Failed (Error=3)"},
      {13, 0, L""},
      {13, 3, L""},
      {14, 0, L""},
      {14, 9109, L"DC_NET_CMD_DWLOAD_TRACK Failed (Error=9109)"},
      {15, 0, L" DC_NET_CMD_QUERY_PHOTO_LIST OK"},
      {15, 12, L" Failed (Error=12)"},
      {16, 0, L"DC_NET_CMD_QUERY_TRACK_PHOTO_LIST OK"},
      {16, 12, L"DC_NET_CMD_QUERY_TRACK_PHOTO_LIST Failed (Error=12)"},
      {26, 0, L""},
  };
  for (const Case& c : cases)
    EXPECT_EQ(NetReplyLogText(Reply(c.netCmd, c.error)), CString(c.text)) << c.netCmd << "/" << c.error;

  CDataControlCmdBlkNet user = Reply(1, 0);
  user.userInfo.szUid = L"4711";
  user.userInfo.szToken = L"a1b2c3";
  user.userInfo.szUserName = L"ann";
  user.userInfo.szDisplayName = L"Ann B";
  EXPECT_EQ(NetReplyLogText(user), CString(L"\nUid = 4711, Token = a1b2c3"));
  user.nNetCmd = 2;
  EXPECT_EQ(NetReplyLogText(user), CString(L"UserName = [ann]\r\nDisplayName = [Ann B]"));
  user.nNetCmd = 3;
  EXPECT_EQ(NetReplyLogText(user),
            CString(L"DC_NET_CMD_CREATE_ACCOUNT OK\r\nUserName = [ann]\r\nDisplayName = [Ann B]"));

  CDataControlCmdBlkNet photos = Reply(8, 0);
  photos.photoInfo.resize(2);
  photos.photoInfo[0].szTrackId = L"T1";
  photos.photoInfo[0].szTrackPhotoId = L"P1";
  photos.photoInfo[1].szTrackId = L"T1";
  photos.photoInfo[1].szTrackPhotoId = L"P2";
  EXPECT_EQ(NetReplyLogText(photos),
            CString(L"DC_NET_CMD_ADD_PHOTO_TO_TRACK OK\r\n Add To Track [T1], Id = [P1]"
                    L"\r\n Add To Track [T1], Id = [P2]"));
}

TEST_F(NetFront, LoggingALoginAsksForTheTrackList) {
  CString log;
  LogNetReply(Reply(1, 401), log);
  EXPECT_FALSE(NextNet());
  LogNetReply(Reply(4, 0), log);
  EXPECT_FALSE(NextNet());
  EXPECT_EQ(log, CString(L"Failed to DC_NET_CMD_LOGIN. (Error=401)DC_NET_CMD_UPLOAD_TRACK OK"));
  LogNetReply(Reply(1, 0), log);
  auto list = NextNet();
  ASSERT_TRUE(list);
  EXPECT_EQ(list->nNetCmd, DC_NET_CMD_QUERY_TRACK_LIST);
  EXPECT_EQ(list->trackInfo.nPageId, 0);
}

// A login dialog without a screen: the fields and the state of the controls.
class FakeLoginView : public ILoginView {
 public:
  CString GetUserName() override { return name; }
  CString GetPassword() override { return password; }
  bool GetKeepPassword() override { return keep; }
  void SetUserName(const CString& s) override { name = s; }
  void SetPassword(const CString& s) override { password = s; }
  void SetKeepPassword(bool k) override { keep = k; }
  void EnableOk(bool e) override { okEnabled = e; }
  void EnableOtherControls(bool e) override { othersEnabled = e; }
  void EndDialog(int r) override { result = r; }
  void ShowMessageBox(const CString& text, Icon icon, bool rtl) override {
    messages.push_back(text);
    lastIcon = icon;
    rightToLeft = rtl;
  }

  CString name, password;
  bool keep = false;
  bool okEnabled = true;
  bool othersEnabled = true;
  int result = 0;
  std::vector<CString> messages;
  Icon lastIcon = Icon::kNone;
  bool rightToLeft = false;
};

TEST_F(NetFront, LoginDialogFillsEnablesAndSends) {
  USER_MAP_INFO profile(GPS_APP_TRIP);
  profile.userAccount = L"ann";
  profile.password = L"stored";
  for (bool keep : {false, true}) {
    profile.keepPassword = keep;
    FakeLoginView view;
    CLoginDlg dlg(view, profile);
    dlg.OnInitDialog();
    EXPECT_EQ(view.name, CString(L"ann"));
    EXPECT_EQ(view.password, CString(keep ? L"stored" : L""));
    EXPECT_EQ(view.keep, keep);
    EXPECT_EQ(view.okEnabled, keep);
    EXPECT_EQ(view.result, 0);
  }

  FakeLoginView view;
  CLoginDlg dlg(view, profile);
  struct Fields {
    const wchar_t* name;
    const wchar_t* password;
    bool ok;
  };
  for (const Fields& f : {Fields{L"", L"", false}, Fields{L"ann", L"", false},
                          Fields{L"", L"tok", false}, Fields{L"ann", L"tok", true}}) {
    view.name = f.name;
    view.password = f.password;
    dlg.OnChangeName();
    EXPECT_EQ(view.okEnabled, f.ok) << f.name << "/" << f.password;
    dlg.BeginLogin();
    auto sent = NextNet();
    EXPECT_EQ(sent.has_value(), f.ok);
    if (sent) {
      EXPECT_EQ(sent->nNetCmd, DC_NET_CMD_LOGIN);
      EXPECT_EQ(sent->userInfo.szUserName, CString(f.name));
      EXPECT_EQ(sent->userInfo.szPassword, CString(f.password));
      EXPECT_FALSE(view.okEnabled);
      EXPECT_FALSE(view.othersEnabled);
    }
  }
}

TEST_F(NetFront, LoginDialogTakesTheReplies) {
  USER_MAP_INFO profile(GPS_APP_TRIP);
  profile.ReadInfo();
  FakeLoginView view;
  CLoginDlg dlg(view, profile, L"Arabic");
  dlg.OnInitDialog();
  view.name = L"ann";
  view.password = L"the-token";
  view.keep = true;
  dlg.BeginLogin();
  ASSERT_TRUE(NextNet());

  // A refused login: the message, the controls back, nothing stored.
  CDataControlCmdBlkNet refused = Reply(DC_NET_CMD_LOGIN, 401);
  dlg.OnReceiveQueueMessage(0, reinterpret_cast<LPARAM>(&refused));
  ASSERT_EQ(view.messages.size(), 1u);
  ASSERT_FALSE(LoadResString(9546).IsEmpty());
  EXPECT_EQ(view.messages[0], LoadResString(9546));
  EXPECT_EQ(view.lastIcon, IDataCtrlDialogView::Icon::kError);
  EXPECT_TRUE(view.rightToLeft);
  EXPECT_TRUE(view.okEnabled);
  EXPECT_TRUE(view.othersEnabled);
  EXPECT_FALSE(g_bLogon);
  EXPECT_EQ(view.result, 0);
  EXPECT_TRUE(profile.userAccount.IsEmpty());

  // Replies to other commands, and user data that failed, leave the dialog open.
  for (CDataControlCmdBlkNet other : {Reply(DC_NET_CMD_UPLOAD_TRACK, 0), Reply(DC_NET_CMD_GETUSERDATA, 5)}) {
    view.okEnabled = view.othersEnabled = false;
    dlg.OnReceiveQueueMessage(0, reinterpret_cast<LPARAM>(&other));
    EXPECT_EQ(view.result, 0);
    EXPECT_EQ(view.okEnabled, other.nNetCmd == DC_NET_CMD_GETUSERDATA);
  }

  // The accepted login is stored, sealed, in the profile's file.
  CDataControlCmdBlkNet accepted = Reply(DC_NET_CMD_LOGIN, 0);
  dlg.OnReceiveQueueMessage(0, reinterpret_cast<LPARAM>(&accepted));
  EXPECT_TRUE(g_bLogon);
  EXPECT_EQ(view.result, IDOK);
  const std::string file = navmisc::testutil::ReadFileBytes(profile.GetProfilePathName());
  EXPECT_NE(file.find("user_account=ann"), std::string::npos);
  EXPECT_NE(file.find("keep_password=1"), std::string::npos);
  EXPECT_EQ(file.find("the-token"), std::string::npos);
  USER_MAP_INFO reread(GPS_APP_TRIP);
  reread.ReadInfo();
  EXPECT_EQ(reread.password, CString(L"the-token"));

  // Opened again while logged on: closes at once, without a request.
  FakeLoginView again;
  CLoginDlg second(again, profile);
  second.OnInitDialog();
  EXPECT_EQ(again.result, IDOK);
  EXPECT_FALSE(NextNet());

  // User data that came back closes the dialog.
  FakeLoginView third;
  CLoginDlg dataDlg(third, profile);
  CDataControlCmdBlkNet data = Reply(DC_NET_CMD_GETUSERDATA, 0);
  dataDlg.OnReceiveQueueMessage(0, reinterpret_cast<LPARAM>(&data));
  EXPECT_EQ(third.result, IDOK);

  // Of the device replies only the clear-log outcome counts.
  CDataControlCmdBlkKVDevice device;
  InitDeviceBlockDefaults(device);
  device.nDeviceCmd = DC_DEVICE_READ_LOG;
  dlg.OnReceiveQueueMessage(0, reinterpret_cast<LPARAM>(&device));
  EXPECT_TRUE(dlg.clearLogText().IsEmpty());
  device.nDeviceCmd = DC_DEVICE_CLEAR_LOG;
  device.nLastError = 5;
  dlg.OnReceiveQueueMessage(0, reinterpret_cast<LPARAM>(&device));
  EXPECT_EQ(dlg.clearLogText(), ClearLogOutcomeText(5));
  EXPECT_NE(dlg.clearLogText(), ClearLogOutcomeText(0));
}

}  // namespace
