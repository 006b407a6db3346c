/// \file
/// The table of what is measured: each row an operation of the library, the straightforward way to do the same,
/// the physical floor, and the ratios that must be reached.
#pragma once

#include <functional>
#include <string>
#include <vector>

namespace bench {

/// Done once before a variant is measured; returns what is measured, which cleans up when it is destroyed.
using Variant = std::function<std::function<void()>()>;

struct Row {
    std::string name;
    Variant library;
    Variant baseline;               ///< may be empty
    std::size_t baselineParts = 1;  ///< the baseline does one of so many equal parts of the work
    Variant floor;                  ///< may be empty
    double mostOfFloor = 0;         ///< library / floor at most; 0: not checked
    double mostOfBaseline = 0;      ///< library / baseline at most; 0: not checked
};

/// `scale` divides the queue lengths: 1 measures, 100 only shows that everything runs.
std::vector<Row> Rows(std::size_t scale);

}  // namespace bench
