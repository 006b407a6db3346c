// Services, through init scripts and through a systemctl that only writes down what it is asked.
#include "support.h"

#include <vork/service.h>

#include <sys/stat.h>

#include <csignal>

using platform_test::Mounts;
using platform_test::ReadText;
using platform_test::WriteScript;

namespace {

const std::string kJournal = "/tmp/services";

// What was asked for since the last look.
std::string Asked() {
    std::string asked = ReadText(kJournal);
    std::filesystem::remove(kJournal);
    return asked;
}

struct Step {
    const char *name;
    std::function<int()> run;
    int code;  ///< 0: succeeds
    std::string asked;
};

void Check(const std::vector<Step> &steps) {
    for (const Step &step : steps) {
        VLIBCErrSetEx(0, "", 0);
        EXPECT_EQ(step.run() < 0, step.code != 0) << step.name;
        EXPECT_EQ(VLIBCErrGet(), step.code) << step.name;
        EXPECT_EQ(Asked(), step.asked) << step.name;
    }
}

void InstallInitScript(const std::string &name, const std::string &body) {
    WriteScript("/etc/init.d/" + name, "echo " + name + " $1 >>" + kJournal + "\n" + body);
}

TEST(InitScriptsTest, AreRunByTheirNamesHere) {
    InstallInitScript("fileindexd", "");
    InstallInitScript("failing", "exit 1");
    InstallInitScript("samba", "");  // the domain controller
    Check({
        {"start", [] { return VLIBServiceStart("fileindexd", 1); }, 0, "fileindexd start\n"},
        {"stop", [] { return VLIBServiceStop("fileindexd", 1); }, 0, "fileindexd stop\n"},
        {"restart", [] { return VLIBServiceRestart("fileindexd"); }, 0, "fileindexd restart\n"},
        {"refused", [] { return VLIBServiceStart("failing", 1); }, VORK_ERR_SERVICE, "failing start\n"},
        {"unknown", [] { return VLIBServiceStart("unheard", 1); }, VORK_ERR_NO_SUCH_SERVICE, ""},
        {"no file server", [] { return VLIBServiceRestart("samba"); }, VORK_ERR_NO_SUCH_SERVICE, ""},
        {"a path", [] { return VLIBServiceStart("../init.d/fileindexd", 1); }, VORK_ERR_BAD_PARAMETER, ""},
        {"an option", [] { return VLIBServiceStart("--status-all", 1); }, VORK_ERR_BAD_PARAMETER, ""},
        {"empty", [] { return VLIBServiceStart("", 1); }, VORK_ERR_BAD_PARAMETER, ""},
        {"null", [] { return VLIBServiceStop(nullptr, 1); }, VORK_ERR_BAD_PARAMETER, ""},
    });
    InstallInitScript("smb", "");
    Check({{"second name", [] { return VLIBServiceRestart("samba"); }, 0, "smb restart\n"}});
    InstallInitScript("smbd", "");
    Check({{"first name", [] { return VLIBServiceRestart("samba"); }, 0, "smbd restart\n"}});
}

TEST(InitScriptsTest, AreKilledWithAllTheyStartedWhenOverdue) {
    InstallInitScript("hanging", "sleep 1000 & echo $$ $! >/tmp/hanging\nwait");
    EXPECT_LT(VLIBServiceStart("hanging", 1), 0);
    EXPECT_EQ(VLIBCErrGet(), VORK_ERR_TIMEOUT);
    EXPECT_EQ(Asked(), "hanging start\n");
    std::ifstream numbers("/tmp/hanging");
    pid_t script = 0;
    pid_t child = 0;
    ASSERT_TRUE(numbers >> script >> child);
    const auto hasEnded = [](pid_t process) {
        const std::string status = ReadText("/proc/" + std::to_string(process) + "/stat");
        return status.empty() || status.find(") Z") != std::string::npos;
    };
    for (const pid_t process : {script, child}) {
        // The signal has been sent; on a busy machine a process may yet have to get to it.
        for (int tries = 0; tries < 10000 && !hasEnded(process); ++tries) {
            usleep(1000);
        }
        EXPECT_TRUE(hasEnded(process));
    }
}

class SystemdTest : public testing::Test {
protected:
    void SetUp() override {
        std::filesystem::create_directories("/run/systemd/system");
        // Knows the units whose names are files in /tmp/units; the text of such a file is what "start" exits
        // with. A unit is enabled while NAME.enabled exists.
        WriteScript("/tmp/systemctl", R"(
test "$1 $2" = "--no-ask-password --no-pager" || exit 99
shift 2
for unit; do :; done
case $1 in
    cat) test -e /tmp/units/$unit; exit ;;
    --quiet) test -e /tmp/units/$unit.enabled; exit ;;
esac
echo "$@" >>/tmp/services
case $1 in
    enable) : >/tmp/units/$unit.enabled ;;
    disable) rm /tmp/units/$unit.enabled ;;
    start) exit $(cat /tmp/units/$unit) ;;
esac
)");
        ASSERT_TRUE(mounts_.Mount("/tmp/systemctl", "/usr/bin/systemctl", "--bind"));
    }

    void TearDown() override { std::filesystem::remove_all("/run/systemd"); }

    static void AddUnit(const std::string &name, int startStatus) {
        platform_test::WriteFile("/tmp/units/" + name + ".service", std::to_string(startStatus));
    }

    Mounts mounts_;
};

TEST_F(SystemdTest, IsAskedForUnitsByTheirNamesHere) {
    AddUnit("fileindexd", 0);
    AddUnit("failing", 1);
    AddUnit("samba", 0);
    const auto start = [] { return VLIBServiceStart("fileindexd", 1); };
    const auto stop = [] { return VLIBServiceStop("fileindexd", 1); };
    Check({
        {"start without enabling", [] { return VLIBServiceStart("fileindexd", 0); }, 0,
         "start fileindexd.service\n"},
        {"start", start, 0, "start fileindexd.service\nenable fileindexd.service\n"},
        {"start again", start, 0, "start fileindexd.service\n"},
        {"stop", stop, 0, "--no-block stop fileindexd.service\ndisable fileindexd.service\n"},
        {"stop again", stop, 0, "--no-block stop fileindexd.service\n"},
        {"restart", [] { return VLIBServiceRestart("fileindexd"); }, 0, "restart fileindexd.service\n"},
        {"refused", [] { return VLIBServiceStart("failing", 1); }, VORK_ERR_SERVICE, "start failing.service\n"},
        {"unknown", [] { return VLIBServiceStop("unheard", 1); }, VORK_ERR_NO_SUCH_SERVICE, ""},
        {"no file server", [] { return VLIBServiceRestart("samba"); }, VORK_ERR_NO_SUCH_SERVICE, ""},
    });
    AddUnit("smbd", 0);
    Check({{"file server", [] { return VLIBServiceRestart("samba"); }, 0, "try-restart smbd.service\n"}});
}

}  // namespace
