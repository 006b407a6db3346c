#undef _FORTIFY_SOURCE  // its inline syslog would clash with the definition below

#include "syslog_capture.h"

#include <syslog.h>

#include <cerrno>
#include <cstdarg>
#include <cstdio>
#include <mutex>
#include <string_view>

namespace fileindex_test {
namespace {

struct Log {
    std::mutex mutex;
    std::vector<LogRecord> records;
};

Log &TheLog() {
    static Log log;
    return log;
}

void Keep(int priority, const char *format, va_list arguments) {
    const int error = errno;  // what %m stands for
    constexpr std::string_view kPrefix = "%s:%d ";
    LogRecord record;
    record.priority = priority;
    record.format = format;
    if (std::string_view(format).starts_with(kPrefix)) {
        va_list prefix;
        va_copy(prefix, arguments);
        record.file = va_arg(prefix, const char *);  // NOLINT(clang-analyzer-valist.Uninitialized): it is a copy
        record.line = va_arg(prefix, int);
        va_end(prefix);
    }
    std::string text(16384, '\0');
    errno = error;
    // NOLINTNEXTLINE(clang-analyzer-valist.Uninitialized): the callers have started it
    const int length = std::vsnprintf(text.data(), text.size(), format, arguments);
    text.resize(std::min(static_cast<size_t>(length), text.size() - 1));
    record.message = record.file.empty() ? text : text.substr(text.find(' ') + 1);

    const std::lock_guard guard(TheLog().mutex);
    TheLog().records.push_back(record);
    errno = error;
}

}  // namespace

std::vector<LogRecord> SyslogCapture::Records() {
    const std::lock_guard guard(TheLog().mutex);
    return TheLog().records;
}

void SyslogCapture::Clear() {
    const std::lock_guard guard(TheLog().mutex);
    TheLog().records.clear();
}

}  // namespace fileindex_test

extern "C" void syslog(int priority, const char *format, ...) {
    va_list arguments;
    va_start(arguments, format);
    fileindex_test::Keep(priority, format, arguments);
    va_end(arguments);
}

// NOLINTNEXTLINE(bugprone-reserved-identifier): the C library's name for it
extern "C" void __syslog_chk(int priority, int /*flag*/, const char *format, ...) {
    va_list arguments;
    va_start(arguments, format);
    fileindex_test::Keep(priority, format, arguments);
    va_end(arguments);
}
