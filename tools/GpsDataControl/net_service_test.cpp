// The web service end to end: the library's front functions, the command thread, the real
// GpsDataControl.exe and a web service on 127.0.0.1 (osm_test_server.h), friendly or hostile.
#include <gtest/gtest.h>

#include <atomic>
#include <cwchar>
#include <chrono>
#include <fstream>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <thread>

#include "navmisc/datactrl/dc_errors.h"
#include "navmisc/datactrl/device_state.h"
#include "navmisc/datactrl/net_commands.h"
#include "navmisc/datactrl/request_queue.h"
#include "navmisc/platform/data_root.h"
#include "navmisc/platform/window.h"
#include "osm_test_server.h"
#include "testutil.h"

namespace {

using namespace navmisc::datactrl;
using gpsdc::testing::OsmTestServer;
using Mode = OsmTestServer::Mode;
using navmisc::testutil::TempDir;
using navmisc::testutil::WriteFileBytes;
using Clock = std::chrono::steady_clock;

// The owner window: keeps the web-service replies and connection states delivered to it.
class NetReplies : public CWnd {
 public:
  LRESULT WindowProc(UINT message, WPARAM, LPARAM lParam) override {
    if (message != WM_DATACTRL_RECEIVE) return 0;
    const auto* block = reinterpret_cast<const CDataControlCmdBlk*>(lParam);
    if (block->nCmdType == DC_CMD_NET) nets.push_back(*static_cast<const CDataControlCmdBlkNet*>(block));
    if (block->nCmdType == DC_CMD_CONNECTION_STATUS)
      statuses.push_back(*static_cast<const CDataControlConnectionStatus*>(block));
    return 0;
  }
  std::vector<CDataControlCmdBlkNet> nets;
  std::vector<CDataControlConnectionStatus> statuses;
};

bool Until(const std::function<bool()>& done, int ms) {
  const auto end = Clock::now() + std::chrono::milliseconds(ms);
  while (!done()) {
    if (Clock::now() >= end) return false;
    navmisc::PumpMessagesUntil(done, 10);
  }
  return true;
}

const char kGpx[] =
    "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n"
    "<gpx version=\"1.1\" creator=\"test\" xmlns=\"http://www.topografix.com/GPX/1/1\">"
    "<trk><name>Förde &amp; pier</name><trkseg>"
    "<trkpt lat=\"54.3233\" lon=\"10.1228\"><ele>3.5</ele><time>2024-05-01T08:30:15Z</time></trkpt>"
    "<trkpt lat=\"54.3240\" lon=\"10.1300\"><ele>4</ele><time>2024-05-01T08:30:20.250Z</time></trkpt>"
    "<trkpt lat=\"54.3250\" lon=\"10.1400\"><time>2024-05-01T10:30:25+02:00</time></trkpt>"
    "</trkseg></trk></gpx>\n";

class NetService : public ::testing::Test {
 protected:
  void SetUp() override {
    ASSERT_TRUE(navmisc::UseDataRoot(root_.path()));
    prog_ = std::make_unique<navmisc::testutil::ProgPathScope>(CString::FromUtf8(NAVMISC_TOOLS_DIR));
    g_bLogon = false;
  }
  void TearDown() override {
    Stop();
    EndKeptDataControlProcess();
    navmisc::RemovePerRootObjects(root_.path());
  }

  void Start(const std::string& url, const std::string& geolocateUrl = "", int timeoutSeconds = 2) {
    WriteFileBytes(root_ / L"GpsDataControl.ini",
                   "[WEBSERVICE]\nUrl=" + url + "\nGeolocateUrl=" +
                       (geolocateUrl.empty() ? url + "/v1/geolocate" : geolocateUrl) +
                       "\nTimeoutSeconds=" + std::to_string(timeoutSeconds) + "\n");
    g_bExit = false;
    finished_ = false;
    const HWND hwnd = window_.GetSafeHwnd();
    thread_ = std::thread([this, hwnd] {
      ProcessCommand(&window_);
      finished_ = true;
      PostMessageW(hwnd, WM_NULL, 0, 0);
    });
    ASSERT_TRUE(Until([] { return GetChannelState() == ChannelState::kRunning; }, 10000));
  }

