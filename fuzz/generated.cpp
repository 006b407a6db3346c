// Generates texts of a grammar: checks so many lines, folder files and documents and some queues, or writes so
// many texts into a directory as seeds of the fuzz targets.

#include "checks.h"

#include <cstdio>
#include <fstream>
#include <iterator>
#include <map>
#include <random>
#include <sstream>
#include <vector>

namespace {

using namespace fileindex_fuzz;  // NOLINT(google-build-using-namespace): this is their program

using Grammar = std::map<std::string, std::vector<std::string>>;  ///< forms by name

Grammar ReadGrammar(const char *path) {
    Grammar grammar;
    std::ifstream file(path);
    for (std::string line, name; std::getline(file, line);) {
        std::istringstream words(line);
        words >> name;  // "#" is the name of the comments, which no form names
        std::vector<std::string> &forms = grammar[name];
        forms.insert(forms.end(), std::istream_iterator<std::string>(words), {});
    }
    return grammar;
}

/// Random texts, the same for the same seed.
class Generator {
public:
    Generator(const Grammar &grammar, unsigned long seed) : grammar_(grammar), random_(seed) {}

    std::size_t Below(std::size_t bound) { return random_() % bound; }
    bool OneIn(std::size_t n) { return Below(n) == 0; }

    std::string Text(const std::string &name) {
        const std::string rare = name + "|";
        const std::vector<std::string> &forms = grammar_.at(grammar_.contains(rare) && OneIn(10) ? rare : name);
        const std::string &form = forms[Below(forms.size())];
        std::string text;
        for (std::size_t i = 0; i < form.size(); ++i) {
            if (form[i] == '$') {
                text += Text({form[++i]});
            } else if (form[i] == '%') {
                text += static_cast<char>(std::stoi(form.substr(i + 1, 2), nullptr, 16));
                i += 2;
            } else {
                text += form[i];
                const bool mayStandBeforeBlank = std::string_view("[{,:").find(form[i]) != std::string_view::npos;
                text += mayStandBeforeBlank && OneIn(12) ? Text("w") : "";
            }
        }
        return text;
    }

    /// One in four is broken somewhere.
    std::string MaybeSpoilt(const std::string &name) {
        std::string text = Text(name);
        if (text.empty() || !OneIn(4)) {
            return text;
        }
        const std::size_t at = OneIn(8) ? 0 : Below(text.size() + 1);
        const std::size_t replaced = Below(2);
        if (OneIn(3)) {
            return text.substr(0, at);
        }
        return text.replace(at, replaced,
                            OneIn(3) ? std::string(1, static_cast<char>(Below(256))) : Text(OneIn(2) ? "q" : "t"));
    }

private:
    const Grammar &grammar_;
    std::mt19937_64 random_;
};

/// Queues with a line of just about the sizes at which the reader's buffer ends, and the longest line.
void CheckLongLines() {
    const std::string around = "{\"event\":256,\"path\":\"/a\"}\n";
    for (const std::size_t about : {64UL * 1024, 128UL * 1024, 1024UL * 1024, 1088UL * 1024}) {
        for (const std::size_t size : {about - 1, about, about + 1}) {
            std::string line = R"({"event":65536,"path":"/vol1/a/d","data":")";
            line.resize(size - 2, 'x');
            line += "\"}";
            CheckQueue(line, about / 2);
            CheckQueue(line + '\n', about);
            CheckQueue(std::string(around).append(line).append("\n").append(around), around.size() + about / 2);
        }
    }
}

void Check(const Grammar &grammar, unsigned long count) {
    struct {
        const char *name;
        const char *what;
        bool (*check)(std::string_view);
        unsigned long decided = 0;
    } subjects[] = {
        {"Q", "queue lines", CheckEvent}, {"F", "folder files", CheckFolders}, {"D", "documents", CheckWriter}};
    for (unsigned long i = 0; i < count; ++i) {
        Generator next(grammar, i);
        auto &subject = subjects[i % std::size(subjects)];
        subject.decided += subject.check(next.MaybeSpoilt(subject.name)) ? 1 : 0;
        if (i % 32 == 0) {
            const std::string queue = next.MaybeSpoilt("M");
            CheckQueue(queue, next.Below(queue.size() + 1));
        }
    }
    for (const auto &subject : subjects) {
        std::printf("%lu of %lu %s compared\n", subject.decided, count / std::size(subjects), subject.what);
        Require(subject.decided > count / 32, "so little shows nothing");
    }
}

}  // namespace

int main(int argc, char **argv) {
    if (argc < 3) {
        std::fputs("usage: fuzz_generated GRAMMAR COUNT [DIRECTORY]\n", stderr);
        return 2;
    }
    const Grammar grammar = ReadGrammar(argv[1]);
    const unsigned long count = std::stoul(argv[2]);
    if (argc == 3) {
        CheckLongLines();
        Check(grammar, count);
    }
    for (unsigned long i = 0; argc > 3 && i < count; ++i) {
        std::ofstream(argv[3] + ("/" + std::to_string(i))) << Generator(grammar, i).MaybeSpoilt({"QMFDUT"[i % 6]});
    }
    return 0;
}
