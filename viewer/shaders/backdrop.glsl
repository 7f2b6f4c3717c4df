// The paper behind the stage, from the lower edge (0) to the upper edge (1) of the picture.
vec3 backdropColour(float height)
{
    return mix(vec3(0.80, 0.81, 0.83), vec3(0.55, 0.62, 0.72), smoothstep(0.15, 1.0, height));
}
