#version 330 core
// A square around the origin, made of the vertex's number. It lies a little below the feet, so that a
// model that lies flat on it does not flicker.
const float kBelowFeet = 0.002; // in the characters' largest extent

uniform float halfSize;
uniform mat4 toClip;

out vec3 stagePosition;

void main()
{
    vec2 corner = vec2(gl_VertexID & 1, gl_VertexID >> 1) * 2.0 - 1.0;
    stagePosition = vec3(corner.x * halfSize, -kBelowFeet, corner.y * halfSize);
    gl_Position = toClip * vec4(stagePosition, 1.0);
}
