/// \file
/// Numbers in JSON text.
#pragma once

#include <cstddef>
#include <string_view>

namespace VORK {

/// The length of the number that the text begins with; 0 when it begins with none, or with one that breaks off or
/// has needless zeros in front.
std::size_t NumberLength(std::string_view text);

}  // namespace VORK
