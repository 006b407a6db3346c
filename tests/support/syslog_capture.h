/// \file
/// The system log as a list. `syslog` is replaced in every unit test, also in the form that fortified builds call.
#pragma once

#include <string>
#include <vector>

namespace fileindex_test {

struct LogRecord {
    int priority = 0;
    std::string file = {};  ///< of the beginning "FILE:LINE "
    int line = 0;
    std::string message;  ///< what follows
};

/// For any number of threads.
class SyslogCapture {
public:
    static std::vector<LogRecord> Records();
    static void Clear();
};

}  // namespace fileindex_test
