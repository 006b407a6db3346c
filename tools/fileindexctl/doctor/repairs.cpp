// Mending what was found.
#include "doctor/finding.h"
#include "facts/config_lock.h"
#include "report/schedule.h"

#include <algorithm>
#include <cstdio>
#include <ctime>
#include <filesystem>
#include <system_error>

namespace VORK::FILEINDEXCTL::DOCTOR {

namespace fs = std::filesystem;

namespace {

// Never that of another file.
std::string FreeName(const std::string &path) {
    const std::string first = path + "." + LocalTime(std::time(nullptr), "%Y%m%d-%H%M%S");
    std::string name = first;
    std::error_code error;
    for (int number = 2; fs::exists(fs::symlink_status(name, error)); ++number) {
        name = first + "-" + std::to_string(number);
    }
    return name;
}

void Report(const std::string &target, const std::string &copy, Output &output) {
    Json::Value entry(Json::objectValue);
    entry["target"] = target;
    entry["copy"] = copy.empty() ? Json::Value() : Json::Value(copy);
    output.Data()["changed"].append(entry);
    output.Line("changed " + target + (copy.empty() ? "" : "; as it was: " + copy));
}

// All edits of status.conf, on what it holds now.
void Edit(const Repairs &repairs, Patience &patience, Output &output) {
    StatusFile file;
    ForgetErrors();
    const ConfigLock lock(file, patience);
    const bool replaces = std::any_of(repairs.begin(), repairs.end(), std::mem_fn(&Repair::replaces));
    if (!lock.IsHeld() || (!file.Load() && !replaces)) {
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

template <typename Step>
void Try(Step step, Output &output) {
    try {
        step();
    } catch (const Failure &failure) {
        output.Warn(failure.what());
    }
}

}  // namespace

std::string SetAside(const std::string &path) {
    std::string name = FreeName(path);
    if (rename(path.c_str(), name.c_str()) != 0) {
        throw ErrnoFailure(path, "set aside");
    }
    return name;
}

std::string KeepCopy(const std::string &path) {
    std::error_code error;
    if (!fs::exists(path, error)) {
        return {};
    }
    std::string copy = FreeName(path);
    if (!fs::copy_file(path, copy, fs::copy_options::none, error)) {
        throw Failure(ExitStatus::kCannotSave, "no copy of " + path + " could be kept: " + error.message());
    }
    return copy;
}

void CarryOut(const Repairs &repairs, Patience &patience, Output &output) {
    // Directories, owners and modes come first: saving needs them.
    for (const auto &repair : repairs) {
        if (repair.act) {
            Try(
                [&] {
                    std::string copy;
                    repair.act(patience, copy);
                    Report(repair.target, copy, output);
                },
                output);
        }
    }
    Try([&] { Edit(repairs, patience, output); }, output);
}

}  // namespace VORK::FILEINDEXCTL::DOCTOR
