/// \file
/// How long the variants of a row take, told apart from what else the machine does.
#pragma once

#include "rows.h"

namespace bench {

/// Seconds of one run; 0 for a variant that the row does not have.
struct Times {
    double library = 0;
    double baseline = 0;
    double floor = 0;
};

/// Runs the variants by turns, in short batches, and keeps the fastest batch of each: what disturbs a batch only
/// makes it slower. Counts the time that the processor spends on them, not what they wait for a turn on it. Goes
/// on until none gets faster. `once` only shows that they run.
Times Measure(const Row &row, bool once);

}  // namespace bench
