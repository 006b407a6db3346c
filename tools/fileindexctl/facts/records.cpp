#include "facts/records.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstdarg>
#include <cstdio>
#include <exception>

// <syslog.h> is left out: a fortified build would make its `syslog` an inline function that clashes with the
// definition below.
extern "C" void vsyslog(int priority, const char *format, va_list arguments);

namespace VORK::FILEINDEXCTL {

namespace {

// Must not throw, as its callers know it, and must leave errno alone: the message may name it ("%m") once more.
// True when the record is not to reach the system log yet.
bool Keep(int priority, const char *format, va_list arguments) noexcept {
    const int error = errno;
    std::array<char, 8192> text{};
    std::vsnprintf(text.data(), text.size(), format, arguments);
    bool isHeld = false;
    try {
        Records().Add(text.data());
        isHeld = Records().HoldBack(priority);
    } catch (const std::exception &) {
        Records().Clear();  // the record still reaches the system log
    }
    errno = error;
    return isHeld;
}

void Log(int priority, const char *format, va_list arguments) {
    va_list copy;
    va_copy(copy, arguments);
    if (!Keep(priority, format, copy)) {
        vsyslog(priority, format, arguments);
    }
    va_end(copy);
}

// Past the `syslog` of this program.
__attribute__((format(printf, 2, 3))) void PassOn(int priority, const char *format, ...) {
    va_list arguments;
    va_start(arguments, format);
    vsyslog(priority, format, arguments);
    va_end(arguments);
}

}  // namespace

void RecordLog::Add(std::string record) {
    const auto blank = record.find(' ');
    if (blank == std::string::npos) {
        records_.push_back({std::string(), std::move(record)});
        return;
    }
    records_.push_back({record.substr(0, blank), record.substr(blank + 1)});
}

bool RecordLog::HoldBack(int priority) {
    const Record &last = records_.back();
    const bool isLock = last.place.starts_with("config.cpp:") && last.message == "Failed to lock folder";
    if (!isLock && !last.Fits({records::kEventDropped})) {
        return false;
    }
    held_.emplace_back(priority, last);
    return true;
}

void RecordLog::Clear() {
    for (const auto &[priority, record] : held_) {
        PassOn(priority, "%s %s", record.place.c_str(), record.message.c_str());
    }
    held_.clear();
    records_.clear();
}

bool RecordLog::Record::Fits(const Mark &mark) const {
    return place == std::string(mark.record.module) + ":" + std::to_string(mark.record.line) &&
           std::string_view(message).ends_with(mark.ending);
}

std::size_t RecordLog::Count(const Mark &mark) const {
    return static_cast<std::size_t>(
        std::count_if(records_.begin(), records_.end(), [&](const Record &record) { return record.Fits(mark); }));
}

const std::string *RecordLog::Find(const Mark &mark) const {
    const auto found =
        std::find_if(records_.rbegin(), records_.rend(), [&](const Record &record) { return record.Fits(mark); });
    return found == records_.rend() ? nullptr : &found->message;
}

std::string RecordLog::Last() const {
    return records_.empty() ? std::string("see the system log") : records_.back().message;
}

RecordLog &Records() {
    static RecordLog log;
    return log;
}

}  // namespace VORK::FILEINDEXCTL

extern "C" {

__attribute__((visibility("default"), format(printf, 2, 3))) void syslog(int priority, const char *format, ...) {
    va_list arguments;
    va_start(arguments, format);
    VORK::FILEINDEXCTL::Log(priority, format, arguments);
    va_end(arguments);
}

// What a fortified library calls in its place. NOLINTNEXTLINE(bugprone-reserved-identifier)
__attribute__((visibility("default"), format(printf, 3, 4))) void __syslog_chk(int priority, int /*flag*/,
                                                                               const char *format, ...) {
    va_list arguments;
    va_start(arguments, format);
    VORK::FILEINDEXCTL::Log(priority, format, arguments);
    va_end(arguments);
}

}  // extern "C"
