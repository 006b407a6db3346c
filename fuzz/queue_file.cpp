// Any bytes as a queue file. The last bytes say where it is cut in two, and may blow up one place of it to the
// size of the reader's block or of its longest line.

#include "queue_checks.h"

#include <fuzzer/FuzzedDataProvider.h>

#include <string>

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size) {
    FuzzedDataProvider input(data, size);
    const auto kind = input.ConsumeIntegral<std::uint8_t>();
    const auto place = input.ConsumeIntegral<std::uint16_t>();
    const auto excess = input.ConsumeIntegralInRange<std::size_t>(0, 512);
    const auto where = input.ConsumeIntegral<std::uint16_t>();
    std::string text = input.ConsumeRemainingBytesAsString();
    constexpr std::uint8_t kBlock = 225;  // most inputs stay small: a large one costs as much as a thousand
    constexpr std::uint8_t kLongest = 254;
    if (kind >= kBlock) {
        const std::size_t filler = (kind >= kLongest ? 1024UL : 64UL) * 1024 + excess - 500;
        text.insert(place % (text.size() + 1), std::string(filler, kind % 2 == 0 ? 'x' : ' '));
    }
    fileindex_fuzz::CheckQueue(text,
                               kind >= kBlock ? where * 20UL % (text.size() + 1) : where % (text.size() + 1));
    return 0;
}
