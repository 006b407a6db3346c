// Comparison of names.
#include <vork/text.h>

#include <gtest/gtest.h>

#include <algorithm>
#include <string>
#include <vector>

namespace {

int Compare(const std::string &a, const std::string &b) {
    return std::clamp(VLIBCUnicodeUTF8StrCaseCmp(a.c_str(), b.c_str()), -1, 1);
}

struct Ranked {
    std::string text;
    int rank;  ///< of equal texts the same
};

void ExpectOrder(const std::vector<Ranked> &texts) {
    for (const Ranked &a : texts) {
        for (const Ranked &b : texts) {
            ASSERT_EQ(Compare(a.text, b.text), std::clamp(a.rank - b.rank, -1, 1)) << a.text << " " << b.text;
        }
    }
}

TEST(TextTest, FoldsCaseAndOrdersAnyBytes) {
    ExpectOrder({{"", 0},
                 {"[", 1},
                 {"_", 2},
                 {"a", 3},
                 {"A", 3},
                 {"a\xFF", 4},
                 {"A\xFF", 4},
                 {"B", 5},
                 {"k", 6},
                 {"\u212A", 6},
                 {"photo", 7},
                 {"PHOTO", 7},
                 {"Photos", 8},
                 {"phöto", 9},
                 {"straße", 10},
                 {"STRASSE", 10},
                 {"z", 11},
                 {"Z", 11},
                 {"ÄPFEL", 12},
                 {"äpfel", 12},
                 {"é", 13},
                 {"É", 13},
                 {"é\x80", 14},
                 {"É\x80", 14},
                 {"Σίσυφος", 15},
                 {"ΣΊΣΥΦΟΣ", 15},
                 {"ЖУК", 16},
                 {"жук", 16},
                 {"\x80", 17},
                 {"\xC3", 18},
                 {"\xED\xA0\x80", 19},
                 {"\xFE", 20},
                 {"\xFF", 21}});
    EXPECT_EQ(VLIBCUnicodeUTF8StrCaseCmp(nullptr, ""), 0);
    EXPECT_LT(VLIBCUnicodeUTF8StrCaseCmp(nullptr, "a"), 0);
}

// Sorting with anything less is undefined.
TEST(TextTest, IsAStrictWeakOrderForAnyBytes) {
    std::vector<Ranked> texts;
    const std::string pieces[] = {"",     "a",    "A",    "b",    "z",        "_",          "[",
                                  "é",    "É",    "ß",    "ss",   "σ",        "ς",          "Σ",
                                  "i",    "İ",    "ı",    "K",    "\u212A",   "\u0307",     "\xC3",
                                  "\x80", "\xFF", "\xFE", "\xF0", "\xE2\x84", "\U00010400", "\U00010428"};
    for (const std::string &first : pieces) {
        for (const std::string &second : pieces) {
            texts.push_back({first + second, 0});
        }
    }
    std::sort(texts.begin(), texts.end(), [](auto &a, auto &b) { return Compare(a.text, b.text) < 0; });
    for (size_t i = 1; i < texts.size(); ++i) {
        texts[i].rank = texts[i - 1].rank + (Compare(texts[i - 1].text, texts[i].text) == 0 ? 0 : 1);
    }
    ExpectOrder(texts);
}

}  // namespace
