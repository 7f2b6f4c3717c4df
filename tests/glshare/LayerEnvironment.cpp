// The entry of the test programs: puts the layer that was built in front of the runtime, and sets
// the environment variables given as arguments of the form NAME=VALUE. The OpenCL loader and the
// layer look at the environment when the first OpenCL function is called.
#include <gtest/gtest.h>

#include <cstdlib>

int main(int argc, char** argv)
{
    setenv("OPENCL_LAYERS", GLSHARE_LAYER, 1);
    testing::InitGoogleTest(&argc, argv);
    for (int i = 1; i < argc; ++i)
        putenv(argv[i]);
    return RUN_ALL_TESTS();
}
