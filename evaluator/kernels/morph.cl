// Morph targets: adds the deltas of eight targets to each vertex.
//
// The deltas of a target are stored one component after the other, which any device reads in whole
// lines. Eight targets at a time are added without a loop, so that a CPU runtime can use vector
// instructions.
#include "deformers.clh"

#define TARGETS                                                                                    \
    global const float* deltas0, global const float* deltas1, global const float* deltas2,         \
        global const float* deltas3, global const float* deltas4, global const float* deltas5,     \
        global const float* deltas6, global const float* deltas7, const float8 weights
#define TARGET_NAMES                                                                               \
    deltas0, deltas1, deltas2, deltas3, deltas4, deltas5, deltas6, deltas7, weights

// Returns the sum of one component of all targets; `at` is its index in the deltas.
INLINE float weightedSum(const size_t at, TARGETS)
{
    return weights.s0 * deltas0[at] + weights.s1 * deltas1[at] + weights.s2 * deltas2[at] +
           weights.s3 * deltas3[at] + weights.s4 * deltas4[at] + weights.s5 * deltas5[at] +
           weights.s6 * deltas6[at] + weights.s7 * deltas7[at];
}

INLINE void morphPosition(const size_t vertex, const uint count, global const float* positions,
                          global float* deformedPositions, TARGETS)
{
    const size_t at = 3 * vertex;
    const size_t n = count;
    const float x = positions[at] + weightedSum(vertex, TARGET_NAMES);
    const float y = positions[at + 1] + weightedSum(n + vertex, TARGET_NAMES);
    const float z = positions[at + 2] + weightedSum(2 * n + vertex, TARGET_NAMES);
    deformedPositions[at] = x;
    deformedPositions[at + 1] = y;
    deformedPositions[at + 2] = z;
}

INLINE void morphNormal(const size_t vertex, const uint count, global const float* normals,
                        global float* deformedNormals, TARGETS, const uint isLastPass)
{
    const size_t at = 3 * vertex;
    const size_t n = count;
    const float x = normals[at] + weightedSum(3 * n + vertex, TARGET_NAMES);
    const float y = normals[at + 1] + weightedSum(4 * n + vertex, TARGET_NAMES);
    const float z = normals[at + 2] + weightedSum(5 * n + vertex, TARGET_NAMES);
    const float scale = isLastPass ? unitScale(x * x + y * y + z * z) : 1.0f;
    deformedNormals[at] = x * scale;
    deformedNormals[at + 1] = y * scale;
    deformedNormals[at + 2] = z * scale;
}

INLINE void copyNormal(const size_t vertex, global const float* normals,
                       global float* deformedNormals)
{
    const size_t at = 3 * vertex;
    deformedNormals[at] = normals[at];
    deformedNormals[at + 1] = normals[at + 1];
    deformedNormals[at + 2] = normals[at + 2];
}

// `isLastPass` is 1 in the pass that normalises the normals.
kernel void morph(const uint vertexCount, global const float* positions,
                  global const float* normals, global float* deformedPositions,
                  global float* deformedNormals, TARGETS, const uint isLastPass)
{
    FOR_VERTEX(vertexCount,
               morphPosition(vertex, vertexCount, positions, deformedPositions, TARGET_NAMES);
               morphNormal(vertex, vertexCount, normals, deformedNormals, TARGET_NAMES,
                           isLastPass));
}

// For targets without normals.
kernel void morphPositions(const uint vertexCount, global const float* positions,
                           global const float* normals, global float* deformedPositions,
                           global float* deformedNormals, TARGETS)
{
    FOR_VERTEX(vertexCount,
               morphPosition(vertex, vertexCount, positions, deformedPositions, TARGET_NAMES);
               copyNormal(vertex, normals, deformedNormals));
}
