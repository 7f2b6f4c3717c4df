// Two deformers whose results depend on the order in which they ran. Work-items from `count` on are padding.

__kernel void add(__global float* data, float amount, uint count)
{
    const size_t index = get_global_id(0);
    if (index < count)
        data[index] += amount;
}

__kernel void scale(__global float* data, float amount, uint count)
{
    const size_t index = get_global_id(0);
    if (index < count) {
#ifdef SupportsDoublePrecision
        data[index] = (float)((double)data[index] * (double)amount);
#else
        data[index] *= amount;
#endif
    }
}
