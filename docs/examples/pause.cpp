#include <fileindex/fileindex.h>

#include <ctime>
#include <iostream>
#include <string>

using VORK::FILEINDEX::ErrorHandler;
using VORK::FILEINDEX::StatusMgr;

int main() {
    // A failure without a code: the pause is saved, but the daemon could not be told. It reads the file when it
    // starts.
    ErrorHandler::SetError(VORK::FILEINDEX::FILEINDEX_ERR_NONE);
    if (!StatusMgr::Pause(8)) {
        const bool saved = ErrorHandler::GetError() == VORK::FILEINDEX::FILEINDEX_ERR_NONE;
        std::cout << (saved ? "saved, the daemon was not told\n" : "the pause could not be saved\n");
    }

    long long resumeTime = -1;
    if (StatusMgr::GetPauseInfo(resumeTime) && resumeTime > std::time(nullptr)) {
        std::cout << "paused for " << (resumeTime - std::time(nullptr) + 3599) / 3600 << " hours\n";
    }

    // A pause shows as long as there is work.
    std::string status;
    if (StatusMgr::GetStatus(status)) {
        std::cout << status << '\n';
    }
    std::cout << "/photo/2015: " << StatusMgr::GetFolderStatus("/photo/2015") << '\n';

    StatusMgr::Resume();
    std::cout << "/photo/2015: " << StatusMgr::GetFolderStatus("/photo/2015") << '\n';
}
// Output:
// paused for 8 hours
// paused
// /photo/2015: paused
// /photo/2015: processing
