// The import command in the data-control process: its reply and progress, and a cancel or the
// exit block that come while it runs.
#include <gtest/gtest.h>

#include <cstdio>
#include <string>
#include <thread>
#include <vector>

#include "navmisc/import/import_errors.h"
#include "navmisc/platform/files.h"
#include "navmisc/platform/shared_globals.h"
#include "queues_fixture.h"
#include "server.h"
#include "testutil.h"

namespace {

using navmisc::testutil::WriteFileBytes;

class FileImport : public Queues {
 protected:
  void SetUp() override {
    Queues::SetUp();
    std::string doc = "<gpx><metadata><name>Long walk</name></metadata><trk><trkseg>";
    char point[160];
    for (int i = 0; i < 5000; ++i) {
      std::snprintf(point, sizeof point,
                    "<trkpt lat=\"47\" lon=\"8.%d\"><ele>500</ele><time>2024-05-01T%02d:%02d:%02dZ</time></trkpt>", i,
                    6 + i / 3600, i / 60 % 60, i % 60);
      doc += point;
    }
    WriteFileBytes(file_, doc + "</trkseg></trk></gpx>");
  }
  CDataControlCmdBlkFile ImportRequest() {
    CDataControlCmdBlkFile b;
    b.nFileCmd = DC_FILE_IMPORT;
    b.szFilePath = file_;
    b.trackInfo.nMode = GPS_APP_TRIP;
    return b;
  }
  // Every reply until one of kind `kind`; that one's bytes.
  std::vector<uint8_t> Until(int32_t kind, std::vector<int32_t>& seen) {
    for (;;) {
      CxSysMsgInfo info;
      auto bytes = replies_->Receive(20000, &info);
      if (!bytes) return {};
      CUnpackageBlk u(bytes.get(), info.nSize);
      CDataControlCmdBlk header{};
      navmisc::datactrl::UnpackHeader(u, header);
      seen.push_back(header.nCmdType);
      if (header.nCmdType == kind) return {bytes.get(), bytes.get() + info.nSize};
    }
  }
  template <class Block>
  static Block As(const std::vector<uint8_t>& bytes) {
    Block b{};
    CUnpackageBlk u(bytes.data(), bytes.size());
    navmisc::datactrl::UnpackBlock(u, b);
    return b;
  }
  int TripFolders() {
    CStringList names;
    GetContent(root_ / L"Resource", L"*.*", names);
    int n = 0;
    for (const CString& name : names) n += IsDirectory(root_ / L"Resource" + L"/" + name);
    return n;
  }

  CString file_ = root_ / L"walk.gpx";
};

TEST_F(FileImport, RepliesWithTheTripAfterProgressPerThousandPoints) {
  gpsdc::DataControlServer server(*requests_, *replies_, {}, gpsdc::Product::kTracer);
  Request(ImportRequest());
  std::thread run([&] { server.Run(); });
  std::vector<int32_t> seen;
  const auto reply = As<CDataControlCmdBlkFile>(Until(DC_CMD_FILE, seen));
  Request(CDataControlExitCmdBlk{DC_CMD_EXIT, L"", 0});
  run.join();
  ASSERT_EQ(reply.nLastError, 0) << reply.trackInfo.szMetaInfo.ToUtf8();
  EXPECT_EQ(reply.trackInfo.szSubject, L"Long walk");
  EXPECT_EQ(reply.trackInfo.szMetaInfo, L"format=gpx tracks=1 points=5000 markers=0 cut=0 skipped=0");
  EXPECT_EQ(CovertOleDateTimeToTimeT(reply.trackInfo.ptStart.oleTime), 1714543200);
  EXPECT_EQ(CovertOleDateTimeToTimeT(reply.trackInfo.ptEnd.oleTime), 1714543200 + 4999);
  EXPECT_DOUBLE_EQ(reply.trackInfo.ptEnd.dAltitude, 500.0);
  EXPECT_TRUE(IsDirectory(root_ / L"Resource" + L"/" + reply.trackInfo.szTrackId));
  // Two announcements; a block per thousand points and the end of the reading; the complete
  // count once the trip is saved.
  const std::vector<int32_t> progress(7, DC_CMD_PROGRESS);
  std::vector<int32_t> expected = {DC_CMD_CONNECTION_STATUS, DC_CMD_CONNECTION_STATUS};
  expected.insert(expected.end(), progress.begin(), progress.end());
  expected.push_back(DC_CMD_FILE);
  EXPECT_EQ(seen, expected);
}

TEST_F(FileImport, ACancelStopsItAndWhatCameMeanwhileIsServedAfter) {
  gpsdc::DataControlServer server(*requests_, *replies_, {}, gpsdc::Product::kTracer);
  CDataControlConnectionStatus status{};
  status.nCmdType = DC_CMD_CONNECTION_STATUS;
  status.nSource = DC_SOURCE_NET;
  CDataControlCmdBlkKVDevice cancel;
  InitDeviceBlockDefaults(cancel);
  cancel.nDeviceCmd = DC_DEVICE_CANCEL_READ;
  // All of them wait in the queue before the server starts: the import takes the first, the
  // others come "while it runs".
  Request(ImportRequest());
  Request(status);
  Request(cancel);
  Request(ImportRequest());
  Request(CDataControlExitCmdBlk{DC_CMD_EXIT, L"", 0});
  server.Run();
  std::vector<int32_t> seen;
  const auto first = As<CDataControlCmdBlkFile>(Until(DC_CMD_FILE, seen));
  EXPECT_EQ(first.nLastError, DC_ERR_IMPORT_CANCELLED);
  EXPECT_EQ(first.trackInfo.szTrackId, L"");
  EXPECT_EQ(As<CDataControlConnectionStatus>(Until(DC_CMD_CONNECTION_STATUS, seen)).nSource, DC_SOURCE_NET);
  EXPECT_EQ(As<CDataControlCmdBlkKVDevice>(Until(DC_CMD_DEVICE, seen)).nDeviceCmd, DC_DEVICE_CANCEL_READ)
      << "the cancel gets its own reply";
  const auto second = As<CDataControlCmdBlkFile>(Until(DC_CMD_FILE, seen));
  EXPECT_EQ(second.nLastError, 0) << "the next import runs whole";
  EXPECT_EQ(TripFolders(), 1);

  // The exit block during an import stops it too, and nothing after it is served.
  gpsdc::DataControlServer again(*requests_, *replies_, {}, gpsdc::Product::kTracer);
  Request(ImportRequest());
  Request(CDataControlExitCmdBlk{DC_CMD_EXIT, L"", 0});
  Request(ImportRequest());
  EXPECT_EQ(again.Run(), 0);
  EXPECT_EQ(As<CDataControlCmdBlkFile>(Until(DC_CMD_FILE, seen)).nLastError, DC_ERR_IMPORT_CANCELLED);
  CxSysMsgInfo info;
  EXPECT_FALSE(replies_->Receive(0, &info));
  EXPECT_EQ(TripFolders(), 1);
}

}  // namespace
