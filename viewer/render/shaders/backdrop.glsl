// Returns the colour of the backdrop in a direction of view; `elevation` is the sine of its angle
// above the horizon. Below the horizon it is the colour of the lit ground, which fades into it.
vec3 backdropColour(float elevation)
{
    const vec3 kHorizon = vec3(0.80, 0.80, 0.80);
    const vec3 kZenith = vec3(0.52, 0.59, 0.68);
    return mix(kHorizon, kZenith, smoothstep(-0.02, 0.42, elevation));
}
