#include "utils/queue_file.h"

#include "json/text.h"
#include "names.h"
#include "scoped.h"

#include <fileindex/json_access.h>

#include <json/value.h>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <optional>
#include <vector>

namespace VORK::FILEINDEX::internal {

namespace {

constexpr std::size_t kBlockSize = 64 * 1024;
constexpr std::size_t kMaxLine = 1024 * 1024;  // longer than any record; a file without newlines is no queue
constexpr std::size_t kShownOfLongLine = 256;

UniqueFd OpenRegular(const std::string &path) {
    UniqueFd fd(open(path.c_str(), O_RDONLY | O_NOFOLLOW | O_NONBLOCK | O_CLOEXEC));
    struct stat status = {};
    if (!fd || fstat(fd.Get(), &status) != 0) {
        return {};
    }
    if (!S_ISREG(status.st_mode)) {
        fd.Close();
        errno = EINVAL;
        return {};
    }
    return fd;
}

std::optional<QueueEvent> ParseEvent(const JsonReader &reader, std::string_view line) {
    Json::Value record;
    QueueEvent event;
    if (!reader.Parse(line, record) || !RetrieveStringFromJsonObj(event.path, kPathKey, record) ||
        !record.isMember(kEventKey) || !record[kEventKey].isConvertibleTo(Json::uintValue)) {
        return std::nullopt;
    }
    event.type = record[kEventKey].asUInt();
    if (event.type == kRenameEvent) {
        RetrieveStringFromJsonObj(event.oldPath, kOldPathKey, record);
    }
    return event;
}

/// Cuts blocks into lines; a line may lie across blocks.
class LineCutter {
public:
    explicit LineCutter(const QueueVisitor &visit) : visit_(visit) {}

    /// False when the visitor has seen enough.
    bool Feed(std::string_view block) {
        while (!block.empty()) {
            const std::size_t end = block.find('\n');
            if (end == std::string_view::npos) {
                Keep(block);
                return true;
            }
            Keep(block.substr(0, end));
            if (!EndLine()) {
                return false;
            }
            block.remove_prefix(end + 1);
        }
        return true;
    }

    /// The last line may lack its newline.
    void Finish() {
        if (!line_.empty() || too_long_) {
            EndLine();
        }
    }

private:
    void Keep(std::string_view part) {
        if (too_long_) {
            return;
        }
        if (line_.size() + part.size() > kMaxLine) {
            too_long_ = true;
            line_.append(part.substr(0, kShownOfLongLine));
            line_.resize(kShownOfLongLine);
            line_.shrink_to_fit();
            return;
        }
        line_.append(part);
    }

    bool EndLine() {
        const std::optional<QueueEvent> event = too_long_ ? std::nullopt : ParseEvent(reader_, line_);
        const bool goOn = visit_(line_, event ? &*event : nullptr);
        line_.clear();
        too_long_ = false;
        return goOn;
    }

    const QueueVisitor &visit_;
    JsonReader reader_;
    std::string line_;
    bool too_long_ = false;
};

}  // namespace

bool ScanQueue(const std::string &queueFile, const QueueVisitor &visit) {
    const UniqueFd fd = OpenRegular(queueFile);
    if (!fd) {
        return false;
    }
    LineCutter lines(visit);
    std::vector<char> block(kBlockSize);
    for (;;) {
        const ssize_t count = read(fd.Get(), block.data(), block.size());
        if (count < 0 && errno == EINTR) {
            continue;
        }
        if (count <= 0) {
            lines.Finish();
            return true;
        }
        if (!lines.Feed({block.data(), static_cast<std::size_t>(count)})) {
            return true;
        }
    }
}

}  // namespace VORK::FILEINDEX::internal
