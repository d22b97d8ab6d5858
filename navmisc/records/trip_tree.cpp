#include "navmisc/records/trip_tree.h"

#include <vector>

#include "navmisc/platform/files.h"
#include "navmisc/platform/settings.h"
#include "navmisc/platform/shared_globals.h"

using navmisc::DeleteAll;
using navmisc::Items;

namespace {

constexpr const wchar_t* kRootSection = L"SECTION";
// Nodes deeper than this are not read (the read is then incomplete): far beyond any folder tree
// a person builds, and it keeps a hostile file from exhausting the stack.
constexpr int kMaxDepth = 256;

CString ResourceFolder() { return GetAppDataFolder(GPS_APP_TRIP); }
CString TreeFile() { return PathJoin(ResourceFolder(), L"RESOURCE_INFO.INI"); }
CString OldTreeFile() { return PathJoin(ResourceFolder(), L"AMBRO_V20.INI"); }

// A tree file of the earlier format replaces the current one and is then removed.
void MigrateOldTreeFile() {
  const CString old = OldTreeFile();
  if (!FileExists(old)) return;
  if (!CopyFile(old, TreeFile(), false)) return;  // never delete the only copy
  for (int attempt = 0; attempt < 3; ++attempt) {
    const int status = PathStatus(old);
    if (status == 2 || status == 3) return;
    SetFileNormal(old);
    if (DeleteFile(old)) return;
    SleepMs(50);
  }
}

}  // namespace

BLOG_TREE_NODE::BLOG_TREE_NODE(BLOG_TREE_NODE* from) {
  if (!from) return;
  name = from->name;
  value2 = from->value2;
  for (auto* t : Items<BLOG_ITEM_INFO>(from->trips)) trips.AddTail(new BLOG_ITEM_INFO(t, nullptr, 0));
  for (auto* c : Items<BLOG_TREE_NODE>(from->children)) children.AddTail(new BLOG_TREE_NODE(c));
}

BLOG_TREE_NODE::~BLOG_TREE_NODE() {
  DeleteAll<BLOG_ITEM_INFO>(trips);
  DeleteAll<BLOG_TREE_NODE>(children);
}

void BLOG_TREE_NODE::WriteInfo(bool writeTrips, unsigned long handle, const wchar_t* section) {
  const bool root = handle == 0;
  if (root) {
    MakeDir(ResourceFolder());
    handle = WR_BEGIN(TreeFile());
    section = kRootSection;
  }
  WR_STRING(handle, section, L"tree_node_name", name);
  WR_INT(handle, section, L"trip_item_info_count", trips.GetCount() + unreadTrips.GetCount());
  int n = 0;
  for (auto* t : Items<BLOG_ITEM_INFO>(trips)) {
    WR_STRING(handle, section, FormatString(L"trip_item_info_(%d)_resource", n++), t->tripId);
    if (writeTrips) t->WriteInfo(1, nullptr, nullptr);
  }
  for (const CString& id : unreadTrips) WR_STRING(handle, section, FormatString(L"trip_item_info_(%d)_resource", n++), id);
  WR_INT(handle, section, L"trip_tree_node_count", children.GetCount());
  n = 0;
  for (auto* c : Items<BLOG_TREE_NODE>(children)) {
    c->WriteInfo(writeTrips, handle, FormatString(L"%s_%d", section, n++));
  }
  if (root) WR_END(handle);
}

int BLOG_TREE_NODE::ReadInfo(unsigned long handle, const wchar_t* section) {
  if (handle != 0) return ReadNode(handle, section, completeRead, 0);
  completeRead.Begin();
  MigrateOldTreeFile();
  handle = RD_BEGIN(TreeFile());
  if (!handle) {
    completeRead.Missed(L"the tree file " + TreeFile() + L" cannot be read");
    return 0;
  }
  const int read = ReadNode(handle, kRootSection, completeRead, 0);
  RD_END(handle);
  if (!read) {
    completeRead.Missed(L"the tree file " + TreeFile() + L" has no tree_node_name");
    return 0;
  }
  completeRead.Finish();
  return 1;
}

