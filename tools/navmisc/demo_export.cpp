// The demo's export step: each of the demo's trips written in every export format.
#include <cstdio>
#include <string>
#include <vector>

#include "cli.h"
#include "navmisc/platform/files.h"

namespace navmisc::cli {

void DemoExports(const std::string& root, const std::vector<std::string>& trips) {
  const CString folder = PathJoin(CString::FromUtf8(root), L"exports");
  if (!MakeDir(folder)) Fail("cannot create " + folder.ToUtf8());
  std::puts("\nExports (navmisc export TRIP -o FILE):");
  for (const std::string& id : trips) {
    for (const char* format : {"gpx", "kml", "kmz", "tcx", "csv"}) {
      ExportRequest request;
      request.trip = id;
      request.out = PathJoin(folder, CString::FromUtf8(id + "." + format)).ToUtf8();
      // Metric CSV, as a sport user would export it.
      request.metric = request.out.ends_with(".csv");
      for (const std::string& file : RunExport(request)) std::printf("  %-4s %s\n", format, file.c_str());
    }
  }
}

}  // namespace navmisc::cli
