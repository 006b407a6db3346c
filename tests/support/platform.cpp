#include "platform.h"

#include "script.h"

#include <vork/error.h>
#include <vork/filesystem.h>
#include <vork/metadata.h>
#include <vork/process.h>
#include <vork/quota.h>
#include <vork/search.h>
#include <vork/service.h>
#include <vork/share.h>
#include <vork/text.h>
#include <vorknotifyd/monitor_queue.h>

#include <json/reader.h>
#include <json/writer.h>

#include <strings.h>
#include <sys/stat.h>

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <sstream>
#include <stdexcept>
#include <string>

namespace fileindex_test {

Platform &Platform::Current() {
    static Platform platform;
    return platform;
}

namespace {

Platform &World() {
    return Platform::Current();
}

int Failed(int error) {
    VLIBCErrSetEx(error, "platform.c", 77);
    return -1;
}

/// The scripted result of a call if it is to fail, with the platform's error set as a real one would.
std::optional<int> Failure(const char *call, const std::string &about = {}) {
    const auto fault = Script::Current().Take(call, about);
    if (fault && fault->result <= 0) {
        Failed(fault->error);
    }
    return fault ? std::optional(static_cast<int>(fault->result)) : std::nullopt;
}

/// A question with one answer.
int Answer(const char *call, const std::string &about, int answer) {
    return Failure(call, about).value_or(answer);
}

/// A call that changes something: one line of the journal, unless it is to fail.
int Effect(const char *call, const std::string &about, const std::string &line) {
    const auto result = Failure(call, about);
    if (!result) {
        Script::Current().Record(line);
    }
    return result.value_or(0);
}

/// A question that is answered in `out`.
int Fill(const char *call, const std::string &about, int *out, bool answer) {
    const auto result = Failure(call, about);
    *out = result || answer ? 1 : 0;  // what a failed call leaves behind is not to be believed
    return result.value_or(0);
}

bool StartsWithAny(const std::string &path, const std::set<std::string> &beginnings) {
    return std::any_of(beginnings.begin(), beginnings.end(), [&](auto &begin) { return path.starts_with(begin); });
}

struct ShareRecord : _tag_VORKSHARE {
    std::string name, path;
};

const FakeShare &Of(const _tag_VORKSHARE *share) {
    return World().shares.at(share->szName);
}

}  // namespace
}  // namespace fileindex_test

using namespace fileindex_test;

