// Replaces each number n in the vertex buffers with 2 n + offset.
kernel void selfTest(const uint vertexCount, global const float* positions,
                     global const float* normals, global float* vertexPositions,
                     global float* vertexNormals, const float offset)
{
    const size_t vertex = get_global_id(0);
    if (vertex >= vertexCount)
        return;
    vstore3(2.0f * vload3(vertex, vertexPositions) + offset, vertex, vertexPositions);
    vstore3(2.0f * vload3(vertex, vertexNormals) + offset, vertex, vertexNormals);
}
