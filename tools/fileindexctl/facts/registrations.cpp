#include "facts/registrations.h"

#include "base/json/document.h"
#include "base/json/text.h"
#include "base/whole_file.h"
#include "facts/queue_files.h"
#include "report/failure.h"

#include <json/value.h>

#include <algorithm>
#include <cerrno>
#include <chrono>
#include <cstring>
#include <iterator>
#include <thread>

namespace VORK::FILEINDEXCTL {

namespace {

Watches::value_type WatchOf(Json::Value entry) {
    const std::string path = entry["path"].asString();
    entry.removeMember("path");
    return {path, ToString(entry)};
}

Failure Malformed() {
    return {ExitStatus::kMalformed, std::string(kRegistrationsFile) + " does not hold registrations"};
}

Json::Value ReadDocument() {
    const std::string path = kRegistrationsFile;
    const auto text = ReadFile(path);
    if (!text && errno == ENOENT) {
        return {};
    }
    if (!text) {
        throw errno == EACCES ? Denied(path)
                              : Failure(ExitStatus::kCannotSave, path + ": " + std::strerror(errno));
    }
    const auto document = ParseStrictly(*text);
    if (!document) {
        throw Failure(ExitStatus::kMalformed, path + " cannot be read as JSON");
    }
    if (!HoldsRegistrations(*document)) {
        throw Malformed();
    }
    return *document;
}

bool IsOwn(const Json::Value &entry) {
    return entry["name"].asString() == kRegistration;
}

// The first registration makes the file, and withdrawing the last leaves an empty list. Where only other programs
// have registered, the system may still be being set up.
bool TellsPauses(const Json::Value &document) {
    const Json::Value &list = document[kRegistrationsKey];
    return list.isArray() && (list.empty() || std::any_of(list.begin(), list.end(), IsOwn));
}

}  // namespace

std::map<std::string, Watches> ReadRegistrations() try {
    std::map<std::string, Watches> registrations;
    const Json::Value document = ReadDocument();
    for (const auto &entry : document[kRegistrationsKey]) {
        if (!IsOwn(entry)) {
            continue;
        }
        Watches &watches = registrations[entry["queue"].asString()];
        for (const auto &watch : entry["config"]) {
            watches.insert(WatchOf(watch));
        }
    }
    return registrations;
} catch (const Json::Exception &) {
    throw Malformed();
}

bool IsQueuePaused(const std::string &queue) {
    const Json::Value document = ReadDocument();
    const Json::Value &list = document[kRegistrationsKey];
    return TellsPauses(document) && std::none_of(list.begin(), list.end(), [&](const Json::Value &entry) {
               return IsOwn(entry) && entry["queue"].asString() == queue;
           });
}

namespace {

std::set<std::string> Unregistered(const std::set<std::string> &shares) {
    std::set<std::string> paused;
    for (const auto &share : shares) {
        const std::string queue = QueuePathOf(share);
        if (!queue.empty() && IsQueuePaused(queue)) {
            paused.insert(share);
        }
    }
    return paused;
}

}  // namespace

std::set<std::string> PausedShares(const std::set<std::string> &shares) {
    constexpr auto kBetweenSaveAndRegistration = std::chrono::milliseconds(100);
    auto paused = Unregistered(shares);
    if (paused.empty()) {
        return paused;
    }
    // A change saves its folders and has them watched a moment later: one that is at work is no pause.
    std::this_thread::sleep_for(kBetweenSaveAndRegistration);
    return Unregistered(paused);
}

std::string PausedText(const std::string &share) {
    return "the share " + Quoted(share) + " is paused (fileindexctl share resume " + ShellWord(share) + ")";
}

void WarnOfResumption(const std::set<std::string> &touched, const std::set<std::string> &indexed,
                      Output &output) try {
    std::set<std::string> shares;
    std::set_intersection(touched.begin(), touched.end(), indexed.begin(), indexed.end(),
                          std::inserter(shares, shares.end()));
    for (const auto &share : PausedShares(shares)) {
        output.Warn("the share " + Quoted(share) + " is paused; this change has it watched again");
    }
} catch (const Failure &) {
    // The change itself will meet what is wrong with the file.
}

Watches::value_type ExpectedWatch(const std::string &fullPath) {
    Json::Value entry(Json::objectValue);
    entry["path"] = fullPath;
    entry["mask"] = VORK::FILEINDEX::internal::kMonitorMask;
    entry["ignore"].append(VORK::FILEINDEX::internal::kMetadataDir);
    return WatchOf(entry);
}

}  // namespace VORK::FILEINDEXCTL
