#include "json_checks.h"

#include "folder_access.h"
#include "json/ordinary.h"
#include "json/text.h"
#include "names.h"
#include "support.h"

#include <json/json.h>

#include <iterator>
#include <map>
#include <memory>
#include <vector>

namespace fileindex_fuzz {

namespace {

using namespace VORK::FILEINDEX::internal;  // NOLINT(google-build-using-namespace): the subject of every check

/// The text with nothing behind it but the promised bytes, which are of the worst kind: they continue it.
class PaddedText {
public:
    explicit PaddedText(std::string_view text)
        : size_(text.size()), bytes_(new char[text.size() + OrdinaryReader::kPadding]) {
        text.copy(bytes_.get(), text.size());
        constexpr std::string_view kMore = "\"}]0e1,";
        for (std::size_t i = 0; i < OrdinaryReader::kPadding; ++i) {
            bytes_[size_ + i] = kMore[(size_ + i) % kMore.size()];
        }
    }
    std::string_view Get() const { return {bytes_.get(), size_}; }

private:
    std::size_t size_;
    std::unique_ptr<char[]> bytes_;
};

/// One that lives as long as the process: what an earlier text left in it must not matter.
OrdinaryReader &KeptReader() {
    static OrdinaryReader reader;
    return reader;
}

bool CheckEventWith(OrdinaryReader &reader, std::string_view line) {
    OrdinaryEvent fast;
    fast.oldPath = "left over";
    if (!reader.ReadEvent(line, fast)) {
        return false;
    }
    const std::optional<Event> exact = ReferenceEvent(line);
    Require(exact.has_value(), "the fast reader accepts a malformed line", line);
    Require(fast.type == exact->type, "the event differs", line);
    Require(fast.path == exact->path, "the path differs", line);
    Require(fast.oldPath == exact->oldPath, "the old path differs", line);
    return true;
}

bool CheckFoldersWith(OrdinaryReader &reader, std::string_view text) {
    std::vector<FolderRecord> records;
    if (!reader.ReadFolders(text, records)) {
        return false;
    }
    Json::Value document;
    Require(JsonReader().Parse(text, document) && document.isObject(), "the fast reader accepts no object", text);
    Require(records.size() == document.size(), "the number of records differs", text);
    auto member = document.begin();
    for (const FolderRecord &record : records) {
        Require(member.name() == record.path, "the path differs", text);
        VORK::FILEINDEX::Folder folder;
        folder.Load(member.name(), *member);
        Require(folder.name == (record.hasName ? record.name : ""), "the name differs", text);
        for (std::size_t kind = 0; kind < std::size(record.flag); ++kind) {
            Require(folder.*kMediaFlags[kind] == (record.hasFlag[kind] && record.flag[kind]), "a flag differs",
                    text);
        }
        ++member;
    }
    return true;
}

}  // namespace

std::optional<Event> ReferenceEvent(std::string_view line) {
    Json::Value record;
    if (!JsonReader().Parse(line, record) || !record.isObject()) {
        return {};
    }
    const Json::Value &path = record[kPathKey];
    if (!path.isString() || !record.isMember(kEventKey) || !record[kEventKey].isConvertibleTo(Json::uintValue)) {
        return {};
    }
    const Json::Value &oldPath = record[kOldPathKey];
    return Event{record[kEventKey].asUInt(), path.asString(), oldPath.isString() ? oldPath.asString() : ""};
}

bool CheckEvent(std::string_view line) {
    const PaddedText padded(line);
    OrdinaryReader fresh;
    const bool decided = CheckEventWith(fresh, padded.Get());
    Require(CheckEventWith(KeptReader(), padded.Get()) == decided, "an earlier text matters", line);
    return decided;
}

bool CheckFolders(std::string_view text) {
    const PaddedText padded(text);
    OrdinaryReader fresh;
    const bool decided = CheckFoldersWith(fresh, padded.Get());
    Require(CheckFoldersWith(KeptReader(), padded.Get()) == decided, "an earlier text matters", text);
    return decided;
}

bool CheckWriter(std::string_view text) {
    Json::Value value;
    if (!JsonReader().Parse(text, value)) {
        return false;
    }
    Json::StreamWriterBuilder builder;
    builder["indentation"] = "";
    builder["emitUTF8"] = true;
    builder["commentStyle"] = "None";
    const std::string written = ToString(value);
    Require(written == Json::writeString(builder, value), "the JSON library writes otherwise", text);
    Json::Value again;
    Require(JsonReader().Parse(written, again), "what was written cannot be read", written);
    Require(again == value, "what was written reads otherwise", written);
    return true;
}

}  // namespace fileindex_fuzz
