// One changing operation, marked in a system call trace: its outcome, what it leaves, and whether it can be
// repeated.
#include "harness.h"
#include "support/syslog_capture.h"

#include <fcntl.h>
#include <sys/file.h>

#include <map>
#include <sstream>

namespace reliability {

namespace {

struct Row {
    bool (*run)();
    bool fresh = false;  ///< starts without configuration files and with the search setting off
};

const std::map<std::string, Row> kOperations = {
    {"updated", {[] { return StatusMgr::SetUpdated("marker"); }}},
    {"upsert",
     {[] { return IndexMgr::Upsert(Array(FolderRequest("/photo/a", "new"), FolderRequest("/photo/z", ""))); }}},
    {"upsert-first", {[] { return IndexMgr::Upsert(Array(FolderRequest("/photo/a", "first"))); }, true}},
    {"update", {[] { return IndexMgr::Update("/photo/a", Json::Value(1)); }}},
    {"delete", {[] { return IndexMgr::Delete(Array("/photo/a")); }}},
    {"delete-last", {[] { return IndexMgr::Delete(Array("/photo/a", "/photo/b", "/music/c")); }}},
    {"reindex", {[] { return IndexMgr::Reindex(Array("/photo/a", "/music/c")); }}},
    {"monitor-upsert", {[] { return IndexMgr::UpsertVorkNotifydCfg("photo"); }}},
    {"monitor-delete", {[] { return IndexMgr::DeleteVorkNotifydCfg("photo"); }}},
    {"share-rename", {[] { return IndexMgr::ShareRename("music", "photo"); }}},
    {"share-remove", {[] { return IndexMgr::ShareRemove("music"); }}},
    {"share-pause", {[] { return IndexMgr::SharePause("photo"); }}},
    {"share-resume", {[] { return IndexMgr::ShareResume("photo"); }}},
    {"clean", {[] { return IndexMgr::CleanShareIndexData("photo"); }}},
    {"pause", {[] { return StatusMgr::Pause(0); }}},
    {"resume", {[] { return StatusMgr::Resume(); }}},
    {"no-space", {[] { return StatusMgr::ShareSetNoSpace("photo", true); }}},
    {"revive", {[] { return StatusMgr::ShareRevive("music"); }}},
    {"need-reindex", {[] { return StatusMgr::ShareSetNeedReindex("photo", true); }}},
    {"first-marker", {[] { return StatusMgr::SetUpdated("marker"); }, true}},
    {"updater", {[] { return Updater_zol60_beta2(); }}},
};

void Prepare(const Row &row) {
    MakeMachine(!row.fresh);
    if (!row.fresh) {
        Json::Value folders;
        for (const char *path : {"/photo/a", "/photo/b", "/music/c"}) {
            folders[path] = FolderRequest(path, "before");
        }
        // Larger than a page, so that the reading and writing of a long file is in it.
        WriteFile(kFolderConf, folders.toStyledString() + std::string(5000, ' '));
        WriteFile(kStatusConf, "{\"no_space\": {\"music\": true}, \"resume_time\": 5}\n");
    }
    WriteFile(kQueue, "{\"event\": 1, \"path\": \"/vol1/photo/x\"}\n");
}

/// A configuration file as everybody loads it: a tail may follow the bytes that stand first.
class Loaded : public Config {
public:
    explicit Loaded(const char *path) : path_(path), isWhole(LoadJson()) {}
    bool Load() override { return true; }
    bool Save() override { return false; }
    std::string GetLockPath() const override { return ""; }
    std::string GetPath() const override { return path_; }
    bool operator==(const Loaded &other) const { return document_ == other.document_; }

private:
    const char *path_;

public:
    const bool isWhole;
};

/// A change is done wholly or not at all.
const char *StateOf(const Loaded &before, const Loaded &after, const Loaded &repeated) {
    return !after.isWhole ? "BROKEN" : after == before ? "old" : after == repeated ? "new" : "LOST";
}

bool HasWholeLines() {
    std::istringstream queue(ReadFile(kQueue));
    std::string line;
    while (std::getline(queue, line) && Parse(line)) {
    }
    return queue.eof();
}

bool IsFree(const char *lockPath) {
    const int fd = ::open(lockPath, O_RDWR | O_CREAT | O_CLOEXEC, 0644);
    const bool isFree = ::flock(fd, LOCK_EX | LOCK_NB) == 0;
    ::close(fd);
    return isFree;
}

}  // namespace

void Operation(const std::string &name) {
    const Row &row = kOperations.at(name);
    Prepare(row);
    const pid_t daemon = StartDaemon();
    const Loaded folders(kFolderConf);
    const Loaded status(kStatusConf);
    const auto open = fileindex_test::OpenDescriptors();
    ::getppid();  // marks the beginning in the trace
    const bool result = row.run();
    ::getppid();  // and the end
    const int code = ErrorHandler::GetError();
    const auto records = fileindex_test::SyslogCapture::Records();
    const bool sameDescriptors = fileindex_test::OpenDescriptors() == open;
    const bool locksFree = IsFree(kFolderLock) && IsFree(kStatusLock);
    const Loaded foldersAfter(kFolderConf);
    const Loaded statusAfter(kStatusConf);
    const bool isRepeated = row.run();
    std::printf("%s %d folders=%s status=%s queue=%s locks=%s descriptors=%s repeated=%s",
                result ? "true" : "false", code, StateOf(folders, foldersAfter, Loaded(kFolderConf)),
                StateOf(status, statusAfter, Loaded(kStatusConf)), HasWholeLines() ? "whole" : "BROKEN",
                locksFree ? "free" : "HELD", sameDescriptors ? "same" : "DIFFERENT",
                isRepeated ? "true" : "false");
    for (const auto &record : records) {
        std::printf("; %s %s", record.file.c_str(), record.message.c_str());
    }
    std::puts("");
    Kill(daemon);
}

void ListOperations(const std::string &) {
    for (const auto &[name, row] : kOperations) {
        std::puts(name.c_str());
    }
}

}  // namespace reliability
