// The tree of named folders that arranges the trips of the trip application, stored in
// "Resource/RESOURCE_INFO.INI" under the data root (see docs/trip-files.md).
#pragma once

#include <cstdint>

#include "navmisc/platform/lists.h"
#include "navmisc/records/resource_cleanup.h"
#include "navmisc/records/trip.h"

class BLOG_TREE_NODE {
 public:
  // With null, an empty node; otherwise a deep copy in which every trip is duplicated into a
  // new folder.
  explicit BLOG_TREE_NODE(BLOG_TREE_NODE* from = nullptr);
  BLOG_TREE_NODE(const BLOG_TREE_NODE&) = delete;
  BLOG_TREE_NODE& operator=(const BLOG_TREE_NODE&) = delete;
  virtual ~BLOG_TREE_NODE();

  // Called on the root with handle 0, which opens and closes the tree file.
  void WriteInfo(bool writeTrips, unsigned long handle, const wchar_t* section);
  // 1 when the node was read; trips and child nodes that fail to read drop out (and leave the
  // root's `completeRead` incomplete).
  int ReadInfo(unsigned long handle, const wchar_t* section);

  BLOG_TREE_NODE* _FindNodeFmBlogItem(BLOG_ITEM_INFO* trip);
  BLOG_ITEM_INFO* FindBlogItemFmServerID(CString serverId);
  // Takes `old` out of its node and appends `replacement` at the end of that node's trips.
  bool ReplaceBlogItem(BLOG_ITEM_INFO* old, BLOG_ITEM_INFO* replacement);
  // Deletes every folder of "Resource" that no trip of the tree names. Does nothing unless the
  // tree was read completely from its file; `completeRead.Why()` then says what was missing.
  void RemoveAllUnusedResource();

  CString name;
  int32_t value1 = 0;
  int32_t value2 = 0;
  CPtrList trips;     // BLOG_ITEM_INFO*, owned
  CPtrList children;  // BLOG_TREE_NODE*, owned
  // Ids the tree file names whose folders exist but did not read as that trip. They are written
  // back after the trips, so that the file keeps naming them until they are repaired.
  CStringList unreadTrips;
  // Whether the last root ReadInfo saw every trip and node the tree file names.
  navmisc::CompleteReadGuard completeRead;

 protected:
  void _FindAllUsedResource(CStringList& ids);

 private:
  // Reads this node's section, `depth` levels below the root; every trip or child that drops
  // out is reported to `guard`.
  int ReadNode(unsigned long handle, const wchar_t* section, navmisc::CompleteReadGuard& guard, int depth);
};
