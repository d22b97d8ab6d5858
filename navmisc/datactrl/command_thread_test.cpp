// The channel end to end: the command thread, the real queues and the real GpsDataControl.exe.
#include <signal.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <unistd.h>

#include <gtest/gtest.h>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <fstream>
#include <memory>
#include <random>
#include <string>
#include <thread>
#include <tuple>
#include <vector>

#include "navmisc/datactrl/block_codec.h"
#include "navmisc/datactrl/dc_errors.h"
#include "navmisc/datactrl/device_commands.h"
#include "navmisc/datactrl/device_state.h"
#include "navmisc/import/import_errors.h"
#include "navmisc/datactrl/net_commands.h"
#include "navmisc/datactrl/reply_dialog.h"
#include "navmisc/datactrl/request_queue.h"
#include "navmisc/platform/data_root.h"
#include "navmisc/platform/detail/msg_ring.h"
#include "navmisc/platform/files.h"
#include "navmisc/platform/msg_queue.h"
#include "navmisc/platform/process.h"
#include "navmisc/platform/resources.h"
#include "navmisc/platform/shared_globals.h"
#include "navmisc/platform/textconv.h"
#include "channel_harness.h"
#include "sample_blocks.h"
#include "testutil.h"

namespace {

using namespace navmisc::datactrl;
using namespace std::chrono_literals;
using navmisc::datactrl::testing::SampleDevice;
using navmisc::datactrl::testing::SampleKV11;
using navmisc::datactrl::testing::SampleNet;
using navmisc::testutil::ProgPathScope;
using navmisc::testutil::TempDir;
using navmisc::testutil::WriteFileBytes;
using Clock = std::chrono::steady_clock;

// Handles the test thread's messages until `done` holds or `ms` pass; looks again every few
// milliseconds for conditions that change without a message.
template <class F>
bool Until(F done, int ms = 30000) {
  const auto end = Clock::now() + std::chrono::milliseconds(ms);
  while (!done()) {
    if (Clock::now() >= end) return false;
    navmisc::PumpMessagesUntil(done, 10);
  }
  return true;
}

// The owner window: keeps a copy of every reply delivered to it.
class ReplyRecorder : public CWnd {
 public:
  LRESULT WindowProc(UINT message, WPARAM, LPARAM lParam) override {
    if (message != WM_DATACTRL_RECEIVE) return 0;
    const auto* block = reinterpret_cast<const CDataControlCmdBlk*>(lParam);
    kinds.push_back(block->nCmdType);
    ids.emplace_back(block->szDeviceId);
    if (!keepCopies) return 0;
    switch (block->nCmdType) {
      case DC_CMD_DEVICE:
        if (UsesKV11Block(static_cast<const CDataControlCmdBlkKVDevice*>(block)->nDeviceCmd))
          kv11.push_back(*static_cast<const CDataControlCmdBlkKVDevice11*>(block));
        else
          devices.push_back(*static_cast<const CDataControlCmdBlkKVDevice*>(block));
        break;
      case DC_CMD_NET: nets.push_back(*static_cast<const CDataControlCmdBlkNet*>(block)); break;
      case DC_CMD_FILE: files.push_back(*static_cast<const CDataControlCmdBlkFile*>(block)); break;
      case DC_CMD_CONNECTION_STATUS:
        statuses.push_back(*static_cast<const CDataControlConnectionStatus*>(block));
        break;
      case DC_CMD_PROGRESS:
        progress.push_back(*static_cast<const CDataControlProgressCmdBlk*>(block));
        break;
    }
    return 0;
  }

  bool HasId(const std::wstring& id) const {
    return std::find(ids.begin(), ids.end(), id) != ids.end();
  }
  // The status reply that carries `id`.
  const CDataControlConnectionStatus* Status(const std::wstring& id) const {
    for (const auto& s : statuses)
      if (s.szDeviceId == id) return &s;
    return nullptr;
  }

