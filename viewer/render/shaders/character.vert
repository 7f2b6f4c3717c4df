#version 330 core
layout(location = 0) in vec3 position;
layout(location = 1) in vec3 normal;

uniform mat4 toStage;
uniform mat3 normalToStage;
uniform mat4 toClip;

out vec3 stagePosition;
out vec3 stageNormal;

void main()
{
    vec4 placed = toStage * vec4(position, 1.0);
    stagePosition = placed.xyz;
    stageNormal = normalToStage * normal;
    gl_Position = toClip * placed;
}
