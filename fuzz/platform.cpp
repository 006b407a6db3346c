// A platform in memory with the shares of support.h, and a daemon that takes every command.

#include "json/text.h"
#include "scoped.h"
#include "support.h"

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

#include <fcntl.h>
#include <strings.h>
#include <sys/socket.h>
#include <syslog.h>
#include <unistd.h>

#include <algorithm>
#include <cstdarg>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <filesystem>
#include <iterator>
#include <string>
#include <string_view>
#include <utility>

namespace {

using fileindex_fuzz::kShares;
using fileindex_fuzz::Require;
using VORK::FILEINDEX::internal::JsonReader;
using VORK::FILEINDEX::internal::UniqueFd;

constexpr std::string_view kVolume = "/vol1/";

struct Record : _tag_VORKSHARE {
    std::string name;
    std::string path;
};

bool IsShare(std::string_view name) {
    return std::find(std::begin(kShares), std::end(kShares), name) != std::end(kShares);
}

/// The daemon's end of the last connection, and what came over the earlier ones.
struct Daemon {
    UniqueFd connection;
    std::vector<Json::Value> commands;

    void Receive() {
        std::string frame;
        char block[4096];
        ssize_t count = 0;
        while (connection && (count = recv(connection.Get(), block, sizeof(block), MSG_DONTWAIT)) > 0) {
            frame.append(block, static_cast<std::size_t>(count));
        }
        connection.Close();
        if (frame.empty()) {
            return;
        }
        std::uint32_t length = 0;
        Require(frame.size() > sizeof(length), "the frame is cut", frame);
        std::memcpy(&length, frame.data(), sizeof(length));
        Require(length == frame.size() - sizeof(length) && frame.back() == '\0', "the frame's length is wrong");
        Json::Value command;
        const std::string_view text(frame.data() + sizeof(length), length - 1);
        Require(JsonReader().Parse(text, command), "the command is no JSON", text);
        commands.push_back(command);
    }
};

Daemon &TheDaemon() {
    static Daemon daemon;
    return daemon;
}

}  // namespace

namespace fileindex_fuzz {

std::vector<Json::Value> TakeCommands() {
    TheDaemon().Receive();
    return std::exchange(TheDaemon().commands, {});
}

}  // namespace fileindex_fuzz

extern "C" {

int connect(int fd, const sockaddr *, socklen_t) {
    TheDaemon().Receive();
    int ends[2] = {};
    if (socketpair(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0, ends) != 0) {
        return -1;
    }
    const UniqueFd near(ends[0]);
    const UniqueFd far(ends[1]);
    constexpr int kOutOfTheWay = 500;  // the lowest free descriptor is what the leak check looks at
    TheDaemon().connection = UniqueFd(fcntl(far.Get(), F_DUPFD_CLOEXEC, kOutOfTheWay));
    return dup3(near.Get(), fd, O_CLOEXEC) == fd ? 0 : -1;
}

/// Formats the record, so that a bad argument shows, and drops it.
void syslog(int, const char *format, ...) {
    char record[256];
    va_list arguments;
    va_start(arguments, format);
    vsnprintf(record, sizeof(record), format, arguments);
    va_end(arguments);
}

int VORKShareGet(const char *szName, _tag_VORKSHARE **ppShare) {
    if (!IsShare(szName)) {
        return -1;
    }
    auto *record = new Record();
    record->name = szName;
    record->path = std::string(kVolume) + szName;
    record->szName = record->name.c_str();
    record->szPath = record->path.c_str();
    *ppShare = record;
    return 0;
}

void VORKShareFree(_tag_VORKSHARE *pShare) {
    delete static_cast<Record *>(pShare);
}

int VORKShareNamePathGet(const char *szFullPath, char *szName, int cbName, char *szPath, int cbPath) {
    std::string_view name = szFullPath;
    if (!name.starts_with(kVolume)) {
        return -1;
    }
    name.remove_prefix(kVolume.size());
    name = name.substr(0, name.find('/'));
    if (!IsShare(name)) {
        return -1;
    }
    const int size = static_cast<int>(name.size());
    snprintf(szName, static_cast<std::size_t>(cbName), "%.*s", size, name.data());
    snprintf(szPath, static_cast<std::size_t>(cbPath), "/vol1/%.*s", size, name.data());
    return 0;
}

int VORKShareIsShareRecycle(const char *szFullPath) {
    return std::strstr(szFullPath, "/#recycle") != nullptr ? 1 : 0;
}
int VLIBFhsPathInSnapshot(const char *szPath, int *pInSnapshot) {
    *pInSnapshot = std::strstr(szPath, "/#snapshot") != nullptr ? 1 : 0;
    return 0;
}
int VLIBShareIsEncryptedGet(const _tag_VORKSHARE *, int *pEncrypted) {
    return *pEncrypted = 0;
}
int VLIBShareIsEncryptionGet(const _tag_VORKSHARE *, int *pEncryption) {
    return *pEncryption = 0;
}
int VLIBShareIsReadOnlyGet(const _tag_VORKSHARE *pShare, int *pReadOnly) {
    *pReadOnly = std::strcmp(pShare->szName, "ro") == 0 ? 1 : 0;
    return 0;
}
int VORKGetFSType(const char *, int) {
    return 1;
}
int VORKFSIsRemoteFS(int) {
    return 0;
}
int VORKFSIsImageFS(int) {
    return 0;
}
int VORKFSDirIsMntPoint(const char *) {
    return 0;
}
int VORKEAIsHiddenDir(const char *szName) {
    return szName[0] == '@' ? 1 : 0;
}
int VORKEAMKDir(int, const char *szPath) {
    std::error_code error;
    std::filesystem::create_directories(szPath, error);
    return error ? -1 : 0;
}
int VORKQuotaIsEnough(unsigned int, const char *, unsigned long long) {
    return 1;
}
int VLIBCErrGet(void) {
    return 0;
}
void VLIBCErrSetEx(int, const char *, int) {}
const char *VLIBCErrorGetFile(void) {
    return "";
}
int VLIBCErrorGetLine(void) {
    return 0;
}
int VLIBCExec(const char *szProgram, const char *, const char *szPath, const char *, const char *) {
    Require(std::string_view(szProgram) == "/bin/rm", "another program was run", szProgram);
    Require(std::string_view(szPath).find("/@eaDir/VORK@") != std::string_view::npos, "removes too much", szPath);
    std::error_code error;
    std::filesystem::remove_all(szPath, error);
    return 0;
}
int VLIBCExecv(const char *, const char *const[], int, int) {
    return 0;
}
int VORKSMBIsEnableSpotlight(void) {
    return 1;
}
int VORKSMBSetSpotlight(int) {
    return 0;
}
int VLIBServiceStart(const char *, int) {
    return 0;
}
int VLIBServiceStop(const char *, int) {
    return 0;
}
int VLIBServiceRestart(const char *) {
    return 0;
}
int VLIBCUnicodeUTF8StrCaseCmp(const char *a, const char *b) {
    return strcasecmp(a, b);
}

}  // extern "C"

namespace VORKNOTIFYD {

struct MonitorQueue::Description {};

// Something to lose, so that a queue that is not given back shows.
MonitorQueue::MonitorQueue(const Json::Value &) : description_(new Description()) {}
MonitorQueue::~MonitorQueue() {
    delete description_;
}
bool MonitorQueue::Upsert(const MonitorQueue &, const std::string &, _tag_monitor_queue_type_) {
    return true;
}
bool MonitorQueue::Delete(const std::string &, const std::string &, _tag_monitor_queue_type_) {
    return true;
}

}  // namespace VORKNOTIFYD
