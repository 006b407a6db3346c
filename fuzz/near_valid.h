/// \file
/// Random texts that are JSON or nearly so, the same for the same seed.
#ifndef FILEINDEX_FUZZ_NEAR_VALID_H
#define FILEINDEX_FUZZ_NEAR_VALID_H

#include <cstddef>
#include <cstdint>
#include <iterator>
#include <random>
#include <string>
#include <string_view>

namespace fileindex_fuzz {

class NearValid {
public:
    explicit NearValid(std::uint64_t seed) : random_(seed) {}

    std::string Document();    ///< any value
    std::string QueueLine();   ///< an event, without its newline
    std::string FolderConf();  ///< folder records by path

    /// Some lines.
    std::string Queue();

    std::size_t Below(std::size_t bound) { return random_() % bound; }

private:
    bool OneIn(std::size_t n) { return Below(n) == 0; }
    template <typename Table>
    std::string_view OneOf(const Table &table) {
        return table[Below(std::size(table))];
    }
    std::string Blank();
    std::string Number();
    std::string String();
    std::string Quoted(std::string_view usual);
    std::string Value(int depth);
    template <typename Key, typename Content>
    std::string Object(std::size_t members, Key key, Content content);
    std::string Record(bool withPath);
    std::string Spoil(std::string text);

    std::mt19937_64 random_;
};

}  // namespace fileindex_fuzz

#endif
