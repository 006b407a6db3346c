/// \file
/// Text that C functions would take for another one.
#pragma once

#include <string_view>

namespace VORK {

/// A name or path with a NUL inside names nothing; as a C string it would name something else.
inline bool HasNul(std::string_view text) {
    return text.find('\0') != std::string_view::npos;
}

}  // namespace VORK
