#include "facts/platform_file.h"

#include "base/json/document.h"
#include "base/json/elements.h"
#include "base/whole_file.h"
#include "report/failure.h"

#include <cerrno>
#include <cstring>
#include <set>

namespace VORK::FILEINDEXCTL {

Json::Value ReadPlatformFile() {
    const std::string path = kPlatformFile;
    const auto text = ReadFile(path);
    if (!text) {
        throw Failure(errno == EACCES ? ExitStatus::kPermission : ExitStatus::kNotConfigured,
                      path + ": " + std::strerror(errno));
    }
    auto document = ParseObject(*text);
    if (!document) {
        throw Failure(ExitStatus::kMalformed, path + " is not a JSON object");
    }
    return std::move(*document);
}

std::vector<std::string> UnknownMembers(const Json::Value &document) {
    std::vector<std::string> unknown;
    const auto add = [&](const Json::Value &object, const std::string &prefix,
                         const std::set<std::string> &known) {
        for (const auto &name : MemberNames(object)) {
            if (known.count(name) == 0) {
                unknown.push_back(prefix + name);
            }
        }
    };
    add(document, "", {"shares", "search"});
    for (const auto &share : MemberNames(document["shares"])) {
        add(document["shares"][share], "shares." + share + ".", {"path", "recycle", "snapshot"});
    }
    return unknown;
}

std::vector<std::string> ConfiguredShares() {
    try {
        return MemberNames(ReadPlatformFile()["shares"]);
    } catch (const Failure &) {
        return {};
    }
}

}  // namespace VORK::FILEINDEXCTL
