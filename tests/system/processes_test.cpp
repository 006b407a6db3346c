// Several processes at the same files, on the real platform.
#include <fileindex/fileindex.h>

#include <gtest/gtest.h>

#include <fcntl.h>
#include <sys/mount.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <functional>
#include <set>
#include <sstream>
#include <string>
#include <vector>

namespace fs = std::filesystem;
using namespace VORK::FILEINDEX;  // NOLINT(google-build-using-namespace): the subject of every test

namespace {

const std::string kConfigDir = "/usr/vork/etc/fileindex";
const std::string kFolderConf = kConfigDir + "/folder.conf";
const std::string kStatusConf = kConfigDir + "/status.conf";

void WriteFile(const std::string &path, const std::string &text) {
    std::ofstream(path) << text;
}

std::string ReadFile(const std::string &path) {
    std::ostringstream text;
    text << std::ifstream(path).rdbuf();
    return text.str();
}

/// A child process with a pipe from it; killed and reaped at the end of the scope if it still runs.
class Process {
public:
    explicit Process(const std::function<int(FILE *out)> &body) {
        std::array<int, 2> ends{};
        if (::pipe2(ends.data(), O_CLOEXEC) != 0 || (child_ = ::fork()) < 0) {
            std::abort();
        }
        if (child_ == 0) {
            ::close(ends[0]);
            FILE *out = ::fdopen(ends[1], "w");
            const int status = body(out);
            std::fflush(out);
            ::_exit(status);
        }
        ::close(ends[1]);
        in_ = ::fdopen(ends[0], "r");
    }
    ~Process() {
        Kill();
        std::fclose(in_);
    }
    Process(const Process &) = delete;
    Process &operator=(const Process &) = delete;

    /// The next line, empty at the end of its output.
    std::string Line() {
        std::array<char, 256> line{};
        return std::fgets(line.data(), line.size(), in_) != nullptr ? line.data() : "";
    }
    /// Its exit status, -1 when a signal ended it.
    int Wait() {
        int status = 0;
        ::waitpid(child_, &status, 0);
        child_ = -1;
        return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
    }
    void Kill() {
        if (child_ > 0) {
            ::kill(child_, SIGKILL);
            Wait();
        }
    }

private:
    pid_t child_ = -1;
    FILE *in_ = nullptr;
};

/// Reads every connection of the daemon's socket to its end.
int Serve(int listener) {
    std::array<char, 4096> buffer{};
    for (int fd = -1; (fd = ::accept(listener, nullptr, nullptr)) >= 0; ::close(fd)) {
        while (::read(fd, buffer.data(), buffer.size()) > 0) {
        }
    }
    return 0;
}

int Listen() {
    ::unlink("/var/run/fileindexd.sock");
    const int listener = ::socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0);
    sockaddr_un address{};
    address.sun_family = AF_UNIX;
    std::strcpy(address.sun_path, "/var/run/fileindexd.sock");
    EXPECT_EQ(0, ::bind(listener, reinterpret_cast<const sockaddr *>(&address), sizeof address));
    EXPECT_EQ(0, ::listen(listener, 64));
    return listener;
}

/// A machine with the share "photo", a service script and something that listens on the daemon's socket.
class Processes : public testing::Test {
protected:
    void SetUp() override {
        fs::create_directories("/vol1/photo");
        fs::remove(kFolderConf);
        fs::remove(kStatusConf);
        WriteFile("/usr/vork/etc/platform.conf",
                  R"({"shares": {"photo": {"path": "/vol1/photo"}}, "search": true})");
        WriteFile("/etc/init.d/fileindexd", "#!/bin/sh\nexit 0\n");
        fs::permissions("/etc/init.d/fileindexd", fs::perms(0755));
    }
    ~Processes() override { ::close(listener_); }

    static bool Add(const std::string &path) {
        Json::Value request(Json::arrayValue);
        request[0]["path"] = path;
        return IndexMgr::Upsert(request);
    }

    int listener_ = Listen();
    Process daemon_{[this](FILE *) { return Serve(listener_); }};
};

