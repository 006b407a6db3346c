// What the functions answer, and what they do, one by one: the lines of the files in tests/unit/transcripts.
//
//   # a remark
//   given FACT                  see FileIndexTest::Given
//   Function argument | answer, code and records
//     what it did: the journal, and the files that it left otherwise than they were
//
// No call leaves a lock or a descriptor behind.
#include "fixture.h"

#include <filesystem>
#include <set>
#include <sstream>
#include <string>

namespace fs = std::filesystem;

namespace fileindex_test {
namespace {

class Transcripts : public FileIndexTest, public testing::WithParamInterface<std::string> {
protected:
    void SetUp() override {
        FileIndexTest::SetUp();
        GivenShare("photo");
        GivenShare("music", "/vol2/music");
        fs::create_directory("/vol1/photo/a");
        Script::Current().now = 1700000000;
        daemon_.Start();
    }

    static std::string Play(const std::string &call) {
        Forget();
        const std::string files[] = {kFolderConf, kStatusConf};
        const std::string before[] = {ReadFile(files[0]), ReadFile(files[1])};
        std::string outcome = " | " + AskAlone(call);
        outcome.resize(outcome.find_last_not_of(' ') + 1);
        for (const std::string &step : Journal()) {
            outcome += "\n  " + step;
        }
        for (const size_t i : {0U, 1U}) {
            const std::string now = ReadFile(files[i]);
            outcome += now == before[i] ? "" : "\n  " + now.substr(0, now.find('\n'));
        }
        return outcome;
    }
};

TEST_P(Transcripts, AreTrue) {
    const std::string file = TestPath("transcripts/" + GetParam() + ".txt");
    std::string found;
    std::istringstream lines(ReadFile(file));
    for (std::string line; std::getline(lines, line);) {
        if (line.starts_with("  ")) {
            continue;
        }
        found += line.substr(0, line.find(" |"));
        if (line.starts_with("given ")) {
            Given(line.substr(6));
        } else if (!line.empty() && !line.starts_with("#")) {
            found += Play(line.substr(0, line.find(" |")));
        }
        found += "\n";
    }
    ExpectContent(file, found);
}

std::set<std::string> Names() {
    std::set<std::string> names;
    for (const auto &entry : fs::directory_iterator(TestPath("transcripts"))) {
        names.insert(entry.path().stem());
    }
    return names;
}

INSTANTIATE_TEST_SUITE_P(Of, Transcripts, testing::ValuesIn(Names()), [](const auto &info) { return info.param; });

}  // namespace
}  // namespace fileindex_test
