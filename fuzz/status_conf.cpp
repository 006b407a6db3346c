// Any bytes as status.conf: nothing throws, a refused change leaves the file alone, an accepted one can be read
// back.

#include "json/text.h"
#include "names.h"
#include "support.h"

#include <fileindex/status_mgr.h>

#include <cstddef>
#include <cstdint>
#include <string>

namespace {

using namespace fileindex_fuzz;  // NOLINT(google-build-using-namespace): this is their program
using VORK::FILEINDEX::StatusMgr;
namespace names = VORK::FILEINDEX::internal;

/// Runs a change on the file as it is now. True when it was accepted; the file then is a JSON object.
template <typename Operation>
bool Accepts(Operation change) {
    const std::string before = ReadWhole(names::kStatusConf);
    const bool accepted = change();
    const std::string after = ReadWhole(names::kStatusConf);
    Json::Value document;
    Require(!accepted || (names::JsonReader().Parse(after, document) && document.isObject()), "saved no object",
            before);
    Require(accepted || after == before, "a refused change was saved", before);
    return accepted;
}

void ChangeShare(const std::string &share) {
    if (Accepts([&] { return StatusMgr::ShareSetNoSpace(share, true); })) {
        Require(StatusMgr::ShareIsNoSpace(share), "the mark is lost", share);
        Require(Accepts([&] { return StatusMgr::ShareRevive(share); }), "cannot revive", share);
        Require(!StatusMgr::ShareIsNoSpace(share), "the mark stays", share);
    }
    if (Accepts([&] { return StatusMgr::ShareSetNeedReindex(share, true); })) {
        Require(StatusMgr::ShareIsNeedReindex(share), "the mark is lost", share);
        Require(Accepts([&] { return StatusMgr::ShareSetNeedReindex(share, false); }), "cannot unmark", share);
        Require(!StatusMgr::ShareIsNeedReindex(share), "the mark stays", share);
    }
}

void CheckPause(int hours) {
    long long resumeTime = 0;
    if (Accepts([&] { return StatusMgr::Pause(hours); })) {
        Require(hours >= 0 && StatusMgr::GetPauseInfo(resumeTime), "cannot tell the pause");
        Require((resumeTime == 0) == (hours == 0), "pauses for another time");
    }
    if (Accepts([] { return StatusMgr::Resume(); })) {
        Require(StatusMgr::GetPauseInfo(resumeTime) && resumeTime == -1, "cannot tell the end of the pause");
    }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size) {
    ResetMachine();
    const std::string text(reinterpret_cast<const char *>(data), size);
    WriteWhole(names::kStatusConf, text);
    WriteWhole(names::kFolderConf, R"({"/a/d":{},"/ro/d":{},"/away/x":{}})");
    const LeakCheck leaks;
    long long resumeTime = 0;
    std::string status;
    StatusMgr::GetPauseInfo(resumeTime);
    StatusMgr::GetStatus(status);
    StatusMgr::GetFolderStatus("/a/d");
    for (const std::string &name : {std::string("a"), std::string("photo"), text.substr(0, size % 16)}) {
        StatusMgr::ShareIsNoSpace(name);
        StatusMgr::ShareIsNeedReindex(name);
        StatusMgr::IsUpdated(name);
        ChangeShare(name);
        if (Accepts([&] { return StatusMgr::SetUpdated(name); })) {
            Require(StatusMgr::IsUpdated(name), "the marker is lost", name);
        }
    }
    CheckPause(size == 0 ? 0 : static_cast<int>(data[0]) - 8);
    TakeCommands();
    return 0;
}
