#include "measure.h"

#include <sys/resource.h>
#include <sys/time.h>

#include <algorithm>
#include <ctime>
#include <vector>

namespace bench {

namespace {

constexpr double kBatch = 0.01;  // seconds of a batch, unless one run takes longer
constexpr double kEnough = 3;    // seconds of a variant
constexpr double kImprovement = 0.99;
constexpr int kQuietBatches = 25;  // of each variant, while none gets faster

/// Of this thread and the processes it has waited for.
double ProcessorSeconds() {
    timespec own = {};
    clock_gettime(CLOCK_THREAD_CPUTIME_ID, &own);
    rusage children = {};
    getrusage(RUSAGE_CHILDREN, &children);
    const auto seconds = [](const timeval &time) {
        return static_cast<double>(time.tv_sec) + static_cast<double>(time.tv_usec) / 1e6;
    };
    return static_cast<double>(own.tv_sec) + static_cast<double>(own.tv_nsec) / 1e9 + seconds(children.ru_utime) +
           seconds(children.ru_stime);
}

class Subject {
public:
    Subject(const Variant &variant, double &best) : variant_(variant), best_(best) {}

    /// True when this was clearly the fastest batch so far.
    bool RunBatch() {
        const std::function<void()> operation = variant_();
        const double begin = ProcessorSeconds();
        for (int run = 0; run < runs_; ++run) {
            operation();
        }
        const double spent = ProcessorSeconds() - begin;
        const double time = spent / runs_;
        const bool faster = best_ == 0 || time < best_ * kImprovement;
        best_ = best_ == 0 ? time : std::min(best_, time);
        runs_ = std::max(1, static_cast<int>(kBatch / std::max(best_, 1e-9)));
        spent_ += spent;
        ++quiet_;
        return faster;
    }

    void StayLonger() { quiet_ = 0; }
    bool IsDone() const { return quiet_ >= kQuietBatches || spent_ >= kEnough; }
    double Spent() const { return spent_; }

private:
    const Variant &variant_;
    double &best_;
    double spent_ = 0;
    int runs_ = 1;
    int quiet_ = 0;
};

}  // namespace

Times Measure(const Row &row, bool once) {
    Times times;
    std::vector<Subject> subjects;
    const auto add = [&](const Variant &variant, double &best) {
        if (variant) {
            subjects.emplace_back(variant, best);
        }
    };
    add(row.library, times.library);
    add(row.floor, times.floor);
    add(row.baseline, times.baseline);
    for (Subject &subject : subjects) {
        subject.RunBatch();
    }
    const auto isDone = [](const Subject &subject) { return subject.IsDone(); };
    const auto hadLess = [](const Subject &a, const Subject &b) { return a.Spent() < b.Spent(); };
    while (!once && !std::all_of(subjects.begin(), subjects.end(), isDone)) {
        // All get the same time, so that each meets the same quiet moments.
        if (std::min_element(subjects.begin(), subjects.end(), hadLess)->RunBatch()) {
            std::for_each(subjects.begin(), subjects.end(), [](Subject &subject) { subject.StayLonger(); });
        }
    }
    return times;
}

}  // namespace bench
