// Comparison of names.
#include <vork/text.h>

#include <gtest/gtest.h>

#include <algorithm>
#include <random>
#include <string>
#include <vector>

namespace {

int Compare(const std::string &a, const std::string &b) {
    return std::clamp(VLIBCUnicodeUTF8StrCaseCmp(a.c_str(), b.c_str()), -1, 1);
}

TEST(TextTest, FoldsCase) {
    const struct {
        const char *a, *b;
        int expected;
    } rows[] = {
        {"", "", 0},
        {"", "a", -1},
        {"photo", "PHOTO", 0},
        {"Photo", "photos", -1},
        {"a", "B", -1},
        {"Z", "a", 1},
        {"_", "a", -1},
        {"[", "A", -1},
        {"é", "É", 0},
        {"ÄPFEL", "äpfel", 0},
        {"straße", "STRASSE", 0},
        {"Σίσυφος", "ΣΊΣΥΦΟΣ", 0},
        {"k", "\u212A", 0},
        {"z", "é", -1},
        {"é", "z", 1},
        {"ЖУК", "жук", 0},
        {"photo", "phöto", -1},
        {"\xFF", "\xFF", 0},
        {"\xFE", "\xFF", -1},
        {"A\xFF", "a\xFF", 0},
        {"é\x80", "É\x80", 0},
        {"\xC3", "é", 1},
        {"z", "\x80", -1},
        {"\xED\xA0\x80", "a", 1},
    };
    for (const auto &row : rows) {
        EXPECT_EQ(Compare(row.a, row.b), row.expected) << row.a << " " << row.b;
        EXPECT_EQ(Compare(row.b, row.a), -row.expected) << row.b << " " << row.a;
    }
    EXPECT_EQ(VLIBCUnicodeUTF8StrCaseCmp(nullptr, ""), 0);
    EXPECT_LT(VLIBCUnicodeUTF8StrCaseCmp(nullptr, "a"), 0);
}

// Short texts from few pieces, so that equal and nearly equal ones come up often.
std::string RandomText(std::mt19937 &random) {
    static const std::vector<std::string> pieces = {
        "a",      "A",    "b",    "z",    "_",    "[",    "é",        "É",          "ß",
        "ss",     "σ",    "ς",    "Σ",    "i",    "İ",    "ı",        "K",          "\u212A",
        "\u0307", "\xC3", "\x80", "\xFF", "\xFE", "\xF0", "\xE2\x84", "\U00010400", "\U00010428"};
    std::string text;
    for (unsigned int count = random() % 4; count > 0; --count) {
        text += pieces[random() % pieces.size()];
    }
    return text;
}

// Sorting with anything less is undefined.
TEST(TextTest, IsAStrictWeakOrderForAnyBytes) {
    std::mt19937 random(20151104);
    for (int i = 0; i < 200000; ++i) {
        const std::string a = RandomText(random);
        const std::string b = RandomText(random);
        const std::string c = RandomText(random);
        const int ab = Compare(a, b);
        const int bc = Compare(b, c);
        const int ac = Compare(a, c);
        ASSERT_EQ(Compare(a, a), 0);
        ASSERT_EQ(Compare(b, a), -ab);
        ASSERT_TRUE(ab != bc || ac == ab) << testing::PrintToString(std::vector{a, b, c});
        ASSERT_TRUE(ab != 0 || ac == bc) << testing::PrintToString(std::vector{a, b, c});
    }
}

}  // namespace