extern "C" {

int VORKShareGet(const char *szName, _tag_VORKSHARE **ppShare) {
    if (const auto result = Failure("VORKShareGet", szName)) {
        *ppShare = *result == 0 ? nullptr : *ppShare;
        return *result;
    }
    const auto found = World().shares.find(szName);
    if (found == World().shares.end()) {
        return Failed(VORK_ERR_NO_SUCH_SHARE);
    }
    auto *record = new ShareRecord();
    record->name = found->first;
    record->path = found->second.path;
    record->szName = record->name.c_str();
    record->szPath = record->path.empty() ? nullptr : record->path.c_str();
    ++World().shareRecords;
    *ppShare = record;
    return 0;
}

void VORKShareFree(_tag_VORKSHARE *pShare) {
    World().shareRecords -= pShare != nullptr ? 1 : 0;
    delete static_cast<ShareRecord *>(pShare);
}

int VORKShareNamePathGet(const char *szFullPath, char *szName, int cbName, char *szPath, int cbPath) {
    if (const auto result = Failure("VORKShareNamePathGet", szFullPath)) {
        return *result;
    }
    for (const auto &[name, share] : World().shares) {
        if ((std::string(szFullPath) + "/").starts_with(share.path + "/")) {
            std::snprintf(szName, static_cast<size_t>(cbName), "%s", name.c_str());
            std::snprintf(szPath, static_cast<size_t>(cbPath), "%s", share.path.c_str());
            return 0;
        }
    }
    return Failed(VORK_ERR_NO_SUCH_SHARE);
}

int VORKShareIsShareRecycle(const char *szFullPath) {
    return Answer("VORKShareIsShareRecycle", szFullPath, StartsWithAny(szFullPath, World().recycleBins) ? 2 : 0);
}

int VLIBShareIsEncryptedGet(const _tag_VORKSHARE *pShare, int *pEncrypted) {
    return Fill("VLIBShareIsEncryptedGet", pShare->szName, pEncrypted, Of(pShare).encrypted);
}

int VLIBShareIsEncryptionGet(const _tag_VORKSHARE *pShare, int *pEncryption) {
    return Fill("VLIBShareIsEncryptionGet", pShare->szName, pEncryption, Of(pShare).encryptionKind);
}

int VLIBShareIsReadOnlyGet(const _tag_VORKSHARE *pShare, int *pReadOnly) {
    return Fill("VLIBShareIsReadOnlyGet", pShare->szName, pReadOnly, Of(pShare).readOnly);
}

int VORKGetFSType(const char *szPath, int flags) {
    const auto &types = World().fsTypes;
    const auto found = std::find_if(types.begin(), types.end(), [&](const auto &entry) {
        return std::string(szPath).starts_with(entry.first);
    });
    return Answer("VORKGetFSType", szPath, flags != 0 ? -2 : found == types.end() ? kPlainFs : found->second);
}

int VORKFSIsRemoteFS(int type) {
    return Answer("VORKFSIsRemoteFS", {}, type == kRemoteFs ? 1 : 0);
}

int VORKFSIsImageFS(int type) {
    return Answer("VORKFSIsImageFS", {}, type == kImageFs ? 1 : 0);
}

int VORKFSDirIsMntPoint(const char *szPath) {
    return Answer("VORKFSDirIsMntPoint", szPath, World().mountPoints.contains(szPath) ? 1 : 0);
}

int VLIBFhsPathInSnapshot(const char *szPath, int *pInSnapshot) {
    return Fill("VLIBFhsPathInSnapshot", szPath, pInSnapshot, StartsWithAny(szPath, World().snapshots));
}

int VORKEAIsHiddenDir(const char *szName) {
    return Answer("VORKEAIsHiddenDir", szName, std::string(szName) == "@eaDir" ? 1 : 0);
}

int VORKEAMKDir(int flags, const char *szPath) {
    if (const auto result = Failure("VORKEAMKDir", szPath)) {
        return *result;
    }
    return flags == 0 && (::mkdir(szPath, 0755) == 0 || errno == EEXIST) ? 0 : -1;
}

int VORKQuotaIsEnough(unsigned int uid, const char *szPath, unsigned long long cbRequired) {
    const std::string path = szPath;
    return Answer("VORKQuotaIsEnough", std::to_string(uid) + " " + path + " " + std::to_string(cbRequired), 1);
}

int VLIBServiceStart(const char *szName, int flag) {
    return Effect("VLIBServiceStart", szName, "start " + std::string(szName) + " " + std::to_string(flag));
}

int VLIBServiceStop(const char *szName, int flag) {
    return Effect("VLIBServiceStop", szName, "stop " + std::string(szName) + " " + std::to_string(flag));
}

int VLIBServiceRestart(const char *szName) {
    return Effect("VLIBServiceRestart", szName, "restart " + std::string(szName));
}

int VORKSMBIsEnableSpotlight(void) {
    return Answer("VORKSMBIsEnableSpotlight", {}, World().searchOn ? 5 : 0);
}

int VORKSMBSetSpotlight(int enable) {
    const int result = Effect("VORKSMBSetSpotlight", {}, "search " + std::to_string(enable));
    World().searchOn = result < 0 ? World().searchOn : enable != 0;
    return result;
}

int VLIBCErrGet(void) {
    return World().errorCode;
}

void VLIBCErrSetEx(int code, const char *szFile, int line) {
    World().errorCode = code;
    World().errorFile = szFile;
    World().errorLine = line;
}

const char *VLIBCErrorGetFile(void) {
    return World().errorFile.c_str();
}

int VLIBCErrorGetLine(void) {
    return World().errorLine;
}

int VLIBCExec(const char *szProgram, const char *arg1, const char *arg2, const char *arg3, const char *arg4) {
    const NotCancelled removing;
    std::string line = "exec " + std::string(szProgram);
    for (const char *argument : {arg1, arg2, arg3, arg4}) {
        line += argument != nullptr ? " " + std::string(argument) : "";
    }
    const int result = Effect("VLIBCExec", line, line);
    const std::filesystem::path path = arg2;
    const std::set<std::string> removable = {"VORK@file_index_queue", "VORK@file_index_queue.tmp",
                                             "VORK@.fileindexdb"};
    if (line != "exec /bin/rm -rf " + path.string() || !removable.contains(path.filename())) {
        std::fprintf(stderr, "not to be run: %s\n", line.c_str());
        std::abort();
    }
    if (result == 0) {
        std::error_code ignored;
        std::filesystem::remove_all(path, ignored);
    }
    return result;
}

int VLIBCExecv(const char *szPath, const char *const argv[], int a, int b) {
    std::string line = "execv " + std::string(szPath) + " " + std::to_string(a) + " " + std::to_string(b) + ":";
    for (const char *const *argument = argv; *argument != nullptr; ++argument) {
        line += " [" + std::string(*argument) + "]";
    }
    return Effect("VLIBCExecv", szPath, line);
}

int VLIBCUnicodeUTF8StrCaseCmp(const char *a, const char *b) {
    return ::strcasecmp(a, b);
}

}  // extern "C"

namespace VORKNOTIFYD {

struct MonitorQueue::Description {
    Json::Value json;
};

MonitorQueue::MonitorQueue(const Json::Value &description) : description_(new Description{description}) {
    ++World().monitorQueues;
}

MonitorQueue::~MonitorQueue() {
    --World().monitorQueues;
    delete description_;
}

bool MonitorQueue::Upsert(const MonitorQueue &queue, const std::string &name, _tag_monitor_queue_type_ type) {
    Json::StreamWriterBuilder builder;
    builder["indentation"] = "";
    const std::string text = Json::writeString(builder, queue.description_->json);
    Json::Value reread;
    std::istringstream(text) >> reread;
    const char *const note = reread == queue.description_->json ? "" : " of other types than the text's";
    return Effect("MonitorQueue::Upsert", text,
                  "monitor " + name + " " + std::to_string(type) + " " + text + note) == 0;
}

bool MonitorQueue::Delete(const std::string &queuePath, const std::string &name, _tag_monitor_queue_type_ type) {
    return Effect("MonitorQueue::Delete", queuePath,
                  "unmonitor " + name + " " + std::to_string(type) + " " + queuePath) == 0;
}

}  // namespace VORKNOTIFYD
