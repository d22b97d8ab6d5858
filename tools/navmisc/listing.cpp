#include "listing.h"

#include <string>

#include "cli.h"
#include "navmisc/records/trip_tree.h"

namespace navmisc::cli {
namespace {

void PrintNode(std::FILE* out, BLOG_TREE_NODE& node, const std::string& path) {
  for (auto* trip : Items<BLOG_ITEM_INFO>(node.trips)) PrintTripLine(out, path.c_str(), *trip);
  for (auto* child : Items<BLOG_TREE_NODE>(node.children)) PrintNode(out, *child, path + "/" + child->name.ToUtf8());
}

}  // namespace

void PrintTripHeader(std::FILE* out) {
  std::fprintf(out, "%-20s %-16s %-28s %6s %8s %-20s %-20s\n", "NODE", "TRIP", "NAME", "TRACKS", "POINTS",
               "FIRST (UTC)", "LAST (UTC)");
}

void PrintTripLine(std::FILE* out, const char* node, BLOG_ITEM_INFO& trip) {
  const long first = trip.GetUTCStartTime();
  const long last = trip.GetUTCEndTime();
  long points = 0;
  for (auto* t : Items<TRACK_ITEM_INFO>(trip.tracks)) points += t->points.GetCount();
  std::fprintf(out, "%-20s %-16s %-28s %6d %8ld %-20s %-20s\n", node, trip.tripId.ToUtf8().c_str(),
               trip.name.ToUtf8().c_str(), trip.tracks.GetCount(), points, TimeText(first).c_str(),
               TimeText(trip.tracks.IsEmpty() ? -1 : last).c_str());
}

void PrintTree(std::FILE* out, BLOG_TREE_NODE& root) {
  PrintTripHeader(out);
  PrintNode(out, root, root.name.ToUtf8());
}

}  // namespace navmisc::cli
