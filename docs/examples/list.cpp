#include <fileindex/fileindex.h>

#include <iostream>
#include <string>
#include <vector>

using VORK::FILEINDEX::Folder;
using VORK::FILEINDEX::IndexMgr;

int main() {
    std::vector<Folder> folders;
    if (!IndexMgr::List(folders)) {
        std::cerr << "folder.conf cannot be read\n";
        return 1;
    }
    for (const Folder &folder : folders) {
        std::cout << folder.path << " at " << folder.GetFullPath() << (folder.photo ? ", photos" : "") << '\n';
    }

    // A page of at most ten, by name, with one computed fact for each folder.
    Json::Value keys(Json::arrayValue);
    keys.append("is_valid");
    Json::Value page;
    if (!IndexMgr::List(page, 0, 10, "name", "ASC", keys)) {
        return 1;
    }
    std::cout << page["total"].asInt() << " in all\n";
    for (const Json::Value &record : page["folder"]) {
        const bool valid = record["additional"]["is_valid"].asBool();
        std::cout << record["name"].asString() << (valid ? "" : ": cannot be indexed at present") << '\n';
    }
}
// Output:
// /music/old at /vol2/music/old
// /photo/2015 at /vol1/photo/2015, photos
// 2 in all
// Holiday
// Old records: cannot be indexed at present
