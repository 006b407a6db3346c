// Any JSON as a request to every change and to the listing: nothing throws, no lock or descriptor stays behind,
// the configuration stays whole, and a success means that the request was carried out.

#include "json/text.h"
#include "names.h"
#include "support.h"

#include <fileindex/index_mgr.h>

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

namespace {

using namespace fileindex_fuzz;  // NOLINT(google-build-using-namespace): this is their program
using VORK::FILEINDEX::Folder;
using VORK::FILEINDEX::IndexMgr;
namespace names = VORK::FILEINDEX::internal;

bool IsListed(const std::string &path) {
    std::vector<Folder> folders;
    Require(IndexMgr::List(folders), "the configuration is broken");
    return std::any_of(folders.begin(), folders.end(), [&](const Folder &folder) { return folder.path == path; });
}

void CheckUpsert(const Json::Value &request) {
    const std::string before = ReadWhole(names::kFolderConf);
    if (!IndexMgr::Upsert(request)) {
        Require(ReadWhole(names::kFolderConf) == before, "a refused request was saved", before);
        return;
    }
    for (const Json::Value &element : request) {
        Require(IsListed(element["path"].asString()), "an added folder is missing", element["path"].asString());
    }
    Require(TakeCommands().size() == request.size(), "not one command for each element");
}

void CheckDelete(const Json::Value &request) {
    if (IndexMgr::Delete(request)) {
        for (const Json::Value &path : request) {
            Require(!IsListed(path.asString()), "a removed folder is listed", path.asString());
        }
    }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size) {
    Json::Value request;
    if (!names::JsonReader().Parse({reinterpret_cast<const char *>(data), size}, request)) {
        return -1;
    }
    ResetMachine();
    WriteWhole(names::kFolderConf,
               R"({"/a":{"name":"A","audio":true},"/a/d":{"photo":true},"/away/x":{},"/b":{}})");
    const LeakCheck leaks;
    Json::Value page;
    Require(IndexMgr::List(page, 0, 10, "name", "ASC", request), "cannot list");
    IndexMgr::Reindex(request);
    IndexMgr::Update("/a/d", request);
    TakeCommands();
    CheckUpsert(request);
    IndexMgr::Reindex(request);
    CheckDelete(request);
    if (request.isArray()) {
        request[request.size() + 2] = "/a";  // leaves elements that were never assigned
        IndexMgr::Upsert(request);
        IndexMgr::Delete(request);
        IndexMgr::Reindex(request);
        IndexMgr::List(page, 0, 10, "", "DESC", request);
    }
    IsListed("/a");
    TakeCommands();
    return 0;
}
