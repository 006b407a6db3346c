#include "base/json/scanner.h"
#include "base/json/text.h"
#include "config/load_save.h"
#include "folders/folder_access.h"
#include "folders/media_kinds.h"
#include "folders/places.h"
#include "names.h"
#include "records.h"
#include "share/volume.h"

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

/// A member of folder.conf. The views live as long as the text and the home of its decoded strings.
struct StoredFolder {
    std::string_view path;
    std::string_view name{};
    bool flags[std::size(internal::kMediaKinds)] = {};  ///< in the order of kMediaKinds
};

bool *FlagOf(StoredFolder &record, std::string_view key) {
    const auto *kind = std::find_if(std::begin(internal::kMediaKinds), std::end(internal::kMediaKinds),
                                    [&](const internal::MediaKind &known) { return known.key == key; });
    return kind == std::end(internal::kMediaKinds) ? nullptr
                                                   : &record.flags[kind - std::begin(internal::kMediaKinds)];
}

/// All records of a folder.conf in its usual form: in ascending order of their paths. False when it is not quite
/// that; then only the document tells what it says.
bool ReadRecords(std::string_view text, std::string &decoded, std::vector<StoredFolder> &records) {
    JsonScanner json(text, decoded);
    const auto takeRecord = [&](std::string_view path) {
        if (!records.empty() && path <= records.back().path) {
            return false;
        }
        StoredFolder &record = records.emplace_back(StoredFolder{path});
        return json.TakeObject([&](std::string_view key) {
            if (key == internal::kNameKey) {
                return json.TakeString(record.name);
            }
            bool *const flag = FlagOf(record, key);
            return flag != nullptr ? json.TakeBool(*flag) : json.Skip();
        });
    };
    return json.TakeObject(takeRecord) && json.AtEnd();
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
    return LoadWith(store, [&](std::string &text) { return TakeText(store, text); });
}

bool FolderAccess::LoadWith(Folders &store, const std::function<bool(std::string &text)> &takeUsual) {
    bool usual = false;
    const bool loaded = LoadConfig(store.GetPath(), [&](std::string &text) {
        usual = takeUsual(text);
        return usual || JsonReader().Parse(text, store.document_);
    });
    return loaded && (usual || TakeDocument(store));
}

bool FolderAccess::TakeText(Folders &store, std::string_view text) {
    std::string decoded;
    std::vector<StoredFolder> records;
    if (!ReadRecords(text, decoded, records)) {
        return false;
    }
    for (const StoredFolder &record : records) {
        Folder folder;
        folder.path = record.path;
        folder.name = record.name;
        for (std::size_t kind = 0; kind < std::size(record.flags); ++kind) {
            folder.*kMediaKinds[kind].flag = record.flags[kind];
        }
        Resolve(folder);  // a folder whose share is away stays in the list
        std::string key = folder.path;
        Add(store, std::move(key), std::move(folder));
    }
    return true;
}

bool FolderPlaces::Load() {
    const bool loaded = FolderAccess::LoadWith(store_, [&](std::string &text) {
        text_.swap(text);
        const bool taken = TakeText();
        if (!taken) {
            text_.swap(text);
        }
        return taken;
    });
    for (const auto &[path, folder] : FolderAccess::All(store_)) {
        const std::string &fullPath = FolderAccess::StoredFullPath(folder);
        const std::string *volume =
            fullPath.empty() ? nullptr : &volumes_.emplace_back(fullPath, 0, fullPath.size() - path.size());
        places_.push_back({path, volume});
    }
    return loaded;
}

bool FolderPlaces::TakeText() {
    std::vector<StoredFolder> records;
    if (!ReadRecords(text_, decoded_, records)) {
        return false;
    }
    places_.reserve(records.size());
    std::string volume;
    for (const StoredFolder &record : records) {
        const bool found = GetVolume(volume, record.path);
        if (found && (volumes_.empty() || volumes_.back() != volume)) {
            volumes_.push_back(volume);
        }
        places_.push_back({record.path, found ? &volumes_.back() : nullptr});
    }
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
        Add(store, path, std::move(folder));
    }
    return true;
}

void FolderAccess::Add(Folders &store, std::string path, Folder folder) {
    const std::size_t before = store.folders_.size();
    const auto added = store.folders_.emplace_hint(store.folders_.end(), std::move(path), std::move(folder));
    if (store.folders_.size() > before && StoredFullPath(added->second).empty()) {
        ++store.unresolved_;
    }
}

}  // namespace internal

}  // namespace FILEINDEX
}  // namespace VORK
