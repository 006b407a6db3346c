#include <fileindex/fileindex.h>

#include <cstdio>
int main() {
    std::puts(VORK::FILEINDEX::IndexMgr::IsPathIndexed("/photo/2015/beach.jpg") ? "indexed" : "not indexed");
}
// Output:
// indexed
