#version 330 core
// A square around the origin, computed from the vertex index. It is slightly below the feet, to prevent
// z-fighting with a flat model at y = 0.
const float kBelowFeet = 0.002; // in largest extents of a character

uniform float halfSize;
uniform mat4 toClip;

out vec3 worldPosition;

void main()
{
    vec2 corner = vec2(gl_VertexID & 1, gl_VertexID >> 1) * 2.0 - 1.0;
    worldPosition = vec3(corner.x * halfSize, -kBelowFeet, corner.y * halfSize);
    gl_Position = toClip * vec4(worldPosition, 1.0);
}
