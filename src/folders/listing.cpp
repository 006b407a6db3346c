#include "names.h"

#include <fileindex/folders.h>

#include <vork/text.h>

#include <algorithm>
#include <functional>

namespace VORK {
namespace FILEINDEX {

namespace {

using Order = std::function<bool(const Folder *, const Folder *)>;

Order ByText(std::string Folder::*field) {
    return [field](const Folder *a, const Folder *b) {
        return VLIBCUnicodeUTF8StrCaseCmp((a->*field).c_str(), (b->*field).c_str()) < 0;
    };
}

Order ByFlag(bool Folder::*field) {
    return [field](const Folder *a, const Folder *b) { return !(a->*field) && b->*field; };
}

Order OrderOf(const std::string &sortBy) {
    const struct {
        const char *key;
        Order order;
    } orders[] = {
        {"name", ByText(&Folder::name)},   {"document", ByFlag(&Folder::document)},
        {"audio", ByFlag(&Folder::audio)}, {"video", ByFlag(&Folder::video)},
        {"photo", ByFlag(&Folder::photo)},
    };
    for (const auto &known : orders) {
        if (sortBy == known.key) {
            return known.order;
        }
    }
    return ByText(&Folder::path);
}

}  // namespace

bool Folders::List(Json::Value &out, unsigned long offset, unsigned long limit, const std::string &sort_by,
                   const std::string &sort_direction, const Json::Value &additional) {
    std::vector<const Folder *> sorted;
    sorted.reserve(folders_.size());
    for (const auto &[path, folder] : folders_) {
        sorted.push_back(&folder);
    }
    // Stable, so that pages of folders with equal flags fit together, and safe whatever the platform's
    // comparison answers.
    std::stable_sort(sorted.begin(), sorted.end(), OrderOf(sort_by));

    const unsigned long total = sorted.size();
    const unsigned long count = offset > total ? 0 : std::min(total - offset, limit);
    Json::Value page(Json::arrayValue);
    if (sort_direction == "DESC") {
        // Counted from the start, whatever the offset: user interfaces rely on it for their last page.
        for (unsigned long i = count; i-- > 0;) {
            page.append(sorted[i]->asJson(additional));
        }
    } else {
        for (unsigned long i = offset; i < offset + count; ++i) {
            page.append(sorted[i]->asJson(additional));
        }
    }
    Json::Value result(Json::objectValue);
    result["total"] = static_cast<Json::Int>(total);
    result["offset"] = static_cast<Json::UInt64>(offset);
    result["folder"] = std::move(page);
    out = std::move(result);
    return true;
}

}  // namespace FILEINDEX
}  // namespace VORK
