// The sine and cosine of deformers.clh, with sums and products fused or not.
#ifdef NotFused
#pragma OPENCL FP_CONTRACT OFF
#endif
#include "deformers.clh"

kernel void sinesAndCosines(const uint count, global const float* angles, global float* sines,
                            global float* cosines)
{
    const size_t i = get_global_id(0);
    if (i >= count)
        return;
    float sine;
    float cosine;
    sineAndCosine(angles[i], &sine, &cosine);
    sines[i] = sine;
    cosines[i] = cosine;
}
