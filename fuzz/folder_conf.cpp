// Any bytes as folder.conf: no operation of the store throws, and what is saved loads again to the same list.

#include "json/text.h"
#include "names.h"
#include "support.h"

#include <fileindex/folders.h>

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

namespace {

using namespace fileindex_fuzz;  // NOLINT(google-build-using-namespace): this is their program
using VORK::FILEINDEX::Folder;
using VORK::FILEINDEX::Folders;
namespace names = VORK::FILEINDEX::internal;

std::string TextOf(Folders &store) {
    std::vector<Folder> folders;
    Require(store.List(folders), "cannot list");
    std::string text;
    for (const Folder &folder : folders) {
        text += names::ToString(folder.asJson()) + '\n';
    }
    return text;
}

void RoundTrip(Folders &store) {
    const std::string before = TextOf(store);
    Require(store.Save(), "cannot save");
    Folders again;
    Require(again.Load(), "what was saved cannot be loaded", before);
    Require(TextOf(again) == before, "what was saved loads otherwise", before);
    const std::string saved = ReadWhole(names::kFolderConf);
    Require(again.Save() && ReadWhole(names::kFolderConf) == saved, "the same list is saved otherwise", saved);
}

void Change(Folders &store, const Folder &folder) {
    Json::Value out;
    Require(store.Get(out, folder.path) && out == folder.asJson(), "cannot get", folder.path);
    Json::Value changed = folder.asJson();
    changed["audio"] = !folder.audio;
    if (store.Upsert(out, changed)) {
        Require(out["audio"].isBool() && out.size() == 4, "the report is incomplete", folder.path);
        Require(store.Get(out, folder.path) && out == changed, "the change is lost", folder.path);
    }
    Require(store.Delete(out, folder.path) && !store.Get(out, folder.path), "cannot delete", folder.path);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size) {
    ResetMachine();
    const std::string text(reinterpret_cast<const char *>(data), size);
    WriteWhole(names::kFolderConf, text);
    const LeakCheck leaks;
    Folders store;
    Json::Value document;
    const bool isObject = names::JsonReader().Parse(text, document) && document.isObject();
    Require(store.Load() == isObject, "exactly JSON objects are loaded", text);
    if (!isObject) {
        Require(ReadWhole(names::kFolderConf) == text, "the file was changed", text);
        return 0;
    }
    RoundTrip(store);
    std::vector<Folder> folders;
    store.List(folders);
    Json::Value page;
    Json::Value additional(Json::arrayValue);
    additional.append("status");
    additional.append("is_valid");
    Require(
        store.List(page, size % 3, 2, size % 2 == 0 ? "name" : "audio", size % 5 == 0 ? "DESC" : "", additional),
        "cannot list a page");
    Require(page["total"].asUInt64() == folders.size() && page["folder"].size() <= 2, "the page is wrong");
    constexpr std::size_t kChanged = 8;
    for (std::size_t i = 0; i < folders.size() && i < kChanged; ++i) {
        Change(store, folders[i]);
    }
    RoundTrip(store);
    return 0;
}
