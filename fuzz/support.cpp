#include "checks.h"
#include "names.h"
#include "support/fake_daemon.h"
#include "support/platform.h"
#include "support/script.h"
#include "support/syslog_capture.h"

#include <sys/socket.h>

#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <optional>
#include <utility>

namespace fileindex_fuzz {

namespace {

namespace names = VORK::FILEINDEX::internal;
using fileindex_test::FakeDaemon;

/// The library's end of the last connection.
int &LastConnection() {
    static int fd = -1;
    return fd;
}

}  // namespace

void Require(bool holds, const char *what, std::string_view about) {
    if (!holds) {
        std::fprintf(stderr, "FAILED: %s\nabout: %.*s\n", what, static_cast<int>(about.size()), about.data());
        std::abort();
    }
}

std::string ReadWhole(const std::string &path) {
    std::ifstream file(path, std::ios::binary);
    return {std::istreambuf_iterator<char>(file), {}};
}

void WriteWhole(const std::string &path, std::string_view text) {
    std::ofstream file(path, std::ios::binary | std::ios::trunc);
    file << text << std::flush;
    Require(file.good(), "cannot write; not run in its own file system?", path);
}

std::string ShareOf(const std::string &path) {
    return path.empty() ? path : path.substr(1, path.find('/', 1) - 1);
}

std::string QueueOf(const std::string &share) {
    return "/vol1/" + share + "/" + names::kMetadataDir + "/" + names::kQueueFile;
}

void ResetMachine() {
    fileindex_test::Script::Current().Reset();
    fileindex_test::SyslogCapture::Clear();
    auto &platform = fileindex_test::Platform::Current();
    platform = {};
    platform.searchOn = true;
    platform.recycleBins = {"/vol1/a/#recycle"};
    platform.snapshots = {"/vol1/a/#snapshot"};
    std::remove(names::kFolderConf);
    std::remove(names::kStatusConf);
    for (const std::string share : kShares) {
        platform.shares[share] = {.path = "/vol1/" + share, .readOnly = share == "ro"};
        std::filesystem::remove_all("/vol1/" + share + "/" + names::kMetadataDir);
        std::filesystem::create_directories("/vol1/" + share + "/d/e");
    }
    TakeCommands();
}

std::string TakeCommands() {
    static std::optional<FakeDaemon> daemon(std::in_place);
    FakeDaemon::Closed(LastConnection());
    std::string commands;
    for (const std::string &effect : fileindex_test::Script::Current().Journal()) {
        Require(!effect.starts_with("command malformed"), "not a command's frame", effect);
        commands += effect.starts_with("command ") ? effect.substr(effect.find(' ') + 1) + '\n' : "";
    }
    fileindex_test::Script::Current().ClearJournal();
    daemon.emplace().Start();
    return commands;
}

}  // namespace fileindex_fuzz

extern "C" int connect(int fd, const sockaddr *address, socklen_t) {
    fileindex_test::FakeDaemon::Closed(std::exchange(fileindex_fuzz::LastConnection(), fd));
    return fileindex_test::FakeDaemon::Connect(fd, address);
}
