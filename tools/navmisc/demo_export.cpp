// The demo's export step: every trip of the demo tree written in every export format.
#include <cstdio>
#include <functional>
#include <string>

#include "cli.h"
#include "navmisc/platform/files.h"
#include "navmisc/records/trip_tree.h"

namespace navmisc::cli {

void DemoExports(const std::string& root) {
  BLOG_TREE_NODE tree(nullptr);
  if (tree.ReadInfo(0, nullptr) != 1) Fail("the demo's trip tree cannot be read for the exports");
  const CString folder = PathJoin(CString::FromUtf8(root), L"exports");
  if (!MakeDir(folder)) Fail("cannot create " + folder.ToUtf8());

  std::puts("\nExports (navmisc export TRIP -o FILE):");
  std::function<void(BLOG_TREE_NODE&)> exportNode = [&](BLOG_TREE_NODE& node) {
    for (auto* trip : Items<BLOG_ITEM_INFO>(node.trips)) {
      for (const char* format : {"gpx", "kml", "kmz", "tcx", "csv"}) {
        ExportRequest request;
        request.trip = trip->tripId.ToUtf8();
        request.out = PathJoin(folder, trip->tripId + L"." + CString::FromUtf8(format)).ToUtf8();
        // Metric CSV and running laps, as a sport user would export them.
        request.metric = request.out.ends_with(".csv");
        for (const std::string& file : RunExport(request)) std::printf("  %-4s %s\n", format, file.c_str());
      }
    }
    for (auto* child : Items<BLOG_TREE_NODE>(node.children)) exportNode(*child);
  };
  exportNode(tree);
}

}  // namespace navmisc::cli
