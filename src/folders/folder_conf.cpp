#include "config/load_save.h"
#include "folder_access.h"
#include "json/ordinary.h"
#include "json/text.h"
#include "names.h"

#include <fileindex/error.h>
#include <fileindex/folders.h>

#include <syslog.h>

#include <algorithm>
#include <cstddef>
#include <iterator>
#include <string_view>
#include <utility>
#include <vector>

namespace VORK {
namespace FILEINDEX {

namespace {

int CountUnresolved(const std::map<std::string, Folder> &folders) {
    const auto unresolved = [](const auto &entry) {
        return internal::FolderAccess::StoredFullPath(entry.second).empty();
    };
    return static_cast<int>(std::count_if(folders.begin(), folders.end(), unresolved));
}

/// Takes over a folder.conf in its usual form. False, with nothing taken, when it is not quite that.
bool LoadOrdinary(std::map<std::string, Folder> &folders, std::string &text) {
    const std::size_t size = text.size();
    text.append(internal::OrdinaryReader::kPadding, '\0');
    internal::OrdinaryReader reader;
    std::vector<internal::FolderRecord> records;
    const bool ordinary = reader.ReadFolders(std::string_view(text).substr(0, size), records);
    text.resize(size);
    if (!ordinary) {
        return false;
    }
    for (const internal::FolderRecord &record : records) {
        Folder folder;
        folder.path = record.path;
        if (record.hasName) {
            folder.name = record.name;
        }
        for (std::size_t kind = 0; kind < std::size(record.flag); ++kind) {
            folder.*internal::kMediaFlags[kind] = record.hasFlag[kind] && record.flag[kind];
        }
        internal::FolderAccess::Resolve(folder);  // a folder whose share is away stays in the list
        std::string key = folder.path;
        folders.emplace_hint(folders.end(), std::move(key), std::move(folder));
    }
    return true;
}

void AppendMember(std::string &out, const char *key, bool value) {
    out += '"';
    out += key;
    out += value ? "\":true," : "\":false,";
}

/// As ToString writes Folder::asJson(), byte for byte, without building the document first.
void AppendRecord(std::string &out, const Folder &folder) {
    out += '{';
    AppendMember(out, "audio", folder.audio);
    AppendMember(out, "document", folder.document);
    out += "\"name\":";
    internal::AppendQuoted(out, folder.name);
    out += ",\"path\":";
    internal::AppendQuoted(out, folder.path);
    out += ',';
    AppendMember(out, "photo", folder.photo);
    AppendMember(out, "video", folder.video);
    out.back() = '}';
}

}  // namespace

bool Folders::Load() {
    bool done = false;
    const bool loaded = internal::LoadConfig(GetPath(), [&](std::string &text) {
        done = LoadOrdinary(folders_, text);
        if (done) {
            unresolved_ = CountUnresolved(folders_);
            unparsed_ = std::move(text);
            return true;
        }
        unparsed_.clear();
        return internal::JsonReader().Parse(text, document_);
    });
    if (!loaded || done) {
        return loaded;
    }
    if (!document_.isObject()) {
        syslog(LOG_ERR, "%s:%d Malformed folders: %s", internal::kFoldersModule, __LINE__,
               internal::ToString(document_).c_str());
        ErrorHandler::SetError(FILEINDEX_ERR_MALFORMED_CONFIG);
        return false;
    }
    for (auto it = document_.begin(); it != document_.end(); ++it) {
        const std::string path = it.name();
        Folder folder;
        folder.Load(path, *it);  // a folder whose share is away stays in the list
        folders_.emplace(path, std::move(folder));
    }
    unresolved_ = CountUnresolved(folders_);
    return true;
}

bool Folders::Save() {
    return internal::SaveConfig(GetPath(), [this]() -> const std::string & {
        std::string text;
        for (const auto &[path, folder] : folders_) {
            text += text.empty() ? '{' : ',';
            internal::AppendQuoted(text, path);
            text += ':';
            AppendRecord(text, folder);
        }
        text += text.empty() ? "{}\n" : "}\n";
        unparsed_ = std::move(text);
        return unparsed_;
    });
}

}  // namespace FILEINDEX
}  // namespace VORK
