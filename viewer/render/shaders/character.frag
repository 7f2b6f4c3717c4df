// Behind lighting.glsl.
in vec3 stagePosition;
in vec3 stageNormal;

uniform vec3 albedo; // sRGB
uniform vec3 eye;

out vec4 colour;

void main()
{
    vec3 toEye = normalize(eye - stagePosition);
    vec3 normal = normalize(stageNormal);
    // Both sides of a surface are lit: the normal is that of the side that is seen.
    vec3 seenSide = cross(dFdx(stagePosition), dFdy(stagePosition));
    if (dot(seenSide, toEye) * dot(seenSide, normal) < 0.0)
        normal = -normal;
    float facing = dot(normal, lightDirection);

    // Off the surface, so that a surface does not shade itself.
    float key = max(facing, 0.0) * keyVisibility(stagePosition + 0.02 * normal);
    vec3 halfway = normalize(lightDirection + toEye);
    float shine = 0.16 * key * pow(max(dot(normal, halfway), 0.0), 36.0);
    float rim = 0.30 * pow(1.0 - max(dot(normal, toEye), 0.0), 3.5) * (0.5 + 0.5 * normal.y);

    vec3 light = key * kKeyColour + ambientLight(normal);
    colour = vec4(toScreen(toLinear(albedo) * light * 0.72 + shine * kKeyColour + rim * kSkyColour), 1.0);
}
