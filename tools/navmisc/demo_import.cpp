// The demo's import step: the GPX and TCX exports of the demo's first trip come back in as new
// trips, through the data-control process as `navmisc import` brings files in.
#include <cstdio>

#include "cli.h"
#include "navmisc/platform/files.h"
#include "navmisc/records/trip_tree.h"

namespace navmisc::cli {

void DemoImport(const std::string& root) {
  BLOG_TREE_NODE tree(nullptr);
  if (tree.ReadInfo(0, nullptr) != 1 || tree.trips.IsEmpty()) Fail("the demo's trip tree cannot be read for the import");
  const BLOG_ITEM_INFO& first = *static_cast<BLOG_ITEM_INFO*>(tree.trips.GetHead());
  const CString id = first.tripId;
  const CString folder = PathJoin(CString::FromUtf8(root), L"exports");
  std::puts("\nImport (navmisc import FILE...), the first trip's exports back in:");
  const std::vector<std::string> files = {PathJoin(folder, id + L".gpx").ToUtf8(), PathJoin(folder, id + L".tcx").ToUtf8()};
  ImportRequest request;
  request.name = (first.name + L", imported").ToUtf8();
  if (ImportFiles(files, request, nullptr) != 0) Fail("the demo's exports could not be imported back");
}

}  // namespace navmisc::cli
