// A plane wave that travels through the mesh.
//
// (gX, gY, gZ) is the gradient of the wave's angle in the mesh's space, `start` the angle at the
// origin, (uX, uY, uZ) the displacement at the crest, and `stretch` the dot product of the two
// vectors. They are scalars because, with vectors, PoCL's compiler combines components and then does
// not vectorise over work-items.
#include "deformers.clh"

#define WAVE                                                                                       \
    const float gX, const float gY, const float gZ, const float start, const float uX,             \
        const float uY, const float uZ, const float stretch

// With g the gradient, u the displacement and c the cosine of the angle, the Jacobian is
// I + c u g^T. Its transposed inverse times its determinant 1 + c (g . u) turns a normal n into
// (1 + c (g . u)) n - c (u . n) g. The sign of the determinant keeps the normal on its side of the
// surface.
INLINE void waveVertex(const size_t vertex, global const float* positions,
                       global const float* normals, global float* deformedPositions,
                       global float* deformedNormals, WAVE)
{
    const size_t at = 3 * vertex;
    const float x = positions[at];
    const float y = positions[at + 1];
    const float z = positions[at + 2];
    float sine;
    float cosine;
    sineAndCosine(gX * x + gY * y + gZ * z + start, &sine, &cosine);

    const float nx = normals[at];
    const float ny = normals[at + 1];
    const float nz = normals[at + 2];
    const float volume = 1.0f + cosine * stretch;
    const float along = cosine * (uX * nx + uY * ny + uZ * nz);
    const float outX = volume * nx - along * gX;
    const float outY = volume * ny - along * gY;
    const float outZ = volume * nz - along * gZ;
    const float side = volume < 0 ? -1.0f : 1.0f;
    const float scale = side * unitScale(outX * outX + outY * outY + outZ * outZ);

    deformedPositions[at] = x + sine * uX;
    deformedPositions[at + 1] = y + sine * uY;
    deformedPositions[at + 2] = z + sine * uZ;
    deformedNormals[at] = outX * scale;
    deformedNormals[at + 1] = outY * scale;
    deformedNormals[at + 2] = outZ * scale;
}

kernel void wave(const uint vertexCount, global const float* positions,
                 global const float* normals, global float* deformedPositions,
                 global float* deformedNormals, WAVE)
{
    FOR_VERTEX(vertexCount, waveVertex(vertex, positions, normals, deformedPositions,
                                       deformedNormals, gX, gY, gZ, start, uX, uY, uZ, stretch));
}