  bool keepCopies = true;
  std::vector<int32_t> kinds;
  std::vector<std::wstring> ids;
  std::vector<CDataControlConnectionStatus> statuses;
  std::vector<CDataControlProgressCmdBlk> progress;
  std::vector<CDataControlCmdBlkKVDevice> devices;
  std::vector<CDataControlCmdBlkKVDevice11> kv11;
  std::vector<CDataControlCmdBlkNet> nets;
  std::vector<CDataControlCmdBlkFile> files;
};

template <class Block>
Block WithId(Block b, const wchar_t* id) {
  std::wcsncpy(b.szDeviceId, id, 32);
  return b;
}

CDataControlConnectionStatus StatusQuery(int32_t source, const wchar_t* id) {
  CDataControlConnectionStatus s{};
  s.nCmdType = DC_CMD_CONNECTION_STATUS;
  s.nSource = source;
  return WithId(s, id);
}

bool ObjectExists(const std::string& name) {
  struct stat st;
  return ::stat(("/dev/shm" + name).c_str(), &st) == 0;
}

class Channel : public ::testing::Test {
 protected:
  void SetUp() override {
    ASSERT_TRUE(navmisc::UseDataRoot(root_.path()));
    UseProgramFolder(CString::FromUtf8(NAVMISC_TOOLS_DIR));
    g_wDeviceModelID = 0;
  }
  void TearDown() override {
    Stop();
    EndKeptDataControlProcess();
    navmisc::RemovePerRootObjects(root_.path());
  }

  // Where the command thread looks for GpsDataControl.exe.
  void UseProgramFolder(const CString& folder) {
    prog_.reset();  // the old scope puts its value back first
    prog_ = std::make_unique<ProgPathScope>(folder);
  }

  void Configure(const CString& devicePath, const CString& url) {
    WriteFileBytes(root_ / L"GpsDataControl.ini",
                   "[DEVICE]\nPath=" + devicePath.ToUtf8() + "\n[WEBSERVICE]\nUrl=" + url.ToUtf8() +
                       "\n");
  }

  // Starts the command thread with `owner` and waits until the channel runs.
  void Start(CWnd& owner) {
    g_bExit = false;
    finished_ = false;
    const HWND hwnd = owner.GetSafeHwnd();
    thread_ = std::thread([this, &owner, hwnd] {
      ProcessCommand(&owner);
      finished_ = true;
      PostMessageW(hwnd, WM_NULL, 0, 0);
    });
    ASSERT_TRUE(Until([] { return GetChannelState() == ChannelState::kRunning; }, 10000));
  }
  void Start() { Start(window_); }

  // Sets g_bExit and handles the window's messages until the thread has ended; returns the
  // time that took.
  Clock::duration Stop() {
    if (!thread_.joinable()) return {};
    const auto asked = Clock::now();
    g_bExit = true;
    EXPECT_TRUE(Until([this] { return finished_.load(); }, 60000));
    const auto took = Clock::now() - asked;
    thread_.join();
    return took;
  }

