#include "base/json/text.h"
#include "baseline.h"
#include "peer.h"
#include "rows/support.h"

#include <fileindex/daemon.h>
#include <fileindex/status_mgr.h>

#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/un.h>
#include <unistd.h>

#include <climits>
#include <csignal>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <memory>

namespace bench {

namespace {

using VORK::ToString;
using VORK::FILEINDEX::StatusMgr;

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

Row ServiceStatus(std::size_t folders, std::size_t shares) {
    const auto paths = SharePaths(folders, shares);
    const auto prepare = [=] {
        WriteFolderConf(paths);
        for (const std::string &path : paths) {
            std::filesystem::create_directories(FullPath(path));
        }
        for (std::size_t share = 0; share < shares; ++share) {
            std::filesystem::remove(QueuePath("share" + std::to_string(share)));
        }
    };
    Row row;
    row.name = "GetStatus/" + std::to_string(folders) + " folders in " + std::to_string(shares) + " shares";
    row.library = [=] {
        prepare();
        return [] {
            std::string status;
            Require(StatusMgr::GetStatus(status) && status == "finished", "status");
        };
    };
    row.floor = [=] {
        prepare();
        return [=] {
            struct stat status = {};
            lstat(kFolderConf, &status);
            ReadBytes(kFolderConf);
            char resolved[PATH_MAX];
            for (const std::string &path : paths) {
                Require(realpath(FullPath(path).c_str(), resolved) != nullptr, "realpath");
            }
            for (std::size_t share = 0; share < shares; ++share) {
                const std::string queue = std::string(kVolume) + "/share" + std::to_string(share) + "/queue";
                lstat(queue.c_str(), &status);
                lstat((queue + ".tmp").c_str(), &status);
            }
        };
    };
    row.mostOfFloor = 2;
    return row;
}

}  // namespace

std::vector<Row> ServiceRows() {
    return {OneCommand(), ServiceStatus(100, 10), ServiceStatus(1000, 10), ServiceStatus(1000, 100)};
}

}  // namespace bench
