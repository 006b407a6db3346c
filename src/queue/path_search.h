/// \file
/// A quick look at the text of a queue: is a path named there at all?
#pragma once

#include <bitset>
#include <cstddef>
#include <string>
#include <string_view>

namespace VORK::FILEINDEX::internal {

/// A string of JSON stands in the text as it is, except for its escapes. So a text in which neither the path
/// stands nor an escape that can mean one of its characters cannot name it.
class PathSearch {
public:
    explicit PathSearch(std::string path);

    /// False: no line of the text names the path. True: one may.
    bool MayBeNamedIn(std::string_view text) const { return HasEscape(text) || HasTail(text); }

private:
    bool HasEscape(std::string_view text) const;
    bool HasTail(std::string_view text) const;

    static constexpr std::size_t kWindow = 8;  // bytes
    static constexpr int kHashBits = 14;

    static std::size_t HashOf(const char *window);

    std::string path_;
    bool hasQuote_;                          ///< or a backslash
    std::string_view tail_;                  ///< tells paths apart that begin alike
    std::bitset<1U << kHashBits> hashes_{};  ///< of all windows in it
};

}  // namespace VORK::FILEINDEX::internal
