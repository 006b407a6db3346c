// The hidden metadata directories.
#include "common/failure.h"
#include "filesystem/open_directory.h"
#include "shares/share_source.h"

#include <vork/error.h>
#include <vork/metadata.h>

#include <dirent.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <sys/xattr.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstring>
#include <exception>
#include <memory>
#include <string>

using namespace VORK;
using namespace VORK::PLATFORM;

namespace {

constexpr const char *kHiddenDirectory = "@eaDir";

// Services write here, as root; everybody else may read. Users of the share must not be able to plant files that a
// service then takes for its own.
constexpr mode_t kDirectoryMode = 0755;
constexpr mode_t kOthersMayWrite = S_IWGRP | S_IWOTH;

// What a user who made the directory himself may have put there for the services to find.
constexpr const char *kServiceNames[] = {"VORK@file_index_queue", "VORK@file_index_queue.tmp",
                                         "VORK@.fileindexdb"};

bool BelongsToRootAlone(const struct stat &status) {
    return status.st_uid == 0 && (status.st_mode & kOthersMayWrite) == 0;
}

bool IsEmpty(int directory) {
    const NoCancellation guard;
    const std::unique_ptr<DIR, int (*)(DIR *)> entries(
        fdopendir(openat(directory, ".", O_RDONLY | O_DIRECTORY | O_CLOEXEC)), closedir);
    int count = 0;
    while (entries && readdir(entries.get()) != nullptr) {
        ++count;
    }
    return count == 2;  // "." and ".."
}

// Of root's own, which others may write to, that right is taken. What belongs to somebody else gets another name,
// and keeps owner and mode: made root's it could be read by whoever moved it here, and the services would believe
// it.
void KeepFromServices(int directory, const char *name) {
    constexpr int kMostNames = 1000;
    const UniqueFd entry = OpenAt(directory, name, O_RDONLY | O_NOFOLLOW | O_NONBLOCK | O_NOCTTY | O_CLOEXEC);
    struct stat status {};
    if (entry && fstat(entry.Get(), &status) == 0 && status.st_uid == 0) {
        if (S_ISDIR(status.st_mode) || status.st_nlink == 1) {
            fchmod(entry.Get(), status.st_mode & ~kOthersMayWrite);
        }
        return;
    }
    for (int number = 1; number <= kMostNames; ++number) {
        const std::string aside = std::string(name) + ".foreign-" + std::to_string(number);
        if (renameat2(directory, name, directory, aside.c_str(), RENAME_NOREPLACE) == 0 || errno != EEXIST) {
            return;
        }
    }
}

// The owner first: until then the former one may change the mode back. Then what lies in it: nothing can be put
// there any more. The mode only loses bits, for the directory may be another user's, moved here by one who could
// not look into it.
bool TakeOver(int directory, const struct stat &status) {
    if (fchown(directory, 0, 0) != 0 || fchmod(directory, status.st_mode & kDirectoryMode) != 0) {
        return false;
    }
    // One handed down by the share would let users write into the directories that are made in this one.
    fremovexattr(directory, "system.posix_acl_default");
    for (const char *name : kServiceNames) {
        KeepFromServices(directory, name);
    }
    return true;
}

int MakeAsRoot(int parent, const char *name) {
    const bool isNew = mkdirat(parent, name, kDirectoryMode) == 0;
    if (!isNew && errno != EEXIST) {
        return FailErrno(errno);
    }
    const UniqueFd directory = OpenAt(parent, name, O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC);
    if (!directory) {
        return errno == ENOTDIR || errno == ELOOP ? Fail(VORK_ERR_EXISTS) : FailErrno(errno);
    }
    struct stat status {};
    if (fstat(directory.Get(), &status) != 0) {
        return FailErrno(errno);
    }
    // A new one has a mode that the umask has cut, and the group of the share. It is looked at once more: another
    // may have taken its place by now.
    if (isNew && status.st_uid == 0 && IsEmpty(directory.Get())) {
        status.st_mode |= kDirectoryMode;
    } else if (BelongsToRootAlone(status)) {
        return 0;
    }
    return TakeOver(directory.Get(), status) ? 0 : FailErrno(errno);
}

int LookAsUser(int parent, const char *name) {
    struct stat status {};
    if (fstatat(parent, name, &status, AT_SYMLINK_NOFOLLOW) == 0) {
        return S_ISDIR(status.st_mode) ? 0 : Fail(VORK_ERR_EXISTS);
    }
    return errno == ENOENT ? Fail(VORK_ERR_ACCESS) : FailErrno(errno);
}

}  // namespace

int VORKEAIsHiddenDir(const char *szName) {
    return szName != nullptr && std::strcmp(szName, kHiddenDirectory) == 0 ? 1 : 0;
}

int VORKEAMKDir(int flags, const char *szPath) try {
    if (flags != 0 || szPath == nullptr || szPath[0] != '/') {
        return Fail(VORK_ERR_BAD_PARAMETER);
    }
    const DirectoryAndName place(szPath);
    if (!IsComponent(place.name)) {
        return Fail(VORK_ERR_BAD_PARAMETER);
    }
    const UniqueFd parent = OpenDirectory(*Shares().Current().table, place.directory);
    if (!parent) {
        return FailErrno(errno);
    }
    return geteuid() == 0 ? MakeAsRoot(parent.Get(), place.name.c_str())
                          : LookAsUser(parent.Get(), place.name.c_str());
} catch (const std::exception &) {
    return Fail(VORK_ERR_IO);
}
