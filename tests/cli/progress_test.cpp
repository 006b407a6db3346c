// The rate and the estimate of "fileindexctl status --watch".
#include "facts/progress.h"

#include <gtest/gtest.h>

#include <vector>

namespace {

using VORK::FILEINDEXCTL::DurationText;
using VORK::FILEINDEXCTL::Progress;
using Files = std::map<std::string, unsigned long>;

struct Look {
    double time;
    Files files;
};

TEST(ProgressTest, TellsTheRateOrTheStandstill) {
    const struct {
        const char *what;
        std::vector<Look> looks;
        unsigned long done;
        const char *text;
    } rows[] = {
        {"never looked", {}, 0, "nothing waits"},
        {"one look", {{0, {{"a", 5}}}}, 0, "measuring"},
        {"grown only", {{0, {{"a", 5}}}, {10, {{"a", 50}}}}, 0, "measuring"},
        {"a queue is taken: nothing is done yet", {{0, {{"a", 5}}}, {10, {{"a", 5}, {"b", 1}}}}, 0, "measuring"},
        {"a file is gone",
         {{0, {{"a", 60}, {"b", 120}}}, {30, {{"b", 120}}}},
         60,
         "120/min no longer waiting, about 60 s left"},
        {"more came than went",
         {{0, {{"a", 60}}}, {30, {{"b", 600}}}},
         60,
         "120/min no longer waiting, about 5 min left"},
        {"a file shrinks",
         {{0, {{"a", 90}}}, {60, {{"a", 60}}}},
         30,
         "30/min no longer waiting, about 2 min left"},
        {"less than one a minute",
         {{0, {{"a", 9}}}, {550, {{"a", 9}}}, {600, {{"a", 8}}}},
         1,
         "6/h no longer waiting, about 80 min left"},
        {"all done", {{0, {{"a", 60}}}, {30, {}}}, 60, "nothing waits"},
        {"stands still from the start",
         {{0, {{"a", 5}}}, {720, {{"a", 5}, {"b", 1}}}},
         0,
         "no progress for 12 min"},
        {"stands still after work",
         {{0, {{"a", 9}}}, {30, {{"a", 8}}}, {89, {{"a", 8}}}, {95, {{"a", 8}}}},
         1,
         "no progress for 65 s"},
        {"was idle before", {{0, {}}, {9000, {{"a", 5}}}, {9050, {{"a", 5}}}}, 0, "measuring"},
        {"what was done long ago counts for nothing",
         {{0, {{"a", 900}}}, {60, {{"a", 100}}}, {500, {{"a", 99}}}, {1090, {{"a", 99}}}, {1095, {{"a", 98}}}},
         802,
         "7/h no longer waiting, about 14 h left"},
    };
    for (const auto &row : rows) {
        Progress progress;
        for (const auto &look : row.looks) {
            progress.Add(look.time, look.files);
        }
        EXPECT_EQ(progress.Done(), row.done) << row.what;
        EXPECT_EQ(progress.Text(), row.text) << row.what;
    }
}

TEST(ProgressTest, WritesDurations) {
    const struct {
        double seconds;
        const char *text;
    } rows[] = {{0, "0 s"},    {119.9, "119 s"}, {120, "2 min"},     {7199, "119 min"},
                {7200, "2 h"}, {172799, "47 h"}, {172800, "2 days"}, {864000, "10 days"}};
    for (const auto &row : rows) {
        EXPECT_EQ(DurationText(row.seconds), row.text);
    }
}

}  // namespace
