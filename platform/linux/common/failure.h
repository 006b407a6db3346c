// Reporting a failure to the caller's thread, in one expression.
#ifndef PLATFORM_LINUX_COMMON_FAILURE_H
#define PLATFORM_LINUX_COMMON_FAILURE_H

#include <source_location>

namespace VORK::PLATFORM {

/// Sets the platform error with the place of the call; the result is the negative value that the C functions
/// return.
int Fail(int code, std::source_location where = std::source_location::current());

/// Fail with the code that stands for the errno value `error`.
int FailErrno(int error, std::source_location where = std::source_location::current());

/// The platform code for an errno value.
int CodeOfErrno(int error);

}  // namespace VORK::PLATFORM

#endif
