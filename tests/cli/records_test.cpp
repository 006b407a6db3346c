// Which records reach the system log while a command waits for a lock.
#include "facts/records.h"

#include "facts/patience.h"

#include <gmock/gmock.h>

#include <array>
#include <cstdarg>
#include <cstdio>
#include <string>
#include <vector>

using testing::ElementsAre;
using VORK::FILEINDEXCTL::Patience;
using VORK::FILEINDEXCTL::Records;

namespace {

std::vector<std::string> logged;

}  // namespace

extern "C" void syslog(int priority, const char *format, ...);

// In the place of the system's.
extern "C" void vsyslog(int /*priority*/, const char *format, va_list arguments) {
    std::array<char, 200> text{};
    std::vsnprintf(text.data(), text.size(), format, arguments);
    logged.emplace_back(text.data());
}

TEST(HeldRecords, AreThoseOfTheLastAttemptAtOneStep) {
    Patience patience(std::chrono::hours(1));
    syslog(3, "%s:%d try lock too many times, path=%s", "utils.cpp", 516, "/queue");
    Records().Clear();  // another step begins, and waits
    for (int attempt = 0; attempt < 2; ++attempt) {
        syslog(3, "%s:%d Failed to lock folder", "config.cpp", 53);
        ASSERT_TRUE(patience.Again());
    }
    syslog(3, "%s:%d Failed to save json to %s", "config.cpp", 151, "/file");
    syslog(3, "%s:%d Failed to lock folder", "config.cpp", 53);
    ASSERT_FALSE(Patience().Again());
    Records().Clear();
    EXPECT_THAT(logged,
                ElementsAre("utils.cpp:516 try lock too many times, path=/queue",
                            "config.cpp:151 Failed to save json to /file", "config.cpp:53 Failed to lock folder"));
}
