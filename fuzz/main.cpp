// One program for all targets. Built for the fuzzer it feeds the one that FUZZ_TARGET names in the environment;
// otherwise each of them, "fuzz COUNT", with so many random inputs.
#include "base/unique_fd.h"
#include "checks.h"
#include "names.h"
#include "support/fake_daemon.h"
#include "support/platform.h"
#include "support/script.h"
#include "support/syslog_capture.h"

#include <fcntl.h>
#include <sys/file.h>
#include <sys/socket.h>
#include <unistd.h>

#include <algorithm>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iostream>
#include <iterator>
#include <map>
#include <optional>
#include <random>
#include <utility>

namespace fileindex_fuzz {

namespace {

namespace names = VORK::FILEINDEX::internal;
using fileindex_test::FakeDaemon;
using fileindex_test::Script;
using VORK::UniqueFd;

const std::map<std::string, Target *> kTargets = {
    {"readers", FeedReaders}, {"queue", FeedQueue},           {"documents", FeedDocuments},
    {"paths", FeedPaths},     {"operations", FeedOperations},
};

/// The library's end of the last connection.
int lastConnection = -1;

/// Forgets earlier inputs: what the platform and the log have kept, the configuration files, the shares' queues.
void ResetMachine() {
    Script::Current().Reset();
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

void Feed(Target target, std::string_view bytes) {
    ResetMachine();
    const int lowestFree = UniqueFd(dup(0)).Get();
    Input input(bytes);
    target(input);
    TakeCommands();
    Require(UniqueFd(dup(0)).Get() == lowestFree, "a descriptor is left open");
    for (const char *lockFile : {names::kFolderLock, names::kStatusLock}) {
        const UniqueFd fd(open(lockFile, O_RDWR | O_CLOEXEC));
        Require(!fd || flock(fd.Get(), LOCK_EX | LOCK_NB) == 0, "a lock is still held", lockFile);
    }
}

}  // namespace

void Require(bool holds, const char *what, std::string_view about) {
    if (!holds) {
        std::cerr << "FAILED: " << what << "\nabout: " << about << std::endl;
        std::abort();
    }
}

std::string ReadWhole(const std::string &path) {
    std::ifstream file(path, std::ios::binary);
    return {std::istreambuf_iterator<char>(file), {}};
}

void WriteWhole(const std::string &path, std::string_view text) {
    const bool written = static_cast<bool>(std::ofstream(path, std::ios::binary) << text << std::flush);
    Require(written, "cannot write; not run in its own file system?", path);
}

std::string ShareOf(const std::string &path) {
    return path.empty() ? path : path.substr(1, path.find('/', 1) - 1);
}

bool IsKnown(const std::string &path) {
    return std::count(std::begin(kShares), std::end(kShares), ShareOf(path)) > 0;
}

std::string QueueOf(const std::string &share) {
    return "/vol1/" + share + "/" + names::kMetadataDir + "/" + names::kQueueFile;
}

std::string TakeCommands() {
    static std::optional<FakeDaemon> daemon(std::in_place);
    FakeDaemon::Closed(lastConnection);
    std::string commands;
    for (const std::string &effect : Script::Current().Journal()) {
        Require(!effect.starts_with("command malformed"), "not a command's frame", effect);
        commands += effect.starts_with("command ") ? effect.substr(effect.find(' ') + 1) + '\n' : "";
    }
    Script::Current().ClearJournal();
    daemon.emplace().Start();
    return commands;
}

}  // namespace fileindex_fuzz

extern "C" int connect(int fd, const sockaddr *address, socklen_t) {
    fileindex_test::FakeDaemon::Closed(std::exchange(fileindex_fuzz::lastConnection, fd));
    return fileindex_test::FakeDaemon::Connect(fd, address);
}

#ifdef FUZZER

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size) {
    static fileindex_fuzz::Target *const target = fileindex_fuzz::kTargets.at(std::getenv("FUZZ_TARGET"));
    fileindex_fuzz::Feed(target, {reinterpret_cast<const char *>(data), size});
    return 0;
}

#else

int main(int argc, char **argv) {
    const unsigned long count = argc > 1 ? std::stoul(argv[1]) : 1;
    for (const auto &[name, target] : fileindex_fuzz::kTargets) {
        std::mt19937 random(1);
        for (unsigned long i = 0; i < count; ++i) {
            std::string bytes(random() % 512, '\0');
            std::generate(bytes.begin(), bytes.end(), [&random] { return static_cast<char>(random()); });
            fileindex_fuzz::Feed(target, bytes);
        }
        std::printf("%lu inputs for %s\n", count, name.c_str());
    }
    return 0;
}

#endif
