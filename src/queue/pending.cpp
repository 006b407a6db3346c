#include "queue/pending.h"

#include "base/metadata_entry.h"
#include "base/queue/event.h"
#include "queue/path_search.h"
#include "records.h"

#include <fileindex/paths.h>

#include <fcntl.h>
#include <syslog.h>

#include <utility>

namespace VORK::FILEINDEX::internal {

namespace {

/// One that cannot be opened is recorded.
UniqueFd OpenQueue(const std::string &queueFile, struct stat &status) {
    UniqueFd file = MetadataEntry(queueFile).OpenFile(O_RDONLY, status);
    if (!file) {
        syslog(LOG_ERR, "%s:%d Failed to open queue=%s, reason=%m", records::kEventDuplicates.module,
               records::kEventDuplicates.line, queueFile.c_str());
    }
    return file;
}

bool IsReindex(const QueueEvent *event) {
    return event != nullptr && event->type == kReindexEvent;
}

/// Does the line of a reindex of exactly this path begin at the offset?
bool IsReindexAt(const std::string &queueFile, off_t offset, const std::string &fullPath) {
    struct stat status = {};
    UniqueFd file = MetadataEntry(queueFile).OpenFile(O_RDONLY, status);
    if (!file) {
        return false;
    }
    QueueLines lines(std::move(file), offset);
    QueueEventReader reader;
    QueueLine line;
    if (!lines.Next(line)) {
        return false;
    }
    const QueueEvent *event = reader.Read(line);
    return IsReindex(event) && event->path == fullPath;
}

}  // namespace

bool IsReindexQueued(const std::string &fullPath, const std::string &queueFile) {
    if (!IsFileExist(queueFile)) {
        return false;
    }
    struct stat status = {};
    UniqueFd file = OpenQueue(queueFile, status);
    if (!file) {
        return false;
    }
    QueueLines lines(std::move(file));
    const PathSearch search(fullPath);
    lines.SkipUnless([&](std::string_view text) { return search.MayBeNamedIn(text); });
    QueueEventReader reader;
    for (QueueLine line; lines.Next(line);) {
        const QueueEvent *event = reader.Read(line);
        if (IsReindex(event) && event->path == fullPath) {
            return true;
        }
    }
    return false;
}

PendingReindexes::PendingReindexes(std::vector<std::string> sharePaths) : sharePaths_(std::move(sharePaths)) {}

PendingReindexes::KnownQueue &PendingReindexes::Queue(const std::string &queueFile, std::string_view volume) {
    KnownQueue &queue = queues_[queueFile];
    if (queue.wanted.empty() || queue.volume != volume) {
        queue = KnownQueue();
        queue.volume = volume;
        for (const std::string &sharePath : sharePaths_) {
            queue.wanted.insert(queue.volume + sharePath);
        }
    }
    return queue;
}

bool PendingReindexes::ReadOn(KnownQueue &queue, const std::string &queueFile) {
    struct stat status = {};
    UniqueFd file = OpenQueue(queueFile, status);
    if (!file) {
        return false;
    }
    if (!queue.position.IsIn(status)) {
        queue.position = {status.st_dev, status.st_ino, 0};
        queue.pending.clear();
    }
    queue.last.clear();
    QueueLines lines(std::move(file), queue.position.offset);
    QueueEventReader reader;
    for (QueueLine line; lines.Next(line);) {
        const QueueEvent *event = reader.Read(line);
        if (!IsReindex(event)) {
            continue;
        }
        if (!line.whole) {
            queue.last = event->path;
        } else if (queue.wanted.contains(event->path)) {
            queue.pending.emplace(event->path, line.offset);
        }
    }
    queue.position.offset = lines.AfterWhole();
    return true;
}

bool PendingReindexes::IsQueued(const std::string &fullPath, const std::string &sharePath,
                                const std::string &queueFile) {
    if (sharePaths_.size() < 2) {
        return IsReindexQueued(fullPath, queueFile);
    }
    if (!IsFileExist(queueFile)) {
        queues_.erase(queueFile);  // consumed: a new file may get the number of the old one
        return false;
    }
    KnownQueue &queue = Queue(queueFile, std::string_view(fullPath).substr(0, fullPath.size() - sharePath.size()));
    if (!ReadOn(queue, queueFile)) {
        return false;
    }
    const auto found = queue.pending.find(fullPath);
    if (found == queue.pending.end()) {
        return queue.last == fullPath;
    }
    if (IsReindexAt(queueFile, found->second, fullPath)) {
        return true;
    }
    queues_.erase(queueFile);  // consumed in place, or replaced by a file that looks the same
    return IsReindexQueued(fullPath, queueFile);
}

}  // namespace VORK::FILEINDEX::internal
