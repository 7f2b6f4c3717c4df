// Appended to lighting.glsl and backdrop.glsl.
in vec3 worldPosition;

uniform float clearRadius; // the ground is opaque up to here, and invisible at twice this radius

out vec4 colour;

const vec3 kGroundColour = vec3(0.80, 0.79, 0.78);
const float kTile = 0.5;

// Returns 1 on the lines between tiles, anti-aliased. Lines fade out before they alias.
float tileLines(vec2 place)
{
    vec2 width = fwidth(place);
    vec2 distance = abs(fract(place - 0.5) - 0.5);
    vec2 line = 1.0 - smoothstep(vec2(0.0), 1.5 * width, distance);
    return max(line.x, line.y) * (1.0 - smoothstep(0.05, 0.35, max(width.x, width.y)));
}

void main()
{
    float fade = 1.0 - smoothstep(clearRadius, 2.0 * clearRadius, length(worldPosition.xz));
    vec3 up = vec3(0.0, 1.0, 0.0);
    float key = lightDirection.y * keyVisibility(worldPosition);
    vec3 albedo = toLinear(kGroundColour) * (1.0 - 0.16 * tileLines(worldPosition.xz / kTile));
    vec3 lit = toScreen(albedo * (key * kKeyColour + ambientLight(up)) * 0.62);
    colour = vec4(mix(backdropColour(0.0), lit, fade), 1.0);
}
