// What the disk holds when the power fails at any moment of a save.
//
// The calls of a real save are recorded and replayed on a disk that keeps its own counsel: of what was not
// flushed, any page may have arrived and any length, in any combination. Each such disk is handed to the library
// again.
#include "fixture.h"

#include <algorithm>
#include <cstddef>
#include <functional>
#include <random>
#include <string>
#include <vector>

namespace fileindex_test {
namespace {

using Kind = FileChange::Kind;

/// Changes the platter if it arrives: a part of a write within one block, or a length.
class Disk {
public:
    explicit Disk(std::string content) : platter_(std::move(content)), length_(platter_.size()) {}

    void Arrive(const FileChange &part) {
        if (part.kind == Kind::kLength) {
            // What lies beyond a shorter length is gone; beyond the old end of a longer one are zeros.
            platter_.resize(std::min(platter_.size(), std::max(length_, part.at)));
            if (part.at < length_) {
                platter_.resize(part.at);
            }
            length_ = part.at;
            return;
        }
        platter_.resize(std::max(platter_.size(), part.at + part.data.size()));
        platter_.replace(part.at, part.data.size(), part.data);
    }

    [[nodiscard]] std::string Content() const {
        std::string content = platter_.substr(0, length_);
        content.resize(length_);
        return content;
    }

private:
    std::string platter_;  // also what has arrived beyond the length
    size_t length_;
};

/// The parts of a change that can arrive one without the other.
std::vector<FileChange> PartsOf(const FileChange &change, size_t &length, size_t block) {
    if (change.kind == Kind::kLength) {
        length = change.at;
        return {change};
    }
    std::vector<FileChange> parts;
    const size_t end = change.at + change.data.size();
    for (size_t at = change.at; at < end;) {
        const size_t next = std::min(end, (at / block + 1) * block);
        parts.push_back({Kind::kWrite, at, change.data.substr(at - change.at, next - at)});
        at = next;
    }
    if (end > length) {
        length = end;
        parts.push_back({Kind::kLength, end});
    }
    return parts;
}

using Visitor = std::function<void(const std::string &content, bool saved)>;

/// Every disk that a power cut during or after the changes can leave; of very many, some hundred.
void VisitDisks(const std::string &before, const std::vector<FileChange> &changes, size_t block,
                const Visitor &visit) {
    constexpr size_t kMostParts = 8;
    std::mt19937 random(1);
    Disk disk(before);
    size_t length = before.size();
    std::vector<FileChange> pending;
    for (size_t i = 0; i <= changes.size(); ++i) {
        const bool ended = i == changes.size();
        if (!ended && changes[i].kind != Kind::kFlush) {
            const auto parts = PartsOf(changes[i], length, block);
            pending.insert(pending.end(), parts.begin(), parts.end());
        }
        const bool all = pending.size() <= kMostParts;
        for (size_t n = 0; n < size_t{1} << std::min(pending.size(), kMostParts); ++n) {
            Disk left = disk;
            for (size_t part = 0; part < pending.size(); ++part) {
                if (all ? (n >> part & 1U) != 0 : random() % 2 == 0) {
                    left.Arrive(pending[part]);
                }
            }
            visit(left.Content(), ended);
        }
        if (!ended && changes[i].kind == Kind::kFlush) {
            std::for_each(pending.begin(), pending.end(), [&](const FileChange &part) { disk.Arrive(part); });
            pending.clear();
        }
    }
}

/// A document of so many bytes with its newline.
std::string TextOf(char c, size_t size) {
    return "{\"" + std::string(size - 7, c) + "\":1}";
}

class PowerCut : public FileIndexTest {
protected:
    /// Every disk that a cut during the save of `text` over `content` can leave holds one or the other document.
    static void Check(const std::string &content, const std::string &text, size_t block,
                      const Visitor &visit = {}) {
        GivenStatusConf(content);
        const std::string old = Loaded();
        Script::Current().watched = kStatusConf;
        Script::Current().changes.clear();
        EXPECT_TRUE(Document(text).Save());
        Script::Current().watched.clear();
        const auto changes = Script::Current().changes;
        VisitDisks(content, changes, block, [&](const std::string &left, bool saved) {
            GivenStatusConf(left);
            const std::string loaded = Loaded();
            ASSERT_TRUE(loaded == text || (loaded == old && !saved)) << content.size() << " " << text.size();
            if (visit) {
                visit(left, saved);
            }
        });
    }

    static std::string Loaded() {
        Document document;
        return document.Load() ? document.Text() : "(unreadable)";
    }
};

TEST_F(PowerCut, LeavesTheOldOrTheNewDocument) {
    const size_t sizes[] = {20, 4095, 4096, 9000};
    for (const size_t block : {4096U, 512U}) {
        for (const size_t oldSize : sizes) {
            for (const size_t newSize : sizes) {
                Check(TextOf('o', oldSize) + "\n", TextOf('n', newSize), block);
            }
        }
    }
}

TEST_F(PowerCut, DuringTheNextSaveIsNoWorse) {
    for (const size_t newSize : {20U, 5000U}) {
        Check(TextOf('o', 4097) + "\n", TextOf('n', newSize), 4096,
              [](const std::string &left, bool /*saved*/) { Check(left, TextOf('x', 4000), 4096); });
    }
}

TEST_F(PowerCut, FindsANewFileWholeOrNotAtAll) {
    EXPECT_TRUE(Document(R"({"a":1})").Save());
    std::string order;
    for (const auto &[call, about] : Script::Current().Calls()) {
        if (call == "write" || call == "fsync" || call == "linkat") {
            order += call + (about == kConfigDir ? " of the directory, " : ", ");
        }
    }
    EXPECT_EQ("write, fsync, linkat, fsync of the directory, ", order);
}

}  // namespace
}  // namespace fileindex_test
