// Appended to lighting.glsl.
in vec3 worldPosition;
in vec3 worldNormal;

uniform vec3 albedo; // sRGB
uniform vec3 eye;

out vec4 colour;

void main()
{
    vec3 toEye = normalize(eye - worldPosition);
    vec3 normal = normalize(worldNormal);
    // Surfaces are two-sided: use the normal of the visible side.
    vec3 visibleSide = cross(dFdx(worldPosition), dFdy(worldPosition));
    if (dot(visibleSide, toEye) * dot(visibleSide, normal) < 0.0)
        normal = -normal;
    float facing = dot(normal, lightDirection);

    // Offset along the normal, to prevent self-shadowing.
    float key = max(facing, 0.0) * keyVisibility(worldPosition + 0.02 * normal);
    vec3 halfway = normalize(lightDirection + toEye);
    float shine = 0.16 * key * pow(max(dot(normal, halfway), 0.0), 36.0);
    float rim = 0.30 * pow(1.0 - max(dot(normal, toEye), 0.0), 3.5) * (0.5 + 0.5 * normal.y);

    vec3 light = key * kKeyColour + ambientLight(normal);
    colour = vec4(toScreen(toLinear(albedo) * light * 0.72 + shine * kKeyColour + rim * kSkyColour), 1.0);
}
