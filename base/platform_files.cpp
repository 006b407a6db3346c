#include "base/platform_files.h"

#include <algorithm>

namespace VORK {

bool HoldsRegistrations(const Json::Value &document) {
    const auto isRegistration = [](const Json::Value &entry) {
        return entry.isObject() && entry["queue"].isString() && entry["name"].isString();
    };
    if (!document.isObject() || !document[kRegistrationsKey].isArray()) {
        return false;
    }
    const Json::Value &list = document[kRegistrationsKey];
    return std::all_of(list.begin(), list.end(), isRegistration);
}

}  // namespace VORK
