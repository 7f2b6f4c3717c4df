// Behind backdrop.glsl.
in float height;
out vec4 colour;

void main()
{
    colour = vec4(backdropColour(height), 1.0);
}
