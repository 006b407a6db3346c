// A platform that answers at once from a fixed rule: a share named S is at /tmp/bench/S. What is left to measure
// is the library.

#include <vork/filesystem.h>
#include <vork/metadata.h>
#include <vork/share.h>

#include <cstdlib>
#include <cstring>
#include <new>
#include <string>

namespace {

constexpr char kVolume[] = "/tmp/bench/";
constexpr std::size_t kVolumeLength = sizeof(kVolume) - 1;

struct Record : _tag_VORKSHARE {
    char name[64];
    char path[96];
};

}  // namespace

int VORKShareGet(const char *szName, _tag_VORKSHARE **ppShare) {
    const std::size_t length = std::strlen(szName);
    if (length == 0 || length >= sizeof(Record::name)) {
        return -1;
    }
    auto *record = new (std::nothrow) Record();
    if (record == nullptr) {
        return -1;
    }
    std::memcpy(record->name, szName, length + 1);
    std::memcpy(record->path, kVolume, kVolumeLength);
    std::memcpy(record->path + kVolumeLength, szName, length + 1);
    record->szName = record->name;
    record->szPath = record->path;
    *ppShare = record;
    return 0;
}

void VORKShareFree(_tag_VORKSHARE *pShare) {
    delete static_cast<Record *>(pShare);
}

int VORKShareNamePathGet(const char *szFullPath, char *szName, int cbName, char *szPath, int cbPath) {
    if (std::strncmp(szFullPath, kVolume, kVolumeLength) != 0) {
        return -1;
    }
    const char *name = szFullPath + kVolumeLength;
    const std::size_t length = std::strcspn(name, "/");
    if (static_cast<int>(length) >= cbName || static_cast<int>(kVolumeLength + length) >= cbPath) {
        return -1;
    }
    std::memcpy(szName, name, length);
    szName[length] = '\0';
    std::memcpy(szPath, szFullPath, kVolumeLength + length);
    szPath[kVolumeLength + length] = '\0';
    return 0;
}

int VLIBShareIsEncryptedGet(const _tag_VORKSHARE *, int *pEncrypted) {
    return *pEncrypted = 0;
}
int VLIBShareIsReadOnlyGet(const _tag_VORKSHARE *, int *pReadOnly) {
    return *pReadOnly = 0;
}
int VORKGetFSType(const char *, int) {
    return 1;
}
int VORKFSIsRemoteFS(int) {
    return 0;
}
int VORKFSIsImageFS(int) {
    return 0;
}
int VORKFSDirIsMntPoint(const char *) {
    return 0;
}
int VORKEAMKDir(int, const char *) {
    return 0;
}
