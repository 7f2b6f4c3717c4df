// What fuzz targets check: a requirement that does not hold ends the process with its line.
#pragma once

#include <cstdlib>
#include <iostream>

inline void require(bool holds, int line = __builtin_LINE())
{
    if (holds)
        return;
    std::cerr << "The requirement in line " << line << " does not hold.\n";
    std::abort();
}
