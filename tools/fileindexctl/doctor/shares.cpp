// Shares, their queues and their flags.
#include "../failure.h"
#include "../file_locks.h"
#include "../queue_files.h"
#include "../share_record.h"
#include "../status_file.h"
#include "../text.h"
#include "finding.h"

#include <fileindex/indexability.h>

#include <vork/error.h>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <set>

namespace fileindexctl::doctor {

namespace {

std::set<std::string> AllShares(const Facts &facts) {
    std::set<std::string> names(facts.configuredShares.begin(), facts.configuredShares.end());
    for (const auto &[share, count] : facts.folderCount) {
        names.insert(share);
    }
    return names;
}

std::string Consequence(const std::string &share, const Facts &facts) {
    const auto found = facts.folderCount.find(share);
    return found == facts.folderCount.end()
               ? "nothing in it can be indexed"
               : "its indexed folders (" + std::to_string(found->second) + ") are not kept up";
}

Finding Unusable(const std::string &share, int error, const std::string &why) {
    const std::string word = ShellWord(share);
    switch (error) {
        case VORK_ERR_SHARE_DIRECTORY_NAME:
            return {"the directory of the share " + Quoted(share) + " has another name than the share", why,
                    "rename one of them, or bind mount the directory under the share's name"};
        case VORK_ERR_NO_SUCH_SHARE:
            return {
                "there is no share " + Quoted(share) + " any more", why,
                "bring the share back; or \"fileindexctl share rename\" if it has another name, \"fileindexctl "
                "share remove " +
                    word + "\" if it is gone for good"};
        default:
            return {"the share " + Quoted(share) + " cannot be looked up", why,
                    "correct its entry in the platform's configuration"};
    }
}

std::string ReindexCommand(const std::string &share) {
    return "\"fileindexctl reindex " + ShellWord("/" + share) + "\"";
}

bool IsWritable(const std::string &path) {
    return faccessat(AT_FDCWD, path.c_str(), W_OK, AT_EACCESS) == 0;
}

Findings CheckQueue(const std::string &share) {
    const std::string queue = QueuePathOf(share);
    const std::string directory = queue.substr(0, queue.rfind('/'));
    const std::string why = "changes are not indexed until a reindex: their events cannot be queued";
    struct stat status {};
    if (lstat(directory.c_str(), &status) != 0) {
        return {{directory + ": " + std::strerror(errno), why, "make the share writable"}};
    }
    if (!S_ISDIR(status.st_mode)) {
        return {{directory + " is not a directory of its own",
                 "the queue is kept wherever a link leads, and cannot be cleaned", "remove it; it is made anew"}};
    }
    if (!IsWritable(directory)) {
        return {{directory + " is not writable: " + std::strerror(errno), why,
                 "make it writable, or run this as the administrator"}};
    }
    if (lstat(queue.c_str(), &status) != 0) {
        return {};
    }
    if (!S_ISREG(status.st_mode) || !IsWritable(queue)) {
        return {{queue + " is not a file that can be written", why, "remove it, then " + ReindexCommand(share)}};
    }
    const auto holders = LastingLockHolders(queue);
    if (holders.empty()) {
        return {};
    }
    return {{queue + " is held by " + HolderText(holders), "events that come meanwhile are dropped",
             "wait for that program or end it, then " + ReindexCommand(share)}};
}

// Only when everything that names shares could be read: a share that cannot be seen just now keeps its flags.
bool IsGone(const std::string &share, const Facts &facts) {
    return !facts.configuredShares.empty() && facts.areFoldersKnown && facts.folderCount.count(share) == 0 &&
           FindShare(share) == nullptr && VLIBCErrGet() == VORK_ERR_NO_SUCH_SHARE;
}

Finding StaleFlag(const std::string &share, const std::string &flag) {
    const auto remove = [share, flag](Json::Value &document) {
        if (document[flag].isObject()) {
            document[flag].removeMember(share);
        }
    };
    const std::string path = StatusFile().GetPath();
    return {"the unknown share " + Quoted(share) + " is marked in " + Quoted(flag),
            "a share that is given this name later would start with the mark", "remove the mark",
            Repair{path, {"- " + Quoted(flag) + ": " + Quoted(share)}, true, {}, remove}};
}

Finding SpaceFlag(const std::string &share) {
    const std::string why = "its folders are not indexed until it is revived";
    const std::string revive = "\"fileindexctl revive " + ShellWord(share) + "\"";
    if (!IsSharePresent(share)) {
        return {"the share " + Quoted(share) + " is marked as out of space", why,
                "bring the share back, then " + revive};
    }
    if (VORK::FILEINDEX::IsShareSpaceEnough(share)) {
        return {"the share " + Quoted(share) + " is marked as out of space, though there is room", why, revive};
    }
    return {"the share " + Quoted(share) + " is out of space", why, "make room (10 MiB), then " + revive};
}

Finding ReindexFlag(const std::string &share) {
    return {"the share " + Quoted(share) + " waits to be reindexed",
            "changes have been lost, and the index is behind",
            ReindexCommand(share) + "; this is found until fileindexd has cleared the mark"};
}

std::vector<std::string> Marked(const Facts &facts, const char *flag) {
    const bool usable = facts.status.isObject() && facts.status[flag].isObject();
    return usable ? facts.status[flag].getMemberNames() : std::vector<std::string>();
}

}  // namespace

Findings CheckShares(const Facts &facts) {
    Findings findings;
    for (const auto &share : AllShares(facts)) {
        const SharePointer record = FindShare(share);
        const int error = record ? 0 : VLIBCErrGet();
        struct stat status {};
        if (!record) {
            findings.push_back(Unusable(share, error, Consequence(share, facts)));
        } else if (stat(record->szPath, &status) != 0) {
            findings.push_back({std::string("the directory of the share ") + Quoted(share) + ", " +
                                    record->szPath + ": " + std::strerror(errno),
                                Consequence(share, facts), "make the directory, or mount its volume"});
        }
    }
    for (const auto &folder : facts.folders) {
        if (IsSharePresent(ShareOf(folder.path)) && !VORK::FILEINDEX::CanPathBeIndexed(folder.path)) {
            findings.push_back(
                {"the folder " + folder.path + " may not be indexed at present",
                 "it reads as paused, and is not kept up",
                 "\"fileindexctl explain " + ShellWord(folder.path) + "\" tells which rule it breaks"});
        }
    }
    return findings;
}

Findings CheckQueues(const Facts &facts) {
    Findings findings;
    for (const auto &[share, count] : facts.folderCount) {
        const SharePointer record = FindShare(share);
        struct stat status {};
        if (record && stat(record->szPath, &status) == 0) {
            for (const auto &finding : CheckQueue(share)) {
                findings.push_back(finding);
            }
        }
    }
    return findings;
}

Findings CheckFlags(const Facts &facts) {
    Findings findings;
    for (const char *flag : {"no_space", "need_reindex"}) {
        for (const auto &share : Marked(facts, flag)) {
            if (IsGone(share, facts)) {
                findings.push_back(StaleFlag(share, flag));
            } else {
                findings.push_back(std::string(flag) == "no_space" ? SpaceFlag(share) : ReindexFlag(share));
            }
        }
    }
    return findings;
}

}  // namespace fileindexctl::doctor
