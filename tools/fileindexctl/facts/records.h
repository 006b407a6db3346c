/// \file
/// The library's log records of this process.
///
/// A failed operation of the library answers no more than false, but every failing step writes one record, and a
/// record's module and line are its identity for good. This executable therefore defines `syslog` itself: the
/// records pass through here and go on to the system log unchanged. Those that say that another program holds a
/// lock are held back until it is certain that nobody tries again: waiting for a lock leaves one record, not one
/// for each attempt.
#pragma once

#include "src/records.h"

#include <cstddef>
#include <string>
#include <utility>
#include <vector>

namespace VORK::FILEINDEXCTL {

namespace records = VORK::FILEINDEX::internal::records;

/// Which record: records::kUpsertMonitor. Where several shares can be meant, `ending` is the end of the text.
struct Mark {
    VORK::FILEINDEX::internal::Record record;
    std::string ending{};
};

class RecordLog {
public:
    void Add(std::string record);

    /// Forgets the records. What is still held back goes to the system log.
    void Clear();

    /// What is held back is dropped, because the attempt that it tells of is made again.
    void TryAgain() { held_.clear(); }

    /// Holds the last record back if it is of that kind.
    bool HoldBack(int priority);

    /// The message of the last record that fits, without module and line; null when there is none.
    const std::string *Find(const Mark &mark) const;

    /// How many records fit.
    std::size_t Count(const Mark &mark) const;

    /// The message of the last record of all.
    std::string Last() const;

private:
    struct Record {
        std::string place;  // "index_mgr.cpp:598"
        std::string message;

        bool Fits(const Mark &mark) const;
    };
    std::vector<Record> records_;
    std::vector<std::pair<int, Record>> held_;  // with their priority
};

/// The log of this process. There is one `syslog`, so there is one of these.
RecordLog &Records();

}  // namespace VORK::FILEINDEXCTL
