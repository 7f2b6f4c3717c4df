// What the samples of one quantity have in common.
#pragma once

#include <vector>

// The median and the 10th and 90th percentile.
struct Spread {
    double median = 0;
    double low = 0;
    double high = 0;
};

// The value below which `share` (0 to 1) of `sorted`, which is ascending and not empty, lies;
// between two samples it is interpolated.
double percentile(const std::vector<double>& sorted, double share);

// All zero for no samples.
Spread spreadOf(std::vector<double> samples);
