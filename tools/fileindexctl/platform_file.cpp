#include "platform_file.h"

#include "failure.h"

#include <json/reader.h>

#include <cerrno>
#include <cstring>
#include <fstream>

namespace fileindexctl {

Json::Value ReadPlatformFile() {
    const std::string path = kPlatformFile;
    std::ifstream file(path);
    if (!file) {
        throw Failure(errno == EACCES ? ExitStatus::Permission : ExitStatus::NotConfigured,
                      path + ": " + std::strerror(errno));
    }
    Json::CharReaderBuilder builder;
    Json::CharReaderBuilder::strictMode(&builder.settings_);
    Json::Value document;
    std::string errors;
    try {
        if (!Json::parseFromStream(builder, file, &document, &errors) || !document.isObject()) {
            throw Failure(ExitStatus::Malformed, path + " is not a JSON object");
        }
    } catch (const Json::Exception &) {  // nested too deeply
        throw Failure(ExitStatus::Malformed, path + " is not a JSON object");
    }
    return document;
}

std::vector<std::string> ConfiguredShares() {
    try {
        const Json::Value document = ReadPlatformFile();
        return document["shares"].isObject() ? document["shares"].getMemberNames() : std::vector<std::string>();
    } catch (const Failure &) {
        return {};
    }
}

}  // namespace fileindexctl
