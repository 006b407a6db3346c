// What the functions answer, and what they do, one by one: the files in tests/unit/transcripts. Each says at its
// head how it reads, and in its last line how many answers it holds.
#include "fixture.h"

#include <set>
#include <sstream>
#include <string>
#include <vector>

namespace fileindex_test {
namespace {

const std::vector<std::string> kTranscripts = {"documents", "folders",  "listing", "paths",
                                               "places",    "progress", "queues",  "requests"};

/// The arguments of "Function argument & argument".
std::vector<std::string> Arguments(std::string line) {
    std::vector<std::string> arguments;
    const std::string between = " & ";
    for (size_t end = 0; (end = line.find(between)) != std::string::npos;) {
        arguments.push_back(line.substr(0, end));
        line.erase(0, end + between.size());
    }
    arguments.push_back(line);
    return arguments;
}

class Transcripts : public FileIndexTest, public testing::WithParamInterface<std::string> {
protected:
    void SetUp() override {
        FileIndexTest::SetUp();
        Script::Current().now = 1700000000;
        daemon_.Start();
    }

    /// "<it>" stands for the argument.
    std::string Play(const std::string &function, const std::string &argument) {
        Forget();
        ++answers_;
        std::string outcome = " | " + AskAlone(function + " " + argument);
        outcome.resize(outcome.find_last_not_of(' ') + 1);
        for (const std::string &step : Script::Current().Journal()) {
            outcome += "\n  " + step;
        }
        const std::string it = Decoded(argument);
        for (size_t at = 0; it.size() > 1 && (at = outcome.find(it, at)) != std::string::npos; at += 4) {
            outcome.replace(at, it.size(), "<it>");
        }
        return outcome + "\n";
    }

    /// One line for all arguments that come to the same.
    std::string PlayAll(const std::string &line) {
        const auto [function, arguments] = Split(line);
        std::string text;
        std::string last;
        for (const std::string &argument : Arguments(arguments)) {
            const std::string outcome = Play(function, argument);
            text += outcome == last ? " & " : last + function + (argument.empty() ? "" : " ");
            text += argument;
            last = outcome;
        }
        return text + last;
    }

    int answers_ = 0;
};

TEST_P(Transcripts, AreTrue) {
    const std::string file = TestPath("transcripts/" + GetParam() + ".txt");
    std::string found;
    std::istringstream lines(ReadFile(file));
    for (std::string line; std::getline(lines, line);) {
        const std::string call = line.substr(0, line.find(" |"));
        if (line.starts_with("given ")) {
            Given(line.substr(6));
            found += line + "\n";
        } else if (line.empty() || line.starts_with("#")) {
            found += line + "\n";
        } else if (!line.starts_with("  ") && !line.starts_with("= ")) {
            found += PlayAll(call);
        }
    }
    ExpectContent(file, found + "= " + std::to_string(answers_) + " answers\n");
}

INSTANTIATE_TEST_SUITE_P(Of, Transcripts, testing::ValuesIn(kTranscripts),
                         [](const auto &info) { return info.param; });

TEST(TranscriptsTogether, AskEveryFunction) {
    std::string all = ReadFile(TestPath("failures.txt"));
    for (const std::string &name : kTranscripts) {
        all += ReadFile(TestPath("transcripts/" + name + ".txt"));
    }
    for (const std::string &function : FunctionNames()) {
        const bool isAsked = all.find("\n" + function + " ") != std::string::npos ||
                             all.find("\n== " + function + " ") != std::string::npos;
        EXPECT_TRUE(isAsked) << function;
    }
}

}  // namespace
}  // namespace fileindex_test
