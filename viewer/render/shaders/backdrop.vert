#version 330 core
// One triangle that covers the picture, at the far plane.

uniform mat4 fromClip; // to world space
uniform vec3 eye;

out vec3 direction;

void main()
{
    vec2 corner = vec2(gl_VertexID & 1, gl_VertexID >> 1) * 4.0 - 1.0;
    gl_Position = vec4(corner, 1.0, 1.0);
    vec4 far = fromClip * gl_Position;
    direction = far.xyz / far.w - eye;
}
