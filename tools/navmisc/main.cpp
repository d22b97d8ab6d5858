#include <cstdio>
int main() { std::puts("navmisc"); return 0; }
