// A program outside the tree: it sees the library only through the installed package.
#include <cstdio>

#include "navmisc/navmisc.h"

int main() {
  CString name(L"consumer");
  name += L" ok";
  std::printf("%s %lu\n", name.ToUtf8().c_str(), static_cast<unsigned long>(GetUniqueID() > 0));
  return name.GetLength() == 11 ? 0 : 1;
}
