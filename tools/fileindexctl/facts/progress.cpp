#include "facts/progress.h"

#include <cmath>

namespace VORK::FILEINDEXCTL {

namespace {

constexpr double kMinute = 60;
constexpr double kHour = 60 * kMinute;
constexpr double kDay = 24 * kHour;
constexpr double kWindow = 10 * kMinute;
constexpr double kStandstill = kMinute;  // shorter ones are no news: large files take their time

std::string Whole(double number) {
    return std::to_string(std::llround(std::floor(number)));
}

std::string RateText(double perSecond) {
    const bool slow = perSecond * kMinute < 1;
    return std::to_string(std::llround(perSecond * (slow ? kHour : kMinute))) + (slow ? "/h" : "/min");
}

}  // namespace

void Progress::Add(double time, const std::map<std::string, unsigned long> &files) {
    unsigned long done = 0;
    for (const auto &[file, before] : files_) {
        const auto found = files.find(file);
        const unsigned long now = found == files.end() ? 0 : found->second;
        done += before > now ? before - now : 0;
    }
    // A queue that was empty and gets work: nobody has stood still before.
    if (looks_.empty() || done > 0 || Left() == 0) {
        lastProgress_ = time;
    }
    looks_.push_back({time, Done() + done});
    files_ = files;
    while (looks_.size() > 2 && looks_[1].time <= time - kWindow) {
        looks_.pop_front();
    }
}

unsigned long Progress::Left() const {
    unsigned long left = 0;
    for (const auto &[file, events] : files_) {
        left += events;
    }
    return left;
}

std::optional<double> Progress::Rate() const {
    if (looks_.size() < 2 || looks_.back().done == looks_.front().done ||
        looks_.back().time <= looks_.front().time) {
        return std::nullopt;
    }
    return static_cast<double>(looks_.back().done - looks_.front().done) /
           (looks_.back().time - looks_.front().time);
}

std::optional<double> Progress::SecondsLeft() const {
    const auto rate = Rate();
    return rate ? std::optional<double>(static_cast<double>(Left()) / *rate) : std::nullopt;
}

double Progress::SecondsWithoutProgress() const {
    return looks_.empty() || Left() == 0 ? 0 : looks_.back().time - lastProgress_;
}

std::string Progress::Text() const {
    if (Left() == 0) {
        return "nothing waits";
    }
    if (SecondsWithoutProgress() >= kStandstill) {
        return "no progress for " + DurationText(SecondsWithoutProgress());
    }
    const auto rate = Rate();
    return rate ? RateText(*rate) + " no longer waiting, about " + DurationText(*SecondsLeft()) + " left"
                : "measuring";
}

std::string DurationText(double seconds) {
    if (seconds < 2 * kMinute) {
        return Whole(seconds) + " s";
    }
    if (seconds < 2 * kHour) {
        return Whole(seconds / kMinute) + " min";
    }
    return seconds < 2 * kDay ? Whole(seconds / kHour) + " h" : Whole(seconds / kDay) + " days";
}

}  // namespace VORK::FILEINDEXCTL
