#include "folders/media_kinds.h"
#include "names.h"
#include "no_throw.h"

#include <fileindex/folders.h>

#include <vork/text.h>

#include <algorithm>
#include <string>
#include <vector>

namespace VORK {
namespace FILEINDEX {

namespace {

using Sorted = std::vector<const Folder *>;

/// Stable, so that pages of folders with equal flags fit together, and safe whatever the platform's comparison
/// answers.
void SortByText(Sorted &folders, std::string Folder::*field) {
    std::stable_sort(folders.begin(), folders.end(), [field](const Folder *a, const Folder *b) {
        return VLIBCUnicodeUTF8StrCaseCmp((a->*field).c_str(), (b->*field).c_str()) < 0;
    });
}

void SortByFlag(Sorted &folders, bool Folder::*field) {
    std::stable_sort(folders.begin(), folders.end(),
                     [field](const Folder *a, const Folder *b) { return !(a->*field) && b->*field; });
}

void Sort(Sorted &folders, const std::string &sortBy) {
    for (const auto &[key, flag] : internal::kMediaKinds) {
        if (sortBy == key) {
            SortByFlag(folders, flag);
            return;
        }
    }
    SortByText(folders, sortBy == internal::kNameKey ? &Folder::name : &Folder::path);
}

}  // namespace

bool Folders::List(Json::Value &out, unsigned long offset, unsigned long limit, const std::string &sort_by,
                   const std::string &sort_direction, const Json::Value &additional) {
    return internal::NoThrow([&] {
        Sorted sorted;
        sorted.reserve(folders_.size());
        for (const auto &[path, folder] : folders_) {
            sorted.push_back(&folder);
        }
        Sort(sorted, sort_by);

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
    });
}

}  // namespace FILEINDEX
}  // namespace VORK
