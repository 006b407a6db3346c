#include "rows.h"

#include "baseline.h"
#include "data.h"
#include "json/text.h"
#include "peer.h"
#include "utils/queue_file.h"

#include <fileindex/daemon.h>
#include <fileindex/folders.h>
#include <fileindex/index_mgr.h>
#include <fileindex/status_mgr.h>

#include <vork/text.h>

#include <json/reader.h>

#include <fcntl.h>
#include <spawn.h>
#include <sys/file.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/un.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <climits>
#include <csignal>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <memory>
#include <stdexcept>

namespace bench {

namespace {

using VORK::FILEINDEX::Folder;
using VORK::FILEINDEX::Folders;
using VORK::FILEINDEX::IndexMgr;
using VORK::FILEINDEX::StatusMgr;
using VORK::FILEINDEX::internal::ToString;

constexpr char kAbsent[] = "/share0/absent/folder/that/no/event/is/about";

void Require(bool condition, const char *what) {
    if (!condition) {
        throw std::runtime_error(what);
    }
}

std::string FullPath(const std::string &sharePath) {
    return kVolume + sharePath;
}

/// Reads a file as the library does, and does nothing with it.
void ReadBytes(const std::string &path) {
    static std::vector<char> block(128 * 1024);
    const int fd = open(path.c_str(), O_RDONLY | O_CLOEXEC);
    while (read(fd, block.data(), block.size()) > 0) {
    }
    close(fd);
}

void AppendBare(const std::string &path, const std::string &line) {
    const int fd = open(path.c_str(), O_WRONLY | O_APPEND | O_CREAT | O_CLOEXEC, 0644);
    flock(fd, LOCK_EX | LOCK_NB);
    Require(write(fd, line.data(), line.size()) == static_cast<ssize_t>(line.size()), "append");
    flock(fd, LOCK_UN);
    close(fd);
}

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
    row.mostOfFloor = folders >= 100 ? 0.35 : 0;
    return row;
}

Row WholeSave() {
    const auto paths = SharePaths(1000, 10);
    Row row;
    row.name = "whole save/1000";
    row.library = [=] {
        WriteFolderConf(paths);
        const auto store = std::make_shared<Folders>();
        Require(store->Load(), "load");
        return [store] { Require(store->Save(), "save"); };
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
    row.mostOfBaseline = 0.6;
    return row;
}

Row UpsertInMemory() {
    const auto paths = SharePaths(1000, 10);
    Row row;
    row.name = "Upsert in memory/1000 into 1000";
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
    row.mostOfBaseline = 1.0 / 25;
    return row;
}

Row PendingCheck(std::size_t lines, Escapes escapes, const char *name, double ofFloor, double ofBaseline) {
    const std::string queue = QueuePath("share0");
    const auto prepare = [=] { WriteQueue(queue, lines, escapes); };
    Row row;
    row.name = std::string("pending-reindex check/") + std::to_string(lines) + name;
    row.library = [=] {
        prepare();
        return [queue] {
            bool found = false;
            Require(VORK::FILEINDEX::internal::FindInQueue(queue, 0x10000, FullPath(kAbsent), found) && !found,
                    "find");
        };
    };
    row.baseline = [=] {
        prepare();
        return [queue] { Require(!baseline::IsReindexQueued(FullPath(kAbsent), queue), "find"); };
    };
    row.floor = [=] {
        prepare();
        return [queue] { ReadBytes(queue); };
    };
    row.mostOfFloor = ofFloor;
    row.mostOfBaseline = ofBaseline;
    return row;
}

Row FolderState(std::size_t lines, bool unusual, double ofFloor, double ofBaseline) {
    const std::string queue = QueuePath("share0");
    const auto prepare = [=] {
        std::filesystem::create_directories(FullPath(kAbsent));
        unusual ? WriteUnusualQueue(queue, lines) : WriteQueue(queue, lines);
    };
    Row row;
    row.name = "folder state/" + std::to_string(lines) + (unusual ? ", every line unusual" : "");
    row.library = [=] {
        prepare();
        return [] { Require(StatusMgr::GetFolderStatus(kAbsent) == "finished", "state"); };
    };
    row.baseline = [=] {
        prepare();
        return [queue] { Require(!baseline::IsPathInQueue(FullPath(kAbsent), queue), "state"); };
    };
    row.floor = [=] {
        prepare();
        return [queue] { ReadBytes(queue); };
    };
    row.mostOfFloor = ofFloor;
    row.mostOfBaseline = ofBaseline;
    return row;
}

std::string EventLine(const std::string &fullPath) {
    return "{\"data\":null,\"event\":65536,\"path\":\"" + fullPath + "\"}\n";
}

/// Appends to a queue of 10 lines, which is cut back so that it stays that long.
Row OneEvent() {
    const std::string queue = QueuePath("share0");
    const auto prepare = [=] {
        WriteQueue(queue, 10);
        return std::filesystem::file_size(queue);
    };
    const std::string path = FullPath(kAbsent);
    Row row;
    row.name = "one event/queue of 10";
    row.library = [=] {
        return [=, size = prepare()] {
            Require(VORK::FILEINDEX::AddCustomEvent(0x20000, path, Json::Value()), "event");
            Require(truncate(queue.c_str(), static_cast<off_t>(size)) == 0, "truncate");
        };
    };
    row.baseline = [=] {
        return [=, size = prepare()] {
            Require(baseline::AddEvent(0x20000, path, queue), "event");
            Require(truncate(queue.c_str(), static_cast<off_t>(size)) == 0, "truncate");
        };
    };
    // The same system calls: two looks for a queue, its bytes, the append with its checks.
    row.floor = [=] {
        return [=, size = prepare(), line = EventLine(path)] {
            struct stat status = {};
            lstat(queue.c_str(), &status);
            const int in = open(queue.c_str(), O_RDONLY | O_CLOEXEC);
            fstat(in, &status);
            static std::vector<char> block(128 * 1024);
            while (read(in, block.data(), block.size()) > 0) {
            }
            close(in);
            lstat((queue + ".tmp").c_str(), &status);
            const int out = open(queue.c_str(), O_WRONLY | O_APPEND | O_CREAT | O_CLOEXEC, 0644);
            fstat(out, &status);
            flock(out, LOCK_EX | LOCK_NB);
            lstat(queue.c_str(), &status);
            fstat(out, &status);
            Require(write(out, line.data(), line.size()) == static_cast<ssize_t>(line.size()), "write");
            flock(out, LOCK_UN);
            close(out);
            Require(truncate(queue.c_str(), static_cast<off_t>(size)) == 0, "truncate");
        };
    };
    row.mostOfFloor = 2;
    return row;
}

Row Reindex(std::size_t paths, std::size_t lines) {
    const std::string queue = QueuePath("share0");
    const auto sharePaths = SharePaths(paths, 1);
    const auto prepare = [=] {
        WriteFolderConf(sharePaths);
        WriteQueue(queue, lines);
        return std::filesystem::file_size(queue);
    };
    Row row;
    row.name = "Reindex/" + std::to_string(paths) + " paths, queue of " + std::to_string(lines);
    row.library = [=] {
        Json::Value request(Json::arrayValue);
        for (const std::string &path : sharePaths) {
            request.append(path);
        }
        return [=, size = prepare()] {
            Require(IndexMgr::Reindex(request), "reindex");
            Require(truncate(queue.c_str(), static_cast<off_t>(size)) == 0, "truncate");
        };
    };
    // One scan that reads every line, and the appends.
    row.floor = [=] {
        return [=, size = prepare()] {
            VORK::FILEINDEX::internal::ScanQueue(queue, [](auto, auto) { return true; });
            for (const std::string &path : sharePaths) {
                AppendBare(queue, EventLine(FullPath(path)));
            }
            Require(truncate(queue.c_str(), static_cast<off_t>(size)) == 0, "truncate");
        };
    };
    row.mostOfFloor = 3;
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

Row OneCommand() {
    Json::Value data(Json::objectValue);
    data["folder_path"] = SharePaths(1, 1).front();
    Row row;
    row.name = "one command";
    row.library = [=] {
        return [data, peer = std::make_shared<Peer>()] {
            Require(VORK::FILEINDEX::SendCammandToDaemon("upsert_folder_setting", data), "command");
        };
    };
    row.baseline = [=] {
        return [data, peer = std::make_shared<Peer>()] {
            Require(baseline::SendCommand("upsert_folder_setting", data), "command");
        };
    };
    row.floor = [=] {
        Json::Value message(Json::objectValue);
        message["type"] = "upsert_folder_setting";
        message["data"] = data;
        return [text = ToString(message), peer = std::make_shared<Peer>()] {
            signal(SIGPIPE, SIG_IGN);
            const int fd = socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0);
            const timeval timeout = {1, 0};
            setsockopt(fd, SOL_SOCKET, SO_SNDTIMEO, &timeout, sizeof(timeout));
            sockaddr_un address = {};
            address.sun_family = AF_UNIX;
            std::strcpy(address.sun_path, "/var/run/fileindexd.sock");
            Require(connect(fd, reinterpret_cast<const sockaddr *>(&address), sizeof(address)) == 0, "connect");
            setsockopt(fd, SOL_SOCKET, SO_SNDTIMEO, &timeout, sizeof(timeout));
            const auto length = static_cast<unsigned>(text.size() + 1);
            Require(write(fd, &length, sizeof(length)) == sizeof(length), "length");
            Require(write(fd, text.c_str(), length) == static_cast<ssize_t>(length), "text");
            close(fd);
        };
    };
    row.mostOfFloor = 1.6;
    return row;
}

Row ServiceStatus() {
    const auto paths = SharePaths(1000, 10);
    const auto prepare = [=] {
        WriteFolderConf(paths);
        for (const std::string &path : paths) {
            std::filesystem::create_directories(FullPath(path));
        }
        for (int share = 0; share < 10; ++share) {
            std::filesystem::remove(QueuePath("share" + std::to_string(share)));
        }
    };
    Row row;
    row.name = "GetStatus/1000 folders in 10 shares";
    row.library = [=] {
        prepare();
        return [] {
            std::string status;
            Require(StatusMgr::GetStatus(status) && status == "finished", "status");
        };
    };
    row.floor = [=] {
        prepare();
        return [paths] {
            struct stat status = {};
            lstat(kFolderConf, &status);
            ReadBytes(kFolderConf);
            char resolved[PATH_MAX];
            for (const std::string &path : paths) {
                Require(realpath(FullPath(path).c_str(), resolved) != nullptr, "realpath");
            }
            for (int share = 0; share < 10; ++share) {
                const std::string queue = std::string(kVolume) + "/share" + std::to_string(share) + "/queue";
                lstat(queue.c_str(), &status);
                lstat((queue + ".tmp").c_str(), &status);
            }
        };
    };
    row.mostOfFloor = 2;
    return row;
}

void RunProcess(const std::vector<std::string> &arguments) {
    std::vector<char *> argv;
    argv.reserve(arguments.size() + 1);
    for (const std::string &argument : arguments) {
        argv.push_back(const_cast<char *>(argument.c_str()));
    }
    argv.push_back(nullptr);
    pid_t child = 0;
    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    posix_spawn_file_actions_addopen(&actions, STDOUT_FILENO, "/dev/null", O_WRONLY, 0);
    Require(posix_spawnp(&child, argv[0], &actions, nullptr, argv.data(), environ) == 0, argv[0]);
    posix_spawn_file_actions_destroy(&actions);
    int status = 0;
    waitpid(child, &status, 0);
    Require(WIFEXITED(status) && WEXITSTATUS(status) <= 1, argv[0]);
}

Row ProcessFind(std::size_t lines) {
    const std::string queue = QueuePath("share0");
    const std::string path = FullPath(kAbsent);
    Row row;
    row.name = "process: pending-reindex check/" + std::to_string(lines) + " against grep -F";
    row.library = [=] {
        WriteQueue(queue, lines);
        return [=] { RunProcess({"/proc/self/exe", "--find", queue, path}); };
    };
    row.baseline = [=] {
        WriteQueue(queue, lines);
        return [=] { RunProcess({"grep", "-F", path, queue}); };
    };
    row.mostOfBaseline = 1.5;
    return row;
}

Row ProcessCheck() {
    const char *tool = std::getenv("FILEINDEXCTL");
    Row row;
    row.name = "process: fileindexctl check against /bin/true";
    row.library = [=] {
        WriteFolderConf(SharePaths(10, 1));
        return [=] { RunProcess({tool, "check", kAbsent}); };
    };
    row.baseline = [] { return [] { RunProcess({"/bin/true"}); }; };
    row.mostOfBaseline = 3;
    return row;
}

}  // namespace

std::vector<Row> Rows(std::size_t scale) {
    const std::size_t million = 1000000 / scale;
    std::vector<Row> rows = {
        IsPathIndexed(1),
        IsPathIndexed(100),
        IsPathIndexed(1000),
        WholeSave(),
        UpsertInMemory(),
        PendingCheck(10000 / scale, Escapes::kNone, "", 0, 0),
        PendingCheck(100000 / scale, Escapes::kNone, "", 0, 0),
        PendingCheck(million, Escapes::kNone, "", 3, 1.0 / 80),
        PendingCheck(million, Escapes::kEverywhere, ", escapes in every path", 0, 1.0 / 8),
        FolderState(million, false, 7, 1.0 / 30),
        FolderState(million / 10, true, 0, 1.0 / 2),
        OneEvent(),
        Reindex(1000, 100000 / scale),
        ListPage(true),
        ListPage(false),
        OneCommand(),
        ServiceStatus(),
        ProcessFind(million),
    };
    if (std::getenv("FILEINDEXCTL") != nullptr) {
        rows.push_back(ProcessCheck());
    }
    return rows;
}

}  // namespace bench
