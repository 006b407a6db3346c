/// \file
/// What all fuzz targets share: their one kind of assertion, files, and the state of the in-memory platform.
#ifndef FILEINDEX_FUZZ_SUPPORT_H
#define FILEINDEX_FUZZ_SUPPORT_H

#include <json/value.h>

#include <string>
#include <string_view>
#include <vector>

namespace fileindex_fuzz {

/// Ends the program when the condition does not hold, so that the fuzzer keeps the input.
void Require(bool holds, const char *what, std::string_view about = {});

std::string ReadWhole(const std::string &path);  ///< empty when there is no such file
void WriteWhole(const std::string &path, std::string_view text);

/// The platform's shares with a directory below /vol1. "ro" is read-only.
inline constexpr const char *kShares[] = {"a", "b", "photo", "ro"};

std::string QueueOf(const std::string &share);

/// Forgets what the platform and the log have kept of earlier inputs.
void ForgetCalls();

/// That, and removes what the library may have left: configuration files and the shares' index data. Makes the
/// shares' directories when they are missing.
void ResetMachine();

/// The commands the daemon got since the last time, as {"type", "data"}; malformed frames end the program.
std::vector<Json::Value> TakeCommands();

/// Checks on destruction that both configuration locks are free and no descriptor is left open.
class LeakCheck {
public:
    LeakCheck();
    ~LeakCheck();
    LeakCheck(const LeakCheck &) = delete;
    LeakCheck &operator=(const LeakCheck &) = delete;

private:
    int lowest_free_;
};

}  // namespace fileindex_fuzz

#endif
