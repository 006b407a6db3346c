#include "facts/queue.h"

#include "facts/paths.h"
#include "facts/queue_files.h"

#include <algorithm>
#include <functional>
#include <set>
#include <string_view>

namespace VORK::FILEINDEXCTL {

unsigned long Backlog::Total() const {
    unsigned long total = 0;
    for (const auto &[type, count] : events) {
        total += count;
    }
    return total;
}

namespace {

// Which of many places an event belongs to: looked up by each directory above it, so that a long queue and many
// folders do not multiply.
class PlaceIndex {
public:
    explicit PlaceIndex(const std::vector<std::string> &places) {
        for (std::size_t i = 0; i < places.size(); ++i) {
            byPath_.emplace(places[i], i);
        }
    }

    std::set<std::size_t> Of(const QueueEvent &event) const {
        std::set<std::size_t> found;
        AddAbove(event.path, found);
        AddAbove(event.oldPath, found);
        return found;
    }

private:
    void AddAbove(std::string_view path, std::set<std::size_t> &found) const {
        for (bool isLast = false; !isLast;) {
            isLast = path.empty();
            const auto [first, last] = byPath_.equal_range(path);
            std::for_each(first, last, [&](const auto &place) { found.insert(place.second); });
            path = path.substr(0, std::min(path.rfind('/'), path.size()));
        }
    }

    std::multimap<std::string, std::size_t, std::less<>> byPath_;
};

}  // namespace

std::vector<Backlog> ReadBacklogs(const std::string &share, const std::vector<std::string> &places) {
    const std::string path = QueuePathOf(share);
    if (path.empty()) {
        return {};
    }
    QueueFiles files(path);
    const PlaceIndex index(places);
    std::vector<Backlog> backlogs(places.size());
    for (auto &backlog : backlogs) {
        backlog.hasTemporary = files.IsTaken();
        backlog.oldest = files.Oldest();
    }
    unsigned long malformed = 0;
    files.Visit([&](const QueueEvent *event) {
        if (event == nullptr) {
            ++malformed;
            return;
        }
        for (const std::size_t i : index.Of(*event)) {
            ++backlogs[i].events[event->type];
            ++backlogs[i].files[files.Identity()];
            backlogs[i].taken += files.IsAtTaken() ? 1 : 0;
        }
    });
    for (auto &backlog : backlogs) {
        backlog.malformed = malformed;
    }
    return backlogs;
}

std::optional<Backlog> ReadBacklog(const std::string &share, const std::string &below) {
    const auto backlogs = ReadBacklogs(share, {below});
    return backlogs.empty() ? std::nullopt : std::optional<Backlog>(backlogs.front());
}

bool IsReindexQueued(const std::string &share, const std::string &fullPath) {
    bool found = false;
    QueueFiles(QueuePathOf(share)).Visit([&](const QueueEvent *event) {
        found = found || (event != nullptr && event->type == kReindexEvent && event->path == fullPath);
    });
    return found;
}

std::string EventName(unsigned type) {
    switch (type) {
        case kRenameEvent:
            return "rename";
        case kReindexEvent:
            return "reindex";
        case kSettingEvent:
            return "settings";
        default:
            return std::to_string(type);
    }
}

Json::Value BacklogJson(const Backlog &backlog) {
    Json::Value result(Json::objectValue);
    result["total"] = static_cast<Json::UInt64>(backlog.Total());
    result["malformed"] = static_cast<Json::UInt64>(backlog.malformed);
    result["tmp"] = backlog.hasTemporary;
    result["oldest"] = backlog.oldest ? Json::Value(static_cast<Json::Int64>(*backlog.oldest)) : Json::Value();
    result["events"] = Json::Value(Json::objectValue);
    for (const auto &[type, count] : backlog.events) {
        result["events"][std::to_string(type)] = static_cast<Json::UInt64>(count);
    }
    return result;
}

std::string BacklogText(const Backlog &backlog) {
    unsigned long reindex = 0;
    unsigned long settings = 0;
    unsigned long files = 0;
    for (const auto &[type, count] : backlog.events) {
        (type == kReindexEvent ? reindex : type == kSettingEvent ? settings : files) += count;
    }
    std::string text;
    const auto add = [&](unsigned long count, const char *what) {
        if (count > 0) {
            text += (text.empty() ? "" : ", ") + std::to_string(count) + what;
        }
    };
    add(reindex, " reindex");
    add(settings, " settings");
    add(files, " files");
    add(backlog.malformed, " malformed");
    return text.empty() ? "nothing" : text;
}

}  // namespace VORK::FILEINDEXCTL
