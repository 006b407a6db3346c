#include "support.h"

#include "names.h"
#include "scoped.h"
#include "support/platform.h"
#include "support/script.h"
#include "support/syslog_capture.h"

#include <fcntl.h>
#include <sys/file.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iterator>

namespace fileindex_fuzz {

namespace {

using VORK::FILEINDEX::internal::UniqueFd;
namespace names = VORK::FILEINDEX::internal;

void RequireFree(const char *lockFile) {
    const UniqueFd fd(open(lockFile, O_RDWR | O_CLOEXEC));
    Require(!fd || flock(fd.Get(), LOCK_EX | LOCK_NB) == 0, "a lock is still held", lockFile);
}

}  // namespace

void Require(bool holds, const char *what, std::string_view about) {
    if (holds) {
        return;
    }
    std::fprintf(stderr, "FAILED: %s\n", what);
    if (!about.empty()) {
        std::fprintf(stderr, "about: %.*s\n", static_cast<int>(about.size()), about.data());
    }
    std::abort();
}

std::string ReadWhole(const std::string &path) {
    std::ifstream file(path, std::ios::binary);
    return {std::istreambuf_iterator<char>(file), {}};
}

void WriteWhole(const std::string &path, std::string_view text) {
    std::ofstream file(path, std::ios::binary | std::ios::trunc);
    file.write(text.data(), static_cast<std::streamsize>(text.size()));
    file.close();
    Require(file.good(), "cannot write; not run in its own file system?", path);
}

std::string QueueOf(const std::string &share) {
    return "/vol1/" + share + "/" + names::kMetadataDir + "/" + names::kQueueFile;
}

void ForgetCalls() {
    fileindex_test::Script::Current().Reset();
    fileindex_test::SyslogCapture::Clear();
}

void ResetMachine() {
    ForgetCalls();
    auto &platform = fileindex_test::Platform::Current();
    platform = {};
    platform.searchOn = true;
    platform.recycleBins = {"/vol1/a/#recycle"};
    platform.snapshots = {"/vol1/a/#snapshot"};
    for (const char *share : kShares) {
        platform.shares[share] = {.path = std::string("/vol1/") + share,
                                  .readOnly = std::string_view(share) == "ro"};
    }
    std::remove(names::kFolderConf);
    std::remove(names::kStatusConf);
    for (const std::string share : kShares) {
        std::remove(QueueOf(share).c_str());
        std::remove((QueueOf(share) + names::kQueueTmpSuffix).c_str());
        std::filesystem::create_directories("/vol1/" + share + "/d/e");
    }
    TakeCommands();
}

LeakCheck::LeakCheck() : lowest_free_(UniqueFd(dup(0)).Get()) {}

LeakCheck::~LeakCheck() {
    Require(UniqueFd(dup(0)).Get() == lowest_free_, "a descriptor is left open");
    RequireFree(names::kFolderLock);
    RequireFree(names::kStatusLock);
}

}  // namespace fileindex_fuzz
