#include "repairs.h"

#include "../config_lock.h"
#include "../failure.h"
#include "../status_file.h"
#include "../text.h"

#include <algorithm>
#include <array>
#include <ctime>
#include <filesystem>
#include <system_error>

namespace fileindexctl::doctor {

namespace {

std::string Stamp() {
    const std::time_t now = std::time(nullptr);
    std::tm local{};
    localtime_r(&now, &local);
    std::array<char, 32> text{};
    std::strftime(text.data(), text.size(), "%Y%m%d-%H%M%S", &local);
    return text.data();
}

// The name of the copy; empty when there is nothing to copy. Never takes the place of another file.
std::string KeepCopy(const std::string &path) {
    namespace fs = std::filesystem;
    std::error_code error;
    if (!fs::exists(path, error)) {
        return {};
    }
    const std::string first = path + "." + Stamp();
    std::string copy = first;
    for (int number = 2; fs::exists(fs::symlink_status(copy, error)); ++number) {
        copy = first + "-" + std::to_string(number);
    }
    if (!fs::copy_file(path, copy, fs::copy_options::none, error)) {
        throw Failure(ExitStatus::CannotSave, "no copy of " + path + " could be kept: " + error.message());
    }
    return copy;
}

void Report(const std::string &target, const std::string &copy, Output &output) {
    Json::Value entry(Json::objectValue);
    entry["target"] = target;
    entry["copy"] = copy.empty() ? Json::Value() : Json::Value(copy);
    output.Data()["changed"].append(entry);
    output.Line(Printable("changed " + target + (copy.empty() ? "" : "; as it was: " + copy)));
}

// All edits of status.conf, on what it holds now.
void Edit(const Repairs &repairs, Patience &patience, Output &output) {
    StatusFile file;
    ForgetErrors();
    const ConfigLock lock(file, patience);
    if (!lock.IsHeld()) {
        throw FailureOf(file);
    }
    const bool replaces =
        std::any_of(repairs.begin(), repairs.end(), [](const Repair &repair) { return repair.replaces; });
    if (!file.Load() && !replaces) {
        throw FailureOf(file);
    }
    bool any = false;
    for (const auto &repair : repairs) {
        if (repair.edit) {
            repair.edit(file.Document());
            any = true;
        }
    }
    if (!any) {
        return;
    }
    const std::string copy = KeepCopy(file.GetPath());
    ForgetErrors();
    if (!file.Save()) {
        throw FailureOf(file);
    }
    Report(file.GetPath(), copy, output);
}

void Act(const Repair &repair, Output &output) {
    const std::string copy = repair.keepsCopy ? KeepCopy(repair.target) : std::string();
    repair.act();
    Report(repair.target, copy, output);
}

template <typename Step>
void Try(Step step, Output &output) {
    try {
        step();
    } catch (const Failure &failure) {
        output.Warn(failure.what());
    }
}

}  // namespace

void ShowDifference(const Repairs &repairs, Output &output) {
    for (const auto &repair : repairs) {
        output.Line(Printable("to change: " + repair.target));
        for (const auto &line : repair.difference) {
            output.Line("  " + output.Paint(line.front() == '-' ? Colour::Bad : Colour::Good, Printable(line)));
        }
    }
}

void CarryOut(const Repairs &repairs, Patience &patience, Output &output) {
    // Directories, owners and modes come first: saving needs them.
    for (const auto &repair : repairs) {
        if (repair.act) {
            Try([&] { Act(repair, output); }, output);
        }
    }
    Try([&] { Edit(repairs, patience, output); }, output);
}

}  // namespace fileindexctl::doctor
