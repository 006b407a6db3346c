/// \file
/// What a target is fed: bytes, each of which decides something; and texts that they choose from a grammar.
#pragma once

#include <array>
#include <cstddef>
#include <string>
#include <string_view>

namespace fileindex_fuzz {

class Input {
public:
    explicit Input(std::string_view bytes) : left_(bytes) {}

    bool IsEmpty() const { return left_.empty(); }

    /// Below the bound; 0 when nothing is left.
    std::size_t Below(std::size_t bound);
    bool OneIn(std::size_t n) { return Below(n) == n - 1; }

    template <typename Element, std::size_t kSize>
    const Element &OneOf(const Element (&elements)[kSize]) {
        return elements[Below(kSize)];
    }

    std::string Rest();

    /// A text of this name in the file "grammar".
    std::string Text(const std::string &name);
    /// One in four is broken somewhere, and one in ten is any bytes.
    std::string MaybeSpoilt(const std::string &name);

private:
    std::string_view left_;
};

}  // namespace fileindex_fuzz
