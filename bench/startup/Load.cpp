// Opens the libraries given as arguments, in order, and prints the milliseconds that each takes to
// load. A separate program, since none of the libraries may be loaded already.
#include <chrono>
#include <cstdio>

#include <dlfcn.h>

int main(int argumentCount, char** arguments)
{
    for (int index = 1; index < argumentCount; ++index) {
        const auto begin = std::chrono::steady_clock::now();
        if (!dlopen(arguments[index], RTLD_NOW | RTLD_GLOBAL)) {
            std::fprintf(stderr, "vyra-opencl-bench-load: %s\n", dlerror());
            return 1;
        }
        const std::chrono::duration<double, std::milli> time =
            std::chrono::steady_clock::now() - begin;
        std::printf("%.3f %s\n", time.count(), arguments[index]);
    }
    return 0;
}
