// Any bytes as a configuration file, and any JSON as a request.

#include "base/json/text.h"
#include "checks.h"
#include "config/tail.h"
#include "names.h"

#include <fileindex/folders.h>
#include <fileindex/index_mgr.h>
#include <fileindex/status_mgr.h>

#include <algorithm>
#include <vector>

namespace fileindex_fuzz {

namespace {

using namespace VORK;             // NOLINT(google-build-using-namespace): its tools
using namespace VORK::FILEINDEX;  // NOLINT(google-build-using-namespace): the subject of every check
using namespace internal;         // NOLINT(google-build-using-namespace): its names

/// Of what a file holds, the document may be only a part.
bool HoldsAnObject(const std::string &bytes) {
    Json::Value document;
    return JsonReader().Parse(ContentOf(bytes).document, document) && document.isObject();
}

std::string TextOf(Folders &store) {
    std::vector<Folder> folders;
    Require(store.List(folders), "cannot list");
    std::string text;
    for (const Folder &folder : folders) {
        text += ToString(folder.asJson()) + '\n';
    }
    return text;
}

void RoundTrip(Folders &store) {
    const std::string before = TextOf(store);
    Require(store.Save(), "cannot save");
    Folders again;
    Require(again.Load(), "what was saved cannot be loaded", before);
    Require(TextOf(again) == before, "what was saved loads otherwise", before);
    const std::string saved = ReadWhole(kFolderConf);
    Require(again.Save() && ReadWhole(kFolderConf) == saved, "the same list is saved otherwise", saved);
}

/// Runs a change on status.conf as it is now. True when it was accepted; the file then is a JSON object.
template <typename Operation>
bool Accepts(Operation change) {
    const std::string before = ReadWhole(kStatusConf);
    const bool accepted = change();
    const std::string after = ReadWhole(kStatusConf);
    Require(accepted ? HoldsAnObject(after) : after == before, "the file has become something else", before);
    return accepted;
}

/// Sets a mark, and takes it away again.
void CheckMark(bool (*is)(const std::string &), bool (*mark)(const std::string &, bool),
               const std::string &share) {
    is(share);
    for (const bool set : {true, false}) {
        if (Accepts([&] { return mark(share, set); })) {
            Require(is(share) == set, "the mark is not as it was set", share);
        }
    }
}

bool IsListed(const std::string &path) {
    std::vector<Folder> folders;
    Require(IndexMgr::List(folders), "the configuration is broken");
    return std::any_of(folders.begin(), folders.end(), [&](const Folder &folder) { return folder.path == path; });
}

void CheckUpsert(const Json::Value &request) {
    const std::string before = ReadWhole(kFolderConf);
    const bool carriedOut = IndexMgr::Upsert(request);
    if (!carriedOut && ReadWhole(kFolderConf) == before) {
        return;
    }
    // What is saved stays saved when telling the others fails; but then it is the whole request.
    for (const Json::Value &element : request) {
        Require(IsListed(element["path"].asString()), "a folder is missing", element["path"].asString());
    }
    const std::string commands = TakeCommands();
    const bool oneForEach = std::count(commands.begin(), commands.end(), '\n') == request.size();
    Require(oneForEach || !carriedOut, "not one command for each element", commands);
}

void CheckDelete(const Json::Value &request) {
    if (IndexMgr::Delete(request)) {
        for (const Json::Value &path : request) {
            Require(!IsListed(path.asString()), "a removed folder is listed", path.asString());
        }
    }
}

// No operation of the store throws, and what is saved loads again to the same list.
void CheckFolderConf(const std::string &text) {
    WriteWhole(kFolderConf, text);
    Folders store;
    const bool isObject = HoldsAnObject(text);
    Require(store.Load() == isObject, "exactly JSON objects are loaded", text);
    if (!isObject) {
        Require(ReadWhole(kFolderConf) == text, "the file was changed", text);
        return;
    }
    RoundTrip(store);
    std::vector<Folder> folders;
    store.List(folders);
    Json::Value page;
    Json::Value additional;
    JsonReader().Parse(R"(["status","is_valid"])", additional);
    const char *const sortedBy = text.size() % 2 == 0 ? "name" : "audio";
    Require(store.List(page, text.size() % 3, 2, sortedBy, "DESC", additional), "cannot list a page");
    Require(page["total"].asUInt64() == folders.size() && page["folder"].size() <= 2, "the page is wrong");
    const std::string before = TextOf(store);
    Json::Value out;
    for (const Folder &folder : folders) {
        store.Upsert(out, folder.asJson());
    }
    Require(TextOf(store) == before, "the records as they are change something", before);
    for (const Folder &folder : folders) {
        Require(store.Delete(out, folder.path) && !store.Get(out, folder.path), "cannot delete", folder.path);
    }
    RoundTrip(store);
}

// Nothing throws, a refused change leaves the file alone, an accepted one can be read back.
void CheckStatusConf(const std::string &text) {
    WriteWhole(kStatusConf, text);
    WriteWhole(kFolderConf, R"({"/a/d":{},"/ro/d":{},"/away/x":{}})");
    long long resumeTime = 0;
    std::string status;
    StatusMgr::GetPauseInfo(resumeTime);
    StatusMgr::GetStatus(status);
    StatusMgr::GetFolderStatus("/a/d");
    for (const std::string &name : {std::string("a"), std::string("photo"), text.substr(0, text.size() % 16)}) {
        StatusMgr::IsUpdated(name);
        CheckMark(StatusMgr::ShareIsNoSpace, StatusMgr::ShareSetNoSpace, name);
        CheckMark(StatusMgr::ShareIsNeedReindex, StatusMgr::ShareSetNeedReindex, name);
        Accepts([&] { return StatusMgr::ShareRevive(name); });
        if (Accepts([&] { return StatusMgr::SetUpdated(name); })) {
            Require(StatusMgr::IsUpdated(name), "the marker is lost", name);
        }
    }
    for (const int hours : {-1, 0, 5}) {
        if (Accepts([&] { return StatusMgr::Pause(hours); })) {
            Require(hours >= 0 && StatusMgr::GetPauseInfo(resumeTime), "cannot tell the pause");
            Require((resumeTime == 0) == (hours == 0), "pauses for another time");
        }
    }
    if (Accepts([] { return StatusMgr::Resume(); })) {
        Require(StatusMgr::GetPauseInfo(resumeTime) && resumeTime == -1, "cannot tell the end of the pause");
    }
}

// Nothing throws, no lock or descriptor stays behind, the configuration stays whole, and a success means that the
// request was carried out.
void CheckRequests(const std::string &text) {
    Json::Value request;
    if (!JsonReader().Parse(text, request)) {
        return;
    }
    WriteWhole(kFolderConf, R"({"/a":{"name":"A","audio":true},"/a/d":{"photo":true},"/away/x":{},"/b":{}})");
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
    }
    IsListed("/a");
}

}  // namespace

void FeedDocuments(Input &input) {
    switch (input.Below(3)) {
        case 0:
            return CheckFolderConf(input.MaybeSpoilt("F"));
        case 1:
            return CheckStatusConf(input.MaybeSpoilt("T"));
        default:
            return CheckRequests(input.MaybeSpoilt("U"));
    }
}

}  // namespace fileindex_fuzz