  Clock::duration Stop() {
    if (!thread_.joinable()) return {};
    const auto asked = Clock::now();
    g_bExit = true;
    EXPECT_TRUE(Until([this] { return finished_.load(); }, 60000));
    thread_.join();
    return Clock::now() - asked;
  }

  // Sends a request and waits for the web-service reply that follows it.
  CDataControlCmdBlkNet Ask(const std::function<void()>& send, int ms = 30000) {
    const size_t before = window_.nets.size();
    send();
    if (!Until([&] { return window_.nets.size() > before; }, ms)) {
      ADD_FAILURE() << "no reply";
      return {};
    }
    return window_.nets[before];
  }
  CDataControlCmdBlkNet Ask(CDataControlCmdBlkNet block, int ms = 30000) {
    return Ask([&] { InsertRequestMessage(block); }, ms);
  }
  static CDataControlCmdBlkNet Block(int32_t netCmd, const wchar_t* trackId = L"") {
    CDataControlCmdBlkNet b;
    b.nNetCmd = netCmd;
    b.trackInfo.szTrackId = trackId;
    return b;
  }
  // Asks for the web service's connection state and waits for the answer to this question.
  std::optional<CDataControlConnectionStatus> AskStatus() {
    CDataControlConnectionStatus ask{};
    ask.nCmdType = DC_CMD_CONNECTION_STATUS;
    ask.nSource = DC_SOURCE_NET;
    const std::wstring id = L"ask-" + std::to_wstring(++asked_);
    std::wcsncpy(ask.szDeviceId, id.c_str(), 32);
    InsertRequestMessage(ask);
    std::optional<CDataControlConnectionStatus> answer;
    Until([&] {
      for (const auto& s : window_.statuses)
        if (s.szDeviceId == id) answer = s;
      return answer.has_value();
    }, 10000);
    return answer;
  }
  void LogIn() {
    ASSERT_EQ(Ask([] { DC_NET_UserLogin(L"", CString::FromUtf8(OsmTestServer::kToken)); }).nLastError, 0);
  }

