#include "rows/support.h"

#include "base/metadata_entry.h"
#include "base/queue/event.h"

#include <fcntl.h>
#include <unistd.h>

#include <stdexcept>

namespace bench {

void Require(bool condition, const char *what) {
    if (!condition) {
        throw std::runtime_error(what);
    }
}

std::string FullPath(const std::string &sharePath) {
    return kVolume + sharePath;
}

void ReadBytes(const std::string &path) {
    static std::vector<char> block(128 * 1024);
    const int fd = open(path.c_str(), O_RDONLY | O_CLOEXEC);
    while (read(fd, block.data(), block.size()) > 0) {
    }
    close(fd);
}

void ReadEvents(const std::string &queue) {
    struct stat status = {};
    VORK::QueueLines lines(VORK::MetadataEntry(queue).OpenFile(O_RDONLY, status));
    VORK::QueueEventReader reader;
    for (VORK::QueueLine line; lines.Next(line);) {
        (void)reader.Read(line);
    }
}

}  // namespace bench
