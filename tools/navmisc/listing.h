// Printing trips as the tool lists them.
#pragma once

#include <cstdio>

class BLOG_ITEM_INFO;
class BLOG_TREE_NODE;

namespace navmisc::cli {

void PrintTripHeader(std::FILE* out);
// One line: node, trip id, name, tracks, points, first and last UTC time. Loads the points.
void PrintTripLine(std::FILE* out, const char* node, BLOG_ITEM_INFO& trip);
// Every trip of the tree, depth first, with the node path.
void PrintTree(std::FILE* out, BLOG_TREE_NODE& root);

}  // namespace navmisc::cli
