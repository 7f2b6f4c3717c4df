// The main function of the test programs. It sets OPENCL_LAYERS to the built layer, and the
// variables that are passed as arguments of the form NAME=VALUE. The OpenCL loader and the layer
// read the environment with the first OpenCL call.
#include <gtest/gtest.h>

#include <cstdlib>

// Called by AddressSanitizer. A large quarantine of freed memory would look like a leak to the test
// that measures the size of the process.
extern "C" [[gnu::visibility("default")]] const char* __asan_default_options()
{
    return "quarantine_size_mb=16";
}

// Called by ThreadSanitizer. It cannot see how the runtime and the OpenGL driver synchronise, since
// they are not built for it.
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
