#include <fileindex/fileindex.h>

#include <iostream>
#include <string>

using VORK::FILEINDEX::ErrorHandler;
using VORK::FILEINDEX::IndexMgr;

namespace {

// After a failure the code tells why, unless a daemon, a service or the monitor refused: then the log does. The
// code is that of the last failure, whenever that was, so it is reset first.
void Report(const char *what, bool done) {
    std::cout << what << ": ";
    if (done) {
        std::cout << "done\n";
        return;
    }
    switch (ErrorHandler::GetError()) {
        case VORK::FILEINDEX::FILEINDEX_ERR_LOCK:
            std::cout << "somebody else is changing the list, try again\n";
            break;
        case VORK::FILEINDEX::FILEINDEX_ERR_BAD_PARAM:
            std::cout << "there is no such share\n";
            break;
        default:
            std::cout << "failed, code " << ErrorHandler::GetError() << ", see the system log\n";
    }
    ErrorHandler::SetError(VORK::FILEINDEX::FILEINDEX_ERR_NONE);
}

Json::Value Request(const std::string &path) {
    Json::Value folder;
    folder["path"] = path;
    folder["photo"] = true;
    Json::Value folders(Json::arrayValue);
    folders.append(folder);
    return folders;
}

}  // namespace

int main() {
    Json::Value folders = Request("/photo/2016");
    folders[0]["name"] = "Winter";
    Report("add", IndexMgr::Upsert(folders));

    // Members that the request does not hold stay as they are.
    folders = Request("/photo/2016");
    folders[0]["video"] = true;
    Report("change", IndexMgr::Upsert(folders));

    Json::Value record;
    if (IndexMgr::Get(record, "/photo/2016")) {
        std::cout << record["name"].asString() << (record["video"].asBool() ? ", with videos\n" : "\n");
    }

    Report("add on a share that does not exist", IndexMgr::Upsert(Request("/attic/boxes")));

    Json::Value paths(Json::arrayValue);
    paths.append("/photo/2016");
    Report("remove", IndexMgr::Delete(paths));
}
// Output:
// add: done
// change: done
// Winter, with videos
// add on a share that does not exist: there is no such share
// remove: done
