// Shares, their folders and their flags.
#include "doctor/finding.h"
#include "facts/platform_file.h"
#include "facts/share_record.h"
#include "facts/status_file.h"
#include "report/text.h"

#include <fileindex/indexability.h>

#include <vork/error.h>

#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <set>

namespace VORK::FILEINDEXCTL::DOCTOR {

namespace {

std::set<std::string> AllShares(const Facts &facts) {
    std::set<std::string> names(facts.configuredShares.begin(), facts.configuredShares.end());
    for (const auto &[share, count] : facts.folderCount) {
        names.insert(share);
    }
    return names;
}

constexpr const char *kNothingIndexed = "nothing in it can be indexed";

// Nothing is to be forgotten while shares may be missing only because their entries cannot be used.
Finding Gone(const std::string &share, const Facts &facts) {
    return {"there is no such share any more",
            kNothingIndexed,
            facts.areSharesKnown
                ? "bring the share back; or \"fileindexctl share rename\" if it has another name, \"fileindexctl "
                  "share remove %\" if it is gone for good"
                : "mend the list of shares in " + std::string(kPlatformFile) + " first: it is not whole",
            {},
            Level::kWrong,
            {share}};
}

Finding Unusable(const std::string &share, int error, const Facts &facts) {
    const auto &shares = facts.configuredShares;
    const bool isListed = std::find(shares.begin(), shares.end(), share) != shares.end();
    switch (error) {
        case VORK_ERR_SHARE_DIRECTORY_NAME:
            return {"the share's directory has another name than the share",
                    kNothingIndexed,
                    "rename one of them, or bind mount the directory under the share's name",
                    {},
                    Level::kWrong,
                    {share}};
        case VORK_ERR_NO_SUCH_SHARE:
            return Gone(share, facts);
        case VORK_ERR_ACCESS:
            return NotAllowed("a share", {share});
        default:
            return {"the share cannot be looked up",
                    kNothingIndexed,
                    (isListed ? "correct its entry in " : "mend ") + std::string(kPlatformFile),
                    {},
                    Level::kWrong,
                    {share}};
    }
}

Findings CheckDirectory(const std::string &share, const VORKSHARE &record, const Facts &facts) {
    struct stat status {};
    if (stat(record.szPath, &status) != 0) {
        if (errno == EACCES && geteuid() != 0) {
            return {NotAllowed("the directory of a share", {share})};
        }
        return {{std::string("the share's directory cannot be seen (") + std::strerror(errno) + ")",
                 kNothingIndexed,
                 "make the directory, or mount its volume",
                 {},
                 Level::kWrong,
                 {record.szPath}}};
    }
    const bool isMarked =
        facts.status.isObject() && facts.status["no_space"].isObject() && facts.status["no_space"].isMember(share);
    if (facts.folderCount.count(share) == 0 || isMarked || VORK::FILEINDEX::IsShareSpaceEnough(share)) {
        return {};
    }
    return {{"a full share",
             "its folders cannot be indexed for want of space",
             "make room (10 MiB)",
             {},
             Level::kWrong,
             {share}}};
}

Findings CheckFolder(const std::string &path, const std::string &fullPath) {
    const SharePointer record = FindShare(ShareOf(path));
    int error = record ? 0 : VLIBCErrGet() == VORK_ERR_ACCESS ? EACCES : ENOENT;
    struct stat status {};
    if (record && stat(record->szPath, &status) != 0) {
        error = errno;
    }
    if (error != 0 && (error != EACCES || geteuid() == 0)) {
        return {{"not kept up, since its share cannot be used",
                 "changes in it are not indexed",
                 "mend what is found of the share",
                 {},
                 Level::kWrong,
                 {path}}};
    }
    if (error == 0 && VORK::FILEINDEX::CanPathBeIndexed(path)) {
        return {};
    }
    if (error != 0 || (geteuid() != 0 && stat(fullPath.c_str(), &status) != 0 && errno == EACCES)) {
        return {NotAllowed("a folder", {path})};
    }
    return {{"may not be indexed at present",
             "it reads as paused, and is not kept up",
             "\"fileindexctl explain %\" tells which rule it breaks",
             {},
             Level::kWrong,
             {path}}};
}

// Only when everything that names shares could be read: a share that cannot be seen just now keeps its flags. The
// library marks the empty name for an event that lay in no share.
bool IsGone(const std::string &share, const Facts &facts) {
    if (share.empty()) {
        return true;
    }
    return facts.areSharesKnown && facts.areFoldersKnown && facts.folderCount.count(share) == 0 &&
           FindShare(share) == nullptr && VLIBCErrGet() == VORK_ERR_NO_SUCH_SHARE;
}

Finding StaleFlag(const std::string &share, const std::string &flag) {
    const auto remove = [share, flag](Json::Value &document) {
        if (document[flag].isObject()) {
            document[flag].removeMember(share);
        }
    };
    return {
        "an unknown share is marked in " + Quoted(flag),
        "a share that is given this name later would start with the mark",
        "remove the mark",
        {{StatusFile().GetPath(), "removes the mark", {"- " + Quoted(flag) + ": " + Quoted(share)}, {}, remove}},
        Level::kWrong,
        {share}};
}

Finding SpaceFlag(const std::string &share) {
    Finding finding{"marked as out of space",
                    "its folders are not indexed until it is revived",
                    "\"fileindexctl revive %\"",
                    {},
                    Level::kWrong,
                    {share}};
    if (!IsSharePresent(share)) {
        finding.what += ", and away";
        finding.remedy = "bring the share back, then " + finding.remedy;
    } else if (VORK::FILEINDEX::IsShareSpaceEnough(share)) {
        finding.what += ", though there is room";
    } else {
        finding.remedy = "make room (10 MiB), then " + finding.remedy;
    }
    return finding;
}

Finding ReindexFlag(const std::string &share) {
    return {"a share waits to be reindexed",
            "changes have been lost, and the index is behind",
            "\"fileindexctl reindex /%\"; this is found until fileindexd has cleared the mark",
            {},
            Level::kWrong,
            {share}};
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
        Append(findings, record ? CheckDirectory(share, *record, facts) : Findings{Unusable(share, error, facts)});
    }
    for (const auto &folder : facts.folders) {
        Append(findings, CheckFolder(folder.path, folder.GetFullPath()));
    }
    return findings;
}

Findings CheckFlags(const Facts &facts) {
    Findings findings;
    StatusFile file;
    file.Document() = facts.status;
    long long resumeTime = -1;
    if (file.GetPauseInfo(resumeTime) && resumeTime == 0) {
        findings.push_back({"indexing is paused without an end",
                            "nothing is indexed until somebody ends the pause",
                            "\"fileindexctl resume\" if it is to go on",
                            {},
                            Level::kNote});
    }
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

}  // namespace VORK::FILEINDEXCTL::DOCTOR
