// Any text: the fast reader and the exact one agree, and so do the two writers.

#include "json_checks.h"

#include <cstddef>
#include <cstdint>
#include <string_view>

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size) {
    const std::string_view text(reinterpret_cast<const char *>(data), size);
    fileindex_fuzz::CheckEvent(text);
    fileindex_fuzz::CheckFolders(text);
    fileindex_fuzz::CheckWriter(text);
    return 0;
}
