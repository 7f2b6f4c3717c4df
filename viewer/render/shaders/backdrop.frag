// Appended to backdrop.glsl.
in vec3 direction;
out vec4 colour;

void main()
{
    colour = vec4(backdropColour(normalize(direction).y), 1.0);
}