TEST_F(Processes, FoldersAddedByManyAtOnceAreAllThereAndNoOthers) {
    constexpr int kFoldersEach = 20;
    const auto writer = [](const std::string &name) {
        return [name](FILE *out) {
            for (int number = 0; number < kFoldersEach; ++number) {
                const std::string path = "/photo/" + name + std::to_string(number);
                const bool added = Add(path);
                std::fprintf(out, "%s %d\n", path.c_str(), added ? 0 : ErrorHandler::GetError());
            }
            return 0;
        };
    };
    // Readers take no lock: each must find a whole list, which only grows.
    const auto reader = [](FILE *) {
        size_t seen = 0;
        while (fs::exists("/vol1/photo/go-on")) {
            std::vector<Folder> folders;
            if (!IndexMgr::List(folders) || folders.size() < seen) {
                return 1;
            }
            seen = folders.size();
        }
        return 0;
    };
    WriteFile("/vol1/photo/go-on", "");
    Process reading(reader);
    Process writers[] = {Process(writer("a")), Process(writer("b")), Process(writer("c"))};
    std::set<std::string> added;
    int refused = 0;
    for (Process &process : writers) {
        for (std::string line = process.Line(); !line.empty(); line = process.Line()) {
            std::istringstream words(line);
            std::string path;
            int code = 0;
            words >> path >> code;
            ASSERT_TRUE(code == 0 || code == FILEINDEX_ERR_LOCK) << line;
            code == 0 ? static_cast<void>(added.insert(path)) : static_cast<void>(++refused);
        }
        EXPECT_EQ(0, process.Wait());
    }
    fs::remove("/vol1/photo/go-on");
    EXPECT_EQ(0, reading.Wait()) << "a reader found a broken or a shorter list";

    std::vector<Folder> folders;
    ASSERT_TRUE(IndexMgr::List(folders));
    std::set<std::string> stored;
    for (const Folder &folder : folders) {
        stored.insert(folder.path);
    }
    EXPECT_EQ(added, stored);
    EXPECT_EQ(3U * kFoldersEach, added.size() + static_cast<size_t>(refused));
    EXPECT_FALSE(added.empty());
    const std::string queue = ReadFile("/vol1/photo/@eaDir/VORK@file_index_queue");
    EXPECT_EQ(added.size(), static_cast<size_t>(std::count(queue.begin(), queue.end(), '\n')));
}

TEST_F(Processes, KilledWhileSavingLeaveTheOldOrTheNewDocument) {
    const std::string key(3000, 'x');
    const auto save = [&key](bool large) {
        Status status;
        status.Pause(large ? 1 : 123456789);
        return (!large || status.SetUpdated(key)) && status.Save();
    };
    std::set<std::string> whole;
    for (const bool large : {false, true}) {
        ASSERT_TRUE(save(large));
        whole.insert(ReadFile(kStatusConf));
    }
    for (int round = 0; round < 40; ++round) {
        Process process([&save](FILE *out) {
            for (bool large = false; save(large); large = !large) {
                std::fprintf(out, "saved\n");
                std::fflush(out);
            }
            return 1;
        });
        for (int count = 0; count <= round; ++count) {
            ASSERT_EQ("saved\n", process.Line());
        }
        process.Kill();
        // What a shorter document has not yet been cut to are blanks.
        std::string text = ReadFile(kStatusConf);
        text = text.substr(0, text.find_last_not_of(" \n") + 1) + "\n";
        EXPECT_TRUE(whole.contains(text)) << text;
    }
    EXPECT_TRUE(save(false)) << "nobody holds anything any more";
}

TEST_F(Processes, AFullDiskRefusesAFolderAndKeepsTheList) {
    ASSERT_EQ(0, ::mount("tmpfs", kConfigDir.c_str(), "tmpfs", 0, "size=8k"));
    ASSERT_TRUE(Add("/photo/a"));
    const std::string list = ReadFile(kFolderConf);
    WriteFile(kConfigDir + "/filler", std::string(4096, 'f'));
    EXPECT_FALSE(Add("/photo/" + std::string(4000, 'b')));
    EXPECT_EQ(FILEINDEX_ERR_SAVE_JSON, ErrorHandler::GetError());
    EXPECT_EQ(list, ReadFile(kFolderConf));
    EXPECT_TRUE(Add("/photo/b")) << "which fits the block that is there";
    EXPECT_TRUE(IndexMgr::IsPathIndexed("/photo/b"));
    EXPECT_EQ(0, ::umount(kConfigDir.c_str()));
}

}  // namespace
