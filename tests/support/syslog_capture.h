/// \file
/// The system log as a list. `syslog` is replaced in every unit test, also in the form that fortified builds call.
#pragma once

#include <string>
#include <vector>

namespace fileindex_test {

struct LogRecord {
    int priority = 0;
    std::string format;   ///< whole, as given to syslog
    std::string file;     ///< the first argument, when the format begins with "%s:%d "
    int line = 0;         ///< the second
    std::string message;  ///< formatted, without the prefix
};

class SyslogCapture {
public:
    static std::vector<LogRecord> Records();
    static void Clear();
};

}  // namespace fileindex_test
