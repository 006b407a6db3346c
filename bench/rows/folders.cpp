#include "base/json/text.h"
#include "baseline.h"
#include "folders/folder_access.h"
#include "rows/support.h"

#include <fileindex/folders.h>
#include <fileindex/index_mgr.h>

#include <json/reader.h>

#include <fcntl.h>
#include <strings.h>
#include <unistd.h>

#include <algorithm>
#include <filesystem>
#include <memory>

namespace bench {

namespace {

using VORK::ToString;
using VORK::FILEINDEX::Folder;
using VORK::FILEINDEX::Folders;
using VORK::FILEINDEX::IndexMgr;
using VORK::FILEINDEX::internal::FolderAccess;

Row IsPathIndexed(std::size_t folders) {
    const auto prepare = [folders] { WriteFolderConf(SharePaths(folders, 10)); };
    Row row;
    row.name = "IsPathIndexed/" + std::to_string(folders);
    row.library = [=] {
        prepare();
        return [] { Require(!IndexMgr::IsPathIndexed(kAbsent), "not covered"); };
    };
    row.baseline = [=] {
        prepare();
        return [] { Require(!baseline::IsPathIndexed(kAbsent), "not covered"); };
    };
    row.floor = [=] {
        prepare();
        const std::shared_ptr<Json::CharReader> reader(Json::CharReaderBuilder().newCharReader());
        return [reader, text = ReadWhole(kFolderConf)] {
            Json::Value document;
            Require(reader->parse(text.data(), text.data() + text.size(), &document, nullptr), "parse");
        };
    };
    row.mostOfFloor = folders >= 1000 ? 0.2 : folders >= 100 ? 0.35 : 0;
    return row;
}

/// As the operations of IndexMgr save, or as a program does with a store of its own, which also gets its document.
Row WholeSave(bool ours) {
    const auto paths = SharePaths(1000, 10);
    Row row;
    row.name = std::string("whole save/1000") + (ours ? "" : ", of a program's own store");
    row.library = [=] {
        WriteFolderConf(paths);
        const auto store = std::make_shared<Folders>();
        Require(store->Load(), "load");
        return [store, ours] { Require(ours ? FolderAccess::Save(*store) : store->Save(), "save"); };
    };
    row.baseline = [=] {
        WriteFolderConf(paths);
        return [folders = baseline::Load()] { baseline::Save(folders); };
    };
    row.floor = [=] {
        WriteFolderConf(paths);
        return [text = ReadWhole(kFolderConf)] {
            const int fd = open(kFolderConf, O_WRONLY | O_CLOEXEC);
            Require(write(fd, text.data(), text.size()) == static_cast<ssize_t>(text.size()), "write");
            close(fd);
        };
    };
    row.mostOfBaseline = ours ? 0.6 : 0;
    return row;
}

Row UpsertInMemory(std::size_t size) {
    const auto paths = SharePaths(size, 10);
    Row row;
    const std::string count = std::to_string(size);
    row.name = "Upsert in memory/" + count + " into " + count;
    row.library = [=] {
        WriteFolderConf(paths);
        const auto store = std::make_shared<Folders>();
        Require(store->Load(), "load");
        return [store, records = Records(paths)] {
            Json::Value report;
            for (const Json::Value &record : records) {
                Require(store->Upsert(report, record), "upsert");
            }
        };
    };
    row.baseline = [=] {
        WriteFolderConf(paths);
        const auto folders = std::make_shared<baseline::FolderMap>(baseline::Load());
        return [folders, records = Records(paths)] {
            for (const Json::Value &record : records) {
                Require(baseline::Upsert(*folders, record).size() == 4, "report");
            }
        };
    };
    row.mostOfBaseline = size >= 1000 ? 1.0 / 25 : 0;
    return row;
}

Row ListPage(bool ascii) {
    const auto prepare = [=] {
        Json::Value document(Json::objectValue);
        for (Json::Value record : Records(SharePaths(1000, 10))) {
            record["name"] = record["name"].asString() + (ascii ? " holiday" : " Ferien in Österreich");
            document[record["path"].asString()] = record;
        }
        std::filesystem::remove(kFolderConf);
        const int fd = open(kFolderConf, O_WRONLY | O_CREAT | O_CLOEXEC, 0644);
        const std::string text = ToString(document);
        Require(write(fd, text.data(), text.size()) == static_cast<ssize_t>(text.size()), "write");
        close(fd);
    };
    Row row;
    row.name = std::string("List page/50 of 1000 by name, ") + (ascii ? "ASCII" : "not ASCII");
    row.library = [=] {
        prepare();
        const auto store = std::make_shared<Folders>();
        Require(store->Load(), "load");
        return [store] {
            Json::Value page;
            Require(store->List(page, 100, 50, "name", "ASC", Json::Value(Json::arrayValue)), "list");
        };
    };
    row.baseline = [=] {
        prepare();
        return [folders = baseline::Load()] { Require(baseline::List(folders, 100, 50).size() == 50, "list"); };
    };
    row.floor = [=] {
        prepare();
        const auto folders = std::make_shared<std::vector<Folder>>();
        Require(IndexMgr::List(*folders), "list");
        return [folders] {
            std::vector<const Folder *> sorted;
            for (const Folder &folder : *folders) {
                sorted.push_back(&folder);
            }
            std::sort(sorted.begin(), sorted.end(), [](const Folder *a, const Folder *b) {
                return strcasecmp(a->name.c_str(), b->name.c_str()) < 0;
            });
            Json::Value page(Json::arrayValue);
            for (std::size_t i = 100; i < 150; ++i) {
                Json::Value record = sorted[i]->asJson();
                record["additional"] = Json::Value(Json::objectValue);
                page.append(std::move(record));
            }
        };
    };
    row.mostOfFloor = ascii ? 2 : 5;
    return row;
}

}  // namespace

std::vector<Row> FolderRows() {
    return {IsPathIndexed(1),    IsPathIndexed(100),   IsPathIndexed(1000), WholeSave(true), WholeSave(false),
            UpsertInMemory(100), UpsertInMemory(1000), ListPage(true),      ListPage(false)};
}

}  // namespace bench