int BLOG_TREE_NODE::ReadNode(unsigned long handle, const wchar_t* section,
                             navmisc::CompleteReadGuard& guard, int depth) {
  name = RD_STRING(handle, section, L"tree_node_name", L"");
  if (name.IsEmpty()) return 0;
  // Only the entries present are visited, and a count that promises more leaves the read
  // incomplete.
  const int tripCount = RD_INT(handle, section, L"trip_item_info_count", 0);
  const std::vector<int> tripNumbers = navmisc::KeyIndices(handle, section, L"trip_item_info_(%d)_resource", tripCount);
  if (static_cast<int>(tripNumbers.size()) < tripCount) {
    guard.Missed(FormatString(L"the node \"%s\" counts %d trips but names %d", name.c_str(), tripCount,
                              static_cast<int>(tripNumbers.size())));
  }
  for (int n : tripNumbers) {
    const CString id = RD_STRING(handle, section, FormatString(L"trip_item_info_(%d)_resource", n), L"");
    // Only a plain folder name may come from the file; anything else drops out like a trip
    // whose folder is gone.
    if (!IsPlainPathComponent(id)) {
      guard.Missed(FormatString(L"trip %d of the node \"%s\" has no valid id", n, name.c_str()));
      continue;
    }
    auto* trip = new BLOG_ITEM_INFO(GPS_APP_TRIP, id, 0);
    const bool read = trip->ReadInfo() == 1;
    // The folder is the trip's real name; a settings file that names another trip was damaged or
    // copied in from elsewhere.
    const CString problem = !read ? CString(L"its settings file cannot be read or names no trip id")
                                  : trip->tripId != id ? L"its settings file names the trip " + trip->tripId
                                                       : CString();
    if (read) trips.AddTail(trip);
    else delete trip;
    // A folder that is gone holds nothing a clean-up could delete. One that is there but did not
    // read stays named in the tree file, so that no later clean-up takes it for unused.
    if (problem.IsEmpty() || !IsDirectory(PathJoin(ResourceFolder(), id))) continue;
    unreadTrips.AddTail(id);
    guard.Missed(L"trip " + id + L": " + problem);
  }
  const int childCount = RD_INT(handle, section, L"trip_tree_node_count", 0);
  const std::vector<int> childNumbers = navmisc::SectionIndices(handle, L"%s_%d", section, childCount);
  if (static_cast<int>(childNumbers.size()) < childCount) {
    guard.Missed(FormatString(L"the node \"%s\" counts %d child nodes but holds %d", name.c_str(), childCount,
                              static_cast<int>(childNumbers.size())));
  }
  for (int n : childNumbers) {
    const CString childSection = FormatString(L"%s_%d", section, n);
    if (depth >= kMaxDepth) {
      guard.Missed(L"the tree node " + childSection + L" lies too deep");
      continue;
    }
    auto* child = new BLOG_TREE_NODE(nullptr);
    if (child->ReadNode(handle, childSection, guard, depth + 1) == 1) {
      children.AddTail(child);
    } else {
      guard.Missed(L"the tree node " + childSection + L" has no name");
      delete child;
    }
  }
  return 1;
}

BLOG_TREE_NODE* BLOG_TREE_NODE::_FindNodeFmBlogItem(BLOG_ITEM_INFO* trip) {
  if (trips.Find(trip)) return this;
  for (auto* c : Items<BLOG_TREE_NODE>(children))
    if (BLOG_TREE_NODE* found = c->_FindNodeFmBlogItem(trip)) return found;
  return nullptr;
}

BLOG_ITEM_INFO* BLOG_TREE_NODE::FindBlogItemFmServerID(CString serverId) {
  for (auto* t : Items<BLOG_ITEM_INFO>(trips))
    if (t->serverId == serverId) return t;
  for (auto* c : Items<BLOG_TREE_NODE>(children))
    if (BLOG_ITEM_INFO* found = c->FindBlogItemFmServerID(serverId)) return found;
  return nullptr;
}

bool BLOG_TREE_NODE::ReplaceBlogItem(BLOG_ITEM_INFO* old, BLOG_ITEM_INFO* replacement) {
  if (POSITION pos = trips.Find(old)) {
    trips.RemoveAt(pos);
    trips.AddTail(replacement);  // at the end, not in old's place
    return true;
  }
  for (auto* c : Items<BLOG_TREE_NODE>(children))
    if (c->ReplaceBlogItem(old, replacement)) return true;
  return false;
}

void BLOG_TREE_NODE::_FindAllUsedResource(CStringList& ids) {
  for (auto* t : Items<BLOG_ITEM_INFO>(trips)) ids.AddTail(t->tripId);
  ids.AddTail(&unreadTrips);
  for (auto* c : Items<BLOG_TREE_NODE>(children)) c->_FindAllUsedResource(ids);
}

void BLOG_TREE_NODE::RemoveAllUnusedResource() {
  CStringList used;
  _FindAllUsedResource(used);
  navmisc::RemoveUnusedResourceFolders(PathFolder(PathJoin(ResourceFolder(), L"dumy.file")), used,
                                       completeRead);
}
