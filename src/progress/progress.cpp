#include "progress/progress.h"

#include "base/metadata_entry.h"
#include "base/path_cover.h"
#include "base/queue/event.h"
#include "names.h"
#include "no_throw.h"
#include "records.h"
#include "share/location.h"
#include "status/access.h"

#include <fileindex/indexability.h>
#include <fileindex/paths.h>

#include <fcntl.h>
#include <syslog.h>

#include <ctime>
#include <utility>

namespace VORK::FILEINDEX::internal {

namespace {

/// Does the queue file hold an event at or under the folder (a share path)?
///
/// A rename counts for its old place too. That place is kept for all later lines until the next rename: the
/// daemon works the lines off in order and may still be moving entries out of it.
bool IsPathInQueue(const std::string &path, const std::string &queueFile) {
    if (!IsFileExist(queueFile)) {
        return false;
    }
    std::string fullPath;
    if (!GetFullPath(fullPath, path)) {
        syslog(LOG_ERR, "%s:%d Cannot get full path: %s", records::kFolderStatusPath.module,
               records::kFolderStatusPath.line, path.c_str());
        return false;
    }
    struct stat status = {};
    UniqueFd file = MetadataEntry(queueFile).OpenFile(O_RDONLY, status);
    if (!file) {
        syslog(LOG_ERR, "%s:%d Failed to open queue=%s, reason=%m", records::kFolderStatusOpen.module,
               records::kFolderStatusOpen.line, queueFile.c_str());
        return false;
    }
    bool found = false;
    std::string oldPath;
    QueueLines lines(std::move(file));
    QueueEventReader reader;
    for (QueueLine line; lines.Next(line);) {  // to the end, so that every malformed line is recorded
        const QueueEvent *event = reader.Read(line);
        if (event == nullptr) {
            syslog(LOG_ERR, "%s:%d Malformed command: %s", records::kFolderStatusLine.module,
                   records::kFolderStatusLine.line, std::string(line.text).c_str());
            continue;
        }
        if (event->type == kRenameEvent) {
            oldPath = event->oldPath;
        }
        found = found || IsAtOrUnder(event->path, fullPath) || IsAtOrUnder(oldPath, fullPath);
    }
    return found;
}

std::string Progress(const std::string &path) {
    if (!CanPathBeIndexed(path)) {
        return kPaused;  // for the user it is waiting, not broken
    }
    std::string share;
    if (!GetShareNameByPath(share, path)) {
        syslog(LOG_ERR, "%s:%d Failed to get share name from path: %s", records::kFolderStatusShare.module,
               records::kFolderStatusShare.line, path.c_str());
        return kFinished;
    }
    if (AskStatus([&](Status &status) { return status.ShareIsNoSpace(share); })) {
        return kNoSpace;
    }
    char buffer[kPathSize] = {};
    if (QueuePathOf(share, buffer) < 0) {
        syslog(LOG_ERR, "%s:%d FILEIDXQueuePathGet failed, share=%s", records::kFolderStatusQueue.module,
               records::kFolderStatusQueue.line, share.c_str());
        return kFinished;
    }
    const std::string queue = buffer;
    long long resumeTime = -1;
    (void)AskStatus(
        [&](Status &status) { return status.GetPauseInfo(resumeTime); });  // unreadable reads as not paused
    if (!IsPathInQueue(path, queue) && !IsPathInQueue(path, queue + kQueueTmpSuffix)) {
        return kFinished;
    }
    return ProgressOfWork(resumeTime);
}

}  // namespace

const char *ProgressOfWork(long long resumeTime) {
    const bool paused = resumeTime == 0 || time(nullptr) < resumeTime;
    return paused ? kPaused : kProcessing;
}

std::string FolderProgress(const std::string &path) {
    return NoThrow([&] { return Progress(path); }, kFinished);
}

}  // namespace VORK::FILEINDEX::internal
