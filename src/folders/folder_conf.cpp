#include "base/json/text.h"
#include "config/load_save.h"
#include "folders/folder_access.h"
#include "json/ordinary.h"
#include "records.h"

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
    AppendQuoted(out, folder.name);
    out += ",\"path\":";
    AppendQuoted(out, folder.path);
    out += ',';
    AppendMember(out, "photo", folder.photo);
    AppendMember(out, "video", folder.video);
    out.back() = '}';
}

/// All records as ToString writes the document, byte for byte.
std::string TextOf(const std::map<std::string, Folder> &folders) {
    std::string text;
    for (const auto &[path, folder] : folders) {
        text += text.empty() ? '{' : ',';
        AppendQuoted(text, path);
        text += ':';
        AppendRecord(text, folder);
    }
    text += text.empty() ? "{}" : "}";
    return text;
}

}  // namespace

bool Folders::Load() {
    return LoadJson() && internal::FolderAccess::TakeDocument(*this);
}

bool Folders::Save() {
    document_ = Json::Value(Json::objectValue);
    for (const auto &[path, folder] : folders_) {
        if (!folder.AddToJson(document_)) {
            return false;
        }
    }
    return SaveJson();
}

namespace internal {

bool FolderAccess::Load(Folders &store) {
    bool done = false;
    const bool loaded = LoadConfig(store.GetPath(), [&](std::string &text) {
        done = LoadOrdinary(store.folders_, text);
        return done || JsonReader().Parse(text, store.document_);
    });
    if (!loaded) {
        return false;
    }
    if (!done) {
        return TakeDocument(store);
    }
    store.unresolved_ = CountUnresolved(store.folders_);
    return true;
}

bool FolderAccess::Save(const Folders &store) {
    return SaveConfig(store.GetPath(), [&](std::string &text) {
        text = TextOf(store.folders_) + '\n';
        return true;
    });
}

bool FolderAccess::TakeDocument(Folders &store) {
    if (!store.document_.isObject()) {
        syslog(LOG_ERR, "%s:%d Malformed folders: %s", kFoldersModule, __LINE__,
               ToString(store.document_).c_str());
        ErrorHandler::SetError(FILEINDEX_ERR_MALFORMED_CONFIG);
        return false;
    }
    for (auto it = store.document_.begin(); it != store.document_.end(); ++it) {
        const std::string path = it.name();
        Folder folder;
        folder.Load(path, *it);  // a folder whose share is away stays in the list
        store.folders_.emplace(path, std::move(folder));
    }
    store.unresolved_ = CountUnresolved(store.folders_);
    return true;
}

}  // namespace internal

}  // namespace FILEINDEX
}  // namespace VORK
