#include "baseline.h"

#include "data.h"

#include <fileindex/folders.h>
#include <fileindex/paths.h>

#include <vork/text.h>

#include <json/reader.h>
#include <json/writer.h>

#include <fcntl.h>
#include <sys/file.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

#include <algorithm>
#include <cstring>
#include <fstream>
#include <memory>
#include <optional>

namespace baseline {

using VORK::FILEINDEX::Folder;
using VORK::FILEINDEX::GetMostSuitableCfg;
using VORK::FILEINDEX::StringStartWith;

namespace {

std::vector<Folder> Copies(const FolderMap &folders) {
    std::vector<Folder> copies;
    for (const auto &[path, folder] : folders) {
        copies.push_back(folder);
    }
    return copies;
}

std::string Text(const Json::Value &value) {
    Json::StreamWriterBuilder builder;
    builder["indentation"] = "";
    builder["emitUTF8"] = true;
    return Json::writeString(builder, value);
}

std::optional<Json::Value> Parse(const std::string &line) {
    Json::CharReaderBuilder builder;
    builder["failIfExtra"] = true;
    const std::unique_ptr<Json::CharReader> reader(builder.newCharReader());
    Json::Value value;
    if (!reader->parse(line.data(), line.data() + line.size(), &value, nullptr) || !value.isObject() ||
        !value["event"].isConvertibleTo(Json::uintValue) || !value["path"].isString()) {
        return std::nullopt;
    }
    return value;
}

}  // namespace

FolderMap Load() {
    std::ifstream file(bench::kFolderConf);
    Json::Value document;
    file >> document;
    FolderMap folders;
    for (auto it = document.begin(); it != document.end(); ++it) {
        Folder folder;
        folder.Load(it.name(), *it);
        folders.emplace(it.name(), folder);
    }
    return folders;
}

bool IsPathIndexed(const std::string &path) {
    const std::vector<Folder> folders = Copies(Load());
    return std::any_of(folders.begin(), folders.end(),
                       [&](const Folder &folder) { return StringStartWith(path + "/", folder.path + "/"); });
}

void Save(const FolderMap &folders) {
    Json::Value document(Json::objectValue);
    for (const auto &[path, folder] : folders) {
        folder.AddToJson(document);
    }
    Json::StreamWriterBuilder builder;
    builder["indentation"] = "";
    builder["emitUTF8"] = true;
    const std::unique_ptr<Json::StreamWriter> writer(builder.newStreamWriter());
    std::ofstream file(bench::kFolderConf, std::ios::trunc);
    writer->write(document, &file);
}

Json::Value Upsert(FolderMap &folders, const Json::Value &record) {
    const std::vector<Folder> before = Copies(folders);
    Folder &folder = folders[record["path"].asString()];
    folder.Load(record["path"].asString(), record);
    const Json::Value was = GetMostSuitableCfg(before, folder.GetFullPath());
    const Json::Value is = folder.asJson();
    Json::Value report(Json::objectValue);
    for (const char *kind : {"document", "audio", "video", "photo"}) {
        report[kind] = !was.isMember(kind) || was[kind] != is[kind];
    }
    return report;
}

Json::Value List(const FolderMap &folders, unsigned long offset, unsigned long limit) {
    std::vector<Folder> sorted = Copies(folders);
    std::sort(sorted.begin(), sorted.end(), [](const Folder &a, const Folder &b) {
        return VLIBCUnicodeUTF8StrCaseCmp(a.name.c_str(), b.name.c_str()) < 0;
    });
    Json::Value page(Json::arrayValue);
    for (unsigned long i = offset; i < std::min<unsigned long>(offset + limit, sorted.size()); ++i) {
        page.append(sorted[i].asJson());
    }
    return page;
}

bool IsReindexQueued(const std::string &fullPath, const std::string &queueFile) {
    std::ifstream queue(queueFile);
    std::string line;
    while (std::getline(queue, line)) {
        const std::optional<Json::Value> event = Parse(line);
        if (event && (*event)["event"].asUInt() == 0x10000 && (*event)["path"].asString() == fullPath) {
            return true;
        }
    }
    return false;
}

bool IsPathInQueue(const std::string &fullPath, const std::string &queueFile) {
    std::ifstream queue(queueFile);
    std::string line;
    bool found = false;
    while (std::getline(queue, line)) {
        const std::optional<Json::Value> event = Parse(line);
        found = found || (event && StringStartWith((*event)["path"].asString() + "/", fullPath + "/"));
    }
    return found;
}

bool AddEvent(int type, const std::string &fullPath, const std::string &queueFile) {
    if (IsReindexQueued(fullPath, queueFile)) {
        return true;
    }
    Json::Value record(Json::objectValue);
    record["event"] = type;
    record["path"] = fullPath;
    record["data"] = Json::Value();
    const std::string line = Text(record) + "\n";
    const int fd = open(queueFile.c_str(), O_WRONLY | O_APPEND | O_CREAT | O_CLOEXEC, 0644);
    const bool written = flock(fd, LOCK_EX | LOCK_NB) == 0 &&
                         write(fd, line.data(), line.size()) == static_cast<ssize_t>(line.size());
    flock(fd, LOCK_UN);
    close(fd);
    return written;
}

bool SendCommand(const std::string &command, const Json::Value &data) {
    const int fd = socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0);
    sockaddr_un address = {};
    address.sun_family = AF_UNIX;
    std::strcpy(address.sun_path, "/var/run/fileindexd.sock");
    Json::Value message(Json::objectValue);
    message["type"] = command;
    message["data"] = data;
    const std::string text = Text(message);
    const auto length = static_cast<unsigned>(text.size() + 1);
    const bool sent = connect(fd, reinterpret_cast<const sockaddr *>(&address), sizeof(address)) == 0 &&
                      write(fd, &length, sizeof(length)) == sizeof(length) &&
                      write(fd, text.c_str(), length) == static_cast<ssize_t>(length);
    close(fd);
    return sent;
}

}  // namespace baseline
