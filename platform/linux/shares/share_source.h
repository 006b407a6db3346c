/// \file
/// Where the share table comes from.
#pragma once

#include "shares/share_table.h"

#include <memory>

namespace VORK::PLATFORM {

/// A source of shares: the platform's own file, or a file-sharing service's configuration.
class ShareSource {
public:
    struct Snapshot {
        std::shared_ptr<const ShareTable> table;  ///< never null
        int error = 0;  ///< set when the table is not the present one because that cannot be read
    };

    ShareSource() = default;
    ShareSource(const ShareSource &) = delete;
    ShareSource &operator=(const ShareSource &) = delete;
    virtual ~ShareSource() = default;

    /// The present table. Called for each lookup, from any thread: a call that finds nothing changed costs
    /// microseconds. Never fails; a source that cannot be read gives its last good table and the error.
    virtual Snapshot Current() = 0;
};

/// The source this machine uses.
ShareSource &Shares();

}  // namespace VORK::PLATFORM
