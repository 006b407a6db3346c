/// \file
/// The fast reader against the exact one, and the writer against the JSON library's.
#ifndef FILEINDEX_FUZZ_JSON_CHECKS_H
#define FILEINDEX_FUZZ_JSON_CHECKS_H

#include <optional>
#include <string>
#include <string_view>

namespace fileindex_fuzz {

/// A well-formed queue line, read by the rules alone.
struct Event {
    unsigned type = 0;
    std::string path;
    std::string oldPath;
};

std::optional<Event> ReferenceEvent(std::string_view line);

/// Each returns whether the fast reader decided, or whether the text is JSON at all.
bool CheckEvent(std::string_view line);
bool CheckFolders(std::string_view text);
bool CheckWriter(std::string_view text);

}  // namespace fileindex_fuzz

#endif
