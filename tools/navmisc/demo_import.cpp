// The demo's import step: the GPX and TCX exports of one of the demo's trips come back in as new
// trips, through the data-control process as `navmisc import` brings files in.
#include <cstdio>

#include "cli.h"
#include "navmisc/platform/files.h"
#include "navmisc/records/trip.h"

namespace navmisc::cli {

void DemoImport(const std::string& root, const std::string& tripId) {
  const std::unique_ptr<BLOG_ITEM_INFO> first = OpenTrip(tripId);
  const CString id = first->tripId;
  const CString folder = PathJoin(CString::FromUtf8(root), L"exports");
  std::puts("\nImport (navmisc import FILE...), the first trip's exports back in:");
  const std::vector<std::string> files = {PathJoin(folder, id + L".gpx").ToUtf8(), PathJoin(folder, id + L".tcx").ToUtf8()};
  ImportRequest request;
  request.name = (first->name + L", imported").ToUtf8();
  if (ImportFiles(files, request, nullptr) != 0) Fail("the demo's exports could not be imported back");
}

}  // namespace navmisc::cli
