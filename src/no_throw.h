/// \file
/// The border at which exceptions end: callers in other languages and of other compilers get a plain failure.
#ifndef FILEINDEX_SRC_NO_THROW_H
#define FILEINDEX_SRC_NO_THROW_H

#include <exception>

namespace VORK::FILEINDEX::internal {

/// The operation's result, or `onException` (false, 0, empty by default) when the JSON library, an allocation
/// or the platform throws.
template <typename Operation>
auto NoThrow(Operation operation, decltype(operation()) onException = {}) noexcept -> decltype(operation()) {
    try {
        return operation();
    } catch (const std::exception &) {
        return onException;
    }
}

}  // namespace VORK::FILEINDEX::internal

#endif
