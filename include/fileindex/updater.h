/// \file
/// The one-time step after an upgrade from the earlier release.
#ifndef FILEINDEX_UPDATER_H
#define FILEINDEX_UPDATER_H

#include <fileindex/export.h>

namespace VORK {
namespace FILEINDEX {

/// Brings the system into line with folder.conf: with folders, starts the daemon, switches the search setting
/// on, registers each share's monitor and queues a reindex of every folder; without any, stops the daemon.
///
/// Stops at the first failure with false, and what was done stays done; it may be run again. Takes no lock. The
/// caller has to remember whether it has run.
FILEINDEX_API bool Updater_zol60_beta2();

}  // namespace FILEINDEX
}  // namespace VORK

#endif
