#include "tools/info/text/NearestName.h"

#include <algorithm>
#include <cctype>
#include <cstddef>
#include <numeric>

namespace info {
namespace {

// Two names are near with at most one edit in this many letters.
constexpr std::size_t kLettersPerEdit = 3;

char folded(char letter)
{
    return static_cast<char>(std::tolower(static_cast<unsigned char>(letter)));
}

// Returns the Levenshtein distance regardless of case.
std::size_t editDistance(const std::string& from, const std::string& to)
{
    std::vector<std::size_t> row(to.size() + 1);
    std::iota(row.begin(), row.end(), std::size_t{0});
    for (std::size_t i = 0; i < from.size(); ++i) {
        std::size_t diagonal = row[0];
        row[0] = i + 1;
        for (std::size_t j = 0; j < to.size(); ++j) {
            const std::size_t replaced = diagonal + (folded(from[i]) != folded(to[j]) ? 1 : 0);
            diagonal = row[j + 1];
            row[j + 1] = std::min({replaced, row[j] + 1, row[j + 1] + 1});
        }
    }
    return row.back();
}

} // namespace

const std::string* nearestName(const std::string& text, const std::vector<std::string>& names)
{
    const std::string* nearest = nullptr;
    std::size_t fewest = 0;
    for (const std::string& name : names) {
        const std::size_t count = editDistance(text, name);
        if (count * kLettersPerEdit > std::max(text.size(), name.size()))
            continue;
        if (!nearest || count < fewest) {
            nearest = &name;
            fewest = count;
        }
    }
    return nearest;
}

} // namespace info
