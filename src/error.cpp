#include <fileindex/error.h>

#include <atomic>

namespace VORK {
namespace FILEINDEX {

_tag_fileindex_err_ ErrorHandler::g_error_code = FILEINDEX_ERR_NONE;

int LOG_LEVEL = 3;

// A plain variable, which programs of old read; several threads may fail at once all the same.
void ErrorHandler::SetError(_tag_fileindex_err_ code) {
    std::atomic_ref(g_error_code).store(code, std::memory_order_relaxed);
}

_tag_fileindex_err_ ErrorHandler::GetError() {
    return std::atomic_ref(g_error_code).load(std::memory_order_relaxed);
}

}  // namespace FILEINDEX
}  // namespace VORK
