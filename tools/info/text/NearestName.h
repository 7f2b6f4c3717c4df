// The name that somebody who mistyped probably meant.
#pragma once

#include <string>
#include <vector>

namespace info {

// The entry of `names` that is nearest to `text` in number of typing mistakes, upper and lower case
// being alike. Null when all are too far away to be meant.
const std::string* nearestName(const std::string& text, const std::vector<std::string>& names);

} // namespace info
