#include "shares/share_table.h"

#include "base/has_nul.h"

#include <vork/error.h>

#include <climits>
#include <utility>

namespace VORK::PLATFORM {

namespace {

// Lookups compare bytes, so a directory written in any other way than the kernel would is never found.
bool IsPlainAbsolutePath(std::string_view path) {
    if (path.empty() || path.front() != '/' || path.size() >= PATH_MAX) {
        return false;
    }
    while (!path.empty()) {
        path.remove_prefix(1);
        const std::string_view component = path.substr(0, path.find('/'));
        if (!IsComponent(component)) {
            return false;
        }
        path.remove_prefix(component.size());
    }
    return true;
}

int WhyRefused(const Share &share) {
    if (!IsComponent(share.name)) {
        return VORK_ERR_BAD_PARAMETER;
    }
    if (!IsPlainAbsolutePath(share.path)) {
        return VORK_ERR_MALFORMED;
    }
    // Full paths are built as the directory above the share's, plus the share's name.
    const bool named = share.path.substr(share.path.rfind('/') + 1) == share.name;
    return named ? 0 : VORK_ERR_SHARE_DIRECTORY_NAME;
}

}  // namespace

bool IsComponent(std::string_view text) {
    return !text.empty() && text != "." && text != ".." && text.find('/') == text.npos && !HasNul(text);
}

void ShareTable::Add(Share share) {
    while (share.path.size() > 1 && share.path.back() == '/') {
        share.path.pop_back();
    }
    const int error = WhyRefused(share);
    if (error != 0) {
        Refuse(share.name, error);
        return;
    }
    const auto [position, isNew] = byName_.try_emplace(share.name, std::move(share));
    if (isNew) {
        byPath_.emplace(position->second.path, &position->second);
    }
}

void ShareTable::Refuse(const std::string &name, int error) {
    refused_.emplace(name, error);
}

const Share *ShareTable::Find(const std::string &name) const {
    const auto found = byName_.find(name);
    return found == byName_.end() ? nullptr : &found->second;
}

int ShareTable::WhyNot(const std::string &name) const {
    const auto found = refused_.find(name);
    return found == refused_.end() ? VORK_ERR_NO_SUCH_SHARE : found->second;
}

const Share *ShareTable::Holding(std::string_view fullPath) const {
    const std::vector<const Share *> all = AllHolding(fullPath);
    return all.empty() ? nullptr : all.back();
}

std::vector<const Share *> ShareTable::AllHolding(std::string_view fullPath) const {
    std::vector<const Share *> holding;
    for (size_t end = 0; end < fullPath.size();) {
        end = fullPath.find('/', end + 1);
        if (end == fullPath.npos) {
            end = fullPath.size();
        }
        const auto found = byPath_.find(fullPath.substr(0, end));
        if (found != byPath_.end()) {
            holding.push_back(found->second);
        }
    }
    return holding;
}

}  // namespace VORK::PLATFORM