  TempDir root_;
  std::unique_ptr<navmisc::testutil::ProgPathScope> prog_;
  NetReplies window_;
  std::thread thread_;
  std::atomic<bool> finished_{false};
  int asked_ = 0;
};

TEST_F(NetService, LoginGoodAndBad) {
  OsmTestServer server;
  Start(server.url());
  // Nothing but a login works before one.
  EXPECT_EQ(Ask([] { DC_NET_GetUserData(); }).nLastError, DC_ERR_NET_NOT_LOGGED_ON);
  EXPECT_EQ(Ask([] { DC_NET_QueryTrackList(0); }).nLastError, DC_ERR_NET_NOT_LOGGED_ON);
  EXPECT_EQ(server.requests(), 0);

  struct Case {
    const wchar_t* name;
    std::string token;
    int32_t error;
  };
  const Case cases[] = {
      {L"Ann Example", "wrong-token", 401},
      {L"", "", DC_ERR_NET_BAD_REQUEST},
      {L"Bob", OsmTestServer::kToken, DC_ERR_NET_WRONG_USER},
      {L"ann example", OsmTestServer::kToken, 0},
  };
  for (const Case& c : cases) {
    const CDataControlCmdBlkNet reply =
        Ask([&] { DC_NET_UserLogin(c.name, CString::FromUtf8(c.token)); });
    EXPECT_EQ(reply.nNetCmd, DC_NET_CMD_LOGIN);
    EXPECT_EQ(reply.nLastError, c.error) << c.token;
    EXPECT_TRUE(reply.userInfo.szPassword.IsEmpty()) << "the token never comes back";
    if (c.error) continue;
    EXPECT_EQ(reply.userInfo.szUid, CString(L"4711"));
    EXPECT_EQ(reply.userInfo.szDisplayName, CString(L"Ann Example"));
    // The log shows a fingerprint of the token, never the token.
    const CString log = NetReplyLogText(reply);
    EXPECT_EQ(log.Find(CString::FromUtf8(OsmTestServer::kToken)), -1);
    EXPECT_EQ(reply.userInfo.szToken.GetLength(), 12);
    EXPECT_EQ(log, L"\nUid = 4711, Token = " + reply.userInfo.szToken);
  }
  const CDataControlCmdBlkNet user = Ask([] { DC_NET_GetUserData(); });
  EXPECT_EQ(user.nLastError, 0);
  EXPECT_EQ(NetReplyLogText(user), CString(L"UserName = [Ann Example]\r\nDisplayName = [Ann Example]"));
  EXPECT_TRUE(g_bNetConnected);

  // A refused login ends the session.
  EXPECT_EQ(Ask([] { DC_NET_UserLogin(L"", L"wrong-token"); }).nLastError, 401);
  EXPECT_EQ(Ask([] { DC_NET_GetUserData(); }).nLastError, DC_ERR_NET_NOT_LOGGED_ON);
}

TEST_F(NetService, UploadListDownloadDelete) {
  OsmTestServer server;
  Start(server.url());
  LogIn();
  WriteFileBytes(root_ / L"trip.gpx", kGpx);
  WriteFileBytes(root_ / L"broken.gpx", "<gpx><trk>");
  WriteFileBytes(root_ / L"notgpx.xml", "<kml/>");

  // What an upload cannot use is refused before anything is sent.
  const int before = server.requests();
  for (const auto& [path, error] : {std::pair<CString, int32_t>{CString(), DC_ERR_NET_BAD_REQUEST},
                                    std::pair<CString, int32_t>{root_ / L"broken.gpx", DC_ERR_NET_BAD_GPX},
                                    std::pair<CString, int32_t>{root_ / L"notgpx.xml", DC_ERR_NET_BAD_GPX},
                                    std::pair<CString, int32_t>{root_ / L"missing.gpx", DC_ERR_NET_BAD_GPX},
                                    std::pair<CString, int32_t>{root_.path(), DC_ERR_NET_BAD_GPX}}) {
    CDataControlCmdBlkNet upload = Block(DC_NET_CMD_UPLOAD_TRACK);
    upload.fileInfo.sFilePath = path;
    EXPECT_EQ(Ask([&] { DC_NET_UploadTrack(upload); }).nLastError, error) << path.ToUtf8();
  }
  EXPECT_EQ(server.requests(), before);

  CDataControlCmdBlkNet upload = Block(DC_NET_CMD_UPLOAD_TRACK);
  upload.fileInfo.sFilePath = root_ / L"trip.gpx";
  upload.fileInfo.sName = L"Kiel Förde/1.gpx";
  upload.trackInfo.szSubject = L"Kiel";
  upload.trackInfo.szTag = L"sea, bike";
  const CDataControlCmdBlkNet uploaded = Ask([&] { DC_NET_UploadTrack(upload); });
  ASSERT_EQ(uploaded.nLastError, 0);
  EXPECT_EQ(NetReplyLogText(uploaded), CString(L"DC_NET_CMD_UPLOAD_TRACK OK"));
  EXPECT_EQ(uploaded.trackInfo.szTrackId, CString(L"1000"));
  auto traces = server.Traces();
  ASSERT_EQ(traces.size(), 1u);
  EXPECT_EQ(traces[1000].gpx, kGpx);
  EXPECT_EQ(traces[1000].name, "Kiel_F__rde_1.gpx");
  EXPECT_EQ(traces[1000].description, "Kiel") << "without a description the subject stands in";
  EXPECT_EQ(traces[1000].tags, "sea, bike");
  EXPECT_EQ(traces[1000].visibility, "private");

  upload.trackInfo.szDesc = L"Second";
  upload.trackInfo.bListed = 1;
  ASSERT_EQ(Ask([&] { DC_NET_UploadTrack(upload); }).nLastError, 0);
  EXPECT_EQ(server.Traces()[1001].visibility, "public");
  EXPECT_EQ(server.Traces()[1001].description, "Second");

  // The list, newest first, as the reply's marker list.
  CDataControlCmdBlkNet list = Ask([] { DC_NET_QueryTrackList(0); });
  ASSERT_EQ(list.nLastError, 0);
  ASSERT_EQ(list.trackInfo.ptrPOIList.size(), 2u);
  const DC_NET_POI_INFO& newest = list.trackInfo.ptrPOIList[0];
  EXPECT_EQ(newest.szTrackId, CString(L"1001"));
  EXPECT_EQ(newest.szTitle, CString(L"Kiel_F__rde_1.gpx"));
  EXPECT_EQ(newest.szDesc, CString(L"Second"));
  EXPECT_EQ(newest.szIcon, CString(L"public"));
  EXPECT_EQ(newest.sEmbeddedCode, CString(L"sea, bike"));
  EXPECT_DOUBLE_EQ(newest.dLatitude, 54.3233);
  EXPECT_EQ(CovertOleDateTimeToTimeT(newest.tTime), ConvertStdStringTimeT(L"2024-05-01T10:00:01"));
  EXPECT_EQ(list.trackInfo.ptrPOIList[1].szTrackId, CString(L"1000"));
  list = Ask([] { DC_NET_QueryTrackList(1); });
  ASSERT_EQ(list.trackInfo.ptrPOIList.size(), 1u);
  EXPECT_EQ(list.trackInfo.ptrPOIList[0].szTrackId, CString(L"1001"));

  // Download: the details and the points.
  const CDataControlCmdBlkNet track = Ask([] {
    CDataControlCmdBlkNet b = Block(DC_NET_CMD_DWLOAD_TRACK, L"1000");
    DC_NET_QueryTrack(b);
  });
  ASSERT_EQ(track.nLastError, 0);
  EXPECT_TRUE(NetReplyLogText(track).IsEmpty());
  EXPECT_EQ(track.trackInfo.szSubject, CString(L"Kiel_F__rde_1.gpx"));
  EXPECT_EQ(track.trackInfo.szMetaInfo, CString(L"private"));
  EXPECT_EQ(track.trackInfo.bListed, 0);
  ASSERT_EQ(track.trackInfo.ptrPtList.size(), 3u);
  const long t0 = ConvertStdStringTimeT(L"2024-05-01T08:30:15");
  const long times[] = {t0, t0 + 5, t0 + 10};
  const double alts[] = {3.5, 4, 0};
  for (int i = 0; i < 3; ++i) {
    EXPECT_EQ(CovertOleDateTimeToTimeT(track.trackInfo.ptrPtList[i].oleTime), times[i]) << i;
    EXPECT_DOUBLE_EQ(track.trackInfo.ptrPtList[i].dAltitude, alts[i]) << i;
  }
  EXPECT_DOUBLE_EQ(track.trackInfo.ptEnd.dLongitude, 10.14);
  const CDataControlCmdBlkNet info = Ask(Block(DC_NET_CMD_TRACK_INFO, L"1001"));
  EXPECT_EQ(info.nLastError, 0);
  EXPECT_EQ(info.trackInfo.szDesc, CString(L"Second"));
  EXPECT_TRUE(info.trackInfo.ptrPtList.empty());

  // Delete, then the trace is gone.
  EXPECT_EQ(Ask(Block(DC_NET_CMD_REMOVE_TRACK, L"TK_1")).nLastError, DC_ERR_NET_BAD_REQUEST);
  const CDataControlCmdBlkNet removed = Ask(Block(DC_NET_CMD_REMOVE_TRACK, L"1000"));
  EXPECT_EQ(NetReplyLogText(removed), CString(L"DC_NET_CMD_REMOVE_TRACK OK"));
  EXPECT_EQ(NetReplyLogText(Ask(Block(DC_NET_CMD_REMOVE_TRACK, L"1000"))),
            CString(L"DC_NET_CMD_REMOVE_TRACK Failed (Error=404)"));
  EXPECT_EQ(Ask(Block(DC_NET_CMD_DWLOAD_TRACK, L"1000")).nLastError, 404);
  EXPECT_EQ(server.Traces().count(1000), 0u);
}

TEST_F(NetService, CommandsTheServiceCannotDoAnswerNotOffered) {
  OsmTestServer server;
  Start(server.url());
  LogIn();
  const int before = server.requests();
  for (int32_t cmd : {3, 6, 7, 8, 9, 10, 11, 12, 15, 16, 17, 18, 19, 20, 21, 22, 24, 25}) {
    const CDataControlCmdBlkNet reply = Ask(Block(cmd, L"1000"));
    EXPECT_EQ(reply.nNetCmd, cmd);
    EXPECT_EQ(reply.nLastError, DC_ERR_NET_NOT_OFFERED) << cmd;
  }
  for (int32_t cmd : {0, 27, 99, -1}) EXPECT_EQ(Ask(Block(cmd)).nLastError, DC_ERR_UNKNOWN_COMMAND) << cmd;
  EXPECT_EQ(server.requests(), before);
}

TEST_F(NetService, PositionFromCells) {
  OsmTestServer server;
  Start(server.url());
  CxStringList cells;
  cells.AddTail(L"262, 1, 1234, 56789, -71, LTE");
  cells.AddTail(L"262,1,1234,56790");
  // No login needed: the cell database is another service, and it never sees the token.
  LogIn();
  const CDataControlCmdBlkNet reply = Ask([&] { DC_NET_QueryPositionByCellId(cells); });
  ASSERT_EQ(reply.nLastError, 0);
  ASSERT_EQ(reply.cellInfo.GpsInfo.size(), 1u);
  EXPECT_EQ(reply.cellInfo.GpsInfo[0], CString(L"54.3233000,10.1228000,1200"));
  ASSERT_EQ(server.GeolocateBodies().size(), 1u);
  EXPECT_EQ(server.GeolocateBodies()[0],
            R"({"cellTowers":[{"cellId":56789,"locationAreaCode":1234,"mobileCountryCode":262,)"
            R"("mobileNetworkCode":1,"radioType":"lte","signalStrength":-71},{"cellId":56790,)"
            R"("locationAreaCode":1234,"mobileCountryCode":262,"mobileNetworkCode":1,)"
            R"("radioType":"gsm"}],"considerIp":false})");
  EXPECT_EQ(server.GeolocateWithAuthorization(), 0);

  struct Case {
    const wchar_t* cell;
    int32_t error;
  };
  for (const Case& c : {Case{L"262,1,1234,404", 404}, Case{L"262,1,1234", DC_ERR_NET_BAD_REQUEST},
                        Case{L"262,1,x,5", DC_ERR_NET_BAD_REQUEST},
                        Case{L"262,1,2,5,-70,wimax", DC_ERR_NET_BAD_REQUEST}}) {
    CxStringList one;
    one.AddTail(c.cell);
    EXPECT_EQ(Ask([&] { DC_NET_QueryPositionByCellId(one); }).nLastError, c.error);
  }
  CxStringList none;
  EXPECT_EQ(Ask([&] { DC_NET_QueryPositionByCellId(none); }).nLastError, DC_ERR_NET_BAD_REQUEST);
}

// The peak memory of a process, in KiB, from the kernel's account.
long PeakKiB(int pid) {
  std::ifstream status("/proc/" + std::to_string(pid) + "/status");
  std::string line;
  while (std::getline(status, line))
    if (line.rfind("VmHWM:", 0) == 0) return std::stol(line.substr(6));
  return -1;
}

TEST_F(NetService, HostileServersEndInAnErrorWithinBounds) {
  OsmTestServer server;
  Start(server.url(), "", 2);
  LogIn();
  struct Case {
    Mode mode;
    int32_t error;
  };
  const Case cases[] = {
      {Mode::kError500, 500},
      {Mode::kBrokenBody, DC_ERR_NET_BAD_REPLY},
      {Mode::kRedirect, 302},
      {Mode::kHugeHeaders, DC_ERR_NET_TOO_LARGE},
      {Mode::kHugeBody, DC_ERR_NET_TOO_LARGE},
      {Mode::kSilent, DC_ERR_NET_TIMEOUT},
      {Mode::kSlowDrip, DC_ERR_NET_TIMEOUT},
  };
  for (const Case& c : cases) {
    server.SetMode(c.mode);
    const int before = server.requests();
    const auto asked = Clock::now();
    const CDataControlCmdBlkNet reply = Ask([] { DC_NET_GetUserData(); });
    const auto took = Clock::now() - asked;
    EXPECT_EQ(reply.nLastError, c.error) << static_cast<int>(c.mode);
    EXPECT_EQ(NetReplyLogText(reply),
              L"DC_NET_CMD_GETUSERDATA Failed (Error=" + CString(std::to_wstring(c.error)) + L")");
    // The time-out is 2 s; a loaded machine gets a generous margin.
    EXPECT_LT(took, std::chrono::seconds(15)) << static_cast<int>(c.mode);
    EXPECT_EQ(server.requests() - before, 1) << "one exchange, no retries, no redirects followed";
  }
  EXPECT_LT(PeakKiB(DataControlProcessId()), 512 * 1024) << "the endless body was not kept";
  EXPECT_FALSE(g_bNetConnected) << "a service that does not answer is not reachable";

  // A command stuck on a silent service holds up neither status queries nor the end of the
  // channel: the exchange is cut short when the process is told to end.
  server.SetMode(Mode::kNormal);
  Stop();
  Start(server.url(), "", 60);
  LogIn();
  server.SetMode(Mode::kSilent);
  const size_t replies = window_.nets.size();
  const int sent = server.requests();
  DC_NET_GetUserData();
  ASSERT_TRUE(Until([&] { return server.requests() > sent; }, 10000));
  // Behind it 16 commands may wait; more are turned away at once.
  for (int i = 0; i < 20; ++i) DC_NET_GetUserData();
  ASSERT_TRUE(Until([&] { return window_.nets.size() >= replies + 4; }, 10000));
  for (size_t i = replies; i < window_.nets.size(); ++i)
    EXPECT_EQ(window_.nets[i].nLastError, DC_ERR_NET_BUSY);
  const auto asked = Clock::now();
  EXPECT_TRUE(AskStatus());
  EXPECT_LT(Clock::now() - asked, std::chrono::seconds(5));
  EXPECT_LT(Stop(), std::chrono::seconds(10));
  EXPECT_EQ(window_.nets.size(), replies + 4) << "the waiting commands went with the process";
  EXPECT_EQ(DataControlProcessId(), 0) << "the process ended in time, it was not kept";
}

TEST_F(NetService, OnlyHttpsOrTheLoopbackIsUsed) {
  OsmTestServer server;
  // Plain http elsewhere is refused without a connection; https to a server that speaks no TLS
  // fails its handshake (certificate checks are never switched off).
  struct Case {
    std::string url;
    int32_t error;
    bool connected;
  };
  const Case cases[] = {
      {"http://192.0.2.1:" + std::to_string(server.port()), DC_ERR_NET_BAD_ADDRESS, false},
      {"ftp://127.0.0.1:" + std::to_string(server.port()), DC_ERR_NET_BAD_ADDRESS, false},
      {"https://127.0.0.1:" + std::to_string(server.port()), DC_ERR_NET_TLS, true},
      {"http://localhost:" + std::to_string(server.port()) + "/", 0, true},
  };
  for (const Case& c : cases) {
    Start(c.url);
    const auto status = AskStatus();
    ASSERT_TRUE(status);
    EXPECT_EQ(status->bConnected, c.connected) << c.url;
    EXPECT_EQ(Ask([] { DC_NET_UserLogin(L"", CString::FromUtf8(OsmTestServer::kToken)); }).nLastError,
              c.error)
        << c.url;
    Stop();
  }
}

}  // namespace
