// One changing operation, marked in a system call trace: its outcome, what it leaves, and whether it can be
// repeated.
#include "harness.h"
#include "scenarios.h"
#include "support/processes.h"
#include "support/syslog_capture.h"

#include <fcntl.h>
#include <sys/file.h>
#include <unistd.h>

#include <cstdio>
#include <sstream>

namespace reliability {

namespace {

using namespace VORK::FILEINDEX;
using fileindex_test::SyslogCapture;

struct Row {
    const char *name;
    bool (*run)();
    bool fresh = false;  ///< starts without configuration files and with the search setting off
};

const Row kOperations[] = {
    {"updated", [] { return StatusMgr::SetUpdated("marker"); }},
    {"upsert",
     [] {
         return IndexMgr::Upsert(Array({FolderRequest("/photo/a", "new"), FolderRequest("/photo/z", "")}));
     }},
    {"upsert-first", [] { return IndexMgr::Upsert(Array({FolderRequest("/photo/a", "first")})); }, true},
    {"update", [] { return IndexMgr::Update("/photo/a", Json::Value(1)); }},
    {"delete", [] { return IndexMgr::Delete(Array({"/photo/a"})); }},
    {"delete-last",
     [] {
         return IndexMgr::Delete(Array({"/photo/a", "/photo/b", "/music/c"}));
     }},
    {"reindex",
     [] {
         return IndexMgr::Reindex(Array({"/photo/a", "/music/c"}));
     }},
    {"monitor-upsert", [] { return IndexMgr::UpsertVorkNotifydCfg("photo"); }},
    {"monitor-delete", [] { return IndexMgr::DeleteVorkNotifydCfg("photo"); }},
    {"share-rename", [] { return IndexMgr::ShareRename("music", "photo"); }},
    {"share-remove", [] { return IndexMgr::ShareRemove("music"); }},
    {"share-pause", [] { return IndexMgr::SharePause("photo"); }},
    {"share-resume", [] { return IndexMgr::ShareResume("photo"); }},
    {"clean", [] { return IndexMgr::CleanShareIndexData("photo"); }},
    {"pause", [] { return StatusMgr::Pause(0); }},
    {"resume", [] { return StatusMgr::Resume(); }},
    {"no-space", [] { return StatusMgr::ShareSetNoSpace("photo", true); }},
    {"revive", [] { return StatusMgr::ShareRevive("music"); }},
    {"need-reindex", [] { return StatusMgr::ShareSetNeedReindex("photo", true); }},
    {"first-marker", [] { return StatusMgr::SetUpdated("marker"); }, true},
    {"updater", [] { return Updater_zol60_beta2(); }},
};

/// Larger than a page, so that the reading and writing of a long file is in it.
std::string FoldersBefore() {
    Json::Value folders;
    for (const char *path : {"/photo/a", "/photo/b", "/music/c"}) {
        folders[path] = FolderRequest(path, "before");
    }
    return folders.toStyledString() + std::string(5000, ' ');
}

void Prepare(const Row &row) {
    MakeMachine(!row.fresh);
    if (!row.fresh) {
        WriteFile(kFolderConf, FoldersBefore());
        WriteFile(kStatusConf, "{\"no_space\": {\"music\": true}, \"resume_time\": 5}\n");
    }
    WriteFile(kQueue, "{\"event\": 1, \"path\": \"/vol1/photo/x\"}\n");
}

struct Files {
    std::optional<std::string> folders = ReadFile(kFolderConf);
    std::optional<std::string> status = ReadFile(kStatusConf);
};

/// "old", "new", or, when it is neither, "lost".
std::string StateOf(const std::optional<std::string> &before, const std::optional<std::string> &after,
                    const std::optional<std::string> &repeated) {
    return after == before ? "old" : after == repeated ? "new" : "lost";
}

bool IsWhole(const char *path) {
    const auto text = ReadFile(path);
    return !text || Parse(*text).has_value();
}

bool HasWholeLines() {
    std::istringstream queue(ReadFile(kQueue).value_or(""));
    for (std::string line; std::getline(queue, line);) {
        if (!Parse(line)) {
            return false;
        }
    }
    return true;
}

bool IsFree(const char *lockPath) {
    const int fd = ::open(lockPath, O_RDWR | O_CREAT | O_CLOEXEC, 0644);
    const bool isFree = ::flock(fd, LOCK_EX | LOCK_NB) == 0;
    ::close(fd);
    return isFree;
}

std::string Records() {
    std::string all;
    for (const auto &record : SyslogCapture::Records()) {
        all += "; " + record.file + " " + record.message;
    }
    return all;
}

}  // namespace

void Operation(const std::string &name) {
    for (const Row &row : kOperations) {
        if (row.name != name) {
            continue;
        }
        Prepare(row);
        const pid_t daemon = StartDaemon();
        const Files before;
        const auto open = fileindex_test::OpenDescriptors();
        ErrorHandler::SetError(FILEINDEX_ERR_NONE);
        ::getppid();  // marks the beginning in the trace
        const bool result = row.run();
        ::getppid();  // and the end
        const int code = ErrorHandler::GetError();
        const std::string records = Records();
        const bool sameDescriptors = fileindex_test::OpenDescriptors() == open;
        const bool locksFree = IsFree(kFolderLock) && IsFree(kStatusLock);
        const bool whole = IsWhole(kFolderConf) && IsWhole(kStatusConf) && HasWholeLines();
        const Files after;
        const bool repeated = row.run();
        const Files again;
        std::printf("%s %d folders=%s status=%s files=%s locks=%s descriptors=%s repeated=%s%s\n",
                    result ? "true" : "false", code, StateOf(before.folders, after.folders, again.folders).c_str(),
                    StateOf(before.status, after.status, again.status).c_str(), whole ? "whole" : "BROKEN",
                    locksFree ? "free" : "HELD", sameDescriptors ? "same" : "DIFFERENT",
                    repeated ? "true" : "false", records.c_str());
        Kill(daemon);
        return;
    }
    Check(false, "no operation " + name);
}

void ListOperations() {
    for (const Row &row : kOperations) {
        std::printf("%s\n", row.name);
    }
}

}  // namespace reliability
