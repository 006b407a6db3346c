#undef _FORTIFY_SOURCE  // its inline syslog would clash with the definition below

#include "syslog_capture.h"

#include <syslog.h>

#include <array>
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
} &log = *new Log;  // for ever: what runs at the end of a process writes records too

void Keep(int priority, const char *format, va_list arguments) {
    const int error = errno;  // what %m stands for
    std::array<char, 16384> text{};
    // NOLINTNEXTLINE(clang-analyzer-valist.Uninitialized): the callers have started it
    std::vsnprintf(text.data(), text.size(), format, arguments);
    LogRecord record{.priority = priority, .message = text.data()};
    if (std::string_view(format).starts_with("%s:%d ")) {
        const size_t colon = record.message.find(':');
        record.file = record.message.substr(0, colon);
        record.line = std::stoi(record.message.substr(colon + 1));
        record.message.erase(0, record.message.find(' ', colon) + 1);
    }
    const std::lock_guard guard(log.mutex);
    log.records.push_back(record);
    errno = error;
}

}  // namespace

std::vector<LogRecord> SyslogCapture::Records() {
    const std::lock_guard guard(log.mutex);
    return log.records;
}

void SyslogCapture::Clear() {
    const std::lock_guard guard(log.mutex);
    log.records.clear();
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
