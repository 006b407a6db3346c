#include "registrations.h"

#include "failure.h"

#include <json/reader.h>
#include <json/value.h>
#include <json/writer.h>

#include <cerrno>
#include <fstream>

namespace fileindexctl {

namespace {

constexpr unsigned kMask = 0xFFCE;
constexpr const char *kIgnored = "@eaDir";

std::string Text(const Json::Value &value) {
    Json::StreamWriterBuilder builder;
    builder["indentation"] = "";
    return Json::writeString(builder, value);
}

Watches::value_type WatchOf(Json::Value entry) {
    const std::string path = entry["path"].asString();
    entry.removeMember("path");
    return {path, Text(entry)};
}

Json::Value ReadDocument() {
    errno = 0;
    std::ifstream file(kRegistrationsFile);
    if (!file && errno == ENOENT) {
        return Json::Value(Json::objectValue);
    }
    if (!file) {
        throw Failure(ExitStatus::Permission,
                      std::string("no permission for ") + kRegistrationsFile + "; run this as the administrator");
    }
    Json::Value document;
    std::string errors;
    if (!Json::parseFromStream(Json::CharReaderBuilder(), file, &document, &errors)) {
        throw Failure(ExitStatus::Malformed, std::string(kRegistrationsFile) + " cannot be read as JSON");
    }
    return document;
}

}  // namespace

std::map<std::string, Watches> ReadRegistrations() try {
    std::map<std::string, Watches> registrations;
    const Json::Value document = ReadDocument();
    for (const auto &entry : document["registrations"]) {
        if (entry["name"].asString() != kRegistration) {
            continue;
        }
        Watches &watches = registrations[entry["queue"].asString()];
        for (const auto &watch : entry["config"]) {
            watches.insert(WatchOf(watch));
        }
    }
    return registrations;
} catch (const Json::Exception &) {
    throw Failure(ExitStatus::Malformed, std::string(kRegistrationsFile) + " does not hold registrations");
}

Watches::value_type ExpectedWatch(const std::string &fullPath) {
    Json::Value entry(Json::objectValue);
    entry["path"] = fullPath;
    entry["mask"] = kMask;
    entry["ignore"].append(kIgnored);
    return WatchOf(entry);
}

}  // namespace fileindexctl
