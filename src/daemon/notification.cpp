#include "no_throw.h"

#include <fileindex/daemon.h>

#include <vork/process.h>

namespace VORK {
namespace FILEINDEX {

bool NotifyNoSpace() {
    constexpr char kTool[] = "/usr/vork/bin/vorkzolnotify";
    constexpr char kLink[] =
        "<a data-vork-app=\"VORK.KDX.AdminCenter.Application\" "
        "data-vork-fn=\"VORK.KDX.AdminCenter.MediaIndex.Main\" data-vork-tab=\"fileIndex\">";
    // Title and message are keys that the desktop translates; the link opens the index page of the
    // administration application.
    const char *const argv[] = {
        kTool,
        "-e",
        "false",
        "-c",
        "VORK.KDX.AdminCenter.Application",
        "@administrators",
        "fileindex:fileindex_title",
        "fileindex:notify_no_space",
        kLink,
        "</a>",
        nullptr,
    };
    return internal::NoThrow([&] { return VLIBCExecv(kTool, argv, 1, 0) == 0; });
}

}  // namespace FILEINDEX
}  // namespace VORK
