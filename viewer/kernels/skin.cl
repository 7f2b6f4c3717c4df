// Linear-blend skinning: every vertex follows up to four bones.
//
// `bones` holds three rows per bone, the upper part of its matrix. Positions and normals are packed
// floats, three each. Work-items beyond `vertexCount` do nothing.

// Where the device can, the blended matrix is summed and applied in double precision: a model far
// from its origin keeps its shape.
#ifdef SupportsDoublePrecision
#pragma OPENCL EXTENSION cl_khr_fp64 : enable
typedef double real;
typedef double4 real4;
#define toReal4 convert_double4
#else
typedef float real;
typedef float4 real4;
#define toReal4 convert_float4
#endif

real4 blendedRow(global const float4* bones, const uint4 index, const real4 weight, const uint row)
{
    return weight.x * toReal4(bones[3 * index.x + row]) +
           weight.y * toReal4(bones[3 * index.y + row]) +
           weight.z * toReal4(bones[3 * index.z + row]) +
           weight.w * toReal4(bones[3 * index.w + row]);
}

float3 unitLength(const float3 v)
{
    const float squared = dot(v, v);
    return squared > 0 ? v / sqrt(squared) : v;
}

kernel void skin(const uint vertexCount, global const float* positions,
                 global const float* normals, global const uint* boneIndices,
                 global const float* boneWeights, global const float4* bones,
                 global float* skinnedPositions, global float* skinnedNormals)
{
    const size_t vertexId = get_global_id(0);
    if (vertexId >= vertexCount)
        return;

    const uint4 index = vload4(vertexId, boneIndices);
    const real4 weight = toReal4(vload4(vertexId, boneWeights));
    const real4 row0 = blendedRow(bones, index, weight, 0);
    const real4 row1 = blendedRow(bones, index, weight, 1);
    const real4 row2 = blendedRow(bones, index, weight, 2);

    const real4 point = toReal4((float4)(vload3(vertexId, positions), 1.0f));
    const float3 skinned = (float3)(dot(row0, point), dot(row1, point), dot(row2, point));
    vstore3(skinned, vertexId, skinnedPositions);

    // The cofactors carry normals through any blend, also a sheared one; the sign keeps them
    // outside of a mirrored mesh.
    const real4 first = cross(row1, row2);
    const real4 second = cross(row2, row0);
    const real4 third = cross(row0, row1);
    const real4 normal = toReal4((float4)(vload3(vertexId, normals), 0.0f));
    const float sign = dot(row0, first) < 0 ? -1.0f : 1.0f; // cross products have no fourth part
    const float3 carried = (float3)(dot(first, normal), dot(second, normal), dot(third, normal));
    vstore3(unitLength(sign * carried), vertexId, skinnedNormals);
}
