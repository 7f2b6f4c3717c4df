// A twist around the y axis of a space: the angle grows with the height of a vertex.
//
// Three rows each transform from the mesh's space to that of the twist and back.
#include "deformers.clh"

// With R the rotation by the angle twist * y, a point p becomes R p. Its Jacobian is
// R (I + twist w e_y^T), w = (z, 0, -x), so a normal n becomes R (n - twist (w . n) e_y).
INLINE void twistVertex(const size_t vertex, global const float* positions,
                        global const float* normals, global float* deformedPositions,
                        global float* deformedNormals, const float4 to0, const float4 to1,
                        const float4 to2, const float4 from0, const float4 from1,
                        const float4 from2, const float twist)
{
    const size_t at = 3 * vertex;
    const float px = positions[at];
    const float py = positions[at + 1];
    const float pz = positions[at + 2];
    const float x = to0.x * px + to0.y * py + to0.z * pz + to0.w;
    const float y = to1.x * px + to1.y * py + to1.z * pz + to1.w;
    const float z = to2.x * px + to2.y * py + to2.z * pz + to2.w;

    float sine;
    float cosine;
    sineAndCosine(twist * y, &sine, &cosine);
    const float turnedX = cosine * x + sine * z;
    const float turnedZ = cosine * z - sine * x;

    // Normals transform with the transposed inverse.
    const float nx = normals[at];
    const float ny = normals[at + 1];
    const float nz = normals[at + 2];
    const float u = from0.x * nx + from1.x * ny + from2.x * nz;
    const float w = from0.z * nx + from1.z * ny + from2.z * nz;
    const float v = from0.y * nx + from1.y * ny + from2.y * nz - twist * (z * u - x * w);
    const float turnedU = cosine * u + sine * w;
    const float turnedW = cosine * w - sine * u;
    const float outX = to0.x * turnedU + to1.x * v + to2.x * turnedW;
    const float outY = to0.y * turnedU + to1.y * v + to2.y * turnedW;
    const float outZ = to0.z * turnedU + to1.z * v + to2.z * turnedW;
    const float scale = unitScale(outX * outX + outY * outY + outZ * outZ);

    deformedPositions[at] = from0.x * turnedX + from0.y * y + from0.z * turnedZ + from0.w;
    deformedPositions[at + 1] = from1.x * turnedX + from1.y * y + from1.z * turnedZ + from1.w;
    deformedPositions[at + 2] = from2.x * turnedX + from2.y * y + from2.z * turnedZ + from2.w;
    deformedNormals[at] = outX * scale;
    deformedNormals[at + 1] = outY * scale;
    deformedNormals[at + 2] = outZ * scale;
}

kernel void twist(const uint vertexCount, global const float* positions,
                  global const float* normals, global float* deformedPositions,
                  global float* deformedNormals, const float4 to0, const float4 to1,
                  const float4 to2, const float4 from0, const float4 from1, const float4 from2,
                  const float twistPerHeight)
{
    FOR_VERTEX(vertexCount,
               twistVertex(vertex, positions, normals, deformedPositions, deformedNormals, to0, to1,
                           to2, from0, from1, from2, twistPerHeight));
}
