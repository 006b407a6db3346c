#include "shares/platform_file.h"

#include "base/has_nul.h"
#include "base/json/document.h"
#include "base/platform_files.h"
#include "base/unique_fd.h"
#include "base/whole_file.h"
#include "common/failure.h"

#include <vork/error.h>

#include <fcntl.h>
#include <pthread.h>

#include <cerrno>
#include <ctime>

namespace VORK::PLATFORM {

namespace {

constexpr const char *kDefaultRecycle = "#recycle";

// File times come from a clock that advances every few milliseconds: a second change within one tick leaves
// them as they were.
constexpr long kNanosecondsPerSecond = 1000000000;
constexpr long kClockTick = 20000000;

bool IsRecent(const timespec &time) {
    timespec now{};
    clock_gettime(CLOCK_REALTIME, &now);
    const time_t seconds = now.tv_sec - time.tv_sec;
    if (seconds < 0 || seconds > 1) {
        return seconds < 0;
    }
    return static_cast<long>(seconds) * kNanosecondsPerSecond + now.tv_nsec - time.tv_nsec < kClockTick;
}

bool SameTime(const timespec &a, const timespec &b) {
    return a.tv_sec == b.tv_sec && a.tv_nsec == b.tv_nsec;
}

// A directory below the share's, such as "#recycle"; an empty text means none.
bool IsRelativeDirectory(const std::string &text) {
    return text.empty() || (text.front() != '/' && text.back() != '/' && !HasNul(text));
}

bool ReadSetting(const Json::Value &record, const char *member, std::string &setting) {
    if (!record.isMember(member)) {
        return true;
    }
    if (!record[member].isString() || !IsRelativeDirectory(record[member].asString())) {
        return false;
    }
    setting = record[member].asString();
    return true;
}

bool ReadShare(const std::string &name, const Json::Value &record, Share &share) {
    if (!record.isObject() || !record.isMember("path") || !record["path"].isString()) {
        return false;
    }
    share.name = name;
    share.path = record["path"].asString();
    share.recycle = kDefaultRecycle;
    return ReadSetting(record, "recycle", share.recycle) && ReadSetting(record, "snapshot", share.snapshot);
}

// One bad record costs that share only; the others must not vanish with it.
std::shared_ptr<const ShareTable> TableOf(const Json::Value &shares) {
    auto table = std::make_shared<ShareTable>();
    for (auto entry = shares.begin(); entry != shares.end(); ++entry) {
        Share share;
        if (ReadShare(entry.name(), *entry, share)) {
            table->Add(std::move(share));
        } else {
            table->Refuse(entry.name(), VORK_ERR_MALFORMED);
        }
    }
    return table;
}

}  // namespace

bool PlatformFileShares::Identity::operator==(const Identity &other) const {
    return device == other.device && inode == other.inode && size == other.size &&
           SameTime(modified, other.modified) && SameTime(changed, other.changed);
}

PlatformFileShares::Identity PlatformFileShares::IdentityOf(const struct stat &status) {
    return {status.st_dev, status.st_ino, status.st_size, status.st_mtim, status.st_ctim};
}

bool PlatformFileShares::IsKnown(const struct stat &status) const {
    return !mayHaveChangedUnseen_ && identity_ == IdentityOf(status);
}

ShareSource::Snapshot PlatformFileShares::Current() {
    struct stat status {};
    const int error = stat(path_.c_str(), &status) == 0 ? 0 : errno;
    const std::lock_guard guard(mutex_);
    if (error == ENOENT || error == ENOTDIR) {
        mayHaveChangedUnseen_ = true;
        snapshot_ = {std::make_shared<const ShareTable>(), 0};
    } else if (error != 0) {
        Keep(CodeOfErrno(error));
    } else if (!IsKnown(status)) {
        Load();
    }
    return snapshot_;
}

void PlatformFileShares::Load() {
    const UniqueFd file = Open(path_.c_str(), O_RDONLY | O_NONBLOCK | O_CLOEXEC);
    struct stat status {};
    if (!file || fstat(file.Get(), &status) != 0) {
        Keep(CodeOfErrno(errno));
        return;
    }
    // The identity is taken before the text: a change in between is seen by the next call. It counts only once the
    // text has been read: an exception, or the end of the thread, may come first.
    const bool isRecent = IsRecent(status.st_mtim) || IsRecent(status.st_ctim);
    mayHaveChangedUnseen_ = true;
    if (LoadText(file.Get())) {
        identity_ = IdentityOf(status);
        mayHaveChangedUnseen_ = isRecent;
    }
}

bool PlatformFileShares::LoadText(int fd) {
    const std::optional<std::string> text = ReadAll(fd);
    if (!text) {
        Keep(CodeOfErrno(errno));
        return false;
    }
    const std::optional<Json::Value> document = ParseObject(*text);
    if (!document) {
        snapshot_.error = VORK_ERR_MALFORMED;
        return true;
    }
    const Json::Value &shares = (*document)["shares"];
    if (!shares.isNull() && !shares.isObject()) {
        snapshot_.error = VORK_ERR_MALFORMED;
        return true;
    }
    snapshot_ = {TableOf(shares), 0};
    return true;
}

// Trouble with reading may pass without the file changing: it is tried again each time.
void PlatformFileShares::Keep(int error) {
    snapshot_.error = error;
    mayHaveChangedUnseen_ = true;
}

namespace {

PlatformFileShares &Source() {
    // Never destroyed: destructors of other libraries may still ask for shares.
    static auto *const source = new PlatformFileShares(kPlatformFile);
    return *source;
}

// A forked child has one thread. What others held or were making at that moment stays so in it for good, and its
// first lookup would wait for ever. So the source, and the one static of jsoncpp, are made when the library is
// loaded, and a fork waits until no lookup is reading.
[[gnu::constructor]] void PrepareForForks() {
    Json::Value::nullSingleton();
    Source();
    pthread_atfork([] { Source().BeforeFork(); }, [] { Source().AfterFork(); }, [] { Source().AfterFork(); });
}

}  // namespace

ShareSource &Shares() {
    return Source();
}

}  // namespace VORK::PLATFORM
