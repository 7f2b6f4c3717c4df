// Laplacian smoothing, one iteration per pass, and a last pass for the normals.
//
// Ranges are indices of the first element of a vertex and of the one past its last. A corner holds
// the two other vertices of a triangle.
//
// The first pass compares each normal with a triangle, and marks a normal on the other side of the
// surface by the length 2. Later passes copy the mark, and the last one reads it.
#include "deformers.clh"

// The areas of a vertex's triangles cancel if their sum is below this fraction of their sizes.
#define CANCELLED 1e-4f

// Returns twice the area of a triangle, as a vector that is perpendicular to it.
INLINE float3 areaVector(const float3 position, const uint2 corner, global const float* positions)
{
    const float3 next = vload3(corner.x, positions) - position;
    const float3 last = vload3(corner.y, positions) - position;
    return next.yzx * last.zxy - next.zxy * last.yzx;
}

INLINE float sumOf(const float3 v)
{
    return v.x + v.y + v.z;
}

kernel void smooth(const uint vertexCount, global const float* positions,
                   global const float* normals, global float* deformedPositions,
                   global float* deformedNormals, global const uint* cornerRanges,
                   global const uint* corners, global const uint* neighbourRanges,
                   global const uint* neighbours, const float weight, const uint isFirstPass)
{
    const size_t vertex = get_global_id(0);
    if (vertex >= vertexCount)
        return;

    const float3 position = vload3(vertex, positions);
    const uint2 range = vload2(vertex, neighbourRanges);
    float3 sum = (float3)(0.0f);
    for (uint i = range.x; i < range.y; ++i)
        sum += vload3(neighbours[i], positions) - position;
    const float part = range.x < range.y ? weight / (float)(range.y - range.x) : 0.0f;
    vstore3(position + part * sum, vertex, deformedPositions);

    float3 normal = vload3(vertex, normals);
    if (isFirstPass) {
        const uint2 triangles = vload2(vertex, cornerRanges);
        if (triangles.x < triangles.y &&
            dot(areaVector(position, vload2(triangles.x, corners), positions), normal) < 0)
            normal *= 2.0f;
    }
    vstore3(normal, vertex, deformedNormals);
}

kernel void smoothNormals(const uint vertexCount, global const float* positions,
                          global const float* normals, global float* deformedPositions,
                          global float* deformedNormals, global const uint* cornerRanges,
                          global const uint* corners)
{
    const size_t vertex = get_global_id(0);
    if (vertex >= vertexCount)
        return;

    const float3 position = vload3(vertex, positions);
    const uint2 range = vload2(vertex, cornerRanges);
    float3 sum = (float3)(0.0f);
    float3 size = (float3)(0.0f);
    for (uint i = range.x; i < range.y; ++i) {
        const float3 area = areaVector(position, vload2(i, corners), positions);
        sum += area;
        size += fabs(area);
    }
    const float3 incoming = vload3(vertex, normals);
    const bool isReversed = dot(incoming, incoming) > 2.0f;
    float3 normal = isReversed ? 0.5f * incoming : incoming;
    if (sumOf(fabs(sum)) > CANCELLED * sumOf(size))
        normal = sum * ((isReversed ? -1.0f : 1.0f) * rsqrt(dot(sum, sum)));
    vstore3(position, vertex, deformedPositions);
    vstore3(normal, vertex, deformedNormals);
}
