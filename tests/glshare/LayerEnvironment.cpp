// The entry of the test programs: puts the layer that was built in front of the runtime. The OpenCL
// loader looks at the environment when its first function is called.
#include <gtest/gtest.h>

#include <cstdlib>

int main(int argc, char** argv)
{
    setenv("OPENCL_LAYERS", GLSHARE_LAYER, 1);
    testing::InitGoogleTest(&argc, argv);
    return RUN_ALL_TESTS();
}
