#include "data.h"

#include "base/json/text.h"

#include <cstdint>
#include <filesystem>
#include <fstream>
#include <map>
#include <random>
#include <sstream>

namespace bench {

namespace {

using VORK::ToString;

std::string RandomTail(std::mt19937 &random, Escapes escapes) {
    static const char *const kWords[] = {"photos",    "Фото", "Holiday trip",           "日本", "archive",
                                         "project-x", "été",  "Documents and settings", "2015", "video clips"};
    std::string tail;
    const std::size_t length = 60 + random() % 120;
    while (tail.size() < length) {
        tail += '/';
        tail += kWords[random() % std::size(kWords)];
        if (escapes == Escapes::kEverywhere || (escapes == Escapes::kSome && random() % 50 == 0)) {
            tail += "\"quoted\"";
        }
    }
    return tail;
}

Json::Value QueueRecord(std::mt19937 &random, std::size_t line, Escapes escapes) {
    Json::Value record(Json::objectValue);
    record["path"] = std::string(kVolume) + "/share0" + RandomTail(random, escapes) + std::to_string(line);
    if (line % 50 == 0) {
        record["event"] = 256;
        record["path_old"] = record["path"].asString() + ".old";
        record["cookie"] = static_cast<Json::UInt>(line);
        return record;
    }
    record["event"] = line % 2 == 0 ? 0x10000 : 0x20000;
    record["data"] = Json::Value();
    if (line % 2 == 1) {
        for (const char *kind : {"audio", "document", "photo", "video"}) {
            record["data"][kind] = random() % 2 == 0;
        }
    }
    return record;
}

/// Makes each kind of queue once: a row prepares anew for every batch. One that is still of its size is put by and
/// taken out again. Links would not do, since the library refuses them.
template <typename Write>
void PlaceQueue(const std::string &path, const std::string &kind, Write write) {
    namespace fs = std::filesystem;
    struct Placed {
        fs::path keptAt;
        std::uintmax_t size = 0;
    };
    static std::map<std::string, Placed> all;
    Placed &placed = all[path];
    if (fs::exists(path) && !placed.keptAt.empty() && fs::file_size(path) == placed.size) {
        fs::rename(path, placed.keptAt);
    }
    placed.keptAt = std::string(kVolume) + "/queue-" + kind;
    if (fs::exists(placed.keptAt)) {
        fs::rename(placed.keptAt, path);
    } else {
        std::ofstream queue(path, std::ios::trunc);
        write(queue);
    }
    placed.size = fs::file_size(path);
}

}  // namespace

std::vector<std::string> SharePaths(std::size_t count, std::size_t shares) {
    std::mt19937 random(1);
    std::vector<std::string> paths;
    for (std::size_t i = 0; i < count; ++i) {
        paths.push_back("/share" + std::to_string(i % shares) + RandomTail(random, Escapes::kSome) +
                        std::to_string(i));
    }
    return paths;
}

Json::Value Records(const std::vector<std::string> &paths) {
    Json::Value records(Json::arrayValue);
    std::size_t number = 0;
    for (const std::string &path : paths) {
        Json::Value record(Json::objectValue);
        record["path"] = path;
        record["name"] = "Folder " + std::to_string(++number * 7919 % 1000);
        for (const char *kind : {"document", "audio", "video", "photo"}) {
            record[kind] = number % 3 == 0;
        }
        records.append(record);
    }
    return records;
}

void WriteFolderConf(const std::vector<std::string> &paths) {
    Json::Value document(Json::objectValue);
    for (const Json::Value &record : Records(paths)) {
        document[record["path"].asString()] = record;
    }
    std::filesystem::create_directories(std::filesystem::path(kFolderConf).parent_path());
    std::ofstream(kFolderConf) << ToString(document) << '\n';
}

std::string QueuePath(const std::string &share) {
    const std::filesystem::path directory = std::filesystem::path(kVolume) / share / "@eaDir";
    std::filesystem::create_directories(directory);
    return directory / "VORK@file_index_queue";
}

void WriteQueue(const std::string &path, std::size_t lines, Escapes escapes) {
    const std::string kind = std::to_string(lines) + "-" + std::to_string(static_cast<int>(escapes));
    PlaceQueue(path, kind, [=](std::ofstream &queue) {
        std::mt19937 random(2);
        for (std::size_t line = 0; line < lines; ++line) {
            const std::string text = ToString(QueueRecord(random, line, escapes));
            queue << (line % 1000 == 999 ? text.substr(1) : text) << '\n';
        }
    });
}

void WriteUnusualQueue(const std::string &path, std::size_t lines) {
    PlaceQueue(path, std::to_string(lines) + "-unusual", [=](std::ofstream &queue) {
        // Bytes that are not UTF-8, escaped surrogates, odd numbers: valid, and not what is usually written.
        const char *const kUnusual[] = {"\"by\":\"caf\xe9\"", R"("by":"\ud83d\udcf7")", "\"time\":0.0"};
        std::mt19937 random(3);
        for (std::size_t line = 0; line < lines; ++line) {
            queue << '{' << kUnusual[line % std::size(kUnusual)] << ','
                  << ToString(QueueRecord(random, line, Escapes::kNone)).substr(1) << '\n';
        }
    });
}

std::string ReadWhole(const std::string &path) {
    std::ostringstream text;
    text << std::ifstream(path).rdbuf();
    return text.str();
}

}  // namespace bench
