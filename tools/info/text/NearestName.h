// Suggestions for misspelt names.
#pragma once

#include <string>
#include <vector>

namespace info {

// Returns the entry of `names` with the smallest edit distance to `text`, regardless of case. Null
// if none is near.
const std::string* nearestName(const std::string& text, const std::vector<std::string>& names);

} // namespace info
