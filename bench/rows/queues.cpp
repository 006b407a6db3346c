#include "baseline.h"
#include "queue/pending.h"
#include "rows/support.h"

#include <fileindex/daemon.h>
#include <fileindex/index_mgr.h>
#include <fileindex/status_mgr.h>

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include <filesystem>
#include <functional>
#include <string>
#include <utility>

namespace bench {

namespace {

using VORK::FILEINDEX::IndexMgr;
using VORK::FILEINDEX::StatusMgr;

void AppendBare(const std::string &path, const std::string &line) {
    const int fd = open(path.c_str(), O_WRONLY | O_APPEND | O_CREAT | O_CLOEXEC, 0644);
    flock(fd, LOCK_EX | LOCK_NB);
    Require(write(fd, line.data(), line.size()) == static_cast<ssize_t>(line.size()), "append");
    flock(fd, LOCK_UN);
    close(fd);
}

std::string EventLine(const std::string &fullPath) {
    return "{\"data\":null,\"event\":65536,\"path\":\"" + fullPath + "\"}\n";
}

struct Ratios {
    double ofFloor;
    double ofBaseline;
};

using PrepareQueue = std::function<void(std::size_t lines)>;

/// A scan of the whole queue, against reading its bytes. The baseline is so slow that a part of the queue has to
/// do: it takes each line for itself.
Row Scan(const std::string &name, std::size_t lines, const PrepareQueue &prepare,
         const std::function<void()> &library, const std::function<void()> &baseline, Ratios most) {
    Row row;
    row.name = name;
    row.library = [=] {
        prepare(lines);
        return library;
    };
    row.baselineParts = 20;
    row.baseline = [=, part = lines / row.baselineParts] {
        prepare(part);
        return baseline;
    };
    row.floor = [=] {
        prepare(lines);
        return [queue = QueuePath("share0")] { ReadBytes(queue); };
    };
    row.mostOfFloor = most.ofFloor;
    row.mostOfBaseline = most.ofBaseline;
    return row;
}

Row PendingCheck(std::size_t lines, Escapes escapes, const char *name, Ratios most) {
    const std::string queue = QueuePath("share0");
    const auto prepare = [=](std::size_t count) { WriteQueue(queue, count, escapes); };
    const auto library = [queue] {
        Require(!VORK::FILEINDEX::internal::IsReindexQueued(FullPath(kAbsent), queue), "find");
    };
    const auto baseline = [queue] { Require(!baseline::IsReindexQueued(FullPath(kAbsent), queue), "find"); };
    return Scan("pending-reindex check/" + std::to_string(lines) + name, lines, prepare, library, baseline, most);
}

Row FolderState(std::size_t lines, bool unusual, Ratios most) {
    const std::string queue = QueuePath("share0");
    const auto prepare = [=](std::size_t count) {
        std::filesystem::create_directories(FullPath(kAbsent));
        unusual ? WriteUnusualQueue(queue, count) : WriteQueue(queue, count);
    };
    const auto library = [] { Require(StatusMgr::GetFolderStatus(kAbsent) == "finished", "state"); };
    const auto baseline = [queue] { Require(!baseline::IsPathInQueue(FullPath(kAbsent), queue), "state"); };
    return Scan("folder state/" + std::to_string(lines) + (unusual ? ", every line unusual" : ""), lines, prepare,
                library, baseline, most);
}

Row OneEvent() {
    const std::string queue = QueuePath("share0");
    const auto prepare = [=] {
        WriteQueue(queue, 10);
        return std::filesystem::file_size(queue);
    };
    const std::string path = FullPath(kAbsent);
    Row row;
    row.name = "one event/queue of 10";
    row.library = [=] {
        return [=, size = prepare()] {
            Require(VORK::FILEINDEX::AddCustomEvent(0x20000, path, Json::Value()), "event");
            Require(truncate(queue.c_str(), static_cast<off_t>(size)) == 0, "truncate");
        };
    };
    row.baseline = [=] {
        return [=, size = prepare()] {
            Require(baseline::AddEvent(0x20000, path, queue), "event");
            Require(truncate(queue.c_str(), static_cast<off_t>(size)) == 0, "truncate");
        };
    };
    // The same system calls: two looks for a queue, its bytes, the append with its checks.
    row.floor = [=] {
        return [=, size = prepare(), line = EventLine(path)] {
            struct stat status = {};
            lstat(queue.c_str(), &status);
            const int in = open(queue.c_str(), O_RDONLY | O_CLOEXEC);
            fstat(in, &status);
            static std::vector<char> block(128 * 1024);
            while (read(in, block.data(), block.size()) > 0) {
            }
            close(in);
            lstat((queue + ".tmp").c_str(), &status);
            const int out = open(queue.c_str(), O_WRONLY | O_APPEND | O_CREAT | O_CLOEXEC, 0644);
            fstat(out, &status);
            flock(out, LOCK_EX | LOCK_NB);
            lstat(queue.c_str(), &status);
            fstat(out, &status);
            Require(write(out, line.data(), line.size()) == static_cast<ssize_t>(line.size()), "write");
            flock(out, LOCK_UN);
            close(out);
            Require(truncate(queue.c_str(), static_cast<off_t>(size)) == 0, "truncate");
        };
    };
    row.mostOfFloor = 2;
    return row;
}

Row Reindex(std::size_t paths, std::size_t lines) {
    const std::string queue = QueuePath("share0");
    const auto sharePaths = SharePaths(paths, 1);
    const auto prepare = [=] {
        WriteFolderConf(sharePaths);
        WriteQueue(queue, lines);
        return std::filesystem::file_size(queue);
    };
    Row row;
    row.name = "Reindex/" + std::to_string(paths) + " paths, queue of " + std::to_string(lines);
    row.library = [=] {
        Json::Value request(Json::arrayValue);
        for (const std::string &path : sharePaths) {
            request.append(path);
        }
        return [=, size = prepare()] {
            Require(IndexMgr::Reindex(request), "reindex");
            Require(truncate(queue.c_str(), static_cast<off_t>(size)) == 0, "truncate");
        };
    };
    // One scan that reads every line, and the appends.
    row.floor = [=] {
        return [=, size = prepare()] {
            ReadEvents(queue);
            for (const std::string &path : sharePaths) {
                AppendBare(queue, EventLine(FullPath(path)));
            }
            Require(truncate(queue.c_str(), static_cast<off_t>(size)) == 0, "truncate");
        };
    };
    row.mostOfFloor = 3;
    return row;
}

}  // namespace

std::vector<Row> QueueRows(std::size_t scale) {
    const std::size_t million = 1000000 / scale;
    return {
        PendingCheck(million / 100, Escapes::kNone, "", {0, 0}),
        PendingCheck(million / 10, Escapes::kNone, "", {0, 0}),
        PendingCheck(million, Escapes::kNone, "", {3, 1.0 / 80}),
        PendingCheck(million, Escapes::kEverywhere, ", escapes in every path", {0, 1.0 / 8}),
        FolderState(million, false, {7, 1.0 / 30}),
        FolderState(million / 10, true, {0, 1.0 / 2}),
        OneEvent(),
        Reindex(1000, million / 10),
    };
}

}  // namespace bench
