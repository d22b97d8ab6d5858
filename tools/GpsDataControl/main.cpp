// GpsDataControl.exe: the data-control process of the suite. The command thread of an
// application starts it as "<folder>/GpsDataControl.exe /Tracer" (or "/Dongle"), with the data
// root in NAVMISC_DATA_ROOT; it serves that root's queues until it gets the exit block.
#include <cstdio>
#include <cstring>
#include <string>

#include "navmisc/datactrl/request_queue.h"
#include "navmisc/platform/data_root.h"
#include "navmisc/platform/shared_globals.h"
#include "server.h"

namespace {

constexpr int kExitUsage = 2;
constexpr int kExitNoChannel = 3;

constexpr const char* kUsage =
    "Usage: GpsDataControl.exe /Tracer|/Dongle\n"
    "\n"
    "The data-control process of NavMiscLib: serves the requests of the data root named by\n"
    "NAVMISC_DATA_ROOT on its queues \"Data_Control_Send\" and \"Data_Control_Recv\" until it\n"
    "is told to end. Applications start it; it is not meant to be run by hand.\n"
    "  /Tracer  serve the loggers of the trip, sport and tracker applications\n"
    "  /Dongle  serve the where-am-I receiver\n";

}  // namespace

int main(int argc, char** argv) {
  if (argc == 2 && (std::strcmp(argv[1], "--help") == 0 || std::strcmp(argv[1], "-h") == 0)) {
    std::fputs(kUsage, stdout);
    return 0;
  }
  gpsdc::Product product;
  if (argc == 2 && std::strcmp(argv[1], "/Tracer") == 0) {
    product = gpsdc::Product::kTracer;
  } else if (argc == 2 && std::strcmp(argv[1], "/Dongle") == 0) {
    product = gpsdc::Product::kDongle;
  } else {
    std::fputs(kUsage, stderr);
    return kExitUsage;
  }
  if (navmisc::ChosenDataRoot().empty()) {
    std::fprintf(stderr, "GpsDataControl.exe: no data root (%s is not set)\n",
                 navmisc::kDataRootVariable);
    return kExitNoChannel;
  }
  CxSysMsgQueue requests(navmisc::datactrl::kRequestQueueName, 0, navmisc::kSysMsgOpenExisting);
  CxSysMsgQueue replies(navmisc::datactrl::kReplyQueueName, 0, navmisc::kSysMsgOpenExisting);
  if (!requests.IsValid() || !replies.IsValid()) {
    const CxSysMsgQueue& bad = requests.IsValid() ? replies : requests;
    std::fprintf(stderr, "GpsDataControl.exe: cannot open the queue %s: %s\n",
                 bad.objectName().c_str(), bad.error().message().c_str());
    return kExitNoChannel;
  }
  gpsdc::DataControlServer server(requests, replies, gpsdc::ReadConfig(g_szAppDataPath), product);
  return server.Run();
}
