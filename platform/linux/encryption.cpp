// Encrypted shares: directories encrypted by the file system, and encrypting file systems.
#include "base/unique_fd.h"
#include "common/failure.h"
#include "filesystem/path_mount.h"
#include "filesystem/types.h"

#include <vork/error.h>
#include <vork/share.h>

#include <fcntl.h>
#include <linux/fscrypt.h>
#include <sys/ioctl.h>
#include <sys/stat.h>

#include <algorithm>
#include <cerrno>
#include <exception>
#include <optional>
#include <string>

using namespace VORK;
using namespace VORK::PLATFORM;

namespace {

enum class State { kPlain, kUnlocked, kLocked };

// Nothing, with errno set, when the file system's answer is neither yes nor no.
std::optional<bool> HasPolicy(int fd, fscrypt_get_policy_ex_arg &policy) {
    policy.policy_size = sizeof policy.policy;
    if (ioctl(fd, FS_IOC_GET_ENCRYPTION_POLICY_EX, &policy) == 0) {
        return true;
    }
    if (errno == ENODATA || errno == EOPNOTSUPP || errno == ENOTTY) {
        return false;
    }
    return std::nullopt;
}

fscrypt_key_specifier KeyOf(const fscrypt_get_policy_ex_arg &policy) {
    fscrypt_key_specifier key{};
    if (policy.policy.version == FSCRYPT_POLICY_V2) {
        key.type = FSCRYPT_KEY_SPEC_TYPE_IDENTIFIER;
        std::copy(std::begin(policy.policy.v2.master_key_identifier),
                  std::end(policy.policy.v2.master_key_identifier), key.u.identifier);
    } else {
        key.type = FSCRYPT_KEY_SPEC_TYPE_DESCRIPTOR;
        std::copy(std::begin(policy.policy.v1.master_key_descriptor),
                  std::end(policy.policy.v1.master_key_descriptor), key.u.descriptor);
    }
    return key;
}

// A key that is being removed opens nothing new any more: locked as well.
std::optional<State> StateOfDirectory(int fd) {
    fscrypt_get_policy_ex_arg policy{};
    const std::optional<bool> hasPolicy = HasPolicy(fd, policy);
    if (!hasPolicy) {
        return std::nullopt;
    }
    if (!*hasPolicy) {
        return State::kPlain;
    }
    fscrypt_get_key_status_arg key{};
    key.key_spec = KeyOf(policy);
    if (ioctl(fd, FS_IOC_GET_ENCRYPTION_KEY_STATUS, &key) != 0) {
        return std::nullopt;
    }
    return key.status == FSCRYPT_KEY_STATUS_PRESENT ? State::kUnlocked : State::kLocked;
}

bool IsSurelyPlain(const std::string &path) {
    struct statx status {};
    return statx(AT_FDCWD, path.c_str(), AT_NO_AUTOMOUNT | AT_STATX_DONT_SYNC, 0, &status) == 0 &&
           (status.stx_attributes_mask & STATX_ATTR_ENCRYPTED) != 0 &&
           (status.stx_attributes & STATX_ATTR_ENCRYPTED) == 0;
}

std::optional<State> StateOf(const std::string &path) {
    const std::optional<PathMount> found = FindMount(path);
    if (!found) {
        return std::nullopt;
    }
    if (CodeOfType(found->mount.type) == kEncrypting) {
        return State::kUnlocked;
    }
    if (found->isRemote || IsSurelyPlain(found->path)) {
        return State::kPlain;
    }
    const UniqueFd directory = Open(found->path.c_str(), O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC);
    if (!directory) {
        return std::nullopt;
    }
    return StateOfDirectory(directory.Get());
}

template <typename Question>
int Answer(const struct _tag_VORKSHARE *share, int *answer, Question question) try {
    if (share == nullptr || share->szPath == nullptr || answer == nullptr) {
        return Fail(VORK_ERR_BAD_PARAMETER);
    }
    const std::optional<State> state = StateOf(share->szPath);
    if (!state) {
        return FailErrno(errno);
    }
    *answer = question(*state) ? 1 : 0;
    return 0;
} catch (const std::exception &) {
    return Fail(VORK_ERR_IO);
}

}  // namespace

int VLIBShareIsEncryptedGet(const struct _tag_VORKSHARE *pShare, int *pEncrypted) {
    return Answer(pShare, pEncrypted, [](State state) { return state == State::kLocked; });
}

int VLIBShareIsEncryptionGet(const struct _tag_VORKSHARE *pShare, int *pEncryption) {
    return Answer(pShare, pEncryption, [](State state) { return state != State::kPlain; });
}
