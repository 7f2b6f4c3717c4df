// A result that shows both ways of a shared buffer: OpenGL's value comes in, OpenCL's goes out.
// Work-items beyond `count` are padding.
__kernel void deform(__global float* positions, float offset, uint count)
{
    const size_t index = get_global_id(0);
    if (index < count)
        positions[index] = 2.0f * positions[index] + offset;
}
