// Linear-blend skinning: each vertex follows four bones.
//
// `bones` holds the columns of a 3x4 matrix for each bone, four floats each, from the float4
// with the index `firstBone` on. Blending by columns takes no sums across a vector, and two columns take
// one load.
#include "deformers.clh"

#ifdef UseDouble
#pragma OPENCL EXTENSION cl_khr_fp64 : enable
typedef double real;
typedef double4 real4;
typedef double8 real8;
#define TO_REAL4 convert_double4
#define TO_REAL8 convert_double8
#else
typedef float real;
typedef float4 real4;
typedef float8 real8;
#define TO_REAL4
#define TO_REAL8
#endif

// Returns two columns of the blended matrix: those of the pair with the index `pair`.
INLINE real8 blendedColumns(global const float* bones, const uint4 index, const real4 weight,
                            const uint pair)
{
    return weight.x * TO_REAL8(vload8(pair, bones + 16 * (size_t)index.x)) +
           weight.y * TO_REAL8(vload8(pair, bones + 16 * (size_t)index.y)) +
           weight.z * TO_REAL8(vload8(pair, bones + 16 * (size_t)index.z)) +
           weight.w * TO_REAL8(vload8(pair, bones + 16 * (size_t)index.w));
}

INLINE real4 crossProduct(const real4 a, const real4 b)
{
    return a * b.yzxw - a.yzxw * b;
}

kernel void skin(const uint vertexCount, global const float* positions,
                 global const float* normals, global float* deformedPositions,
                 global float* deformedNormals, global const uint* boneIndices,
                 global const float* boneWeights, global const float4* bones,
                 const uint firstBone)
{
    const size_t vertex = get_global_id(0);
    if (vertex >= vertexCount)
        return;

    const uint4 index = vload4(vertex, boneIndices);
    const real4 weight = TO_REAL4(vload4(vertex, boneWeights));
    global const float* columns = (global const float*)(bones + firstBone);
    const real8 xy = blendedColumns(columns, index, weight, 0);
    const real8 zw = blendedColumns(columns, index, weight, 1);
    const real4 x = xy.lo;
    const real4 y = xy.hi;
    const real4 z = zw.lo;

    const size_t at = 3 * vertex;
    const real4 point =
        x * positions[at] + y * positions[at + 1] + z * positions[at + 2] + zw.hi;
    // The cofactors transform normals correctly for any blend, also with shear; the sign of the
    // determinant keeps them on the outside of a mirrored mesh.
    const real4 yz = crossProduct(y, z);
    const real4 turned = yz * normals[at] + crossProduct(z, x) * normals[at + 1] +
                         crossProduct(x, y) * normals[at + 2];
    const real4 normal = turned.yzxw;
    const real4 volumes = x.zxyw * yz;
    const real side = volumes.x + volumes.y + volumes.z < 0 ? -1 : 1;
    const real squared = normal.x * normal.x + normal.y * normal.y + normal.z * normal.z;
    const real4 unit = normal * (squared > 0 ? side * rsqrt(squared) : side);

    deformedPositions[at] = (float)point.x;
    deformedPositions[at + 1] = (float)point.y;
    deformedPositions[at + 2] = (float)point.z;
    deformedNormals[at] = (float)unit.x;
    deformedNormals[at + 1] = (float)unit.y;
    deformedNormals[at + 2] = (float)unit.z;
}
