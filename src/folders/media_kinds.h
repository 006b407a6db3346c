/// \file
/// The kinds of file that a folder has indexed or not.
#pragma once

#include <fileindex/folder.h>

namespace VORK::FILEINDEX::internal {

struct MediaKind {
    const char *key;  ///< in a folder record and in a change report
    bool Folder::*flag;
};

inline constexpr MediaKind kMediaKinds[] = {
    {"document", &Folder::document},
    {"audio", &Folder::audio},
    {"video", &Folder::video},
    {"photo", &Folder::photo},
};

}  // namespace VORK::FILEINDEX::internal
