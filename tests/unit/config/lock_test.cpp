// The lock of a configuration file.
#include "fixture.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <csignal>
#include <filesystem>
#include <functional>
#include <string>

namespace fs = std::filesystem;

namespace fileindex_test {
namespace {

class ConfigLock : public FileIndexTest {};

TEST_F(ConfigLock, ExcludesOthersUnlessAllAreReaders) {
    for (const bool held : {true, false}) {
        for (const bool asked : {true, false}) {
            SCOPED_TRACE(std::to_string(static_cast<int>(held)) + std::to_string(static_cast<int>(asked)));
            const bool granted = !held && !asked;
            Script::Current().random = 7;
            Document first;
            Document second;
            second.Unlock();  // what was never locked: nothing
            ASSERT_TRUE(first.Lock(held));
            Forget();
            EXPECT_EQ(granted, second.Lock(asked));
            EXPECT_EQ(granted ? 1 : 3, Script::Current().Calls("flock", kStatusLock));
            EXPECT_EQ(granted ? 0 : 3, Script::Current().Calls("usleep", "7000"));
            EXPECT_EQ(granted ? "" : kBusy, Left());
            second.Unlock();
            EXPECT_TRUE(IsLocked(kStatusLock));
            first.Unlock();
            EXPECT_FALSE(IsLocked(kStatusLock));
        }
    }
}

TEST_F(ConfigLock, IsGrantedWhenTheHolderLetsGoBetweenTwoAttempts) {
    LockAgent holder(kStatusLock);
    Fail({.call = "usleep", .action = [&] { holder.Release(); }});
    Document document;
    EXPECT_TRUE(document.Lock(true));
    EXPECT_EQ(2, Script::Current().Calls("flock", kStatusLock));
    document.Unlock();
    EXPECT_EQ("", Left());
}

TEST_F(ConfigLock, IsTriedAgainOnlyWhenTriedTooEarly) {
    const struct {
        const char *name;
        Fault fault;
        int attempts;
        bool locked;
    } rows[] = {
        {"interrupted once", {.call = "flock", .error = EINTR}, 2, true},
        {"busy twice", {.call = "flock", .times = 2, .error = EAGAIN}, 3, true},
        {"interrupted always", {.call = "flock", .times = 3, .error = EINTR}, 3, false},
        {"no locks on this file system", {.call = "flock", .error = ENOLCK}, 1, false},
        {"read-only /tmp", {.call = "open", .error = EROFS}, 1, false},
        {"no descriptors left at the second attempt", {.call = "open", .nth = 2, .error = EMFILE}, 2, false},
    };
    for (const auto &row : rows) {
        SCOPED_TRACE(row.name);
        Forget();
        const auto before = OpenDescriptors();
        if (row.fault.nth == 2) {
            Fail({.call = "flock", .error = EAGAIN});
        }
        Fail(row.fault);
        Document document;
        EXPECT_EQ(row.locked, document.Lock(true));
        EXPECT_EQ(row.attempts, Script::Current().Calls("open", kStatusLock));
        EXPECT_EQ(row.locked ? "" : kBusy, Left());
        EXPECT_THAT(Script::Current().Finish(), IsEmpty());
        document.Unlock();
        EXPECT_EQ(before, OpenDescriptors());
    }
}

TEST_F(ConfigLock, FileIsOwnWritableClosedOnExecAndNoLink) {
    {
        ::umask(0);
        Document document;
        ASSERT_TRUE(document.Lock(true));
        EXPECT_EQ(0100644U, StatusOf(kStatusLock).st_mode);
        for (const std::string &open : OpenDescriptors()) {
            if (open.ends_with(kStatusLock)) {
                EXPECT_EQ(FD_CLOEXEC, ::fcntl(std::stoi(open), F_GETFD));
            }
        }
        document.Unlock();
    }
    const std::string target = std::string(kConfigDir) + "/elsewhere";
    fs::remove(kStatusLock);
    fs::create_symlink(target, kStatusLock);
    Document document;
    EXPECT_FALSE(document.Lock(true));
    EXPECT_EQ(kBusy, Left());
    EXPECT_FALSE(fs::exists(target));
    document.Unlock();
}

TEST_F(ConfigLock, CountsOnlyOnAFileThatStrangersCannotTakeAway) {
    constexpr uid_t kStranger = 4711;
    const struct {
        const char *name;
        std::function<void()> prepare;
        uid_t user;
        bool locked;
    } rows[] = {
        {"root's", [] { ::chown(kStatusLock, 0, 0); }, kStranger, true},
        {"our own", [] { ::chown(kStatusLock, kStranger, 0); }, kStranger, true},
        {"a stranger's", [] { ::chown(kStatusLock, kStranger, 0); }, 0, false},
        {"without a name", [] { Fail({.call = "flock", .times = 3, .action = [] { ::unlink(kStatusLock); }}); }, 0,
         false},
        {"anew after losing its name", [] { Fail({.call = "flock", .action = [] { ::unlink(kStatusLock); }}); }, 0,
         true},
        {"a FIFO", [] { ::unlink(kStatusLock), ::mkfifo(kStatusLock, 0600); }, 0, false},
    };
    for (const auto &row : rows) {
        SCOPED_TRACE(row.name);
        fs::remove(kStatusLock);
        WriteFile(kStatusLock, "");
        ::chmod(kStatusLock, 0666);
        row.prepare();
        ASSERT_EQ(0, ::seteuid(row.user));
        Document document;
        EXPECT_EQ(row.locked, document.Lock(true));
        document.Unlock();
        ASSERT_EQ(0, ::seteuid(0));
        EXPECT_EQ(row.locked ? "" : kBusy, Left());
        EXPECT_THAT(Script::Current().Finish(), IsEmpty());
    }
}

TEST_F(ConfigLock, DoesNotWaitForALease) {
    WriteFile(kStatusLock, "");
    const int fd = ::open(kStatusLock, O_RDONLY);
    ASSERT_EQ(0, ::fcntl(fd, F_SETLEASE, F_RDLCK));
    const auto previous = std::signal(SIGIO, SIG_IGN);
    ::alarm(5);  // the kernel would give the holder 45 s
    Document document;
    EXPECT_FALSE(document.Lock(true));
    ::alarm(0);
    EXPECT_EQ(kBusy, Left());
    document.Unlock();
    ::fcntl(fd, F_SETLEASE, F_UNLCK);
    ::close(fd);
    std::signal(SIGIO, previous);
}

TEST_F(ConfigLock, IsNotReleasedByTheDestructorButByTheEndOfTheProcess) {
    const auto lockAndEnd = [] {
        {
            Document document;
            document.Lock(true);
        }
        ::_exit(IsLocked(kStatusLock) ? 1 : 0);
    };
    EXPECT_EXIT(lockAndEnd(), testing::ExitedWithCode(1), "");
    EXPECT_FALSE(IsLocked(kStatusLock));
}

}  // namespace
}  // namespace fileindex_test
