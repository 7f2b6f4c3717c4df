#version 330 core
layout(location = 0) in vec3 position;

uniform mat4 toWorld;
uniform mat4 toLight;

void main()
{
    gl_Position = toLight * (toWorld * vec4(position, 1.0));
}
