// The paper behind the stage, by how far one looks up: the sine of the angle above the horizon. Up
// to the horizon it has the colour of the lit ground, which fades into it.
vec3 backdropColour(float elevation)
{
    const vec3 kHorizon = vec3(0.80, 0.80, 0.80);
    const vec3 kZenith = vec3(0.52, 0.59, 0.68);
    return mix(kHorizon, kZenith, smoothstep(-0.02, 0.42, elevation));
}
