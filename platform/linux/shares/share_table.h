/// \file
/// The shares as they were at one moment, ready for lookups by name and by path.
#pragma once

#include <string>
#include <string_view>
#include <unordered_map>
#include <vector>

namespace VORK::PLATFORM {

struct Share {
    std::string name;
    std::string path;      ///< absolute, no trailing "/"
    std::string recycle;   ///< the recycle bin, relative to the path; empty: none
    std::string snapshot;  ///< the directory that shows snapshots, relative to the path; empty: none
};

class ShareTable {
public:
    /// Takes the share in, or remembers why lookups of its name are to be refused.
    void Add(Share share);

    /// Remembers a share that cannot be handed out, with the platform error that tells why.
    void Refuse(const std::string &name, int error);

    /// Null when there is no such share or it was refused.
    const Share *Find(const std::string &name) const;

    /// The platform error for a name that Find does not know.
    int WhyNot(const std::string &name) const;

    /// The innermost share whose directory is the path or lies above it; null when none does.
    const Share *Holding(std::string_view fullPath) const;

    /// All shares whose directory is the path or lies above it, outermost first.
    std::vector<const Share *> AllHolding(std::string_view fullPath) const;

private:
    std::unordered_map<std::string, Share> byName_;
    std::unordered_map<std::string_view, const Share *> byPath_;  // the keys live in byName_, whose nodes stay put
    std::unordered_map<std::string, int> refused_;
};

/// Whether the text can be one component of a path.
bool IsComponent(std::string_view text);

}  // namespace VORK::PLATFORM
