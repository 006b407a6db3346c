// The queues: can events get in, can only root write them, and is everything in them legible?
#include "doctor/finding.h"
#include "facts/queue_files.h"
#include "facts/share_record.h"
#include "report/text.h"

#include <vork/metadata.h>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>

namespace VORK::FILEINDEXCTL::DOCTOR {

namespace {

constexpr const char *kWhyNotWritable = "changes are not indexed until a reindex: their events cannot be queued";
constexpr const char *kWhyNotRoots =
    "others than root can write events, take them away, or have root write somewhere else";

std::string Reindex(const std::string &share) {
    return "\"fileindexctl reindex " + ShellWord("/" + share) + "\"";
}

// By the administrator; what others may not write to, he may.
void CheckWritable(const std::string &path, Findings &findings) {
    if (faccessat(AT_FDCWD, path.c_str(), W_OK, AT_EACCESS) == 0) {
        return;
    }
    if (errno != EROFS && geteuid() != 0) {
        findings.AddNotAllowed("whether events can be queued", {path});
    } else {
        findings.Add(kWrong, path + " is not writable: " + std::strerror(errno), {}, kWhyNotWritable,
                     "make it writable");
    }
}

void CheckFile(const std::string &path, const std::string &share, Findings &findings) {
    struct stat status {};
    if (lstat(path.c_str(), &status) != 0) {
        return;
    }
    const std::string defect =
        S_ISREG(status.st_mode) ? ForeignText(status, "a queue") : "a queue that is no regular file";
    if (defect.empty()) {
        CheckOwnership(path, kNotForOthersToWrite, kWhyNotRoots, Correcting(path, kNotForOthersToWrite), findings);
    } else {  // what is in it may be made up, so it is not taken over
        findings.Add(kWrong, defect, {path}, kWhyNotRoots, "rm %, then " + Reindex(share));
    }
}

void CheckLines(const std::string &queue, const std::string &share, Findings &findings) {
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
        return findings.AddNotAllowed("what is in a queue", {queue});
    }
    if (count > 0) {
        findings.Add(kWrong,
                     "the queue of the share " + Quoted(share) + " has " + std::to_string(count) +
                         (count == 1 ? " malformed line: " : " malformed lines; the first is ") + first,
                     {}, "what they told is lost, and not indexed", Reindex(share));
    }
}

// The platform also sets aside what is not root's in it.
Action LeavingToPlatform(const std::string &directory) {
    return [directory](Patience &, std::string &) {
        if (VORKEAMKDir(0, directory.c_str()) < 0) {
            throw Failure(ExitStatus::kCannotSave, directory + " cannot be given to root");
        }
    };
}

void CheckQueue(const std::string &share, const std::string &shareDirectory, Findings &findings) {
    const std::string queue = QueuePathOf(share);
    const std::string directory = queue.substr(0, queue.rfind('/'));
    struct stat status {};
    if (lstat(directory.c_str(), &status) != 0) {
        switch (errno) {
            case ENOENT:
                return CheckWritable(shareDirectory, findings);
            case EACCES:
                return findings.AddNotAllowed("a queue", {queue});
            default:
                return findings.Add(kWrong, directory + ": " + std::strerror(errno), {}, kWhyNotWritable,
                                    "mend it");
        }
    }
    if (!S_ISDIR(status.st_mode)) {
        return findings.Add(kWrong, "a link, or no directory", {directory}, kWhyNotWritable,
                            "rm %; it is made anew");
    }
    CheckOwnership(directory, kNotForOthersToWrite, kWhyNotRoots, LeavingToPlatform(directory), findings);
    CheckFile(queue, share, findings);
    CheckFile(queue + ".tmp", share, findings);
    CheckWritable(directory, findings);
    CheckLines(queue, share, findings);
    CheckHolders(queue, "events that come meanwhile are dropped",
                 "wait for that program or end it, then " + Reindex(share), findings);
}

}  // namespace

void CheckQueues(Facts &facts, Findings &findings) {
    for (const auto &share : facts.indexedShares) {
        const SharePointer record = FindShare(share);
        struct stat status {};
        if (record && stat(record->szPath, &status) == 0) {
            CheckQueue(share, record->szPath, findings);
        }
    }
}

}  // namespace VORK::FILEINDEXCTL::DOCTOR
