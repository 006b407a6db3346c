// What every fuzz target begins and ends with; FUZZ_TARGET is its function.

#include "base/unique_fd.h"
#include "checks.h"
#include "names.h"

#include <fcntl.h>
#include <fuzzer/FuzzedDataProvider.h>
#include <sys/file.h>
#include <unistd.h>

#include <cstdint>

namespace fileindex_fuzz {

namespace names = VORK::FILEINDEX::internal;

void FeedJsonDifferential(const std::string &text) {
    CheckEvent(text);
    CheckFolders(text);
    CheckWriter(text);
}

// Some bytes say where the queue is cut in two, and may blow up one place to the reader's block or longest line.
void FeedQueueFile(const std::string &bytes) {
    FuzzedDataProvider input(reinterpret_cast<const std::uint8_t *>(bytes.data()), bytes.size());
    const auto kind = input.ConsumeIntegral<std::uint8_t>();
    // Most inputs stay small: a large one costs as much as a thousand.
    const std::size_t least = (kind < 225 ? 0UL : kind < 254 ? 64UL : 1024UL) * 1024;
    const std::size_t filler = least == 0 ? 0 : least - 500 + input.ConsumeIntegralInRange(0, 512);
    const auto place = input.ConsumeIntegral<std::uint32_t>();
    const auto cut = input.ConsumeIntegral<std::uint32_t>();
    std::string text = input.ConsumeRemainingBytesAsString();
    text.insert(place % (text.size() + 1), filler, kind % 2 == 0 ? 'x' : ' ');
    CheckQueue(text, cut % (text.size() + 1));
}

void FUZZ_TARGET(const std::string &input);

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size) {
    ResetMachine();
    const int lowestFree = names::UniqueFd(dup(0)).Get();
    FUZZ_TARGET(std::string(reinterpret_cast<const char *>(data), size));
    TakeCommands();
    Require(names::UniqueFd(dup(0)).Get() == lowestFree, "a descriptor is left open");
    for (const char *lockFile : {names::kFolderLock, names::kStatusLock}) {
        const names::UniqueFd fd(open(lockFile, O_RDWR | O_CLOEXEC));
        Require(!fd || flock(fd.Get(), LOCK_EX | LOCK_NB) == 0, "a lock is still held", lockFile);
    }
    return 0;
}

}  // namespace fileindex_fuzz
