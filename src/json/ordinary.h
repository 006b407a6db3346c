/// \file
/// A fast reader for ordinary JSON: what this library and the other writers of its files really write.
///
/// It decides only what it is sure of and leaves everything else to JsonReader, so that its answers are never
/// different: members that are unsorted or of unusual types, extreme reals, deep nesting, escaped surrogates, text
/// that is not UTF-8 or not JSON at all. A differential fuzz target keeps the two in step.
#pragma once

#include <cstddef>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

namespace VORK::FILEINDEX::internal {

/// A member of folder.conf. The views live as long as the reader is not used again.
struct FolderRecord {
    std::string_view path;  ///< the member's name
    std::string_view name;
    bool hasName = false;
    bool hasFlag[4] = {};  ///< in the order of kMediaKeys
    bool flag[4] = {};
};

/// The members of a queue line that count. The views live as long as the reader is not used again.
struct OrdinaryEvent {
    unsigned type = 0;
    std::string_view path;
    std::string_view oldPath;  ///< empty when absent or not a string
};

class OrdinaryReader {
public:
    /// So many readable bytes have to follow every text given to a reader; their values do not matter.
    static constexpr std::size_t kPadding = 64;

    OrdinaryReader();
    ~OrdinaryReader();
    OrdinaryReader(const OrdinaryReader &) = delete;
    OrdinaryReader &operator=(const OrdinaryReader &) = delete;

    /// False: not ordinary, ask JsonReader.
    bool ReadEvent(std::string_view line, OrdinaryEvent &event);

    /// All records of a folder.conf in ascending order of their paths. False: not ordinary, ask JsonReader.
    bool ReadFolders(std::string_view text, std::vector<FolderRecord> &records);

private:
    struct Parser;
    std::unique_ptr<Parser> parser_;
};

}  // namespace VORK::FILEINDEX::internal
