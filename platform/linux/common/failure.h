/// \file
/// Reporting a failure to the caller's thread, in one expression.
#pragma once

namespace VORK::PLATFORM {

/// A place in the source. As a default argument, `Place::Here()` is the place of the call.
struct Place {
    const char *file;
    int line;

    static constexpr Place Here(const char *file = __builtin_FILE(), int line = __builtin_LINE()) {
        return {file, line};
    }
};

/// Sets the platform error with the place of the call; the result is the negative value that the C functions
/// return.
int Fail(int code, Place where = Place::Here());

/// Fail with the code that stands for the errno value `error`.
int FailErrno(int error, Place where = Place::Here());

/// The platform code for an errno value.
int CodeOfErrno(int error);

}  // namespace VORK::PLATFORM
