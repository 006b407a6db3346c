/// \file
/// The platform's own codes for file system types.
#pragma once

#include <string_view>

namespace VORK::PLATFORM {

enum FsType : int {
    kUnknownType = -1,
    kExt2 = 1,
    kExt3 = 2,
    kExt4 = 3,
    kXfs = 4,
    kBtrfs = 5,
    kZfs = 6,
    kOtherDisk = 7,  ///< other file systems on disks, without features of interest here
    kMemory = 8,
    kUnion = 9,        ///< layers over other local file systems
    kEncrypting = 10,  ///< mounted means unlocked
    kPseudo = 12,
    kNetwork = 20,
    kAutomount = 21,  ///< nothing mounted yet
    kImage = 30,
    kLoopMount = 31  ///< a file in a share, mounted
};

/// The code for the kernel's name of a type; kUnknownType for a name that is not in the table.
FsType CodeOfType(std::string_view name);

bool IsRemoteType(int type);
bool IsImageType(int type);

}  // namespace VORK::PLATFORM
