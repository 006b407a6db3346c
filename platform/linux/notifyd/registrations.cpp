#include "notifyd/registrations.h"

#include "base/has_nul.h"
#include "base/json/document.h"
#include "base/platform_files.h"
#include "base/whole_file.h"
#include "common/failure.h"
#include "common/file_lock.h"

#include <vork/error.h>

#include <sys/stat.h>

#include <algorithm>
#include <cerrno>
#include <optional>
#include <vector>

namespace VORK::PLATFORM {

namespace {

constexpr const char *kDirectory = "/usr/vork/etc/vorknotifyd";
constexpr const char *kLockFile = "/usr/vork/etc/vorknotifyd/registrations.lock";
constexpr mode_t kDirectoryMode = 0755;
constexpr mode_t kFileMode = 0644;

bool IsAbsolutePath(const Json::Value &value) {
    return value.isString() && value.asString().rfind('/', 0) == 0 && !HasNul(value.asString());
}

bool IsWatch(const Json::Value &watch) {
    if (!watch.isObject() || !IsAbsolutePath(watch["path"]) || !watch["mask"].isUInt() ||
        !watch["ignore"].isArray()) {
        return false;
    }
    const Json::Value &ignore = watch["ignore"];
    return std::all_of(ignore.begin(), ignore.end(), [](const Json::Value &name) { return name.isString(); });
}

bool IsOf(const Json::Value &entry, const std::string &queuePath, const std::string &name) {
    return entry["queue"].asString() == queuePath && entry["name"].asString() == name;
}

// The document and the text it was read from, which is empty when there is no file yet.
struct Stored {
    Json::Value document{Json::objectValue};
    std::string text;
};

std::optional<Stored> ReadStored() {
    std::optional<std::string> text = ReadFile(kRegistrationsFile);
    if (!text && errno == ENOENT) {
        Stored fresh;
        fresh.document[kRegistrationsKey] = Json::Value(Json::arrayValue);
        return fresh;
    }
    if (!text) {
        FailErrno(errno);
        return std::nullopt;
    }
    std::optional<Json::Value> document = ParseObject(*text);
    if (!document || !HoldsRegistrations(*document)) {
        Fail(VORK_ERR_REGISTRATIONS);
        return std::nullopt;
    }
    return Stored{std::move(*document), std::move(*text)};
}

// Writing what is there already would only wake the daemon.
bool Write(const Stored &before, const Json::Value &after) {
    const std::string text = FormatDocument(after);
    if (text == before.text) {
        return true;
    }
    if (!ReplaceFile(kRegistrationsFile, text, kFileMode, Replacing::kSettings)) {
        FailErrno(errno);
        return false;
    }
    return true;
}

// Sorted, so that equal registrations make equal files.
Json::Value ListOf(std::vector<Json::Value> entries) {
    std::sort(entries.begin(), entries.end(), [](const Json::Value &a, const Json::Value &b) {
        return std::pair(a["queue"].asString(), a["name"].asString()) <
               std::pair(b["queue"].asString(), b["name"].asString());
    });
    Json::Value list(Json::arrayValue);
    for (Json::Value &entry : entries) {
        list.append(std::move(entry));
    }
    return list;
}

std::vector<Json::Value> AllBut(const Json::Value &list, const std::string &queuePath, const std::string &name) {
    std::vector<Json::Value> entries;
    std::copy_if(list.begin(), list.end(), std::back_inserter(entries),
                 [&](const Json::Value &entry) { return !IsOf(entry, queuePath, name); });
    return entries;
}

bool MakeDirectory() {
    if (mkdir(kDirectory, kDirectoryMode) == 0 || errno == EEXIST) {
        return true;
    }
    FailErrno(errno);
    return false;
}

std::optional<FileLock> Lock() {
    std::optional<FileLock> lock = TakeLock(kLockFile);
    if (!lock) {
        FailErrno(errno);
    }
    return lock;
}

}  // namespace

bool IsDescription(const Json::Value &description) {
    if (!description.isObject() || !IsAbsolutePath(description["queue"]) || !description["config"].isArray()) {
        return false;
    }
    const Json::Value &watches = description["config"];
    return std::all_of(watches.begin(), watches.end(), IsWatch);
}

bool StoreRegistration(const Json::Value &description, const std::string &name, int type) {
    if (!MakeDirectory()) {
        return false;
    }
    const std::optional<FileLock> lock = Lock();
    if (!lock) {
        return false;
    }
    const std::optional<Stored> stored = ReadStored();
    if (!stored) {
        return false;
    }
    Json::Value registration = description;
    registration["name"] = name;
    registration["type"] = type;
    std::vector<Json::Value> entries =
        AllBut(stored->document[kRegistrationsKey], description["queue"].asString(), name);
    entries.push_back(std::move(registration));
    Json::Value document = stored->document;
    document[kRegistrationsKey] = ListOf(std::move(entries));
    return Write(*stored, document);
}

bool RemoveRegistration(const std::string &queuePath, const std::string &name) {
    const std::optional<FileLock> lock = TakeLock(kLockFile);
    if (!lock && errno == ENOENT) {
        return true;  // no directory: nothing was ever registered
    }
    if (!lock) {
        FailErrno(errno);
        return false;
    }
    const std::optional<Stored> stored = ReadStored();
    if (!stored) {
        return false;
    }
    std::vector<Json::Value> entries = AllBut(stored->document[kRegistrationsKey], queuePath, name);
    if (entries.size() == stored->document[kRegistrationsKey].size()) {
        return true;
    }
    Json::Value document = stored->document;
    document[kRegistrationsKey] = ListOf(std::move(entries));
    return Write(*stored, document);
}

}  // namespace VORK::PLATFORM
