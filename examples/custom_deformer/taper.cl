// Scales x and z by s = 1 + taper * y. The normal is carried by the inverse transpose of the
// Jacobian, up to its length.
kernel void taper(const uint vertexCount, global const float* positions,
                  global const float* normals, global float* deformedPositions,
                  global float* deformedNormals, const float taper)
{
    const size_t vertex = get_global_id(0);
    if (vertex >= vertexCount)
        return;
    float3 p = vload3(vertex, positions);
    float3 n = vload3(vertex, normals);
    const float scale = 1.0f + taper * p.y;
    n.y = scale * n.y - taper * (p.x * n.x + p.z * n.z);
    p.xz *= scale;
    vstore3(p, vertex, deformedPositions);
    vstore3(normalize(n), vertex, deformedNormals);
}
