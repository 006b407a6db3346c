#include <fileindex/error.h>

namespace VORK {
namespace FILEINDEX {

_tag_fileindex_err_ ErrorHandler::g_error_code = FILEINDEX_ERR_NONE;

int LOG_LEVEL = 3;

void ErrorHandler::SetError(_tag_fileindex_err_ code) {
    g_error_code = code;
}

_tag_fileindex_err_ ErrorHandler::GetError() {
    return g_error_code;
}

}  // namespace FILEINDEX
}  // namespace VORK
