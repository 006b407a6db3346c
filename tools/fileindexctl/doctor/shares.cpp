// Shares, their folders and their flags.
#include "doctor/finding.h"
#include "facts/platform_file.h"
#include "facts/share_record.h"
#include "report/text.h"

#include <fileindex/indexability.h>

#include <vork/error.h>

#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstring>

namespace VORK::FILEINDEXCTL::DOCTOR {

namespace {

constexpr const char *kNothingIndexed = "nothing in it can be indexed";
constexpr const char *kNoSpace = "no_space";
constexpr const char *kNeedReindex = "need_reindex";

// Nothing is to be forgotten while shares may be missing only because their entries cannot be used.
std::string RemedyForGone(const Facts &facts) {
    return facts.areSharesKnown
               ? "bring the share back; or \"fileindexctl share rename\" if it has another name, \"fileindexctl "
                 "share remove %\" if it is gone for good"
               : "mend the list of shares in " + std::string(kPlatformFile) + " first: it is not whole";
}

void ReportUnusable(const std::string &share, const Facts &facts, Findings &findings) {
    switch (VLIBCErrGet()) {
        case VORK_ERR_SHARE_DIRECTORY_NAME:
            return findings.Add(kWrong, "the share's directory has another name than the share", {share},
                                kNothingIndexed,
                                "rename one of them, or bind mount the directory under the share's name");
        case VORK_ERR_NO_SUCH_SHARE:
            return findings.Add(kWrong, "there is no such share any more", {share}, kNothingIndexed,
                                RemedyForGone(facts));
        case VORK_ERR_ACCESS:
            return findings.AddNotAllowed("a share", {share});
        default:
            const bool isListed = std::ranges::count(facts.configuredShares, share) > 0;
            return findings.Add(kWrong, "the share cannot be looked up", {share}, kNothingIndexed,
                                (isListed ? "correct its entry in " : "mend ") + std::string(kPlatformFile));
    }
}

void CheckDirectory(const std::string &share, const char *directory, const Facts &facts, Findings &findings) {
    struct stat status {};
    if (stat(directory, &status) != 0) {
        if (errno == EACCES && geteuid() != 0) {
            return findings.AddNotAllowed("the directory of a share", {share});
        }
        return findings.Add(kWrong,
                            std::string("the share's directory cannot be seen (") + std::strerror(errno) + ")",
                            {directory}, kNothingIndexed, "make the directory, or mount its volume");
    }
    const bool isMarked = std::ranges::count(facts.status.Marked(kNoSpace), share) > 0;
    if (facts.indexedShares.contains(share) && !isMarked && !VORK::FILEINDEX::IsShareSpaceEnough(share)) {
        findings.Add(kWrong, "a full share", {share}, "its folders cannot be indexed for want of space",
                     "make room (10 MiB)");
    }
}

void CheckFolder(const std::string &path, const std::string &fullPath, Findings &findings) {
    const SharePointer record = FindShare(ShareOf(path));
    int error = record ? 0 : VLIBCErrGet() == VORK_ERR_ACCESS ? EACCES : ENOENT;
    struct stat status {};
    if (record && stat(record->szPath, &status) != 0) {
        error = errno;
    }
    const bool isRoot = geteuid() == 0;
    if (error != 0 && (error != EACCES || isRoot)) {
        findings.Add(kWrong, "not kept up, since its share cannot be used", {path},
                     "changes in it are not indexed", "mend what is found of the share");
    } else if (error == 0 && VORK::FILEINDEX::CanPathBeIndexed(path)) {
        return;
    } else if (error != 0 || (!isRoot && stat(fullPath.c_str(), &status) != 0 && errno == EACCES)) {
        findings.AddNotAllowed("a folder", {path});
    } else {
        findings.Add(kWrong, "may not be indexed at present", {path}, "it reads as paused, and is not kept up",
                     "\"fileindexctl explain %\" tells which rule it breaks");
    }
}

// Only when everything that names shares could be read: a share that cannot be seen just now keeps its flags. The
// library marks the empty name for an event that lay in no share.
bool IsGone(const std::string &share, const Facts &facts) {
    return share.empty() ||
           (facts.areSharesKnown && facts.areFoldersKnown && !facts.indexedShares.contains(share) &&
            !IsSharePresent(share) && VLIBCErrGet() == VORK_ERR_NO_SUCH_SHARE);
}

void ReportStale(const std::string &share, const std::string &flag, const Facts &facts, Findings &findings) {
    const auto remove = [share, flag](Json::Value &document) {
        if (document[flag].isObject()) {
            document[flag].removeMember(share);
        }
    };
    findings.Add(
        kWrong, "an unknown share is marked in " + Quoted(flag), {share},
        "a share that is given this name later would start with the mark", "remove the mark",
        {facts.status.GetPath(), "removes the mark", {"- " + Quoted(flag) + ": " + Quoted(share)}, {}, remove});
}

void ReportNoSpace(const std::string &share, Findings &findings) {
    const bool isAway = !IsSharePresent(share);
    const bool isRoom = !isAway && VORK::FILEINDEX::IsShareSpaceEnough(share);
    const std::string first = isAway ? "bring the share back, then " : isRoom ? "" : "make room (10 MiB), then ";
    findings.Add(kWrong,
                 std::string("marked as out of space") + (isAway   ? ", and away"
                                                          : isRoom ? ", though there is room"
                                                                   : ""),
                 {share}, "its folders are not indexed until it is revived", first + "\"fileindexctl revive %\"");
}

}  // namespace

void CheckShares(Facts &facts, Findings &findings) {
    std::set<std::string> shares = facts.indexedShares;
    shares.insert(facts.configuredShares.begin(), facts.configuredShares.end());
    for (const auto &share : shares) {
        if (const SharePointer record = FindShare(share)) {
            CheckDirectory(share, record->szPath, facts, findings);
        } else {
            ReportUnusable(share, facts, findings);
        }
    }
    for (const auto &folder : facts.folders) {
        CheckFolder(folder.path, folder.GetFullPath(), findings);
    }
}

void CheckFlags(Facts &facts, Findings &findings) {
    long long resumeTime = -1;
    if (facts.status.GetPauseInfo(resumeTime) && resumeTime == 0) {
        findings.Add(kNote, "indexing is paused without an end", {},
                     "nothing is indexed until somebody ends the pause",
                     "\"fileindexctl resume\" if it is to go on");
    }
    for (const std::string flag : {kNoSpace, kNeedReindex}) {
        for (const auto &share : facts.status.Marked(flag.c_str())) {
            if (IsGone(share, facts)) {
                ReportStale(share, flag, facts, findings);
            } else if (flag == kNoSpace) {
                ReportNoSpace(share, findings);
            } else {
                findings.Add(kWrong, "a share waits to be reindexed", {share},
                             "changes have been lost, and the index is behind",
                             "\"fileindexctl reindex /%\"; this is found until fileindexd has cleared the mark");
            }
        }
    }
}

}  // namespace VORK::FILEINDEXCTL::DOCTOR
