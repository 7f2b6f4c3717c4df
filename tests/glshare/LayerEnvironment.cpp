// The entry of the test programs: puts the layer that was built in front of the runtime, and sets
// the environment variables given as arguments of the form NAME=VALUE. The OpenCL loader and the
// layer look at the environment when the first OpenCL function is called.
#include <gtest/gtest.h>

#include <cstdlib>

// AddressSanitizer asks this in builds that have it. Freed memory that it keeps back in large
// amounts would look like a leak to the test that watches the size of the process.
extern "C" [[gnu::visibility("default")]] const char* __asan_default_options()
{
    return "quarantine_size_mb=16";
}

// ThreadSanitizer asks this. The runtime and the OpenGL driver are not built for it, so that it
// cannot see how they synchronise.
extern "C" [[gnu::visibility("default")]] const char* __tsan_default_suppressions()
{
    return "deadlock:libpocl\nrace:swrast_dri\n";
}

int main(int argc, char** argv)
{
    setenv("OPENCL_LAYERS", GLSHARE_LAYER, 1);
    testing::InitGoogleTest(&argc, argv);
    for (int i = 1; i < argc; ++i)
        putenv(argv[i]);
    return RUN_ALL_TESTS();
}
