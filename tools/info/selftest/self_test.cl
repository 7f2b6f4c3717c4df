// Reads what OpenGL wrote into the vertex buffers, and writes a result that depends on it.
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
