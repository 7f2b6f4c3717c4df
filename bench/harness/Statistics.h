// Statistics of the samples of one quantity.
#pragma once

#include <vector>

// The median and the 10th and 90th percentile.
struct Spread {
    double median = 0;
    double low = 0;
    double high = 0;
};

// Returns the value below which the share `share` (0 to 1) of the samples lies, interpolated
// between samples. `sorted` is ascending and not empty.
double percentile(const std::vector<double>& sorted, double share);

// Returns zeros if there are no samples.
Spread spreadOf(std::vector<double> samples);
