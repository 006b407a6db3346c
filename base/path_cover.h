/// \file
/// Which path covers which: the one rule of comparison.
#pragma once

#include <string_view>

namespace VORK {

/// Does `path` + "/" start with `top` + "/"? So "/photo/2019" holds itself and "/photo/2019/x", not
/// "/photo/20190". Bytes are compared, nothing is normalised.
inline bool IsAtOrUnder(std::string_view path, std::string_view top) {
    if (path.size() > top.size() && path[top.size()] != '/') {
        return false;  // settles most comparisons without looking at the text of `top`
    }
    return path.starts_with(top);
}

}  // namespace VORK
