#include "base/metadata_entry.h"
#include "names.h"
#include "no_throw.h"
#include "records.h"
#include "share/lookup.h"

#include <fileindex/fileidx.h>

#include <vork/error.h>
#include <vork/metadata.h>

#include <syslog.h>

#include <cerrno>
#include <cstdio>
#include <cstring>
#include <string>

using VORK::MetadataEntry;
using namespace VORK::FILEINDEX::internal;

namespace {

/// The records of one of the two functions.
struct LocationRecords {
    Record argument;
    Record share;
    Record metadata;
};
constexpr LocationRecords kQueueRecords = {records::kQueueArgument, records::kQueueShare, records::kQueueMetadata};
constexpr LocationRecords kDatabaseRecords = {records::kDatabaseArgument, records::kDatabaseShare,
                                              records::kDatabaseMetadata};

/// Reports the failed condition in the words that support tools look for, spelling and final newline included.
int InvalidArgument(const char *condition, const Record &record) {
    syslog(LOG_ERR, "%s:%d Invaild Argument (%s)=[%d]\n", record.module, record.line, condition, 0);
    VLIBCErrSetEx(VORK_ERR_BAD_PARAMETER, record.module, record.line);
    return -1;
}

/// Makes the share's metadata directory and sets `location` to its entry `leaf`. A directory that cannot be made
/// is not fatal: the caller meets the problem where it matters, when it opens the file.
///
/// Returns the share's record, which the caller holds until all is done; null, and a log record, for an unknown
/// share.
Share Locate(std::string &location, const char *shareName, const char *leaf, const LocationRecords &failures) {
    Share share = FindShare(shareName);
    if (!share) {
        syslog(LOG_ERR, "%s:%d VORKShareGet failed, name=%s, code=%d", failures.share.module, failures.share.line,
               shareName, VLIBCErrGet());
        return share;
    }
    const std::string directory = std::string(share->szPath) + "/" + kMetadataDir;
    if (VORKEAMKDir(0, directory.c_str()) < 0) {
        syslog(LOG_ERR, "%s:%d VORKEAMKDir failed, path=%s, code=%d", failures.metadata.module,
               failures.metadata.line, directory.c_str(), VLIBCErrGet());
    }
    location = directory + "/" + leaf;
    return share;
}

int CopyOut(const std::string &location, char *out, int size) {
    snprintf(out, static_cast<std::size_t>(size), "%s", location.c_str());
    return static_cast<int>(strlen(out));
}

}  // namespace

int FILEIDXQueuePathGet(const char *szName, char *szOutQueuePath, int cbOutLen) {
    if (szName == nullptr) {
        return InvalidArgument("__null != szName", kQueueRecords.argument);
    }
    if (szOutQueuePath == nullptr) {
        return InvalidArgument("__null != szOutQueuePath", kQueueRecords.argument);
    }
    if (cbOutLen <= 0) {
        return InvalidArgument("cbOutLen > 0", kQueueRecords.argument);
    }
    return NoThrow(
        [&] {
            std::string location;
            const Share share = Locate(location, szName, kQueueFile, kQueueRecords);
            return share ? CopyOut(location, szOutQueuePath, cbOutLen) : -1;
        },
        -1);
}

int FILEIDXDBPathGet(const char *szName, char *szOutDBPath, int cbOutLen) {
    if (szName == nullptr) {
        return InvalidArgument("__null != szName", kDatabaseRecords.argument);
    }
    if (szOutDBPath == nullptr) {
        return InvalidArgument("__null != szOutDBPath", kDatabaseRecords.argument);
    }
    if (cbOutLen <= 0) {
        return InvalidArgument("cbOutLen > 0", kDatabaseRecords.argument);
    }
    return NoThrow(
        [&] {
            std::string location;
            const Share share = Locate(location, szName, kDatabaseDir, kDatabaseRecords);
            if (!share) {
                return -1;
            }
            const int length = CopyOut(location, szOutDBPath, cbOutLen);
            // From the whole path: a caller's short buffer must not make a directory of another name.
            if (!MetadataEntry(location).MakeDirectory(0777) && errno != EEXIST) {
                syslog(LOG_ERR, "%s:%d mkdir failed, path=%s, reason=%m", records::kDatabaseMake.module,
                       records::kDatabaseMake.line, location.c_str());
            }
            return length;
        },
        -1);
}
