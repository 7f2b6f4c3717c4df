// Edit this file while the program runs.
kernel void ripple(const uint vertexCount, global const float* positions,
                   global const float* normals, global float* deformedPositions,
                   global float* deformedNormals, const float time)
{
    const size_t vertex = get_global_id(0);
    if (vertex >= vertexCount)
        return;
    float3 p = vload3(vertex, positions);
    p.y = 1.0f;
    vstore3(p, vertex, deformedPositions);
    vstore3(vload3(vertex, normals), vertex, deformedNormals);
}