  TempDir root_;
  std::unique_ptr<ProgPathScope> prog_;
  ReplyRecorder window_;
  std::thread thread_;
  std::atomic<bool> finished_{false};
};

TEST_F(Channel, EveryBlockRoundTripsThroughTheProcess) {
  // A logger of the KV-11 family (model 8), so that its settings travel in that family's block.
  navmisc::testutil::MakeLogger(root_ / L"logger", 8, 31);
  Configure(root_ / L"logger", L"http://127.0.0.1:9/");
  Start();

  // Connection status: the process answers from its configuration; an unknown source and a
  // header-only block (no source) get an error.
  InsertRequestMessage(StatusQuery(DC_SOURCE_DEVICE, L"ask-1"));
  InsertRequestMessage(StatusQuery(DC_SOURCE_NET, L"ask-2"));
  InsertRequestMessage(StatusQuery(7, L"ask-7"));
  InsertRequestMessage(CDataControlCmdBlk{DC_CMD_CONNECTION_STATUS, L"header", 0});
  // Device and KV-11 blocks come back as they went, with their outcome; a web-service block
  // with the error code of a command that needs a login, a file block with the import's
  // outcome; progress with the code of a block sent the wrong way.
  const CDataControlCmdBlkKVDevice device = SampleDevice();
  InsertRequestMessage(device);
  CDataControlCmdBlkKVDevice unknown = WithId(SampleDevice(), L"unknown");
  unknown.nDeviceCmd = 77;
  InsertRequestMessage(unknown);
  const CDataControlCmdBlkNet net = SampleNet();
  InsertRequestMessage(net);
  // Web-service commands run on a thread of their own: their replies keep their own order only.
  ASSERT_TRUE(Until([&] { return window_.nets.size() == 1; }));
  CDataControlCmdBlkFile file;
  std::wcscpy(file.szDeviceId, L"file");
  file.nFileCmd = DC_FILE_IMPORT;
  file.szFilePath = L"/home/ann/Tracks/Ostsee 2024.gpx";
  file.nTimeZone = 3600;
  file.trackInfo = net.trackInfo;
  InsertRequestMessage(file);
  const CDataControlProgressCmdBlk progress{DC_CMD_PROGRESS, L"progress", 0, 1, 10, 4, 3, 1};
  InsertRequestMessage(progress);
  ASSERT_TRUE(Until([&] { return window_.HasId(L"progress"); }));

  // The KV-11 family's settings.
  const CDataControlCmdBlkKVDevice11 kv11 = SampleKV11();
  InsertRequestMessage(kv11);
  CDataControlCmdBlkKVDevice read = WithId(SampleDevice(), L"read-log");
  read.nDeviceCmd = DC_DEVICE_READ_LOG;  // not a settings command: the plain block
  InsertRequestMessage(read);
  ASSERT_TRUE(Until([&] { return window_.HasId(L"read-log"); }));

  // Besides the replies, the two statuses the process announces when it starts.
  EXPECT_EQ(window_.kinds, (std::vector<int32_t>{4, 4, 4, 4, 4, 4, 1, 1, 2, 3, 5, 1, 1}));
  const struct {
    const wchar_t* id;
    int32_t source;
    uint8_t connected;
    int32_t error;
  } statuses[] = {{L"ask-1", 1, 1, 0}, {L"ask-2", 2, 1, 0}, {L"ask-7", 7, 0, DC_ERR_UNKNOWN_COMMAND},
                  {L"header", 0, 0, DC_ERR_UNKNOWN_COMMAND}};
  for (const auto& s : statuses) {
    const CDataControlConnectionStatus* got = window_.Status(s.id);
    ASSERT_TRUE(got) << navmisc::ToUtf8Lossy(s.id);
    EXPECT_EQ(std::tuple(got->nSource, got->bConnected, got->nLastError),
              std::tuple(s.source, s.connected, s.error));
  }
  EXPECT_EQ(std::tuple(window_.statuses[0].nSource, window_.statuses[1].nSource), std::tuple(1, 2));
  EXPECT_TRUE(g_bDeviceConnected);
  EXPECT_TRUE(g_bNetConnected);

  auto failed = [](auto block, int32_t error) {
    block.nLastError = error;
    return block;
  };
  // The plain settings written to the KV-11 logger come back in that family's block, as the
  // command thread unpacks every settings reply of the family.
  ASSERT_EQ(window_.kv11.size(), 2u);
  EXPECT_EQ(std::tuple(std::wstring(window_.kv11[0].szDeviceId), window_.kv11[0].nDeviceCmd,
                       window_.kv11[0].nLastError),
            std::tuple(std::wstring(L"dv"), device.nDeviceCmd, 0));
  EXPECT_TRUE(window_.kv11[1] == failed(kv11, DC_ERR_NONE));
  // A read of a logger without logs succeeds without a time range.
  ASSERT_EQ(window_.devices.size(), 2u);
  EXPECT_TRUE(window_.devices[0] == failed(unknown, DC_ERR_UNKNOWN_COMMAND));
  EXPECT_TRUE(window_.devices[1] == failed(read, DC_ERR_NONE));
  ASSERT_EQ(window_.nets.size(), 1u);
  CDataControlCmdBlkNet notLoggedOn = failed(net, DC_ERR_NET_NOT_LOGGED_ON);
  notLoggedOn.userInfo.szPassword.Empty();  // a password never comes back
  EXPECT_TRUE(window_.nets[0] == notLoggedOn);
  ASSERT_EQ(window_.files.size(), 1u);
  // The import takes the track record's data as the file's format name, which the sample's is not.
  EXPECT_EQ(std::tuple(std::wstring(window_.files[0].szDeviceId), window_.files[0].nFileCmd,
                       window_.files[0].nLastError),
            std::tuple(std::wstring(L"file"), int32_t{DC_FILE_IMPORT}, int32_t{DC_ERR_IMPORT_FORMAT}));
  ASSERT_EQ(window_.progress.size(), 1u);
  EXPECT_TRUE(window_.progress[0] == failed(progress, DC_ERR_NOT_A_REQUEST));
}

TEST_F(Channel, StatusFollowsWhatIsConfigured) {
  Configure(root_ / L"no-such-logger", L"ftp://example.org/");
  Start();
  DC_KVDEVICE_QueryDeviceStatus();
  DC_NET_QueryNetStatus();
  ASSERT_TRUE(Until([&] { return window_.statuses.size() == 4; }));
  for (const auto& s : window_.statuses) EXPECT_EQ(std::pair(s.bConnected, s.nLastError), std::pair(uint8_t{0}, 0));
  EXPECT_EQ(std::pair(window_.statuses[2].nSource, window_.statuses[3].nSource), std::pair(1, 2));
  EXPECT_FALSE(g_bDeviceConnected);
}

TEST_F(Channel, LeftoversOfAnEarlierRunAndUnknownKindsAreNotDelivered) {
  {
    // What a crashed run left: a reply nobody took and a request nobody served.
    CxSysMsgQueue replies(kReplyQueueName, kQueueCapacityKiB, navmisc::kSysMsgOpenOrCreate);
    CxSysMsgQueue requests(kRequestQueueName, kQueueCapacityKiB, navmisc::kSysMsgOpenOrCreate);
    ASSERT_TRUE(replies.IsValid() && requests.IsValid());
    for (auto [queue, id] : {std::pair{&replies, L"stale reply"}, {&requests, L"stale request"}}) {
      CPackageBlk p;
      PackBlock(StatusQuery(1, id), p);
      ASSERT_TRUE(queue->Send(p.GetPackagePtr(), p.GetPackageSize()));
    }
  }
  Start();
  // Replies of a kind nobody knows, and bytes that are no package, go no further.
  CxSysMsgQueue replies(kReplyQueueName, 0, navmisc::kSysMsgOpenExisting);
  ASSERT_TRUE(replies.IsValid());
  CPackageBlk strange;
  PackBlock(CDataControlCmdBlk{9, L"kind 9", 0}, strange);
  ASSERT_TRUE(replies.Send(strange.GetPackagePtr(), strange.GetPackageSize()));
  ASSERT_TRUE(replies.Send("garbage", 7));
  InsertRequestMessage(StatusQuery(1, L"fresh"));
  ASSERT_TRUE(Until([&] { return window_.HasId(L"fresh"); }));
  EXPECT_FALSE(window_.HasId(L"stale reply"));
  EXPECT_FALSE(window_.HasId(L"stale request"));
  EXPECT_FALSE(window_.HasId(L"kind 9"));
  EXPECT_EQ(std::count(window_.kinds.begin(), window_.kinds.end(), 9), 0);
}

TEST_F(Channel, ExitEndsTheThreadAndTheProcessAndRemovesTheQueues) {
  Start();
  const int pid = DataControlProcessId();
  ASSERT_GT(pid, 0);
  const std::string requests = CxSysMsgQueue(kRequestQueueName, 0, navmisc::kSysMsgOpenExisting).objectName();
  EXPECT_TRUE(ObjectExists(requests));
  // The loop looks at g_bExit at least every 500 ms plus one reply's handling; a process that
  // obeys the exit block ends well within the 5 s it is given.
  const auto took = Stop();
  EXPECT_LT(took, 5500ms);
  EXPECT_EQ(DataControlProcessId(), 0);
  EXPECT_NE(::kill(pid, 0), 0);  // gone and reaped
  EXPECT_FALSE(ObjectExists(requests));
  EXPECT_EQ(GetChannelState(), ChannelState::kStopped);
  // Stopped: a request has nowhere to go and is dropped at once.
  InsertRequestMessage(StatusQuery(1, L"late"));
}

TEST_F(Channel, AProcessThatIgnoresTheExitBlockIsKept) {
  TempDir fake;
  WriteFileBytes(fake / L"GpsDataControl.exe", "#!/bin/sh\nexec sleep 60\n");
  ASSERT_EQ(::chmod((fake / L"GpsDataControl.exe").ToUtf8().c_str(), 0755), 0);
  UseProgramFolder(fake.path());
  Start();
  const int pid = DataControlProcessId();
  ASSERT_GT(pid, 0);
  const auto took = Stop();
  EXPECT_GE(took, 5000ms);           // the full wait
  EXPECT_LT(took, 5000ms + 5000ms);  // and not much more
  EXPECT_EQ(DataControlProcessId(), pid);
  EXPECT_EQ(::kill(pid, 0), 0);  // still running, its handle kept
  EndKeptDataControlProcess();
  EXPECT_EQ(DataControlProcessId(), 0);
  EXPECT_NE(::kill(pid, 0), 0);
}

TEST_F(Channel, WithoutItsProgramOrItsDataRootThereIsNoChannel) {
  TempDir empty;
  UseProgramFolder(empty.path());
  g_bExit = false;
  EXPECT_EQ(ProcessCommand(&window_), 0u);  // cannot start the process: ends at once
  EXPECT_EQ(GetChannelState(), ChannelState::kStopped);
  EXPECT_EQ(ProcessCommand(nullptr), 0u);

  // A data-control process of another data root finds no queues there, even while this root's
  // channel runs.
  UseProgramFolder(CString::FromUtf8(NAVMISC_TOOLS_DIR));
  Start();
  TempDir other;
  navmisc::ChildProcess stranger;
  ASSERT_TRUE(stranger.Start({"/usr/bin/env", "NAVMISC_DATA_ROOT=" + other.path().ToUtf8(),
                              std::string(NAVMISC_TOOLS_DIR) + "/GpsDataControl.exe", "/Tracer"},
                             {true, true, true}));
  EXPECT_EQ(stranger.Wait(), 3);
  navmisc::RemovePerRootObjects(other.path());
}

TEST_F(Channel, ADeadProcessIsReportedAndStartedAgain) {
  Start();
  const int first = DataControlProcessId();
  ASSERT_GT(first, 0);
  ASSERT_TRUE(Until([&] { return window_.statuses.size() == 2; }));  // its announcement
  ASSERT_EQ(::kill(first, SIGKILL), 0);
  // The owner learns that neither source can be reached, then the new process announces itself.
  ASSERT_TRUE(Until([&] { return window_.statuses.size() >= 6; }));
  EXPECT_EQ(std::pair(window_.statuses[2].nSource, window_.statuses[2].bConnected), std::pair(1, uint8_t{0}));
  EXPECT_EQ(std::pair(window_.statuses[3].nSource, window_.statuses[3].bConnected), std::pair(2, uint8_t{0}));
  const int second = DataControlProcessId();
  EXPECT_GT(second, 0);
  EXPECT_NE(second, first);
  InsertRequestMessage(StatusQuery(2, L"again"));
  EXPECT_TRUE(Until([&] { return window_.HasId(L"again"); }));
}

// The kernel's state letter of a process ('T' when stopped).
char ProcessState(int pid) {
  std::ifstream stat("/proc/" + std::to_string(pid) + "/stat");
  std::string text((std::istreambuf_iterator<char>(stat)), std::istreambuf_iterator<char>());
  const size_t close = text.rfind(')');
  return close == std::string::npos || close + 2 >= text.size() ? '?' : text[close + 2];
}

TEST_F(Channel, ProcessKilledWhileHoldingARingLock) {
  Start();
  window_.keepCopies = false;
  CxSysMsgQueue requests(kRequestQueueName, 0, navmisc::kSysMsgOpenExisting);
  CxSysMsgQueue replies(kReplyQueueName, 0, navmisc::kSysMsgOpenExisting);
  ASSERT_TRUE(requests.IsValid() && replies.IsValid());
  // Large requests keep the process inside the rings' locks much of the time: copying a request
  // out, its echo in.
  CDataControlCmdBlkNet big;
  big.nNetCmd = 4;
  big.trackInfo.szTrackData = std::wstring(700000, L'p');
  std::atomic<bool> stop{false}, stopped{false};
  std::thread flood([&] {
    while (!stop) InsertRequestMessage(big);
    stopped = true;
  });
  // However the test ends, the flood ends with it (a thread left joinable would abort the run).
  struct EndFlood {
    std::atomic<bool>& stop;
    std::thread& flood;
    ~EndFlood() {
      stop = true;
      if (flood.joinable()) flood.join();
    }
  } endFlood{stop, flood};

  // Stop the process at random moments until it is caught holding a ring's lock, and kill it
  // there. On a loaded machine (or under sanitizers) a catch can take many tries: the bound is
  // time, not a count.
  std::mt19937 random(7);
  int victim = 0;
  const navmisc::detail::MsgRingHeader* heldRing = nullptr;
  const auto giveUp = std::chrono::steady_clock::now() + std::chrono::seconds(120);
  while (!heldRing && std::chrono::steady_clock::now() < giveUp) {
    ReleaseCPUTime(1 + random() % 10);
    const int pid = DataControlProcessId();
    if (pid <= 0 || ::kill(pid, SIGSTOP) != 0) continue;
    for (int i = 0; i < 1000 && ProcessState(pid) != 'T'; ++i) std::this_thread::sleep_for(100us);
    for (const CxSysMsgQueue* q : {&requests, &replies}) {
      if (navmisc::detail::RobustMutexOwner(q->ring()->ringLock) == pid) heldRing = q->ring();
    }
    if (heldRing) {
      victim = pid;
      ::kill(pid, SIGKILL);
    } else {
      ::kill(pid, SIGCONT);
    }
  }
  ASSERT_TRUE(heldRing) << "the process was never caught inside a lock";
  stop = true;
  // The channel goes on: the lock is taken over, the process started again, the flood drains.
  ASSERT_TRUE(Until([&] { return stopped.load(); }, 60000));
  flood.join();
  InsertRequestMessage(StatusQuery(1, L"after the kill"));
  ASSERT_TRUE(Until([&] { return window_.HasId(L"after the kill"); }, 60000));
  EXPECT_NE(DataControlProcessId(), victim);
  EXPECT_GE(requests.Recoveries() + replies.Recoveries(), 1u);
  EXPECT_EQ(navmisc::detail::RobustMutexOwner(heldRing->ringLock), 0);
}

TEST(ChannelCommandLine, FolderProgramAndSwitch) {
  const struct {
    const wchar_t* folder;
    GPS_APP_PROG_TYPE product;
    const wchar_t* line;
    std::vector<std::string> argv;
  } cases[] = {
      {L"/opt/navmisc/bin", GPS_APP_TRIP, L"/opt/navmisc/bin/GpsDataControl.exe /Tracer",
       {"/opt/navmisc/bin/GpsDataControl.exe", "/Tracer"}},
      {L"/opt/navmisc/bin/", GPS_APP_TRIP, L"/opt/navmisc/bin/GpsDataControl.exe /Tracer",
       {"/opt/navmisc/bin/GpsDataControl.exe", "/Tracer"}},
      {L"/opt/navmisc/bin", GPS_APP_SPORT, L"/opt/navmisc/bin/GpsDataControl.exe /Tracer",
       {"/opt/navmisc/bin/GpsDataControl.exe", "/Tracer"}},
      {L"/opt/navmisc/bin", GPS_APP_WHEREAMI, L"/opt/navmisc/bin/GpsDataControl.exe /Dongle",
       {"/opt/navmisc/bin/GpsDataControl.exe", "/Dongle"}},
      {L"/home/ann/My Programs", GPS_APP_TRACKER,
       L"/home/ann/My Programs/GpsDataControl.exe /Tracer",
       {"/home/ann/My Programs/GpsDataControl.exe", "/Tracer"}},
  };
  for (const auto& c : cases) {
    const CString line = DataControlCommandLine(c.folder, c.product);
    EXPECT_EQ(line, c.line);
    EXPECT_EQ(DataControlArguments(line), c.argv);
  }
}

// ---- the wait dialog, with the real process answering ----------------------------------------

class RecordingWaitView : public IWaitDataCtrlProcView {
 public:
  void ShowMessageBox(const CString& text, Icon, bool) override { boxes.push_back(text); }
  void EnableButton(bool enable) override { buttons.push_back(enable); }
  void SetMessageText(const CString& text) override { texts.push_back(text); }
  void FlashMessageText() override { ++flashes; }
  std::vector<CString> boxes, texts;
  std::vector<bool> buttons;
  int flashes = 0;
};

TEST_F(Channel, WaitDialogClearsTheLogAndShowsTheOutcome) {
  TempDir texts;
  WriteFileBytes(texts / L"texts.ini",
                 "[STRINGS]\n9583=Clearing failed (%d).\n9584=Cleared.\n9588=Clearing...\n");
  navmisc::SetResourceFile(texts / L"texts.ini");
  navmisc::testutil::MakeLogger(root_ / L"logger", 1, 5);
  WriteFileBytes(root_ / L"logger/LOG/day.nmea", "$GPRMC\n");
  Configure(root_ / L"logger", L"");
  RecordingWaitView view;
  CWaitDataCtrlProcDlg dialog(view);
  Start(dialog);
  dialog.OnInitDialog();
  EXPECT_EQ(view.buttons, std::vector<bool>{false});
  ASSERT_EQ(view.texts.size(), 1u);
  EXPECT_EQ(view.texts[0], L"Clearing...");
  // The first tick sends the clear.
  ASSERT_TRUE(Until([&] { return dialog.done(); }));
  EXPECT_EQ(view.texts.back(), L"Cleared.");
  EXPECT_FALSE(FileExists(root_ / L"logger/LOG/day.nmea"));
  EXPECT_EQ(view.buttons, (std::vector<bool>{false, true}));
  ASSERT_TRUE(Until([&] { return view.flashes >= 2; }));
  EXPECT_TRUE(view.boxes.empty());
  navmisc::SetResourceFile(L"");
}

}  // namespace
