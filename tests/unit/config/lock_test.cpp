// The lock of a configuration file.
#include "fixture.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <csignal>
#include <filesystem>
#include <functional>
#include <string>
#include <vector>

namespace fs = std::filesystem;

namespace fileindex_test {
namespace {

class ConfigLock : public FileIndexTest {
protected:
    /// Does the lock get granted? It is given back.
    static bool Locks(bool exclusive = true) {
        Document document;
        const bool locked = document.Lock(exclusive);
        EXPECT_EQ(locked ? "" : kBusy, Left());
        document.Unlock();
        return locked;
    }
};

TEST_F(ConfigLock, ExcludesOthersUnlessAllAreReaders) {
    Script::Current().random = 7;
    Document().Unlock();  // what was never locked: nothing
    for (const bool held : {true, false}) {
        for (const bool asked : {true, false}) {
            const bool granted = !held && !asked;
            Document first;
            ASSERT_TRUE(first.Lock(held));
            Forget();
            EXPECT_EQ(granted, Locks(asked)) << held << asked;
            EXPECT_EQ(granted ? 1 : 3, Calls("open", kStatusLock));
            EXPECT_EQ(granted ? 0 : 3, Calls("usleep", "7000"));
            EXPECT_TRUE(IsLocked(kStatusLock));
            first.Unlock();
            EXPECT_FALSE(IsLocked(kStatusLock));
        }
    }
}

TEST_F(ConfigLock, IsTriedThreeTimesWhereItMayHelp) {
    LockAgent holder(kStatusLock);
    const struct {
        const char *name;
        std::vector<Fault> faults;
        int attempts;
        bool locked;
    } rows[] = {
        {"let go meanwhile", {{.call = "usleep", .action = [&] { holder.Release(); }}}, 2, true},
        {"interrupted once", {{.call = "flock", .error = EINTR}}, 2, true},
        {"busy twice", {{.call = "flock", .times = 2, .error = EAGAIN}}, 3, true},
        {"interrupted always", {{.call = "flock", .times = 3, .error = EINTR}}, 3, false},
        {"no locks here", {{.call = "flock", .error = ENOLCK}}, 1, false},
        {"read-only /tmp", {{.call = "open", .error = EROFS}}, 1, false},
        {"no descriptors left",
         {{.call = "flock", .error = EAGAIN}, {.call = "open", .nth = 2, .error = EMFILE}},
         2,
         false},
        {"unnamed always", {{.call = "flock", .times = 3, .action = [] { ::unlink(kStatusLock); }}}, 3, false},
        {"unnamed once", {{.call = "flock", .action = [] { ::unlink(kStatusLock); }}}, 2, true},
    };
    for (const auto &row : rows) {
        SCOPED_TRACE(row.name);
        Forget();
        std::for_each(row.faults.begin(), row.faults.end(), Fail);
        EXPECT_EQ(row.locked, Locks());
        EXPECT_EQ(row.attempts, Calls("open", kStatusLock));
        EXPECT_THAT(Script::Current().Finish(), IsEmpty());
    }
}

TEST_F(ConfigLock, FileIsOwnWritableAndClosedOnExec) {
    ::umask(0);
    Document document;
    ASSERT_TRUE(document.Lock(true));
    EXPECT_EQ(0100644U, StatusOf(kStatusLock).st_mode);
    for (const std::string &open : OpenDescriptors()) {
        EXPECT_TRUE(!open.ends_with(kStatusLock) || ::fcntl(std::stoi(open), F_GETFD) == FD_CLOEXEC);
    }
    document.Unlock();
}

TEST_F(ConfigLock, CountsOnlyOnAFileThatStrangersCannotTakeAway) {
    constexpr uid_t kStranger = 4711;
    const std::string elsewhere = std::string(kConfigDir) + "/elsewhere";
    const struct {
        const char *name;
        std::function<void()> prepare;
        uid_t user;
        bool locked;
    } rows[] = {
        {"root's", [] { ::chown(kStatusLock, 0, 0); }, kStranger, true},
        {"our own", [] { ::chown(kStatusLock, kStranger, 0); }, kStranger, true},
        {"a stranger's", [] { ::chown(kStatusLock, kStranger, 0); }, 0, false},
        {"a FIFO", [] { ::unlink(kStatusLock), ::mkfifo(kStatusLock, 0600); }, 0, false},
        {"a link", [&] { ::unlink(kStatusLock), fs::create_symlink(elsewhere, kStatusLock); }, 0, false},
    };
    for (const auto &row : rows) {
        SCOPED_TRACE(row.name);
        fs::remove(kStatusLock);
        WriteFile(kStatusLock, "");
        ::chmod(kStatusLock, 0666);
        row.prepare();
        ASSERT_EQ(0, ::seteuid(row.user));
        EXPECT_EQ(row.locked, Locks());
        ASSERT_EQ(0, ::seteuid(0));
    }
    EXPECT_FALSE(fs::exists(elsewhere));
}

TEST_F(ConfigLock, DoesNotWaitForALease) {
    WriteFile(kStatusLock, "");
    const int fd = ::open(kStatusLock, O_RDONLY);
    ASSERT_EQ(0, ::fcntl(fd, F_SETLEASE, F_RDLCK));
    const auto previous = std::signal(SIGIO, SIG_IGN);
    ::alarm(5);  // the kernel would give the holder 45 s
    EXPECT_FALSE(Locks());
    ::alarm(0);
    ::close(fd);
    std::signal(SIGIO, previous);
}

TEST_F(ConfigLock, IsNotReleasedByTheDestructorButByTheEndOfTheProcess) {
    const auto lockAndEnd = [] {
        Document().Lock(true);
        ::_exit(IsLocked(kStatusLock) ? 1 : 0);
    };
    EXPECT_EXIT(lockAndEnd(), testing::ExitedWithCode(1), "");
    EXPECT_FALSE(IsLocked(kStatusLock));
}

}  // namespace
}  // namespace fileindex_test
