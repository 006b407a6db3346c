/// \file
/// The border at which exceptions end: callers in other languages and of other compilers get a plain failure.
#pragma once

#include <cxxabi.h>

namespace VORK::FILEINDEX::internal {

/// The operation's result, or `onException` (false, 0, empty by default) when the JSON library, an allocation
/// or the platform throws. The cancellation of a thread is no failure and goes on.
// A forced unwinding carries no object: the reference is null, which is not looked at.
template <typename Operation>
__attribute__((no_sanitize("null"))) auto NoThrow(Operation operation, decltype(operation()) onException = {})
    -> decltype(operation()) {
    try {
        return operation();
    } catch (const abi::__forced_unwind &) {
        throw;
    } catch (...) {
        return onException;
    }
}

}  // namespace VORK::FILEINDEX::internal
