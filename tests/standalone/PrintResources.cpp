// Prints the resource directory that the library next to this program finds.
#include "host/Application.h"

#include <cstdio>

int main()
{
    return std::puts(TappLocale::getResourcesLocation().asChar()) < 0 ? 1 : 0;
}
