#include "queue.h"

#include "paths.h"
#include "queue_files.h"

namespace fileindexctl {

unsigned long Backlog::Total() const {
    unsigned long total = 0;
    for (const auto &[type, count] : events) {
        total += count;
    }
    return total;
}

std::optional<Backlog> ReadBacklog(const std::string &share, const std::string &below) {
    const std::string path = QueuePathOf(share);
    if (path.empty()) {
        return std::nullopt;
    }
    QueueFiles files(path);
    Backlog backlog;
    backlog.hasTemporary = files.IsTaken();
    backlog.oldest = files.Oldest();
    files.Visit([&](const QueueEvent *event) {
        if (event == nullptr) {
            ++backlog.malformed;
        } else if (below.empty() || LiesIn(event->path, below) || LiesIn(event->oldPath, below)) {
            ++backlog.events[event->type];
        }
    });
    return backlog;
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
        case kSettingsEvent:
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
        (type == kReindexEvent ? reindex : type == kSettingsEvent ? settings : files) += count;
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

}  // namespace fileindexctl
