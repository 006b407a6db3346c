// The platform's last error, per thread.
#include <vork/error.h>

namespace {

struct LastError {
    int code = 0;
    const char *file = "";
    int line = 0;
};

thread_local LastError lastError;

}  // namespace

int VLIBCErrGet(void) {
    return lastError.code;
}

void VLIBCErrSetEx(int code, const char *szFile, int line) {
    lastError = {code, szFile == nullptr ? "" : szFile, line};
}

const char *VLIBCErrorGetFile(void) {
    return lastError.file;
}

int VLIBCErrorGetLine(void) {
    return lastError.line;
}
