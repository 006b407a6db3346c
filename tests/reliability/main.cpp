#include "harness.h"

#include <sys/socket.h>
#include <sys/un.h>

#include <chrono>
#include <cstdarg>
#include <cstdlib>
#include <map>

namespace reliability {

namespace fs = std::filesystem;

int Rounds(int quick, int whole) {
    const char *tier = std::getenv("FILEINDEX_TORTURE");
    return tier != nullptr && std::string(tier) == "long" ? whole : quick;
}

void Figure(const char *format, ...) {
    std::va_list values;
    va_start(values, format);
    std::printf("figure: ");
    std::vprintf(format, values);
    va_end(values);
    std::puts("");
    std::fflush(stdout);
}

double Now() {
    return std::chrono::duration<double>(std::chrono::steady_clock::now().time_since_epoch()).count();
}

void MakeMachine(bool search) {
    // The fixed places may only be emptied where they are this program's own.
    Check(ReadFile("/proc/self/mountinfo").find("fileindex-private") != std::string::npos,
          "not in a private namespace");
    for (const char *path : {kFolderConf, kStatusConf, kFolderLock, kStatusLock, kSocket, "/vol1/photo/@eaDir",
                             "/vol1/music/@eaDir", kRegistrations}) {
        fs::remove_all(path);
    }
    fs::create_directories("/vol1/photo/@eaDir");
    fs::create_directories("/vol1/music/@eaDir");
    WriteFile(kPlatformConf, std::string(R"({"shares": {"music": {"path": "/vol1/music"}, )") +
                                 R"("photo": {"path": "/vol1/photo"}}, "search": )" +
                                 (search ? "true}" : "false}"));
    // The platform reads its file more often while the file is fresh; a trace is to be the same each time.
    ::usleep(50000);
    for (const char *program : {"/etc/init.d/fileindexd", "/etc/init.d/smbd", "/usr/vork/bin/vorkzolnotify"}) {
        WriteFile(program, "#!/bin/sh\n");
        fs::permissions(program, fs::perms(0755));
    }
}

int Listen(int backlog) {
    ::unlink(kSocket);
    const int listener = ::socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0);
    sockaddr_un address{};
    address.sun_family = AF_UNIX;
    std::memcpy(address.sun_path, kSocket, sizeof kSocket);
    Check(::bind(listener, reinterpret_cast<const sockaddr *>(&address), sizeof address) == 0, "bind");
    Check(backlog < 0 || ::listen(listener, backlog) == 0, "listen");
    return listener;
}

pid_t StartDaemon() {
    const int listener = Listen(64);
    const pid_t daemon = Start([listener] {
        for (int fd = -1; (fd = ::accept(listener, nullptr, nullptr)) >= 0; ::close(fd)) {
            std::array<char, 4096> buffer{};
            while (::read(fd, buffer.data(), buffer.size()) > 0) {
            }
        }
    });
    ::close(listener);
    return daemon;
}

Json::Value FolderRequest(const std::string &path, const std::string &name) {
    Json::Value folder(Json::objectValue);
    folder["path"] = path;
    folder["name"] = name;
    folder["photo"] = true;
    return folder;
}

}  // namespace reliability

int main(int count, char **arguments) {
    using namespace reliability;
    const std::map<std::string, Scenario *> scenarios = {
        {"full-disk", FullDisk},
        {"writers", Writers},
        {"threads", Threads},
        {"cancelled-threads", CancelledThreads},
        {"queue-writers", QueueWriters},
        {"moods", Moods},
        {"writer-model", WriterModel},
        {"operation", Operation},
        {"operations", ListOperations},
        {"at-exit", AtExit},
    };
    const auto scenario = scenarios.find(count > 1 ? arguments[1] : "");
    Check(scenario != scenarios.end(), "usage: fileindex_torture SCENARIO [ARGUMENT]");
    scenario->second(count > 2 ? arguments[2] : "");
    return 0;
}
