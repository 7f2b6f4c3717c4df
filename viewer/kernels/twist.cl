// A twist around the vertical axis of the character's space: the higher, the further round.
//
// The two matrices are three rows each and lead from the mesh's space to the character's and back.
// Input and output may be the same memory: a work-item reads its own vertex before it writes it.
// Work-items beyond `vertexCount` do nothing.

float3 transformPoint(global const float4* rows, const float3 p)
{
    const float4 point = (float4)(p, 1.0f);
    return (float3)(dot(rows[0], point), dot(rows[1], point), dot(rows[2], point));
}

float3 transformTransposed(global const float4* rows, const float3 v)
{
    return v.x * rows[0].xyz + v.y * rows[1].xyz + v.z * rows[2].xyz;
}

float3 turn(const float3 v, const float c, const float s)
{
    return (float3)(c * v.x + s * v.z, v.y, c * v.z - s * v.x);
}

float3 unitLength(const float3 v)
{
    const float squared = dot(v, v);
    return squared > 0 ? v / sqrt(squared) : v;
}

// With R the rotation by the angle twist * y, a point p becomes R p. Its Jacobian is
// R (I + twist w e_y^T), w = (z, 0, -x), so a normal n becomes R (n - twist (w . n) e_y).
kernel void twist(const uint vertexCount, global const float* positions,
                  global const float* normals, global const float4* geometryMatrix,
                  global const float4* inverseGeometryMatrix, const float twistPerHeight,
                  global float* twistedPositions, global float* twistedNormals)
{
    const size_t vertexId = get_global_id(0);
    if (vertexId >= vertexCount)
        return;

    const float3 point = transformPoint(geometryMatrix, vload3(vertexId, positions));
    float3 normal = transformTransposed(inverseGeometryMatrix, vload3(vertexId, normals));
    normal.y -= twistPerHeight * (point.z * normal.x - point.x * normal.z);

    const float angle = twistPerHeight * point.y;
    float c;
    const float s = sincos(angle, &c);
    vstore3(transformPoint(inverseGeometryMatrix, turn(point, c, s)), vertexId, twistedPositions);
    vstore3(unitLength(transformTransposed(geometryMatrix, turn(normal, c, s))), vertexId,
            twistedNormals);
}
