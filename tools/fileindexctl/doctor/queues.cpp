// The queues: can events get in, can only root write them, and is everything in them legible?
#include "doctor/finding.h"
#include "doctor/ownership.h"
#include "facts/file_locks.h"
#include "facts/queue_files.h"
#include "facts/share_record.h"
#include "report/failure.h"

#include <vork/metadata.h>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>

namespace VORK::FILEINDEXCTL::DOCTOR {

namespace {

constexpr const char *kMetadata = "/@eaDir";
constexpr const char *kQueue = "/VORK@file_index_queue";
constexpr const char *kWhyNotWritable = "changes are not indexed until a reindex: their events cannot be queued";
constexpr const char *kWhyNotRoots =
    "others than root can write events, take them away, or have root write somewhere else";

// By the administrator; what others may not write to, he may.
Findings CheckWritable(const std::string &path) {
    if (faccessat(AT_FDCWD, path.c_str(), W_OK, AT_EACCESS) == 0) {
        return {};
    }
    if (errno != EROFS && geteuid() != 0) {
        return {NotAllowed("whether events can be queued", {path})};
    }
    return {{path + " is not writable: " + std::strerror(errno), kWhyNotWritable, "make it writable"}};
}

Finding Planted(const std::string &what, const std::string &path, const std::string &share) {
    return {what, kWhyNotRoots,  "rm %, then \"fileindexctl reindex " + ShellWord("/" + share) + "\"",
            {},   Level::kWrong, {path}};
}

Findings CheckFile(const std::string &path, const std::string &share) {
    struct stat status {};
    if (lstat(path.c_str(), &status) != 0) {
        return {};
    }
    if (!S_ISREG(status.st_mode)) {
        return {Planted("a queue that is no regular file", path, share)};
    }
    if (status.st_nlink != 1) {
        return {Planted("a queue that has further names (hard links)", path, share)};
    }
    // What is in it may be made up, so it is not taken over.
    return status.st_uid != 0
               ? Findings{Planted("a queue that user " + std::to_string(status.st_uid) + " owns", path, share)}
               : CheckOwnership(path, kNotForOthersToWrite, kWhyNotRoots);
}

Findings CheckLines(const std::string &queue, const std::string &share) {
    unsigned long count = 0;
    std::string first;
    try {
        QueueFiles files(queue);
        files.Visit([&](const QueueEvent *event) {
            if (event == nullptr && ++count == 1) {
                first =
                    "line " + std::to_string(files.Line()) + " of " + queue + (files.IsAtTaken() ? ".tmp" : "");
            }
        });
    } catch (const Failure &) {
        return {NotAllowed("what is in a queue", {queue})};
    }
    if (count == 0) {
        return {};
    }
    return {{"the queue of the share " + Quoted(share) + " has " + std::to_string(count) +
                 (count == 1 ? " malformed line: " : " malformed lines; the first is ") + first,
             "what they told is lost, and not indexed",
             "\"fileindexctl reindex " + ShellWord("/" + share) + "\""}};
}

// The platform also sets aside what is not root's in it.
void LeaveToPlatform(Finding &finding, const std::string &directory) {
    for (Repair &repair : finding.repairs) {
        repair.act = [directory](Patience &) {
            if (VORKEAMKDir(0, directory.c_str()) < 0) {
                throw Failure(ExitStatus::kCannotSave, directory + " cannot be given to root");
            }
            return std::string();
        };
    }
}

Findings CheckQueue(const std::string &share, const VORKSHARE &record) {
    const std::string queue = QueueOf(record);
    const std::string directory = std::string(record.szPath) + kMetadata;
    struct stat status {};
    if (lstat(directory.c_str(), &status) != 0) {
        return errno == ENOENT   ? CheckWritable(record.szPath)
               : errno == EACCES ? Findings{NotAllowed("a queue", {queue})}
                                 : Findings{{directory + ": " + std::strerror(errno), kWhyNotWritable, "mend it"}};
    }
    if (!S_ISDIR(status.st_mode)) {
        return {
            {"a link, or no directory", kWhyNotWritable, "rm %; it is made anew", {}, Level::kWrong, {directory}}};
    }
    Findings findings = CheckOwnership(directory, kNotForOthersToWrite, kWhyNotRoots);
    for (Finding &finding : findings) {
        LeaveToPlatform(finding, directory);
    }
    Append(findings, CheckFile(queue, share));
    Append(findings, CheckFile(queue + ".tmp", share));
    Append(findings, CheckWritable(directory));
    Append(findings, CheckLines(queue, share));
    const auto holders = LastingLockHolders(queue);
    if (!holders.empty()) {
        findings.push_back(
            {queue + " is held by " + HolderText(holders), "events that come meanwhile are dropped",
             "wait for that program or end it, then \"fileindexctl reindex " + ShellWord("/" + share) + "\""});
    }
    return findings;
}

}  // namespace

std::string QueueOf(const VORKSHARE &share) {
    return std::string(share.szPath) + kMetadata + kQueue;
}

Findings CheckQueues(const Facts &facts) {
    Findings findings;
    for (const auto &[share, count] : facts.folderCount) {
        const SharePointer record = FindShare(share);
        struct stat status {};
        if (record && stat(record->szPath, &status) == 0) {
            Append(findings, CheckQueue(share, *record));
        }
    }
    return findings;
}

}  // namespace VORK::FILEINDEXCTL::DOCTOR
