#include "server.h"

#include <gtest/gtest.h>

#include <chrono>
#include <memory>
#include <thread>

#include "navmisc/datactrl/dc_errors.h"
#include "navmisc/datactrl/device_state.h"
#include "navmisc/datactrl/request_queue.h"
#include "navmisc/platform/data_root.h"
#include "navmisc/platform/files.h"
#include "progress.h"
#include "channel_harness.h"
#include "queues_fixture.h"
#include "testutil.h"

namespace {

using navmisc::testutil::TempDir;
using navmisc::testutil::WriteFileBytes;

TEST_F(Queues, ConfigurationDecidesTheConnectionState) {
  navmisc::testutil::MakeLogger(root_ / L"logger", 1, 2);
  const struct {
    const char* file;
    bool device, net;
  } cases[] = {
      {nullptr, false, true},  // the public web service, not yet found unreachable
      {"[DEVICE]\nPath=@/logger\n[WEBSERVICE]\nUrl=https://api.example.org\n", true, true},
      {"[device]\npath=@/missing\n[webservice]\nurl=http://127.0.0.1:9/\n", false, true},
      {"[WEBSERVICE]\nUrl=ftp://example.org\n", false, false},
  };
  for (const auto& c : cases) {
    DeleteFile(root_ / gpsdc::kConfigFileName);
    if (c.file) {
      std::string text = c.file;
      if (const size_t at = text.find('@'); at != std::string::npos)
        text.replace(at, 1, root_.path().ToUtf8());
      WriteFileBytes(root_ / gpsdc::kConfigFileName, text);
    }
    const gpsdc::Config config = gpsdc::ReadConfig(root_.path());
    EXPECT_EQ(gpsdc::CurrentStatus(DC_SOURCE_DEVICE, config).bConnected, c.device) << (c.file ? c.file : "");
    EXPECT_EQ(g_bDeviceConnected, c.device);
    EXPECT_EQ(gpsdc::CurrentStatus(DC_SOURCE_NET, config).bConnected, c.net) << (c.file ? c.file : "");
    EXPECT_EQ(g_bNetConnected, c.net);
  }
  const CDataControlConnectionStatus odd = gpsdc::CurrentStatus(3, {});
  EXPECT_EQ(std::pair(odd.bConnected, odd.nLastError), std::pair(uint8_t{0}, int32_t{DC_ERR_UNKNOWN_COMMAND}));
}

TEST_F(Queues, ProgressIsSentFirstLastAndAtMostOncePerInterval) {
  gpsdc::ReplyChannel channel(*replies_);
  gpsdc::ProgressReporter slow(channel, DC_SOURCE_DEVICE, std::chrono::hours(1));
  for (int done = 0; done <= 100; done += 10) slow.Report(100, done);
  EXPECT_EQ(slow.sent(), 2);  // the first and the complete one
  EXPECT_EQ(std::pair(g_nCountOfProgress, g_nCurrentOfProgress), std::pair(100, 100));
  const CDataControlProgressCmdBlk first = Reply<CDataControlProgressCmdBlk>();
  const CDataControlProgressCmdBlk last = Reply<CDataControlProgressCmdBlk>();
  EXPECT_TRUE(first == (CDataControlProgressCmdBlk{DC_CMD_PROGRESS, L"", 0, 1, 100, 0, 0, 0}));
  EXPECT_TRUE(last == (CDataControlProgressCmdBlk{DC_CMD_PROGRESS, L"", 0, 1, 100, 100, 0, 0}));

  // The database count must be complete too; with no interval every report goes.
  gpsdc::ProgressReporter fast(channel, DC_SOURCE_NET, std::chrono::milliseconds(0));
  fast.Report(5, 5, 3, 1);
  fast.Report(5, 5, 3, 3);
  EXPECT_EQ(fast.sent(), 2);
  EXPECT_EQ(Reply<CDataControlProgressCmdBlk>().nDatabaseProcessed, 1);
  EXPECT_EQ(Reply<CDataControlProgressCmdBlk>().nSource, DC_SOURCE_NET);
}

TEST_F(Queues, ServerAnnouncesAnswersDropsAndEnds) {
  gpsdc::DataControlServer server(*requests_, *replies_, {}, gpsdc::Product::kTracer);
  int exitCode = -1;
  std::thread run([&] { exitCode = server.Run(); });
  EXPECT_EQ(Reply<CDataControlConnectionStatus>().nSource, DC_SOURCE_DEVICE);
  EXPECT_EQ(Reply<CDataControlConnectionStatus>().nSource, DC_SOURCE_NET);

  ASSERT_TRUE(requests_->Send("no package", 10));
  Request(CDataControlCmdBlk{42, L"", 0});  // a kind without a handler
  const struct {
    int32_t code;
    int32_t error;
  } netCases[] = {{1, DC_ERR_NET_BAD_REQUEST}, {26, DC_ERR_NET_BAD_REQUEST},
                  {17, DC_ERR_NET_NOT_OFFERED}, {0, DC_ERR_UNKNOWN_COMMAND}};
  for (const auto& c : netCases) {
    CDataControlCmdBlkNet net;
    net.nNetCmd = c.code;
    Request(net);
    const CDataControlCmdBlkNet reply = Reply<CDataControlCmdBlkNet>();
    EXPECT_EQ(std::pair(reply.nNetCmd, reply.nLastError), std::pair(c.code, c.error));
  }
  CDataControlCmdBlkFile export_;
  export_.nFileCmd = 2;
  Request(export_);
  EXPECT_EQ(Reply<CDataControlCmdBlkFile>().nLastError, DC_ERR_UNKNOWN_COMMAND);
  Request(CDataControlExitCmdBlk{DC_CMD_EXIT, L"", 0});
  run.join();
  EXPECT_EQ(exitCode, 0);
  EXPECT_EQ(server.dropped(), 2);
  CxSysMsgInfo info;
  EXPECT_FALSE(replies_->Receive(0, &info));  // nothing for what was dropped, nor for the exit
}

}  // namespace
