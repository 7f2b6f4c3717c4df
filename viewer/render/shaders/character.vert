#version 330 core
layout(location = 0) in vec3 position;
layout(location = 1) in vec3 normal;

uniform mat4 toWorld;
uniform mat3 normalToWorld;
uniform mat4 toClip;

out vec3 worldPosition;
out vec3 worldNormal;

void main()
{
    vec4 placed = toWorld * vec4(position, 1.0);
    worldPosition = placed.xyz;
    worldNormal = normalToWorld * normal;
    gl_Position = toClip * placed;
}
