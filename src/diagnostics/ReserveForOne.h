// Growth of a vector before an element is created. Internal.
#pragma once

#include <vector>

// Makes the next push_back to `list` allocate nothing. The capacity grows geometrically.
template <typename Element>
void reserveForOne(std::vector<Element>& list)
{
    if (list.size() == list.capacity())
        list.reserve(2 * list.size() + 1);
}
