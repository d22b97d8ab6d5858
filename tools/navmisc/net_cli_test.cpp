// `navmisc net ...` against a web service on 127.0.0.1: the real program, the real
// data-control process.
#include <gtest/gtest.h>

#include <cstdio>
#include <string>

#include "navmisc/platform/files.h"
#include "osm_test_server.h"
#include "testutil.h"

namespace {

using gpsdc::testing::OsmTestServer;
using navmisc::testutil::ReadFileBytes;
using navmisc::testutil::RunCommand;
using navmisc::testutil::ShellQuote;
using navmisc::testutil::TempDir;
using navmisc::testutil::WriteFileBytes;

bool Has(const std::string& text, const std::string& part) { return text.find(part) != std::string::npos; }

class NetCommand : public ::testing::Test {
 protected:
  void SetUp() override {
    WriteFileBytes(root_ / L"GpsDataControl.ini",
                   "[WEBSERVICE]\nUrl=" + server_.url() + "\nTimeoutSeconds=10\n");
    WriteFileBytes(keys_ / L"token", std::string(OsmTestServer::kToken) + "\n");
    WriteFileBytes(keys_ / L"bad-token", "not-the-token\n");
  }

  // `navmisc --data-root ROOT ARGS` with standard input from `input`; standard error joined
  // to standard output. The key that seals the token lives outside the data root.
  navmisc::testutil::CommandResult Run(const std::string& args, const std::string& input = "/dev/null") {
    return RunCommand("NAVMISC_KEY_FILE=" + ShellQuote((keys_ / L"secret.key").ToUtf8()) + " " +
                      ShellQuote(NAVMISC_TOOL_PATH) + " --data-root " + ShellQuote(root_.path().ToUtf8()) +
                      " " + args + " 2>&1 <" + ShellQuote(input));
  }
  std::string Path(const wchar_t* name) const { return ShellQuote((root_ / name).ToUtf8()); }

  OsmTestServer server_;
  TempDir root_;
  TempDir keys_;
};

TEST_F(NetCommand, LoginUploadListDownloadRemove) {
  // The demo's profiles and trips, added to a data root that holds the process's configuration.
  ASSERT_EQ(Run("demo --force " + ShellQuote(root_.path().ToUtf8())).status, 0);
  auto r = Run("net whoami");
  EXPECT_NE(r.status, 0);
  EXPECT_TRUE(Has(r.out, "not logged on")) << r.out;

  r = Run("net login 'Ann Example' --token-file " + ShellQuote((keys_ / L"bad-token").ToUtf8()));
  EXPECT_NE(r.status, 0);
  EXPECT_TRUE(Has(r.out, "Failed to DC_NET_CMD_LOGIN. (Error=401)")) << r.out;

  // The token from standard input (a terminal would be asked without echo).
  r = Run("net login 'Ann Example'", (keys_ / L"token").ToUtf8());
  ASSERT_EQ(r.status, 0) << r.out;
  EXPECT_TRUE(Has(r.out, "\nUid = 4711, Token = ")) << r.out;
  EXPECT_TRUE(Has(r.out, "0 traces on the service")) << r.out;
  EXPECT_FALSE(Has(r.out, OsmTestServer::kToken));
  const std::string profile = ReadFileBytes(root_ / L"Resource/USER_MAP_INFO.INI");
  EXPECT_TRUE(Has(profile, "user_account=Ann Example")) << profile;
  EXPECT_TRUE(Has(profile, "keep_password=1"));
  // Nowhere under the data root in clear text.
  EXPECT_NE(RunCommand("grep -rqF " + ShellQuote(OsmTestServer::kToken) + " " + ShellQuote(root_.path().ToUtf8()))
                .status,
            0);

  r = Run("net whoami");
  EXPECT_EQ(r.status, 0) << r.out;
  EXPECT_TRUE(Has(r.out, "UserName = [Ann Example]\nDisplayName = [Ann Example]\n")) << r.out;

  // A demo trip goes up as a GPX 1.0 document.
  CStringList trips;
  ASSERT_GT(GetContent(root_ / L"Resource", L"*.*", trips), 0);
  std::string trip;
  for (const CString& id : trips)
    if (FileExists(root_ / (L"Resource/" + id + L"/BLOG_ITEM_INFO.INI").c_str())) trip = id.ToUtf8();
  ASSERT_FALSE(trip.empty());
  r = Run("net upload " + trip + " --private --tags 'demo, walk'");
  ASSERT_EQ(r.status, 0) << r.out;
  EXPECT_TRUE(Has(r.out, "DC_NET_CMD_UPLOAD_TRACK OK\nId = 1000\n")) << r.out;
  auto traces = server_.Traces();
  ASSERT_EQ(traces.size(), 1u);
  EXPECT_EQ(traces[1000].visibility, "private");
  EXPECT_EQ(traces[1000].tags, "demo, walk");
  EXPECT_EQ(traces[1000].name, trip + ".gpx");
  WriteFileBytes(root_ / L"received.gpx", traces[1000].gpx);
  const std::string schemas = navmisc::testutil::SchemaDir();
  if (navmisc::testutil::HaveProgram("xmllint") && !schemas.empty()) {
    const auto valid = RunCommand("xmllint --noout --nonet --schema " + ShellQuote(schemas + "/gpx10.xsd") +
                                  " " + Path(L"received.gpx") + " 2>&1");
    EXPECT_EQ(valid.status, 0) << valid.out;
  } else {
    std::printf("note: the uploaded GPX is not validated: %s\n",
                schemas.empty() ? "the schema folder (NAVMISC_SCHEMA_DIR) is not there" : "xmllint is not installed");
  }

  r = Run("net tracks");
  EXPECT_EQ(r.status, 0) << r.out;
  EXPECT_TRUE(Has(r.out, "1000 ")) << r.out;
  EXPECT_TRUE(Has(r.out, "private")) << r.out;

  r = Run("net download 1000 -o " + Path(L"back.gpx"));
  EXPECT_EQ(r.status, 0) << r.out;
  EXPECT_TRUE(Has(r.out, " points")) << r.out;
  EXPECT_TRUE(Has(ReadFileBytes(root_ / L"back.gpx"), "<trkpt"));

  r = Run("net remove 1000");
  EXPECT_EQ(r.status, 0) << r.out;
  EXPECT_TRUE(Has(r.out, "DC_NET_CMD_REMOVE_TRACK OK")) << r.out;
  r = Run("net remove 1000");
  EXPECT_NE(r.status, 0);
  EXPECT_TRUE(Has(r.out, "DC_NET_CMD_REMOVE_TRACK Failed (Error=404)")) << r.out;
  r = Run("net download 1000");
  EXPECT_NE(r.status, 0);
  EXPECT_TRUE(Has(r.out, "DC_NET_CMD_DWLOAD_TRACK Failed (Error=404)")) << r.out;
}

}  // namespace
