#version 330 core
// One triangle over the whole picture, at the far end.
out float height;

void main()
{
    vec2 corner = vec2(gl_VertexID & 1, gl_VertexID >> 1) * 4.0 - 1.0;
    height = corner.y * 0.5 + 0.5;
    gl_Position = vec4(corner, 1.0, 1.0);
}
