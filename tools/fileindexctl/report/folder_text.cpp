#include "report/folder_text.h"

#include "report/failure.h"

#include <algorithm>
#include <iterator>
#include <sstream>

namespace VORK::FILEINDEXCTL {

std::string MediaText(const Json::Value &record) {
    std::string text;
    for (const char *kind : kMediaKinds) {
        if (record[kind].asBool()) {
            text += (text.empty() ? "" : ",") + std::string(kind);
        }
    }
    return text.empty() ? "none" : text;
}

void SetMedia(Json::Value &record, const std::string &text) {
    for (const char *kind : kMediaKinds) {
        record[kind] = text == "all";
    }
    if (text == "all" || text == "none") {
        return;
    }
    std::istringstream words(text + ",");
    for (std::string word; std::getline(words, word, ',');) {
        if (std::find(std::begin(kMediaKinds), std::end(kMediaKinds), word) == std::end(kMediaKinds)) {
            throw Failure(ExitStatus::kUsage, "--media: there is no kind \"" + word +
                                                  "\"; the kinds are document, audio, video and photo");
        }
        record[word] = true;
    }
}

Json::Value FolderRecord(const Json::Value &record) {
    Json::Value stored = record;
    stored.removeMember("additional");
    return stored;
}

std::string StatusText(const Json::Value &facts) {
    if (!facts["is_valid"].asBool()) {
        return "not indexable at present";
    }
    return facts["status"].isNull() ? "unknown: no permission for the queue" : facts["status"].asString();
}

}  // namespace VORK::FILEINDEXCTL
