#include "harness/Statistics.h"

#include <algorithm>
#include <cmath>
#include <cstddef>

double percentile(const std::vector<double>& sorted, double share)
{
    const double position = share * static_cast<double>(sorted.size() - 1);
    const double below = std::floor(position);
    const auto index = static_cast<std::size_t>(below);
    if (index + 1 >= sorted.size())
        return sorted.back();
    return std::lerp(sorted[index], sorted[index + 1], position - below);
}

Spread spreadOf(std::vector<double> samples)
{
    if (samples.empty())
        return {};
    std::sort(samples.begin(), samples.end());
    return {percentile(samples, 0.5), percentile(samples, 0.1), percentile(samples, 0.9)};
}
