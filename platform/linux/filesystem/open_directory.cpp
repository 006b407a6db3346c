#include "filesystem/open_directory.h"

#include <fcntl.h>

#include <algorithm>
#include <cerrno>
#include <string_view>

namespace VORK::PLATFORM {

namespace {

UniqueFd OpenIn(int directory, const std::string &path) {
    return OpenAt(directory, path.c_str(), O_PATH | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC);
}

}  // namespace

DirectoryAndName::DirectoryAndName(const std::string &path) {
    const size_t slash = path.rfind('/');
    directory = path.substr(0, std::max<size_t>(slash, 1));
    name = path.substr(slash + 1);
}

UniqueFd OpenDirectory(const ShareTable &shares, const std::string &path) {
    const std::vector<const Share *> holding = shares.AllHolding(path);
    const std::string &start = holding.empty() ? path : holding.front()->path;
    UniqueFd directory = OpenIn(AT_FDCWD, start);
    std::string_view left = std::string_view(path).substr(start.size());
    while (directory && !left.empty()) {
        left.remove_prefix(1);
        const std::string_view component = left.substr(0, left.find('/'));
        if (!IsComponent(component)) {
            errno = EINVAL;
            return UniqueFd();
        }
        directory = OpenIn(directory.Get(), std::string(component));
        left.remove_prefix(component.size());
    }
    return directory;
}

}  // namespace VORK::PLATFORM
