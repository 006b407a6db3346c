#include <fileindex/fileindex.h>

#include <iostream>
#include <string>
#include <vector>

namespace {

// Deriving and catching across the library's boundary needs its vtables and type information.
class Loaded : public VORK::FILEINDEX::Folders {
public:
    bool Ready() { return Load() && Config::LoadJson(); }
};

}  // namespace

int main() {
    using VORK::FILEINDEX::Folder;
    using VORK::FILEINDEX::IndexMgr;

    std::vector<Folder> folders;
    if (!IndexMgr::List(folders) || folders.size() != 1 || folders[0].path != "/photo/2015" || !folders[0].photo ||
        !IndexMgr::IsPathIndexed("/photo/2015/a", folders) || IndexMgr::IsPathIndexed("/photo/20150", folders)) {
        std::cout << "wrong answer\n";
        return 1;
    }
    Loaded loaded;
    VORK::FILEINDEX::Config &config = loaded;
    if (!loaded.Ready() || dynamic_cast<VORK::FILEINDEX::Folders *>(&config) == nullptr) {
        std::cout << "wrong type\n";
        return 1;
    }
    std::cout << "consumer in C++: good\n";
    return 0;
}
