/// \file
/// Files mounted as if they were disks.
#pragma once

#include "base/mount_table.h"

#include <string>

namespace VORK::PLATFORM {

/// The file behind the loop device (or a partition of one) that the mount is from; empty when it is from none.
std::string BackingFileOf(const Mount &mount);

}  // namespace VORK::PLATFORM
